// The registered type library, read through OLE Automation alone and compared
// with the tables generated from the widl header.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <set>
#include <sstream>
#include <vector>

#include "class_table.h"
#include "conformance_support.h"
#include "expectations.h"
#include "tav/com_scope.h"
#include "tav/variant.h"
#include "type_info_view.h"

namespace tav::conformance {
namespace {

std::vector<std::wstring> Words(const wchar_t* text) {
    std::wistringstream stream(text != nullptr ? text : L"");
    std::vector<std::wstring> words;
    for (std::wstring word; stream >> word;) words.push_back(word);
    return words;
}

// A type library keeps one spelling of each name for the whole library (its
// name table ignores case), so "Data" of one declaration may read back as the
// "data" of another.
bool SameName(std::wstring_view expected, std::wstring_view actual) {
    return CompareStringOrdinal(expected.data(), static_cast<int>(expected.size()), actual.data(),
                                static_cast<int>(actual.size()), TRUE) == CSTR_EQUAL;
}

bool SameNames(const std::vector<std::wstring>& expected, const std::vector<std::wstring>& actual) {
    return std::equal(expected.begin(), expected.end(), actual.begin(), actual.end(), SameName);
}

std::wstring Joined(const std::vector<std::wstring>& names) {
    std::wstring text;
    for (const std::wstring& name : names) text += (text.empty() ? L"" : L" ") + name;
    return text;
}

// Records that the IDL takes from the platform's own definitions (FILETIME
// from wtypes.idl): the library carries them because stdole2.tlb does not.
const std::set<std::wstring> kPlatformRecords = {L"_FILETIME"};

// Slots of the vtable up to and including `name`'s own methods.
int SlotCount(std::wstring_view name) {
    if (name == L"IUnknown") return 3;
    const InterfaceShape* shape = HeaderInterface(name);
    return shape == nullptr ? -1000 : SlotCount(shape->base) + static_cast<int>(shape->methods.size());
}

class TypeLibrary : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        com_ = new ComScope();
        loaded_ = LoadRegTypeLib(LIBID_TAVCONTROLLERLib, 1, 0, LOCALE_NEUTRAL, &library_);
    }
    static void TearDownTestSuite() {
        library_ = nullptr;
        delete com_;
        com_ = nullptr;
    }
    void SetUp() override { ASSERT_EQ(S_OK, loaded_) << "LoadRegTypeLib of TAVCONTROLLERLib 1.0"; }

    // Every type of the library by name, with its kind.
    static std::map<std::wstring, std::pair<TYPEKIND, ComPtr<ITypeInfo>>> Types() {
        std::map<std::wstring, std::pair<TYPEKIND, ComPtr<ITypeInfo>>> types;
        for (UINT index = 0; index < library_->GetTypeInfoCount(); ++index) {
            ComPtr<ITypeInfo> info;
            TYPEKIND kind = TKIND_MAX;
            if (SUCCEEDED(library_->GetTypeInfo(index, &info)) && SUCCEEDED(library_->GetTypeInfoType(index, &kind))) {
                types[NameOf(info.Get())] = {kind, info};
            }
        }
        return types;
    }

    static ComPtr<ITypeInfo> Named(const wchar_t* name, TYPEKIND kind) {
        const auto types = Types();
        const auto found = types.find(name);
        if (found == types.end() || found->second.first != kind) return nullptr;
        return found->second.second;
    }

    static ComScope* com_;
    static HRESULT loaded_;
    static ComPtr<ITypeLib> library_;
};

ComScope* TypeLibrary::com_ = nullptr;
HRESULT TypeLibrary::loaded_ = E_UNEXPECTED;
ComPtr<ITypeLib> TypeLibrary::library_;

