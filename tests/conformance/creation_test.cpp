// Creation of every class by a client that knows only ProgIDs, in both kinds
// of apartment, and what each object answers to QueryInterface.
#include <ocidl.h>

#include <map>
#include <set>

#include <gtest/gtest.h>

#include "class_table.h"
#include "com_client.h"
#include "conformance_support.h"
#include "expectations.h"
#include "tav/com_ptr.h"

namespace tav::conformance {
namespace {

// Interfaces no class offers: dispatch, connection points, class and error
// information.
const std::pair<const wchar_t*, const IID*> kNotOffered[] = {
    {L"IDispatch", &IID_IDispatch},
    {L"IConnectionPointContainer", &IID_IConnectionPointContainer},
    {L"IProvideClassInfo", &IID_IProvideClassInfo},
    {L"IProvideClassInfo2", &IID_IProvideClassInfo2},
    {L"ISupportErrorInfo", &IID_ISupportErrorInfo},
};

// Queries `object` for every interface of the header and the standard ones
// above; returns the pointers it answered, by interface name.
std::map<std::wstring, void*> ExpectAnswers(int version, IUnknown* object, int& compared) {
    std::map<std::wstring, void*> answered;
    for (const InterfaceShape& shape : kHeaderInterfaces) {
        void* pointer = reinterpret_cast<void*>(1);
        const HRESULT hr = object->QueryInterface(*shape.iid, &pointer);
        ++compared;
        if (Answers(version, shape.name)) {
            EXPECT_EQ(S_OK, hr) << Narrow(ClassName(version)) << " does not answer " << Narrow(shape.name);
            if (SUCCEEDED(hr)) {
                ComPtr<IUnknown> view;
                view.Attach(static_cast<IUnknown*>(pointer));
                ComPtr<IUnknown> identity;
                EXPECT_EQ(S_OK, view->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&identity)));
                EXPECT_EQ(object, identity.Get()) << Narrow(shape.name) << " breaks the object's identity";
                answered[shape.name] = pointer;
            }
        } else {
            EXPECT_EQ(E_NOINTERFACE, hr) << Narrow(ClassName(version)) << " answers " << Narrow(shape.name);
            EXPECT_EQ(nullptr, pointer) << Narrow(shape.name);
            if (SUCCEEDED(hr)) static_cast<IUnknown*>(pointer)->Release();
        }
    }
    for (const auto& [name, iid] : kNotOffered) {
        void* pointer = reinterpret_cast<void*>(1);
        const HRESULT hr = object->QueryInterface(*iid, &pointer);
        ++compared;
        EXPECT_EQ(E_NOINTERFACE, hr) << Narrow(ClassName(version)) << " answers " << Narrow(name);
        if (SUCCEEDED(hr)) static_cast<IUnknown*>(pointer)->Release();
    }
    return answered;
}

void ExpectFamiliesShareOnePointer(int version, const std::map<std::wstring, void*>& answered) {
    for (const auto& family : Families()) {
        std::set<void*> pointers;
        for (std::wstring_view member : family) {
            if (auto found = answered.find(std::wstring(member)); found != answered.end()) {
                pointers.insert(found->second);
            }
        }
        EXPECT_LE(pointers.size(), 1u) << Narrow(ClassName(version)) << ": the " << Narrow(family.front())
                                       << " family answers with " << pointers.size() << " pointers";
    }
}

class Creation : public ::testing::TestWithParam<DWORD> {};

TEST(CreationByProgId, BothProgIdsOfEveryClassNameTheHeadersClassId) {
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [] {
        for (int version = 1; version <= kClassCount; ++version) {
            const ClassShape* shape = HeaderClass(ClassName(version));
            ASSERT_NE(nullptr, shape) << Narrow(ClassName(version));
            CLSID versioned = {};
            CLSID independent = {};
            EXPECT_EQ(S_OK, CLSIDFromProgID(VersionedProgId(version).c_str(), &versioned));
            EXPECT_EQ(S_OK, CLSIDFromProgID(ProgId(version).c_str(), &independent));
            EXPECT_TRUE(IsEqualCLSID(*shape->clsid, versioned)) << Narrow(VersionedProgId(version));
            EXPECT_TRUE(IsEqualCLSID(*shape->clsid, independent)) << Narrow(ProgId(version));
            LPOLESTR progId = nullptr;
            EXPECT_EQ(S_OK, ProgIDFromCLSID(*shape->clsid, &progId));
            EXPECT_EQ(VersionedProgId(version), progId != nullptr ? progId : L"");
            CoTaskMemFree(progId);
        }
    }));
    Checked("CLSIDFromProgID maps both ProgIDs of each of the 17 classes to the header's CLSID, and "
            "ProgIDFromCLSID gives the versioned ProgID back");
}

TEST_P(Creation, EveryClassAnswersExactlyItsInterfaces) {
    const DWORD model = GetParam();
    int compared = 0;
    ASSERT_EQ(S_OK, RunInApartment(model, [&] {
        for (int version = 1; version <= kClassCount; ++version) {
            ComPtr<IUnknown> object;
            ASSERT_EQ(S_OK, CreateByProgId(ProgId(version), object)) << Narrow(ProgId(version));
            // A proxy would answer IMultiQI: the object must live in the caller's apartment.
            ComPtr<IUnknown> proxy;
            EXPECT_EQ(E_NOINTERFACE, object->QueryInterface(IID_IMultiQI, reinterpret_cast<void**>(&proxy)))
                << Narrow(ClassName(version)) << " was handed out through a proxy";
            const auto answered = ExpectAnswers(version, object.Get(), compared);
            EXPECT_EQ(AnsweredCount(version), static_cast<int>(answered.size())) << Narrow(ClassName(version));
            ExpectFamiliesShareOnePointer(version, answered);
            for (std::wstring_view source : {kObjectEvents, kIpcMessages}) {
                EXPECT_EQ(0u, answered.count(std::wstring(source)));
            }
        }
    }));
    Checked(std::string("in a ") + ApartmentName(model) +
            ": CoCreateInstance by ProgID gives each of the 17 classes directly (no proxy); " +
            std::to_string(compared) +
            " QueryInterface answers match the class table (12 to 37 interfaces, one pointer per family, "
            "COM identity kept; _ITavObjectEvents, _ITavIPCMessages, enumerators, IDispatch, "
            "IConnectionPointContainer, IProvideClassInfo(2), ISupportErrorInfo never answered)");
}

INSTANTIATE_TEST_SUITE_P(Apartments, Creation, ::testing::Values(COINIT_MULTITHREADED, COINIT_APARTMENTTHREADED),
                         [](const ::testing::TestParamInfo<DWORD>& info) {
                             return info.param == COINIT_MULTITHREADED ? "Multithreaded" : "SingleThreaded";
                         });

}  // namespace
}  // namespace tav::conformance
