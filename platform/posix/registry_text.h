// The registry file: UTF-8 text in the manner of a .reg export, one line per
// key and per value, so that a person can read it and diff it.
//
//   ; TavController registry 1
//   [HKEY_LOCAL_MACHINE\SOFTWARE\Classes\CLSID\{...}\InprocServer32]
//   @="/opt/tav/TavController.so"
//   "ThreadingModel"="Both"
//   "Count"=dword:0000002a
//   "Blob"=hex(3):01,ff
//
// Names and strings escape control characters, '%' and '"' as %XX; strings
// are REG_SZ data with one terminator; any other data is written as hex.
#pragma once
#include <string>
#include <string_view>

#include "registry_tree.h"

namespace tav::posix {

std::string WriteRegistryText(const RegistryTree& tree);
// False (and `tree` in an unspecified state) when the text is not a registry file.
bool ReadRegistryText(std::string_view text, RegistryTree& tree);

}  // namespace tav::posix
