// Aggregation through CoCreateInstance: the controller inside an outer object
// of the client's, with its IUnknown delegated to the outer one.
#include <gtest/gtest.h>

#include "class_table.h"
#include "com_client.h"
#include "conformance_support.h"
#include "expectations.h"

namespace tav::conformance {
namespace {

// An interface of the outer object alone, so that delegation shows.
constexpr IID kOuterOnly = {0x5f0c2a71, 0x3e4b, 0x4d8a, {0x9b, 0x16, 0x72, 0xe0, 0x4c, 0xa9, 0x18, 0x3d}};

// Lives on the test's stack: counts its references but never deletes itself.
class OuterObject final : public IUnknown {
public:
    STDMETHODIMP QueryInterface(REFIID iid, void** out) override {
        if (out == nullptr) return E_POINTER;
        if (IsEqualIID(iid, IID_IUnknown) || IsEqualIID(iid, kOuterOnly)) {
            *out = static_cast<IUnknown*>(this);
            AddRef();
            return S_OK;
        }
        if (inner) return inner->QueryInterface(iid, out);
        *out = nullptr;
        return E_NOINTERFACE;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return static_cast<ULONG>(InterlockedIncrement(&references_)); }
    STDMETHODIMP_(ULONG) Release() override { return static_cast<ULONG>(InterlockedDecrement(&references_)); }

    LONG References() const { return references_; }

    ComPtr<IUnknown> inner;  // the aggregated object's own, non-delegating IUnknown

private:
    LONG references_ = 1;
};

void ExpectAggregates(int version, int& compared) {
    OuterObject outer;
    ASSERT_EQ(S_OK, CreateByProgId(ProgId(version), outer.inner, &outer)) << Narrow(ClassName(version));
    EXPECT_EQ(1, outer.References()) << "the inner object must not hold its outer one";

    ComPtr<IUnknown> controller;
    ASSERT_EQ(S_OK, outer.QueryInterface(IID_ITavController, reinterpret_cast<void**>(&controller)));
    EXPECT_EQ(2, outer.References()) << "AddRef through an inner interface must reach the outer object";
    ComPtr<IUnknown> identity;
    ASSERT_EQ(S_OK, controller->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&identity)));
    EXPECT_EQ(static_cast<IUnknown*>(&outer), identity.Get()) << "identity must be the outer object's";
    ComPtr<IUnknown> outerOnly;
    EXPECT_EQ(S_OK, controller->QueryInterface(kOuterOnly, reinterpret_cast<void**>(&outerOnly)));
    outerOnly = nullptr;
    identity = nullptr;
    controller = nullptr;
    EXPECT_EQ(1, outer.References());

    for (const InterfaceShape& shape : kHeaderInterfaces) {
        ComPtr<IUnknown> view;
        const HRESULT hr = outer.QueryInterface(*shape.iid, reinterpret_cast<void**>(&view));
        ++compared;
        EXPECT_EQ(Answers(version, shape.name) ? S_OK : E_NOINTERFACE, hr)
            << Narrow(ClassName(version)) << " aggregated, " << Narrow(shape.name);
    }

    ComPtr<IUnknown> own;
    ASSERT_EQ(S_OK, outer.inner->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&own)));
    EXPECT_EQ(outer.inner.Get(), own.Get()) << "the non-delegating IUnknown must answer itself";
    own = nullptr;
    outer.inner = nullptr;
    EXPECT_EQ(1, outer.References());
}

TEST(Aggregation, EveryClassAggregatesThroughCoCreateInstance) {
    int compared = 0;
    ASSERT_EQ(S_OK, RunInApartment(COINIT_MULTITHREADED, [&] {
        for (int version = 1; version <= kClassCount; ++version) ExpectAggregates(version, compared);
    }));
    Checked("each of the 17 classes aggregates through CoCreateInstance with an outer object: no reference on the "
            "outer, AddRef/QueryInterface/identity delegated, the non-delegating IUnknown answers itself, " +
            std::to_string(compared) + " delegated queries match the class table");
}

}  // namespace
}  // namespace tav::conformance
