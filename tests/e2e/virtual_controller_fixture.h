#pragma once
// A client's view of the module against the virtual controller: objects are
// made through DllGetClassObject and initialised with a URL of their own, so
// every test starts from a fresh controller model.
#include <gtest/gtest.h>

#include <string>

#include "TavController.h"
#include "core/text/convert.h"
#include "module/server_exports.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav::e2e {

class VirtualControllerTest : public ::testing::Test {
protected:
    void SetUp() override {
        CoInitializeEx(nullptr, COINIT_MULTITHREADED);
        registration_ = sim::RegisterInProcess();
        ASSERT_TRUE(registration_) << std::hex << registration_.Result();
        url_ = "/e2e" + std::to_string(++counter_);
        ASSERT_EQ(Make(17, controller_), S_OK);
    }
    void TearDown() override {
        controller_.Reset();
        registration_.Revoke();
        CoUninitialize();
    }

    // A TavController<version> object bound to this test's controller.
    HRESULT Make(int version, ComPtr<ITavController>& out) {
        ComPtr<IClassFactory> factory;
        const CLSID* classes[] = {&CLSID_TavController,   &CLSID_TavController2,  &CLSID_TavController3,
                                  &CLSID_TavController4,  &CLSID_TavController5,  &CLSID_TavController6,
                                  &CLSID_TavController7,  &CLSID_TavController8,  &CLSID_TavController9,
                                  &CLSID_TavController10, &CLSID_TavController11, &CLSID_TavController12,
                                  &CLSID_TavController13, &CLSID_TavController14, &CLSID_TavController15,
                                  &CLSID_TavController16, &CLSID_TavController17};
        HRESULT hr = DllGetClassObject(*classes[version - 1], IID_IClassFactory, reinterpret_cast<void**>(&factory));
        if (FAILED(hr)) return hr;
        hr = factory->CreateInstance(nullptr, IID_ITavController, reinterpret_cast<void**>(&out));
        if (FAILED(hr)) return hr;
        Bstr url(Url());
        return out->Init(url.Get());
    }

    template <class I>
    ComPtr<I> As() {
        ComPtr<I> view;
        EXPECT_EQ(controller_.As(view), S_OK);
        return view;
    }

    OleString Url() const { return text::Widen(url_); }
    std::string LastError() { return LastErrorOf(controller_); }
    static std::string LastErrorOf(const ComPtr<ITavController>& object) {
        ComPtr<ITavHelperBase> helper;
        EXPECT_EQ(object.As(helper), S_OK);
        Bstr text;
        helper->GetLastErrorInfo(text.Receive());
        return text::Narrow(text.View());
    }

    static std::string Narrow(const Bstr& text) { return text::Narrow(text.View()); }

    ComPtr<ITavController> controller_;

private:
    sim::InProcessRegistration registration_;
    std::string url_;
    static inline int counter_ = 0;
};

}  // namespace tav::e2e
