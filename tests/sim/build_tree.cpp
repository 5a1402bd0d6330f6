#include "build_tree.h"

#include "sim/text.h"

namespace tav::sim::test {

std::filesystem::path BuildFolder() {
    OLECHAR path[4096] = {};
    const DWORD length = GetModuleFileNameW(nullptr, path, 4096);
#ifdef _WIN32
    const std::filesystem::path executable(std::wstring(path, length));
#else
    const std::filesystem::path executable(Narrow(TextView(path, length)));
#endif
    return executable.parent_path().parent_path();
}

}  // namespace tav::sim::test
