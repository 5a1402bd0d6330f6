# Writes the registry script into a C++ source, for the platforms whose
# modules carry no resources: cmake -DINPUT=<rgs> -DOUTPUT=<cpp> -P embed_script.cmake
file(READ "${INPUT}" content HEX)
string(REGEX REPLACE "([0-9a-f][0-9a-f])" "0x\\1," bytes "${content}")
string(REGEX REPLACE "((0x..,){16})" "\\1\n    " bytes "${bytes}")
file(WRITE "${OUTPUT}" "// Generated from ${INPUT}; do not edit.
#include <cstddef>

namespace tav {
extern const char kRegistryScript[];
extern const size_t kRegistryScriptSize;
const char kRegistryScript[] = {
    ${bytes}
};
const size_t kRegistryScriptSize = sizeof(kRegistryScript);
}  // namespace tav
")
