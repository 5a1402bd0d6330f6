// What QueryInterface answers for each of the seventeen classes.
#include <gtest/gtest.h>

#include <map>
#include <set>
#include <vector>

#include "module_test_support.h"

namespace tav::test {
namespace {

struct Interface {
    const IID* iid;
    const char* name;
};

#define TAV_IFACE(name) Interface{&IID_##name, #name}

// Per class, what it answers beyond the class before it.
const std::vector<std::vector<Interface>> kAddedByClass = {
    {TAV_IFACE(ITavController), TAV_IFACE(ITavBackupRestore), TAV_IFACE(ITavLANAdaptor), TAV_IFACE(ITavBoot),
     TAV_IFACE(ITavSubscribe), TAV_IFACE(ITavPanel), TAV_IFACE(ITavUser), TAV_IFACE(ITavUAS),
     TAV_IFACE(ITavMastership), TAV_IFACE(ITavVirtualTime), TAV_IFACE(ITavHelperBase),
     TAV_IFACE(ITavDynamicDevices)},
    {TAV_IFACE(ITavController2)},
    {TAV_IFACE(ITavFileManagement), TAV_IFACE(ITavController3)},
    {TAV_IFACE(ITavSystemDiagnostics)},
    {TAV_IFACE(ITavPositionalSafetyController)},
    {TAV_IFACE(ITavLANAdaptor2), TAV_IFACE(ITavDorvel)},
    {TAV_IFACE(ITavPanel2)},
    {TAV_IFACE(ITavIPC), TAV_IFACE(ITavIPCInformation)},
    {TAV_IFACE(ITavDynamicDevices2)},
    {TAV_IFACE(ITavUser2)},
    {TAV_IFACE(ITavLumeret)},
    {TAV_IFACE(ITavController4), TAV_IFACE(ITavLumeret2)},
    {TAV_IFACE(ITavControllerTime)},
    {TAV_IFACE(ITavUser3)},
    {TAV_IFACE(ITavSafety), TAV_IFACE(ITavPanel3), TAV_IFACE(ITavController5), TAV_IFACE(ITavBoot2)},
    {TAV_IFACE(ITavBackupRestore2), TAV_IFACE(ITavController6), TAV_IFACE(ITavBoot3)},
    {TAV_IFACE(ITavPanel4)},
};

// Members of one family are answered with one pointer.
const std::vector<std::vector<Interface>> kFamilies = {
    {TAV_IFACE(ITavController), TAV_IFACE(ITavController2), TAV_IFACE(ITavController3),
     TAV_IFACE(ITavController4), TAV_IFACE(ITavController5), TAV_IFACE(ITavController6)},
    {TAV_IFACE(ITavUser), TAV_IFACE(ITavUser2), TAV_IFACE(ITavUser3)},
    {TAV_IFACE(ITavPanel), TAV_IFACE(ITavPanel2), TAV_IFACE(ITavPanel3), TAV_IFACE(ITavPanel4)},
    {TAV_IFACE(ITavBoot), TAV_IFACE(ITavBoot2), TAV_IFACE(ITavBoot3)},
    {TAV_IFACE(ITavBackupRestore), TAV_IFACE(ITavBackupRestore2)},
    {TAV_IFACE(ITavLANAdaptor), TAV_IFACE(ITavLANAdaptor2)},
    {TAV_IFACE(ITavDynamicDevices), TAV_IFACE(ITavDynamicDevices2)},
    {TAV_IFACE(ITavLumeret), TAV_IFACE(ITavLumeret2)},
};

const Interface kNeverAnswered[] = {
    TAV_IFACE(_ITavObjectEvents), TAV_IFACE(_ITavIPCMessages), TAV_IFACE(IClassFactory),
    TAV_IFACE(ITavCommandCallback),
};

#undef TAV_IFACE

std::vector<Interface> AllControllerInterfaces() {
    std::vector<Interface> all;
    for (const auto& added : kAddedByClass) {
        all.insert(all.end(), added.begin(), added.end());
    }
    return all;
}

std::set<const IID*> AnsweredBy(LONG version) {
    std::set<const IID*> answered;
    for (LONG v = 1; v <= version; ++v) {
        for (const Interface& i : kAddedByClass[v - 1]) {
            answered.insert(i.iid);
        }
    }
    return answered;
}

class ClassInterfaces : public ::testing::TestWithParam<ClassInfo> {
protected:
    void SetUp() override {
        ComPtr<IClassFactory> factory;
        ASSERT_EQ(ClassObjectFor(GetParam(), factory), S_OK);
        ASSERT_EQ(factory->CreateInstance(nullptr, IID_IUnknown, Out(object_)), S_OK);
    }

    ComPtr<IUnknown> object_;
};

// Source, callback and factory interfaces are never answered.
TEST_P(ClassInterfaces, AnswersExactlyItsGenerations) {
    const std::set<const IID*> expected = AnsweredBy(GetParam().version);
    std::vector<Interface> asked = AllControllerInterfaces();
    asked.insert(asked.end(), std::begin(kNeverAnswered), std::end(kNeverAnswered));
    for (const Interface& i : asked) {
        void* raw = reinterpret_cast<void*>(1);
        const HRESULT hr = object_->QueryInterface(*i.iid, &raw);
        if (expected.count(i.iid) != 0) {
            EXPECT_EQ(hr, S_OK) << i.name;
            ASSERT_NE(raw, nullptr) << i.name;
            static_cast<IUnknown*>(raw)->Release();
        } else {
            EXPECT_EQ(hr, E_NOINTERFACE) << i.name;
            EXPECT_EQ(raw, nullptr) << i.name;
        }
    }
}

TEST_P(ClassInterfaces, FamilyMembersShareOnePointer) {
    const std::set<const IID*> answered = AnsweredBy(GetParam().version);
    for (const auto& family : kFamilies) {
        std::map<void*, std::vector<const char*>> pointers;
        for (const Interface& i : family) {
            if (answered.count(i.iid) == 0) {
                continue;
            }
            ComPtr<IUnknown> member;
            ASSERT_EQ(object_->QueryInterface(*i.iid, Out(member)), S_OK) << i.name;
            pointers[member.Get()].push_back(i.name);
        }
        EXPECT_LE(pointers.size(), 1u) << "family of " << family.front().name << " answers different pointers";
    }
}

TEST_P(ClassInterfaces, EveryAnsweredInterfaceLeadsBackToOneIdentity) {
    for (const Interface& i : AllControllerInterfaces()) {
        ComPtr<IUnknown> view;
        if (object_->QueryInterface(*i.iid, Out(view)) != S_OK) {
            continue;
        }
        ComPtr<IUnknown> identity;
        ASSERT_EQ(view->QueryInterface(IID_IUnknown, Out(identity)), S_OK) << i.name;
        EXPECT_EQ(identity.Get(), object_.Get()) << i.name;
        // Each view answers the same set as the object does.
        ComPtr<IUnknown> back;
        EXPECT_EQ(view->QueryInterface(IID_ITavController, Out(back)), S_OK) << i.name;
    }
}

INSTANTIATE_TEST_SUITE_P(AllClasses, ClassInterfaces, ::testing::ValuesIn(kClasses),
                         [](const auto& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace tav::test
