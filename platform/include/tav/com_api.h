// Declarations of the COM, OLE Automation and kernel functions implemented by
// the platform layer on non-Windows platforms.
#pragma once
#include "tav/com_types.h"

extern "C" {
TAV_PLATFORM_API BSTR SysAllocString(const OLECHAR* psz);
TAV_PLATFORM_API BSTR SysAllocStringLen(const OLECHAR* pch, UINT cch);
TAV_PLATFORM_API void SysFreeString(BSTR bstr);
TAV_PLATFORM_API UINT SysStringLen(BSTR bstr);
}