TEST_F(TypeLibrary, LoadsFromTheRegistryOutOfTheModule) {
    Bstr path;
    ASSERT_EQ(S_OK, QueryPathOfRegTypeLib(LIBID_TAVCONTROLLERLib, 1, 0, LOCALE_NEUTRAL, path.Receive()));
    EXPECT_TRUE(SamePath(Modules().controller, path.View())) << Narrow(path.View());
    LibraryAttributes attributes;
    ASSERT_EQ(S_OK, library_->GetLibAttr(attributes.Receive(library_.Get())));
    EXPECT_TRUE(IsEqualGUID(LIBID_TAVCONTROLLERLib, attributes->guid));
    EXPECT_EQ(1, attributes->wMajorVerNum);
    EXPECT_EQ(0, attributes->wMinorVerNum);
    EXPECT_EQ(sizeof(void*) == 8 ? SYS_WIN64 : SYS_WIN32, attributes->syskind);
    Bstr name;
    ASSERT_EQ(S_OK, library_->GetDocumentation(-1, name.Receive(), nullptr, nullptr, nullptr));
    EXPECT_EQ(L"TAVCONTROLLERLib", name.View());
    Checked("LoadRegTypeLib finds TAVCONTROLLERLib 1.0, registered as the DLL itself (TYPELIB resource 1), "
            "for this platform's system kind");
}

TEST_F(TypeLibrary, HoldsExactlyTheHeadersInterfacesRecordsEnumsAndClasses) {
    std::map<TYPEKIND, std::set<std::wstring>> found;
    for (const auto& [name, type] : Types()) found[type.first].insert(name);
    std::set<std::wstring> interfaces, records, enums, classes;
    for (const InterfaceShape& shape : kHeaderInterfaces) interfaces.insert(shape.name);
    for (const RecordShape& shape : kHeaderRecords) records.insert(shape.name);
    for (const EnumShape& shape : kHeaderEnums) enums.insert(shape.name);
    for (const ClassShape& shape : kHeaderClasses) classes.insert(shape.name);
    EXPECT_EQ(interfaces, found[TKIND_INTERFACE]);
    records.insert(kPlatformRecords.begin(), kPlatformRecords.end());
    EXPECT_EQ(records, found[TKIND_RECORD]);
    EXPECT_EQ(enums, found[TKIND_ENUM]);
    EXPECT_EQ(classes, found[TKIND_COCLASS]);
    EXPECT_TRUE(found[TKIND_DISPATCH].empty()) << "no class offers a dispatch interface";
    Checked("the library holds exactly the header's " + std::to_string(interfaces.size()) + " interfaces, " +
            std::to_string(std::size(kHeaderRecords)) + " records (and FILETIME), " + std::to_string(enums.size()) +
            " enums and " + std::to_string(classes.size()) + " classes, and no dispatch interface");
}

