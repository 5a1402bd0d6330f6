#pragma once
#include <ostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/enumerators.h"
#include "support/test_text.h"
#include "tav/com_ptr.h"

namespace tav::test {

using Texts = std::vector<std::string>;

// A string enumerator that took over an array of copies of texts.
inline ComPtr<ITavEnumBSTR> MakeStrings(const Texts& texts) {
    BSTR* array = AllocateArray<BSTR>(texts.size());
    for (size_t i = 0; i < texts.size(); ++i) {
        const OleString wide = Widen(texts[i]);
        array[i] = SysAllocStringLen(wide.data(), static_cast<UINT>(wide.size()));
    }
    ComPtr<ITavEnumBSTR> strings;
    EXPECT_EQ(S_OK, MakeEnumerator<BstrTraits>(array, array + texts.size(), nullptr, EnumOwnership::Take, &strings));
    return strings;
}

struct Fetched {
    HRESULT hr;
    Texts texts;
    bool operator==(const Fetched&) const = default;
};

inline std::ostream& operator<<(std::ostream& out, const Fetched& fetched) {
    out << "hr " << std::hex << fetched.hr << std::dec << ":";
    for (const std::string& text : fetched.texts) out << " '" << text << "'";
    return out;
}

inline Fetched Fetch(const ComPtr<ITavEnumBSTR>& strings, ULONG wanted = 64) {
    std::vector<BSTR> out(wanted + 1, nullptr);
    ULONG got = 0;
    Fetched result{strings->RemNext(wanted, out.data(), &got), {}};
    for (ULONG i = 0; i < got && i < wanted; ++i) {
        result.texts.push_back(Narrow(out[i]));
        SysFreeString(out[i]);
    }
    return result;
}

}  // namespace tav::test
