// RAII over the descriptions that ITypeLib and ITypeInfo lend out, and the
// names they give.
#pragma once
#include <string>

#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/platform.h"

namespace tav::conformance {

// Holds one description borrowed from `Owner` and gives it back on
// destruction through the owner's release function.
template <typename Owner, typename Description, void (STDMETHODCALLTYPE Owner::*Give)(Description*)>
class Borrowed {
public:
    Borrowed() = default;
    Borrowed(const Borrowed&) = delete;
    Borrowed& operator=(const Borrowed&) = delete;
    ~Borrowed() {
        if (description_ != nullptr) (owner_.Get()->*Give)(description_);
    }

    // For the [out] parameter of the borrowing call.
    Description** Receive(Owner* owner) {
        owner_ = ComPtr<Owner>(owner);
        return &description_;
    }
    const Description* operator->() const { return description_; }
    const Description& operator*() const { return *description_; }
    explicit operator bool() const { return description_ != nullptr; }

private:
    ComPtr<Owner> owner_;
    Description* description_ = nullptr;
};

using LibraryAttributes = Borrowed<ITypeLib, TLIBATTR, &ITypeLib::ReleaseTLibAttr>;
using TypeAttributes = Borrowed<ITypeInfo, TYPEATTR, &ITypeInfo::ReleaseTypeAttr>;
using FunctionDescription = Borrowed<ITypeInfo, FUNCDESC, &ITypeInfo::ReleaseFuncDesc>;
using VariableDescription = Borrowed<ITypeInfo, VARDESC, &ITypeInfo::ReleaseVarDesc>;

// The name of a type (MEMBERID_NIL) or of one of its members.
inline std::wstring NameOf(ITypeInfo* info, MEMBERID member = MEMBERID_NIL) {
    Bstr name;
    if (FAILED(info->GetDocumentation(member, name.Receive(), nullptr, nullptr, nullptr))) return L"(no name)";
    return std::wstring(name.View());
}

inline std::wstring DocStringOf(ITypeInfo* info) {
    Bstr doc;
    if (FAILED(info->GetDocumentation(MEMBERID_NIL, nullptr, doc.Receive(), nullptr, nullptr))) return L"";
    return std::wstring(doc.View());
}

}  // namespace tav::conformance
