// The LAN adaptor's method and addresses read in one command.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class LanAdaptorIpTest : public ControllerTest {};

struct LanIp {
    IPMethod method = static_cast<IPMethod>(9);
    TestBstr address, mask, gateway;
    HRESULT Unpack(ControllerObject& o, VARIANT* data) {
        return o.UnpackLANAdaptorIP(data, &method, address.Out(), mask.Out(), gateway.Out());
    }
};

TEST_F(LanAdaptorIpTest, DecodesTheMethodAndUnsetAddresses) {
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

TEST_F(LanAdaptorIpTest, RefusesWhatDoesNotFitItsFields) {
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

TEST_F(LanAdaptorIpTest, GetLANAdaptorIPSendsItsCommand) {
    ControllerObject* object = Make();
    Script("LANAdaptor", "-Method FIXIP -Address 10.0.0.5 -Submask 255.0.0.0 -Gateway unspec");
    LanIp ip;
    ASSERT_EQ(object->GetLANAdaptorIP(nullptr, &ip.method, ip.address.Out(), ip.mask.Out(), ip.gateway.Out()), S_OK);
    EXPECT_EQ(LastCommand().verb + LastCommand().command + LastCommand().args, "GetLANAdaptor");
    EXPECT_EQ(ip.address.Text(), "10.0.0.5");
}

}  // namespace
}  // namespace tav::test
