// Operations of a controller created through the registry, in both kinds of
// apartment: Init finds the virtual controller's components through the
// registry too, replies and error texts cross the module boundary as BSTRs.
#include <gtest/gtest.h>

#include "TavController.h"
#include "class_table.h"
#include "com_client.h"
#include "conformance_support.h"
#include "tav/bstr.h"

namespace tav::conformance {
namespace {

std::wstring LastError(const ComPtr<IUnknown>& object) {
    ComPtr<ITavHelperBase> helper;
    Bstr text;
    if (FAILED(object.As(helper)) || FAILED(helper->GetLastErrorInfo(text.Receive()))) return L"(none)";
    return std::wstring(text.View());
}

bool StartsWith(const std::wstring& text, std::wstring_view prefix) { return text.rfind(prefix, 0) == 0; }

class Operations : public ::testing::TestWithParam<DWORD> {
protected:
    void SetUp() override {
        if (Modules().sim.empty()) {
            Pending("operations through COM: TavSim.dll is not built, so Init has no components to create");
            GTEST_SKIP() << "TavSim.dll is not built";
        }
    }
};

TEST_P(Operations, InitAndSynchronousCallsThroughTheRegisteredModules) {
    const DWORD model = GetParam();
    const std::wstring url = std::wstring(L"/conformance-") + (model == COINIT_MULTITHREADED ? L"mta" : L"sta");
    ASSERT_EQ(S_OK, RunInApartment(model, [&] {
        ComPtr<IUnknown> object;
        ASSERT_EQ(S_OK, CreateByProgId(ProgId(17), object));
        ComPtr<ITavController> controller;
        ASSERT_EQ(S_OK, object.As(controller));

        Bstr name;
        EXPECT_EQ(E_ABORT, controller->GetControllerName(nullptr, name.Receive()));
        Bstr badUrl(L"/two/slashes");
        EXPECT_EQ(E_INVALIDARG, controller->Init(badUrl.Get()));
        EXPECT_TRUE(StartsWith(LastError(object), L"TavController::Init - Invalid URL.")) << Narrow(LastError(object));

        Bstr bound(url.c_str());
        ASSERT_EQ(S_OK, controller->Init(bound.Get()));
        EXPECT_EQ(S_OK, controller->Init(bound.Get()));
        Bstr other(L"/another");
        EXPECT_EQ(E_INVALIDARG, controller->Init(other.Get()));
        EXPECT_TRUE(StartsWith(LastError(object), L"TavController::Init - Reinitialization to new controller not "
                                                  L"allowed."))
            << Narrow(LastError(object));

        Bstr newName(L"Conformance");
        EXPECT_EQ(S_OK, controller->SetControllerName(nullptr, newName.Get()));
        ASSERT_EQ(S_OK, controller->GetControllerName(nullptr, name.Receive()));
        EXPECT_EQ(L"Conformance", name.View());
    }));
    Checked(std::string("in a ") + ApartmentName(model) +
            ": a TavController17 made by ProgID refuses calls before Init (E_ABORT) and bad URLs with their texts, "
            "Inits against TavSim.dll found through the registry, and sets and gets the controller name "
            "synchronously");
}

INSTANTIATE_TEST_SUITE_P(Apartments, Operations, ::testing::Values(COINIT_MULTITHREADED, COINIT_APARTMENTTHREADED),
                         [](const ::testing::TestParamInfo<DWORD>& info) {
                             return info.param == COINIT_MULTITHREADED ? "Multithreaded" : "SingleThreaded";
                         });

}  // namespace
}  // namespace tav::conformance
