#include <sys/random.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

#include "registry_lookup.h"
#include "tav/com_api.h"

namespace {

constexpr int guidTextLength = 38;  // "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}"

int HexValue(OLECHAR c) {
    if (c >= u'0' && c <= u'9') return c - u'0';
    if (c >= u'a' && c <= u'f') return c - u'a' + 10;
    if (c >= u'A' && c <= u'F') return c - u'A' + 10;
    return -1;
}

// Reads `digits` hexadecimal digits; false if one of them is not.
bool ReadHex(const OLECHAR*& p, int digits, std::uint32_t& value) {
    value = 0;
    for (int i = 0; i < digits; ++i) {
        int digit = HexValue(*p++);
        if (digit < 0) return false;
        value = value << 4 | static_cast<std::uint32_t>(digit);
    }
    return true;
}

bool ParseGuid(const OLECHAR* text, GUID& guid) {
    const OLECHAR* p = text;
    std::uint32_t value;
    if (*p++ != u'{') return false;
    if (!ReadHex(p, 8, value) || *p++ != u'-') return false;
    guid.Data1 = value;
    if (!ReadHex(p, 4, value) || *p++ != u'-') return false;
    guid.Data2 = static_cast<std::uint16_t>(value);
    if (!ReadHex(p, 4, value) || *p++ != u'-') return false;
    guid.Data3 = static_cast<std::uint16_t>(value);
    for (int i = 0; i < 8; ++i) {
        if (i == 2 && *p++ != u'-') return false;
        if (!ReadHex(p, 2, value)) return false;
        guid.Data4[i] = static_cast<std::uint8_t>(value);
    }
    return *p++ == u'}' && *p == 0;
}

bool StartsWithBrace(LPCOLESTR text) { return text[0] == u'{'; }

}  // namespace

extern "C" {

HRESULT CoCreateGuid(GUID* pguid) {
    if (pguid == nullptr) return E_INVALIDARG;
    unsigned char bytes[sizeof(GUID)];
    std::size_t filled = 0;
    while (filled < sizeof bytes) {
        ssize_t got = getrandom(bytes + filled, sizeof bytes - filled, 0);
        if (got < 0) {
            if (errno == EINTR) continue;
            return E_FAIL;
        }
        filled += static_cast<std::size_t>(got);
    }
    std::memcpy(pguid, bytes, sizeof bytes);
    pguid->Data3 = static_cast<std::uint16_t>((pguid->Data3 & 0x0FFF) | 0x4000);  // version 4: random
    pguid->Data4[0] = static_cast<std::uint8_t>((pguid->Data4[0] & 0x3F) | 0x80);  // RFC 4122 variant
    return S_OK;
}

int StringFromGUID2(REFGUID rguid, LPOLESTR lpsz, int cchMax) {
    if (lpsz == nullptr || cchMax < guidTextLength + 1) return 0;
    char text[guidTextLength + 1];
    std::snprintf(text, sizeof text, "{%08X-%04X-%04X-%02X%02X-%02X%02X%02X%02X%02X%02X}",
                  static_cast<unsigned>(rguid.Data1), rguid.Data2, rguid.Data3, rguid.Data4[0], rguid.Data4[1],
                  rguid.Data4[2], rguid.Data4[3], rguid.Data4[4], rguid.Data4[5], rguid.Data4[6], rguid.Data4[7]);
    for (int i = 0; i <= guidTextLength; ++i) lpsz[i] = static_cast<OLECHAR>(text[i]);
    return guidTextLength + 1;
}

HRESULT StringFromCLSID(REFCLSID rclsid, LPOLESTR* lplpsz) {
    if (lplpsz == nullptr) return E_INVALIDARG;
    *lplpsz = static_cast<LPOLESTR>(CoTaskMemAlloc((guidTextLength + 1) * sizeof(OLECHAR)));
    if (*lplpsz == nullptr) return E_OUTOFMEMORY;
    StringFromGUID2(rclsid, *lplpsz, guidTextLength + 1);
    return S_OK;
}

HRESULT StringFromIID(REFIID rclsid, LPOLESTR* lplpsz) { return StringFromCLSID(rclsid, lplpsz); }

HRESULT CLSIDFromString(LPCOLESTR lpsz, LPCLSID pclsid) {
    if (pclsid == nullptr) return E_INVALIDARG;
    if (lpsz == nullptr) {
        *pclsid = GUID_NULL;
        return S_OK;
    }
    if (!StartsWithBrace(lpsz)) return CLSIDFromProgID(lpsz, pclsid);
    GUID parsed;
    if (!ParseGuid(lpsz, parsed)) return CO_E_CLASSSTRING;
    *pclsid = parsed;
    return S_OK;
}

HRESULT CLSIDFromProgID(LPCOLESTR lpszProgID, LPCLSID lpclsid) {
    if (lpszProgID == nullptr || lpclsid == nullptr) return E_INVALIDARG;
    std::u16string key = std::u16string(lpszProgID) + u"\\CLSID";
    std::u16string clsidText;
    if (!tav::posix::ReadClassesString(key, clsidText)) return CO_E_CLASSSTRING;
    GUID parsed;
    if (!ParseGuid(clsidText.c_str(), parsed)) return CO_E_CLASSSTRING;
    *lpclsid = parsed;
    return S_OK;
}

}  // extern "C"