TEST_F(TypeLibrary, InterfacesHaveTheHeadersBaseAndMethodsInSlotOrder) {
    int functions = 0;
    for (const InterfaceShape& shape : kHeaderInterfaces) {
        SCOPED_TRACE(Narrow(shape.name));
        ComPtr<ITypeInfo> info;
        ASSERT_EQ(S_OK, library_->GetTypeInfoOfGuid(*shape.iid, &info));
        TypeAttributes attributes;
        ASSERT_EQ(S_OK, info->GetTypeAttr(attributes.Receive(info.Get())));
        EXPECT_EQ(TKIND_INTERFACE, attributes->typekind);
        EXPECT_EQ(shape.name, NameOf(info.Get()));
        ASSERT_EQ(1, attributes->cImplTypes);
        HREFTYPE baseReference = 0;
        ComPtr<ITypeInfo> base;
        ASSERT_EQ(S_OK, info->GetRefTypeOfImplType(0, &baseReference));
        ASSERT_EQ(S_OK, info->GetRefTypeInfo(baseReference, &base));
        EXPECT_EQ(shape.base, NameOf(base.Get()));
        const int firstSlot = SlotCount(shape.base);
        EXPECT_EQ(static_cast<size_t>(SlotCount(shape.name)) * sizeof(void*), attributes->cbSizeVft);
        ASSERT_EQ(shape.methods.size(), static_cast<size_t>(attributes->cFuncs));
        for (size_t index = 0; index < shape.methods.size(); ++index) {
            const MethodShape& method = shape.methods[index];
            FunctionDescription function;
            ASSERT_EQ(S_OK, info->GetFuncDesc(static_cast<UINT>(index), function.Receive(info.Get())));
            ++functions;
            EXPECT_EQ((firstSlot + static_cast<int>(index)) * static_cast<int>(sizeof(void*)), function->oVft)
                << Narrow(method.name);
            EXPECT_EQ(FUNC_PUREVIRTUAL, function->funckind) << Narrow(method.name);
            EXPECT_EQ(INVOKE_FUNC, function->invkind) << Narrow(method.name);
            EXPECT_EQ(CC_STDCALL, function->callconv) << Narrow(method.name);
            EXPECT_EQ(VT_HRESULT, function->elemdescFunc.tdesc.vt) << Narrow(method.name);
            const std::vector<std::wstring> parameters = Words(method.parameters);
            EXPECT_EQ(parameters.size(), static_cast<size_t>(function->cParams)) << Narrow(method.name);
            std::vector<BSTR> names(parameters.size() + 2);
            UINT count = 0;
            ASSERT_EQ(S_OK, info->GetNames(function->memid, names.data(), static_cast<UINT>(names.size()), &count));
            std::vector<std::wstring> actual;
            for (UINT i = 0; i < count; ++i) {
                actual.emplace_back(names[i] != nullptr ? names[i] : L"");
                SysFreeString(names[i]);
            }
            std::vector<std::wstring> expected = {method.name};
            expected.insert(expected.end(), parameters.begin(), parameters.end());
            EXPECT_TRUE(SameNames(expected, actual)) << "slot " << firstSlot + index << ": " << Narrow(Joined(actual));
        }
    }
    Checked("each of the " + std::to_string(std::size(kHeaderInterfaces)) +
            " interfaces has the header's base, vtable size and, slot by slot, the header's " +
            std::to_string(functions) + " methods with their parameter names (pure virtual, stdcall, HRESULT)");
}

TEST_F(TypeLibrary, ClassesDeclareTheirInterfacesWithDefaultAndSourceFlags) {
    const std::vector<std::wstring_view> everyAnswered = AnsweredInterfaces();
    for (int version = 1; version <= kClassCount; ++version) {
        SCOPED_TRACE(Narrow(ClassName(version)));
        const ClassShape* shape = HeaderClass(ClassName(version));
        ASSERT_NE(nullptr, shape);
        ComPtr<ITypeInfo> info;
        ASSERT_EQ(S_OK, library_->GetTypeInfoOfGuid(*shape->clsid, &info));
        TypeAttributes attributes;
        ASSERT_EQ(S_OK, info->GetTypeAttr(attributes.Receive(info.Get())));
        EXPECT_EQ(TKIND_COCLASS, attributes->typekind);
        EXPECT_NE(0, attributes->wTypeFlags & TYPEFLAG_FCANCREATE);
        EXPECT_EQ(Description(version), DocStringOf(info.Get()));
        EXPECT_EQ(DeclaredCount(version), attributes->cImplTypes);

        std::map<std::wstring, INT> flags;
        for (UINT index = 0; index < attributes->cImplTypes; ++index) {
            HREFTYPE reference = 0;
            ComPtr<ITypeInfo> implemented;
            INT implFlags = 0;
            ASSERT_EQ(S_OK, info->GetRefTypeOfImplType(index, &reference));
            ASSERT_EQ(S_OK, info->GetRefTypeInfo(reference, &implemented));
            ASSERT_EQ(S_OK, info->GetImplTypeFlags(index, &implFlags));
            flags[NameOf(implemented.Get())] = implFlags;
        }
        std::map<std::wstring, INT> expected;
        for (std::wstring_view name : everyAnswered) {
            if (version == 1 || Answers(version, name)) expected[std::wstring(name)] = 0;
        }
        expected[L"ITavController"] = IMPLTYPEFLAG_FDEFAULT;
        expected[std::wstring(kObjectEvents)] = IMPLTYPEFLAG_FDEFAULT | IMPLTYPEFLAG_FSOURCE;
        if (version >= kIpcMessagesSince) expected[std::wstring(kIpcMessages)] = IMPLTYPEFLAG_FSOURCE;
        EXPECT_EQ(expected, flags);
    }
    Checked("the 17 classes declare 38, 14, 16, 17, 18, 20, 21, 24, 25, 26, 27, 29, 30, 31, 35, 38 and 39 "
            "interfaces: what each answers (every interface for TavController), ITavController [default], "
            "_ITavObjectEvents [default, source], _ITavIPCMessages [source] from TavController8 on; creatable, "
            "with their descriptions");
}

