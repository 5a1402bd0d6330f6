// The COM, OLE Automation and kernel functions that the platform layer
// implements on non-Windows platforms, with the names, signatures and
// results of their Windows counterparts. Where MinGW's declarations differ
// from the Windows SDK's (a missing const), these follow MinGW, so that what
// compiles here compiles for Windows too.
#pragma once
#include "tav/com_types.h"

extern "C" {

// OLE Automation strings: a 32-bit byte length before the characters and a
// 16-bit terminator after them.
TAV_PLATFORM_API BSTR SysAllocString(const OLECHAR* psz);
TAV_PLATFORM_API BSTR SysAllocStringLen(const OLECHAR* pch, UINT cch);
TAV_PLATFORM_API BSTR SysAllocStringByteLen(LPCSTR psz, UINT len);
TAV_PLATFORM_API INT SysReAllocString(BSTR* pbstr, const OLECHAR* psz);
TAV_PLATFORM_API INT SysReAllocStringLen(BSTR* pbstr, const OLECHAR* psz, UINT len);
TAV_PLATFORM_API void SysFreeString(BSTR bstrString);
TAV_PLATFORM_API UINT SysStringLen(BSTR pbstr);
TAV_PLATFORM_API UINT SysStringByteLen(BSTR bstr);

// VARIANT. VariantClear and VariantCopy know the scalar types, BSTR,
// VT_UNKNOWN, VT_DISPATCH and any VT_BYREF; other types give DISP_E_BADVARTYPE.
TAV_PLATFORM_API void VariantInit(VARIANTARG* pvarg);
TAV_PLATFORM_API HRESULT VariantClear(VARIANTARG* pvarg);
TAV_PLATFORM_API HRESULT VariantCopy(VARIANTARG* pvargDest, VARIANTARG* pvargSrc);  // not const, as MinGW
TAV_PLATFORM_API HRESULT VarUI4FromStr(OLECHAR* strIn, LCID lcid, ULONG dwFlags, ULONG* pulOut);  // not const, as MinGW

// Task memory.
TAV_PLATFORM_API LPVOID CoTaskMemAlloc(SIZE_T cb);
TAV_PLATFORM_API LPVOID CoTaskMemRealloc(LPVOID pv, SIZE_T cb);
TAV_PLATFORM_API void CoTaskMemFree(LPVOID pv);

// GUIDs and their "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}" text form.
TAV_PLATFORM_API HRESULT CoCreateGuid(GUID* pguid);
TAV_PLATFORM_API HRESULT StringFromCLSID(REFCLSID rclsid, LPOLESTR* lplpsz);
TAV_PLATFORM_API HRESULT StringFromIID(REFIID rclsid, LPOLESTR* lplpsz);
TAV_PLATFORM_API int StringFromGUID2(REFGUID rguid, LPOLESTR lpsz, int cchMax);
TAV_PLATFORM_API HRESULT CLSIDFromString(LPCOLESTR lpsz, LPCLSID pclsid);
TAV_PLATFORM_API HRESULT CLSIDFromProgID(LPCOLESTR lpszProgID, LPCLSID lpclsid);

// The COM runtime, in-process servers only: there are no apartments and no
// marshalling. Class objects registered in the process are found first, then
// InprocServer32 under HKCU\Software\Classes\CLSID, then under HKCR\CLSID.
TAV_PLATFORM_API HRESULT CoInitialize(LPVOID pvReserved);
TAV_PLATFORM_API HRESULT CoInitializeEx(LPVOID pvReserved, DWORD dwCoInit);
TAV_PLATFORM_API void CoUninitialize(void);
TAV_PLATFORM_API HRESULT CoRegisterClassObject(REFCLSID rclsid, LPUNKNOWN pUnk, DWORD dwClsContext, DWORD flags,
                                               LPDWORD lpdwRegister);
TAV_PLATFORM_API HRESULT CoRevokeClassObject(DWORD dwRegister);
TAV_PLATFORM_API HRESULT CoGetClassObject(REFCLSID rclsid, DWORD dwClsContext, LPVOID pvReserved, REFIID riid,
                                          LPVOID* ppv);
TAV_PLATFORM_API HRESULT CoCreateInstance(REFCLSID rclsid, LPUNKNOWN pUnkOuter, DWORD dwClsContext, REFIID riid,
                                          LPVOID* ppv);
TAV_PLATFORM_API void CoFreeUnusedLibraries(void);
TAV_PLATFORM_API void CoFreeUnusedLibrariesEx(DWORD dwUnloadDelay, DWORD dwReserved);

// Text conversion. Code page 0 (CP_ACP, and CP_OEMCP, CP_THREAD_ACP) is
// Latin-1; CP_UTF8 is UTF-8.
TAV_PLATFORM_API int MultiByteToWideChar(UINT CodePage, DWORD dwFlags, LPCCH lpMultiByteStr, int cbMultiByte,
                                         LPWSTR lpWideCharStr, int cchWideChar);
TAV_PLATFORM_API int WideCharToMultiByte(UINT CodePage, DWORD dwFlags, LPCWCH lpWideCharStr, int cchWideChar,
                                         LPSTR lpMultiByteStr, int cbMultiByte, LPCCH lpDefaultChar,
                                         LPBOOL lpUsedDefaultChar);

// Thread error state.
TAV_PLATFORM_API DWORD GetLastError(void);
TAV_PLATFORM_API void SetLastError(DWORD dwErrCode);

// Critical sections: recursive, as on Windows.
TAV_PLATFORM_API void InitializeCriticalSection(LPCRITICAL_SECTION lpCriticalSection);
TAV_PLATFORM_API void EnterCriticalSection(LPCRITICAL_SECTION lpCriticalSection);
TAV_PLATFORM_API BOOL TryEnterCriticalSection(LPCRITICAL_SECTION lpCriticalSection);
TAV_PLATFORM_API void LeaveCriticalSection(LPCRITICAL_SECTION lpCriticalSection);
TAV_PLATFORM_API void DeleteCriticalSection(LPCRITICAL_SECTION lpCriticalSection);

// Semaphores (unnamed only) and the waits on them. A handle stays usable by a
// wait in progress even when another thread closes it.
TAV_PLATFORM_API HANDLE CreateSemaphoreW(LPSECURITY_ATTRIBUTES lpSemaphoreAttributes, LONG lInitialCount,
                                         LONG lMaximumCount, LPCWSTR lpName);
TAV_PLATFORM_API BOOL ReleaseSemaphore(HANDLE hSemaphore, LONG lReleaseCount, LPLONG lpPreviousCount);
TAV_PLATFORM_API DWORD WaitForSingleObject(HANDLE hHandle, DWORD dwMilliseconds);
TAV_PLATFORM_API BOOL CloseHandle(HANDLE hObject);

TAV_PLATFORM_API void Sleep(DWORD dwMilliseconds);
TAV_PLATFORM_API DWORD GetTickCount(void);

// Modules: an HMODULE is the load address of a shared object; NULL names the
// executable.
TAV_PLATFORM_API BOOL GetModuleHandleExW(DWORD dwFlags, LPCWSTR lpModuleName, HMODULE* phModule);
TAV_PLATFORM_API DWORD GetModuleFileNameW(HMODULE hModule, LPWSTR lpFilename, DWORD nSize);

// The registry: HKEY_CLASSES_ROOT is HKEY_LOCAL_MACHINE\SOFTWARE\Classes;
// names are compared without regard to case. Persisted in one file (see
// tav/registry_file.h).
TAV_PLATFORM_API LSTATUS RegCreateKeyExW(HKEY hKey, LPCWSTR lpSubKey, DWORD Reserved, LPWSTR lpClass,
                                         DWORD dwOptions, REGSAM samDesired,
                                         const LPSECURITY_ATTRIBUTES lpSecurityAttributes, PHKEY phkResult,
                                         LPDWORD lpdwDisposition);
TAV_PLATFORM_API LSTATUS RegOpenKeyExW(HKEY hKey, LPCWSTR lpSubKey, DWORD ulOptions, REGSAM samDesired,
                                       PHKEY phkResult);
TAV_PLATFORM_API LSTATUS RegCloseKey(HKEY hKey);
TAV_PLATFORM_API LSTATUS RegSetValueExW(HKEY hKey, LPCWSTR lpValueName, DWORD Reserved, DWORD dwType,
                                        const BYTE* lpData, DWORD cbData);
TAV_PLATFORM_API LSTATUS RegQueryValueExW(HKEY hKey, LPCWSTR lpValueName, LPDWORD lpReserved, LPDWORD lpType,
                                          LPBYTE lpData, LPDWORD lpcbData);
TAV_PLATFORM_API LSTATUS RegDeleteValueW(HKEY hKey, LPCWSTR lpValueName);
TAV_PLATFORM_API LSTATUS RegDeleteKeyW(HKEY hKey, LPCWSTR lpSubKey);
TAV_PLATFORM_API LSTATUS RegDeleteTreeW(HKEY hKey, LPCWSTR lpSubKey);
TAV_PLATFORM_API LSTATUS RegEnumKeyExW(HKEY hKey, DWORD dwIndex, LPWSTR lpName, LPDWORD lpcchName,
                                       LPDWORD lpReserved, LPWSTR lpClass, LPDWORD lpcchClass,
                                       PFILETIME lpftLastWriteTime);
TAV_PLATFORM_API LSTATUS RegEnumValueW(HKEY hKey, DWORD dwIndex, LPWSTR lpValueName, LPDWORD lpcchValueName,
                                       LPDWORD lpReserved, LPDWORD lpType, LPBYTE lpData, LPDWORD lpcbData);

}  // extern "C"

