// Every class can be aggregated: the inner unknown owns the object, every
// other interface delegates to the outer object.
#include <gtest/gtest.h>

#include "module_test_support.h"

namespace tav::test {
namespace {

// An outer object that counts what reaches it and answers only IUnknown
// itself, handing ITavController queries on to the inner object.
class Outer : public IUnknown {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        ++queries;
        if (IsEqualIID(riid, IID_IUnknown)) {
            *object = static_cast<IUnknown*>(this);
            AddRef();
            return S_OK;
        }
        return inner != nullptr ? inner->QueryInterface(riid, object) : E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return static_cast<ULONG>(++references); }
    ULONG STDMETHODCALLTYPE Release() override { return static_cast<ULONG>(--references); }

    IUnknown* inner = nullptr;
    int references = 1;
    int queries = 0;
};

class Aggregation : public ::testing::TestWithParam<ClassInfo> {
protected:
    void SetUp() override { ASSERT_EQ(ClassObjectFor(GetParam(), factory_), S_OK); }

    ComPtr<IClassFactory> factory_;
    Outer outer_;
};

TEST_P(Aggregation, InterfacesDelegateToTheOuterObject) {
    ASSERT_EQ(factory_->CreateInstance(&outer_, IID_IUnknown, reinterpret_cast<void**>(&outer_.inner)), S_OK);
    ASSERT_NE(outer_.inner, nullptr);
    EXPECT_EQ(outer_.references, 1) << "creating the inner object must not hold the outer";

    ITavController* controller = nullptr;
    ASSERT_EQ(outer_.inner->QueryInterface(IID_ITavController, reinterpret_cast<void**>(&controller)), S_OK);
    EXPECT_EQ(outer_.references, 2) << "the reference of an inner interface belongs to the outer object";

    controller->AddRef();
    EXPECT_EQ(outer_.references, 3);
    controller->Release();
    controller->Release();
    EXPECT_EQ(outer_.references, 1);

    IUnknown* identity = nullptr;
    const int queriesBefore = outer_.queries;
    ASSERT_EQ(controller->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&identity)), S_OK);
    EXPECT_EQ(identity, static_cast<IUnknown*>(&outer_));
    EXPECT_EQ(outer_.queries, queriesBefore + 1);
    identity->Release();

    EXPECT_EQ(outer_.inner->Release(), 0u);
    outer_.inner = nullptr;
    EXPECT_EQ(outer_.references, 1);
    EXPECT_EQ(DllCanUnloadNow(), S_FALSE) << "the class object is still held";
}

TEST_P(Aggregation, OuterObjectWithAnotherInterfaceIsRefused) {
    void* raw = reinterpret_cast<void*>(1);
    EXPECT_EQ(factory_->CreateInstance(&outer_, IID_ITavController, &raw), CLASS_E_NOAGGREGATION);
    EXPECT_EQ(raw, nullptr);
    EXPECT_EQ(outer_.references, 1);
}

INSTANTIATE_TEST_SUITE_P(AllClasses, Aggregation, ::testing::ValuesIn(kClasses),
                         [](const auto& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace tav::test