TEST_F(TypeLibrary, RecordsHaveTheHeadersFieldsInOrderAndItsLayout) {
    int fields = 0;
    for (const RecordShape& shape : kHeaderRecords) {
        SCOPED_TRACE(Narrow(shape.name));
        const ComPtr<ITypeInfo> info = Named(shape.name, TKIND_RECORD);
        ASSERT_TRUE(info) << "no record of that name";
        TypeAttributes attributes;
        ASSERT_EQ(S_OK, info->GetTypeAttr(attributes.Receive(info.Get())));
        EXPECT_EQ(shape.size, attributes->cbSizeInstance);
        ASSERT_EQ(shape.fields.size(), static_cast<size_t>(attributes->cVars));
        for (size_t index = 0; index < shape.fields.size(); ++index) {
            VariableDescription field;
            ASSERT_EQ(S_OK, info->GetVarDesc(static_cast<UINT>(index), field.Receive(info.Get())));
            ++fields;
            EXPECT_TRUE(SameName(shape.fields[index].name, NameOf(info.Get(), field->memid)))
                << Narrow(NameOf(info.Get(), field->memid));
            EXPECT_EQ(VAR_PERINSTANCE, field->varkind);
            EXPECT_EQ(shape.fields[index].offset, field->oInst) << Narrow(shape.fields[index].name);
        }
    }
    Checked("each of the " + std::to_string(std::size(kHeaderRecords)) + " records has the header's " +
            std::to_string(fields) + " fields in declaration order, at the compiler's offsets and size");
}

TEST_F(TypeLibrary, EnumsHaveTheHeadersValues) {
    int values = 0;
    for (const EnumShape& shape : kHeaderEnums) {
        SCOPED_TRACE(Narrow(shape.name));
        const ComPtr<ITypeInfo> info = Named(shape.name, TKIND_ENUM);
        ASSERT_TRUE(info) << "no enum of that name";
        TypeAttributes attributes;
        ASSERT_EQ(S_OK, info->GetTypeAttr(attributes.Receive(info.Get())));
        ASSERT_EQ(shape.values.size(), static_cast<size_t>(attributes->cVars));
        for (size_t index = 0; index < shape.values.size(); ++index) {
            VariableDescription value;
            ASSERT_EQ(S_OK, info->GetVarDesc(static_cast<UINT>(index), value.Receive(info.Get())));
            ++values;
            EXPECT_TRUE(SameName(shape.values[index].name, NameOf(info.Get(), value->memid)))
                << Narrow(NameOf(info.Get(), value->memid));
            ASSERT_EQ(VAR_CONST, value->varkind);
            Variant number;
            ASSERT_EQ(S_OK, VariantChangeType(number.Get(), value->lpvarValue, 0, VT_I4));
            EXPECT_EQ(shape.values[index].value, number.Get()->lVal) << Narrow(shape.values[index].name);
        }
    }
    Checked("each of the " + std::to_string(std::size(kHeaderEnums)) + " enums has the header's " +
            std::to_string(values) + " values, names and numbers, in order");
}

}  // namespace
}  // namespace tav::conformance
