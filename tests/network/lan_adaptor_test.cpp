// The LAN adaptor's method, addresses, configuration and information.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class LanAdaptorTest : public ControllerTest {};

TEST_F(LanAdaptorTest, GettersAndTheMethodSetterFollowTheCallPattern) {
    IPMethod method{};
    TestBstr a, b, c, d;
    const CallPattern patterns[] = {
        {[](ControllerObject& o, TavInParams* r, bool) { return o.SetLANAdaptorIPMethod(r, DHCP); },
         "SetLANAdaptorIPMethod: Invalid TavInParams", "SetLANAdaptorIPMethod. TavController used before Initialized",
         std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.GetLANAdaptorIPMethod(r, n ? nullptr : &method); },
         "GetLANAdaptorIPMethod: Invalid TavInParams", "GetLANAdaptorIPMethod. TavController used before Initialized",
         "GetLANAdaptorIPMethod: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetLANAdaptorIPConfig(r, a.Out(), n ? nullptr : b.Out(), c.Out());
         },
         "GetLANAdaptorIPConfig: Invalid TavInParams", "GetLANAdaptorIPConfig. TavController used before Initialized",
         "GetLANAdaptorIPConfig: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetLANAdaptorInfo(r, a.Out(), b.Out(), c.Out(), n ? nullptr : d.Out());
         },
         "GetLANAdaptorInfo: Invalid TavInParams", "GetLANAdaptorInfo. TavController used before Initialized",
         "GetLANAdaptorInfo: Invalid out-pointer"},
        {[&](ControllerObject& o, TavInParams* r, bool n) {
             return o.GetLANAdaptorIP(r, &method, a.Out(), n ? nullptr : b.Out(), c.Out());
         },
         "GetLANAdaptorIP: Invalid TavInParams", "GetLANAdaptorIP. TavController used before Initialized",
         "GetLANAdaptorIP: Invalid out-pointer"},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

// The checks of the setters come before initialisation, in their order.
TEST_F(LanAdaptorTest, SettersCheckAddressesInOrder) {
    struct Case {
        const char* address;
        const char* mask;
        const char* gateway;  // nullptr: a NULL BSTR
        const char* error;    // nullptr: accepted
        const char* sent;
    };
    const Case cases[] = {
        {"10.0.0.5", "255.0.255.0", "", nullptr, "-Address 10.0.0.5 -Submask 255.0.255.0 -Gateway \"\""},
        {"10.0.0.5", "255.255.255.0", nullptr, nullptr, "-Address 10.0.0.5 -Submask 255.255.255.0 -Gateway \"\""},
        {"0.0.0.0", "255.255.255.255", "10.9.9.9", nullptr, "-Address 0.0.0.0 -Submask 255.255.255.255 -Gateway 10.9.9.9"},
        {" 1. 2.3.4xyz", "1.1.1.1", "", nullptr, "-Address  1. 2.3.4xyz -Submask 1.1.1.1 -Gateway \"\""},
        {"256.1.1.1", "255.0.0.0", "", "Invalid IP-address.", nullptr},
        {"1.1.1", "255.0.0.0", "", "Invalid IP-address.", nullptr},
        {"-1.1.1.1", "255.0.0.0", "", "Invalid IP-address.", nullptr},
        {"1.1.1.1", "255.0.0.256", "", "Invalid subnetmask.", nullptr},
        {"1.1.1.1", "255.0.0.0", "gateway", "Invalid gateway address.", nullptr},
        {"256.1.1.1", "", "", "Invalid argument", nullptr},
        {"", "255.0.0.0", "", "Invalid argument", nullptr},
    };
    ControllerObject* fresh = MakeUninitialised();
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.address) + " " + c.mask);
        const TestBstr address(c.address), mask(c.mask);
        const TestBstr gateway = c.gateway != nullptr ? TestBstr(c.gateway) : TestBstr();
        for (const bool config : {true, false}) {
            const std::string name = config ? "SetLANAdaptorIPConfig" : "SetLANAdaptorIP";
            auto set = [&](ControllerObject* o) {
                return config ? o->SetLANAdaptorIPConfig(nullptr, address.Get(), mask.Get(), gateway.Get())
                              : o->SetLANAdaptorIP(nullptr, FIXIP, address.Get(), mask.Get(), gateway.Get());
            };
            if (c.error != nullptr) {
                EXPECT_EQ(set(fresh), E_INVALIDARG) << name;
                EXPECT_TRUE(HasError(name + ": " + c.error, fresh));
            } else {
                EXPECT_EQ(set(fresh), E_ABORT) << name;
                EXPECT_TRUE(HasError(config ? "SetLANAdaptorIPConfig used before Initialized"
                                            : "SetLANAdaptorIP. TavController used before Initialized",
                                     fresh));
                ASSERT_EQ(set(object), S_OK) << name;
                EXPECT_EQ(LastCommand().command, config ? "LANAdaptorIP" : "LANAdaptor");
                EXPECT_EQ(LastCommand().args, config ? std::string(c.sent) : std::string("-Method FIXIP") + c.sent);
            }
        }
    }
}

