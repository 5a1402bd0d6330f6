// Two conversions, one target.
#include "core/text/scan.h"

namespace tav {

int Sample(OleStringView text) {
    LONG number = 0;
    return text::Scan<OLESTR("-a %d -b %d")>(text, &number);
}

}  // namespace tav