// Interlocked operations: full barriers, as on Windows.
inline LONG InterlockedIncrement(LONG volatile* addend) { return __atomic_add_fetch(addend, 1, __ATOMIC_SEQ_CST); }
inline LONG InterlockedDecrement(LONG volatile* addend) { return __atomic_sub_fetch(addend, 1, __ATOMIC_SEQ_CST); }
inline LONG InterlockedExchange(LONG volatile* target, LONG value) {
    return __atomic_exchange_n(target, value, __ATOMIC_SEQ_CST);
}
inline LONG InterlockedExchangeAdd(LONG volatile* addend, LONG value) {
    return __atomic_fetch_add(addend, value, __ATOMIC_SEQ_CST);
}
inline LONG InterlockedCompareExchange(LONG volatile* destination, LONG exchange, LONG comparand) {
    __atomic_compare_exchange_n(destination, &comparand, exchange, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
    return comparand;
}
inline PVOID InterlockedExchangePointer(PVOID volatile* target, PVOID value) {
    return __atomic_exchange_n(target, value, __ATOMIC_SEQ_CST);
}
inline PVOID InterlockedCompareExchangePointer(PVOID volatile* destination, PVOID exchange, PVOID comparand) {
    __atomic_compare_exchange_n(destination, &comparand, exchange, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
    return comparand;
}
