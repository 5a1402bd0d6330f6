// A number read into a double.
#include "core/text/scan.h"

namespace tav {

int Sample(OleStringView text) {
    double number = 0;
    return text::Scan<OLESTR("-a %d")>(text, &number);
}

}  // namespace tav
