#pragma once
#include <filesystem>
#include <string>

// Where the tests find the other artefacts of their build: the executable
// lives in <build>/tests, so the build folder is its parent.
namespace tav::sim::test {

std::filesystem::path BuildFolder();

#ifdef _WIN32
inline constexpr const char* kModuleSuffix = ".dll";
inline constexpr const char* kExecutableSuffix = ".exe";
#else
inline constexpr const char* kModuleSuffix = ".so";
inline constexpr const char* kExecutableSuffix = "";
#endif

}  // namespace tav::sim::test
