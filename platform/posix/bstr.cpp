// A BSTR points just past a 32-bit byte length and is followed by a 16-bit
// terminator, so that code which sees only the pointer can still find both.
#include <cstdint>
#include <cstring>

#include "allocation.h"
#include "tav/com_api.h"

namespace {

constexpr std::size_t prefixBytes = sizeof(DWORD);
constexpr std::size_t terminatorBytes = sizeof(OLECHAR);
constexpr std::uint64_t largestByteLength = 0xFFFFFFFFu - prefixBytes - terminatorBytes;

DWORD* PrefixOf(BSTR text) { return reinterpret_cast<DWORD*>(reinterpret_cast<BYTE*>(text) - prefixBytes); }

// Copies `byteLength` bytes from `source` (zeros when NULL) into a new BSTR.
BSTR Allocate(const void* source, std::uint64_t byteLength) {
    if (byteLength > largestByteLength) return nullptr;
    auto* block = static_cast<BYTE*>(tav::posix::Allocate(prefixBytes + byteLength + terminatorBytes));
    if (block == nullptr) return nullptr;
    DWORD length = static_cast<DWORD>(byteLength);
    std::memcpy(block, &length, prefixBytes);
    BYTE* text = block + prefixBytes;
    if (source != nullptr)
        std::memmove(text, source, byteLength);
    else
        std::memset(text, 0, byteLength);
    std::memset(text + byteLength, 0, terminatorBytes);
    return reinterpret_cast<BSTR>(text);
}

std::size_t LengthOf(const OLECHAR* text) {
    std::size_t length = 0;
    while (text[length] != 0) ++length;
    return length;
}

// Replaces *target by a new string, leaving it as it was when that fails.
// The source may lie inside *target.
INT Replace(BSTR* target, const OLECHAR* source, std::uint64_t charCount) {
    if (target == nullptr) return FALSE;
    BSTR fresh = Allocate(source, charCount * sizeof(OLECHAR));
    if (fresh == nullptr) return FALSE;
    SysFreeString(*target);
    *target = fresh;
    return TRUE;
}

}  // namespace

extern "C" {

BSTR SysAllocString(const OLECHAR* psz) {
    if (psz == nullptr) return nullptr;
    return Allocate(psz, std::uint64_t{LengthOf(psz)} * sizeof(OLECHAR));
}

BSTR SysAllocStringLen(const OLECHAR* pch, UINT cch) { return Allocate(pch, std::uint64_t{cch} * sizeof(OLECHAR)); }

BSTR SysAllocStringByteLen(LPCSTR psz, UINT len) { return Allocate(psz, len); }

INT SysReAllocString(BSTR* pbstr, const OLECHAR* psz) {
    if (psz == nullptr) return Replace(pbstr, nullptr, 0);
    return Replace(pbstr, psz, LengthOf(psz));
}

INT SysReAllocStringLen(BSTR* pbstr, const OLECHAR* psz, UINT len) { return Replace(pbstr, psz, len); }

void SysFreeString(BSTR bstrString) {
    if (bstrString != nullptr) tav::posix::Deallocate(PrefixOf(bstrString));
}

UINT SysStringByteLen(BSTR bstr) {
    if (bstr == nullptr) return 0;
    DWORD length;
    std::memcpy(&length, PrefixOf(bstr), prefixBytes);
    return length;
}

UINT SysStringLen(BSTR pbstr) { return SysStringByteLen(pbstr) / sizeof(OLECHAR); }

}  // extern "C"
