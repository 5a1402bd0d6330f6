// %f without l: only double is read, and it must say so.
#include "core/text/scan.h"

namespace tav {

int Sample(OleStringView text) {
    double number = 0;
    return text::Scan<OLESTR("-a %f")>(text, &number);
}

}  // namespace tav
