// The registry file reader with corrupt files: a file is read or refused,
// never a crash, and whatever is read writes back as a file that reads back
// to the same text.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "registry_text.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace tav::posix;
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    RegistryTree tree;
    if (!ReadRegistryText(text, tree)) return 0;
    const std::string written = WriteRegistryText(tree);
    RegistryTree again;
    if (!ReadRegistryText(written, again)) {
        std::fprintf(stderr, "a file we wrote does not read back\n");
        std::abort();
    }
    if (WriteRegistryText(again) != written) {
        std::fprintf(stderr, "a file we wrote reads back as another tree\n");
        std::abort();
    }
    return 0;
}
