// MultiByteToWideChar and WideCharToMultiByte for the code pages the module
// meets: the ANSI code page, taken to be Latin-1, and UTF-8.
#include <cstring>
#include <string>

#include "tav/com_api.h"
#include "utf.h"

namespace {

bool IsLatin1(UINT codePage) { return codePage == CP_ACP || codePage == CP_OEMCP || codePage == CP_THREAD_ACP; }

int Fail(DWORD error) {
    SetLastError(error);
    return 0;
}

// Writes `text` into the caller's buffer of `capacity` units, or only counts when capacity is 0.
template <typename Unit>
int Deliver(const std::basic_string<Unit>& text, Unit* buffer, int capacity) {
    if (text.size() > 0x7FFFFFFF) return Fail(ERROR_INVALID_PARAMETER);
    int needed = static_cast<int>(text.size());
    if (capacity == 0) return needed;
    if (needed > capacity) return Fail(ERROR_INSUFFICIENT_BUFFER);
    std::memcpy(buffer, text.data(), text.size() * sizeof(Unit));
    return needed;
}

std::string EncodeUtf8(std::u16string_view text, bool& sawUnpairedSurrogate) {
    std::u16string cleaned(text);
    for (std::size_t i = 0; i < cleaned.size(); ++i) {
        char16_t c = cleaned[i];
        bool high = c >= 0xD800 && c <= 0xDBFF;
        bool low = c >= 0xDC00 && c <= 0xDFFF;
        if (high && i + 1 < cleaned.size() && cleaned[i + 1] >= 0xDC00 && cleaned[i + 1] <= 0xDFFF) {
            ++i;
        } else if (high || low) {
            cleaned[i] = u'\uFFFD';
            sawUnpairedSurrogate = true;
        }
    }
    return tav::posix::ToUtf8(cleaned);
}

}  // namespace

extern "C" {

int MultiByteToWideChar(UINT CodePage, DWORD dwFlags, LPCCH lpMultiByteStr, int cbMultiByte, LPWSTR lpWideCharStr,
                        int cchWideChar) {
    if (lpMultiByteStr == nullptr || cbMultiByte == 0 || cbMultiByte < -1 || cchWideChar < 0 ||
        (lpWideCharStr == nullptr && cchWideChar != 0))
        return Fail(ERROR_INVALID_PARAMETER);
    std::size_t byteCount = cbMultiByte == -1 ? std::strlen(lpMultiByteStr) + 1 : static_cast<std::size_t>(cbMultiByte);
    std::string_view bytes(lpMultiByteStr, byteCount);
    std::u16string wide;
    if (IsLatin1(CodePage)) {
        wide.reserve(bytes.size());
        for (char byte : bytes) wide += static_cast<char16_t>(static_cast<unsigned char>(byte));
    } else if (CodePage == CP_UTF8) {
        bool valid = true;
        wide = tav::posix::FromUtf8(bytes, &valid, true);
        if (!valid && (dwFlags & MB_ERR_INVALID_CHARS)) return Fail(ERROR_NO_UNICODE_TRANSLATION);
    } else {
        return Fail(ERROR_INVALID_PARAMETER);
    }
    return Deliver(wide, lpWideCharStr, cchWideChar);
}

int WideCharToMultiByte(UINT CodePage, DWORD dwFlags, LPCWCH lpWideCharStr, int cchWideChar, LPSTR lpMultiByteStr,
                        int cbMultiByte, LPCCH lpDefaultChar, LPBOOL lpUsedDefaultChar) {
    if (lpWideCharStr == nullptr || cchWideChar == 0 || cchWideChar < -1 || cbMultiByte < 0 ||
        (lpMultiByteStr == nullptr && cbMultiByte != 0))
        return Fail(ERROR_INVALID_PARAMETER);
    std::size_t charCount = static_cast<std::size_t>(cchWideChar);
    if (cchWideChar == -1) {
        charCount = 0;
        while (lpWideCharStr[charCount] != 0) ++charCount;
        ++charCount;
    }
    std::u16string_view wide(lpWideCharStr, charCount);
    std::string bytes;
    if (IsLatin1(CodePage)) {
        char replacement = lpDefaultChar != nullptr ? *lpDefaultChar : '?';
        bool usedDefault = false;
        bytes.reserve(wide.size());
        for (char16_t c : wide) {
            if (c > 0xFF) usedDefault = true;
            bytes += c > 0xFF ? replacement : static_cast<char>(c);
        }
        if (lpUsedDefaultChar != nullptr) *lpUsedDefaultChar = usedDefault ? TRUE : FALSE;
    } else if (CodePage == CP_UTF8) {
        if (lpDefaultChar != nullptr || lpUsedDefaultChar != nullptr) return Fail(ERROR_INVALID_PARAMETER);
        bool sawUnpairedSurrogate = false;
        bytes = EncodeUtf8(wide, sawUnpairedSurrogate);
        if (sawUnpairedSurrogate && (dwFlags & WC_ERR_INVALID_CHARS)) return Fail(ERROR_NO_UNICODE_TRANSLATION);
    } else {
        return Fail(ERROR_INVALID_PARAMETER);
    }
    return Deliver(bytes, lpMultiByteStr, cbMultiByte);
}

}  // extern "C"
