// A buffer of 10 characters cannot hold a field of 10 and its terminator.
#include "core/text/scan.h"

namespace tav {

int Sample(OleStringView text) {
    OLECHAR word[10];
    return text::Scan<OLESTR("-w %10s")>(text, word);
}

}  // namespace tav
