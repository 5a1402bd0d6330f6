// The registry entries of the seventeen classes and of the type library, as a
// client expects them beneath a classes root (HKLM\Software\Classes for the
// machine, HKCU\Software\Classes for one user, or HKEY_CLASSES_ROOT).
#pragma once
#include <string>
#include <vector>

#include "tav/platform.h"

namespace tav::conformance {

// The three keys of one class: versioned ProgID, ProgID, CLSID\{...}.
std::vector<std::wstring> ClassKeys(int version);
std::wstring ClassKey(int version);  // CLSID\{...}
std::wstring TypeLibraryKey();       // TypeLib\{LIBID}

// Expects every key and value of every class, with the module's path as the
// in-process server; returns the number of values compared.
int ExpectClassesRegistered(HKEY classes, const std::wstring& modulePath);
// Expects the type library's entry: version 1.0, locale 0, the module's
// path for this platform (win64 or win32); returns the number of values compared.
int ExpectTypeLibraryRegistered(HKEY classes, const std::wstring& modulePath);
// Expects none of the classes' keys; returns the number of keys looked for.
int ExpectClassesAbsent(HKEY classes);

// The classes' keys with everything beneath them, as one text.
std::wstring DumpClasses(HKEY classes);

}  // namespace tav::conformance
