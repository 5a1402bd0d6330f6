#pragma once
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "core/enumerators.h"
#include "support/com_double.h"
#include "support/test_text.h"

namespace tav::test {

// A string enumerator that took over an array of copies of texts.
inline Ref<ITavEnumBSTR> MakeStrings(const std::vector<std::string>& texts) {
    BSTR* array = AllocateArray<BSTR>(texts.size());
    for (size_t i = 0; i < texts.size(); ++i) {
        const OleString wide = Widen(texts[i]);
        array[i] = SysAllocStringLen(wide.data(), static_cast<UINT>(wide.size()));
    }
    ITavEnumBSTR* strings = nullptr;
    EXPECT_EQ(S_OK, MakeEnumerator<BstrTraits>(array, array + texts.size(), nullptr, EnumOwnership::Take, &strings));
    return Ref<ITavEnumBSTR>(strings);
}

struct Fetched {
    HRESULT hr;
    std::vector<std::string> texts;
};

inline Fetched Fetch(ITavEnumBSTR* strings, ULONG wanted = 64) {
    std::vector<BSTR> out(wanted == 0 ? 1 : wanted, nullptr);
    ULONG got = 0;
    Fetched result{strings->RemNext(wanted, out.data(), &got), {}};
    EXPECT_LE(got, wanted);
    for (ULONG i = 0; i < got && i < wanted; ++i) {
        result.texts.push_back(Narrow(out[i]));
        SysFreeString(out[i]);
    }
    return result;
}

}  // namespace tav::test