TEST_F(LanAdaptorTest, MethodsOfTheCombinedSetter) {
    ControllerObject* object = Make();
    ASSERT_EQ(object->SetLANAdaptorIP(nullptr, NONE, nullptr, nullptr, nullptr), S_OK);
    EXPECT_EQ(LastCommand().args, "-Method NONE-Address  -Submask  -Gateway \"\"");
    EXPECT_EQ(object->SetLANAdaptorIP(nullptr, DHCP, nullptr, TestBstr("255.0.0.0").Get(), nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("SetLANAdaptorIP: Invalid argument"));
    ASSERT_EQ(object->SetLANAdaptorIP(nullptr, DHCP, TestBstr("10.0.0.2").Get(), TestBstr("255.0.0.0").Get(), nullptr),
              S_OK);
    EXPECT_EQ(LastCommand().args, "-Method DHCP-Address 10.0.0.2 -Submask 255.0.0.0 -Gateway \"\"");
    const size_t sent = CommandCount();
    EXPECT_EQ(object->SetLANAdaptorIP(nullptr, static_cast<IPMethod>(7), TestBstr("10.0.0.2").Get(),
                                      TestBstr("255.0.0.0").Get(), nullptr),
              E_INVALIDARG);
    EXPECT_TRUE(HasError("SetLANAdaptorIP. Unexpected method type"));
    EXPECT_EQ(object->SetLANAdaptorIPMethod(nullptr, static_cast<IPMethod>(3)), E_INVALIDARG);
    EXPECT_TRUE(HasError("SetLANAdaptorIPMethod. Unexpected method type"));
    EXPECT_EQ(CommandCount(), sent);
    ASSERT_EQ(object->SetLANAdaptorIPMethod(nullptr, FIXIP), S_OK);
    EXPECT_EQ(LastCommand().args, "-Method FIXIP");
}

TEST_F(LanAdaptorTest, RepliesDecodeIntoTheirFields) {
    ControllerObject* object = Make();
    TestVariant method = TestVariant::Text("-Method dhcp");
    IPMethod m = FIXIP;
    EXPECT_EQ(object->UnpackLANAdaptorIPMethod(method.Get(), &m), E_FAIL);
    EXPECT_TRUE(HasError("UnpackLANAdaptorIPMethod received unexpected IP method."));
    EXPECT_EQ(m, NONE);
    TestVariant good = TestVariant::Text("-Method DHCP");
    ASSERT_EQ(object->UnpackLANAdaptorIPMethod(good.Get(), &m), S_OK);
    EXPECT_EQ(m, DHCP);

    TestVariant info = TestVariant::Text("-Address unspec -Submask 255.0.0.0 -Gateway unspec -Mac unspec");
    TestBstr a, b, c, d;
    ASSERT_EQ(object->UnpackLANAdaptorInfo(info.Get(), a.Out(), b.Out(), c.Out(), d.Out()), S_OK);
    EXPECT_EQ(a.Text(), "");
    EXPECT_EQ(b.Text(), "255.0.0.0");
    EXPECT_EQ(d.Text(), "unspec") << "the MAC is never replaced";
    TestVariant config = TestVariant::Text("-Address unspec -Submask unspec -Gateway unspec");
    ASSERT_EQ(object->UnpackLANAdaptorIPConfig(config.Get(), a.Out(), b.Out(), c.Out()), S_OK);
    EXPECT_TRUE(a.Text().empty() && b.Text().empty() && c.Text().empty());
    EXPECT_FALSE(a.IsNull());
    TestVariant wide = TestVariant::Text("-Address 1.2.3.4 -Submask 12345678901234567890 -Gateway x");
    EXPECT_EQ(object->UnpackLANAdaptorIPConfig(wide.Get(), a.Out(), b.Out(), c.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackLANAdaptorIPConfig failed."));
    EXPECT_TRUE(a.IsNull());
    TestVariant shortInfo = TestVariant::Text("-Address 1.2.3.4 -Submask 2 -Gateway 3");
    EXPECT_EQ(object->UnpackLANAdaptorInfo(shortInfo.Get(), a.Out(), b.Out(), c.Out(), d.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackLANAdaptorInfo failed."));
}

// The method and addresses read in one command.
struct LanIp {
    IPMethod method = static_cast<IPMethod>(9);
    TestBstr address, mask, gateway;
    HRESULT Unpack(ControllerObject& o, VARIANT* data) {
        return o.UnpackLANAdaptorIP(data, &method, address.Out(), mask.Out(), gateway.Out());
    }
};

TEST_F(LanAdaptorTest, CombinedReadDecodesTheMethodAndUnsetAddresses) {
    struct Case {
        const char* reply;
        IPMethod method;
        const char* address;
        const char* mask;
        const char* gateway;
    };
    const Case cases[] = {
        {"-Method FIXIP -Address 10.0.0.5 -Submask 255.0.0.0 -Gateway 10.0.0.1", FIXIP, "10.0.0.5", "255.0.0.0",
         "10.0.0.1"},
        {"-Method DHCP -Address unspec -Submask unspec -Gateway unspec", DHCP, "", "", ""},
        {"-Method NONE -Address 1234567890123456789 -Submask x -Gateway \"\"", NONE, "1234567890123456789", "x",
         "\"\""},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        LanIp ip;
        ASSERT_EQ(ip.Unpack(*object, reply.Get()), S_OK);
        EXPECT_EQ(ip.method, c.method);
        EXPECT_EQ(ip.address.Text(), c.address);
        EXPECT_FALSE(ip.address.IsNull()) << "an unset address is an empty string";
        EXPECT_EQ(ip.mask.Text(), c.mask);
        EXPECT_EQ(ip.gateway.Text(), c.gateway);
    }
}

TEST_F(LanAdaptorTest, CombinedReadRefusesWhatDoesNotFitItsFields) {
    struct Case {
        const char* reply;
        const char* error;
    };
    const Case cases[] = {
        {"-Method dhcp -Address a -Submask b -Gateway c", "UnpackLANAdaptorIPMethod received unexpected IP method."},
        {"-Method FIXIP -Address 12345678901234567890 -Submask b -Gateway c", "UnpackLANAdaptorIP failed."},
        {"-Method FIXIP -Address a -Submask b -Gateway 12345678901234567890", "UnpackLANAdaptorIP failed."},
        {"-Method FIXIP -Address a -Submask b", "UnpackLANAdaptorIP failed."},
        {"-Method FIXIPADDRESS -Address a -Submask b -Gateway c", "UnpackLANAdaptorIP failed."},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        LanIp ip;
        EXPECT_EQ(ip.Unpack(*object, reply.Get()), E_FAIL);
        EXPECT_TRUE(HasError(c.error));
        EXPECT_EQ(ip.method, 0);
        EXPECT_TRUE(ip.address.IsNull() && ip.mask.IsNull() && ip.gateway.IsNull());
    }
    TestVariant number = TestVariant::Number(3);
    LanIp ip;
    EXPECT_EQ(ip.Unpack(*object, number.Get()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackLANAdaptorIP. Data-variant not of type VT_BSTR"));
    EXPECT_EQ(object->UnpackLANAdaptorIP(number.Get(), &ip.method, ip.address.Out(), nullptr, ip.gateway.Out()),
              E_POINTER);
    EXPECT_TRUE(HasError("UnpackLANAdaptorIP. Invalid out pointer"));
    EXPECT_EQ(object->UnpackLANAdaptorIP(nullptr, &ip.method, nullptr, nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackLANAdaptorIP. NULL data pointer"));
}

TEST_F(LanAdaptorTest, GetLANAdaptorIPSendsItsCommand) {
    ControllerObject* object = Make();
    Script("LANAdaptor", "-Method FIXIP -Address 10.0.0.5 -Submask 255.0.0.0 -Gateway unspec");
    LanIp ip;
    ASSERT_EQ(object->GetLANAdaptorIP(nullptr, &ip.method, ip.address.Out(), ip.mask.Out(), ip.gateway.Out()), S_OK);
    EXPECT_EQ(LastCommand().verb + LastCommand().command + LastCommand().args, "GetLANAdaptor");
    EXPECT_EQ(ip.address.Text(), "10.0.0.5");
}

}  // namespace
}  // namespace tav::test
