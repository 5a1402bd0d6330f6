#pragma once
#include <array>
#include <string>

#include "TavController.h"
#include "module/server_exports.h"
#include "support/test_text.h"
#include "tav/com_ptr.h"
#include "tav/platform.h"

namespace tav::test {

// The classes in the order and with the names the module serves them.
struct ClassInfo {
    const CLSID* clsid;
    const char* name;
    LONG version;
};

inline constexpr std::array<ClassInfo, 17> kClasses = {{
    {&CLSID_TavController, "TavController", 1},
    {&CLSID_TavController2, "TavController2", 2},
    {&CLSID_TavController3, "TavController3", 3},
    {&CLSID_TavController4, "TavController4", 4},
    {&CLSID_TavController5, "TavController5", 5},
    {&CLSID_TavController6, "TavController6", 6},
    {&CLSID_TavController7, "TavController7", 7},
    {&CLSID_TavController8, "TavController8", 8},
    {&CLSID_TavController9, "TavController9", 9},
    {&CLSID_TavController10, "TavController10", 10},
    {&CLSID_TavController11, "TavController11", 11},
    {&CLSID_TavController12, "TavController12", 12},
    {&CLSID_TavController13, "TavController13", 13},
    {&CLSID_TavController14, "TavController14", 14},
    {&CLSID_TavController15, "TavController15", 15},
    {&CLSID_TavController16, "TavController16", 16},
    {&CLSID_TavController17, "TavController17", 17},
}};

// For a void** out-parameter; releases what the pointer held first.
template <typename T>
void** Out(ComPtr<T>& pointer) {
    return reinterpret_cast<void**>(&pointer);
}

inline HRESULT ClassObjectFor(const ClassInfo& info, ComPtr<IClassFactory>& factory) {
    return DllGetClassObject(*info.clsid, IID_IClassFactory, Out(factory));
}

// The GUID in its registry form, "{...}", as narrow text.
inline std::string GuidText(REFGUID guid) {
    OLECHAR text[40] = {};
    const int length = StringFromGUID2(guid, text, 40);
    return length > 0 ? Narrow(OleStringView(text, static_cast<size_t>(length - 1))) : std::string();
}

}  // namespace tav::test
