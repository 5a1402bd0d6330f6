// The one header through which the module reaches COM, OLE Automation and the
// kernel services. On Windows these are the system's own; elsewhere they are
// our small implementation with the same names and semantics.
#pragma once

#ifdef _WIN32
#ifndef WIN32_LEAN_AND_MEAN
#define WIN32_LEAN_AND_MEAN
#endif
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>
#include <ole2.h>
#include <oleauto.h>
#else
#include "tav/com_types.h"
#include "tav/com_api.h"
#endif

#include "tav/fault_injection.h"
#include "tav/memory.h"
#include "tav/registry_file.h"

// OLECHAR is 16 bits everywhere: wchar_t on Windows, char16_t elsewhere.
static_assert(sizeof(OLECHAR) == 2, "OLECHAR must be 16 bits");

#ifndef _WIN32
#define OLESTR(s) u##s
#endif
