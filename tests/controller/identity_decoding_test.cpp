// The Unpack operations of identity, names and version information: their
// checks in order with their own texts, and each reply grammar.
#include <functional>
#include <tuple>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class IdentityDecodingTest : public ControllerTest {};

using BstrUnpack = HRESULT (STDMETHODCALLTYPE ControllerObject::*)(VARIANT*, BSTR*);
using Unpack = std::function<HRESULT(ControllerObject&, VARIANT*, bool nullOut)>;

Unpack WithBstr(BstrUnpack unpack) {
    return [unpack](ControllerObject& o, VARIANT* data, bool nullOut) {
        TestBstr out;
        return (o.*unpack)(data, nullOut ? nullptr : out.Out());
    };
}

TEST_F(IdentityDecodingTest, ChecksRunInOrderWithEachOperationsTexts) {
    struct Case {
        Unpack unpack;
        const char* nullData;
        const char* nullOut;
        const char* notText;
    };
    const Case cases[] = {
        {WithBstr(&ControllerObject::UnpackVersionInfo), "UnpackVersionInfo. NULL VARIANT", "",
         "UnpackVersionInfo. Non-BSTR VARIANT"},
        {WithBstr(&ControllerObject::UnpackControllerName), "UnpackControllerName. NULL data-variant", "",
         "UnpackControllerName. Invalid argument."},
        {WithBstr(&ControllerObject::UnpackControllerID), "UnpackControllerID. NULL data-variant", "",
         "UnpackControllerID. Non-BSTR VARIANT."},
        {WithBstr(&ControllerObject::UnpackSystemID), "UnpackSystemID. NULL data-variant", "",
         "UnpackSystemID. Non-BSTR variant."},
        {WithBstr(&ControllerObject::UnpackEnvironmentVariable), "UnpackEnvironmentVariable. NULL data-variant", "",
         "UnpackEnvironmentVariable. Invalid argument."},
        {WithBstr(&ControllerObject::UnpackConnectedTavAPIClients), "UnpackConnectedTavAPIClients. NULL VARIANT", "",
         "UnpackConnectedTavAPIClients. Non-BSTR VARIANT"},
        {WithBstr(&ControllerObject::UnpackVersionName), "UnpackVersionName. NULL data pointer",
         "UnpackVersionName. Invalid out pointer", "UnpackVersionName. Data-variant not of type VT_BSTR"},
        {WithBstr(&ControllerObject::UnpackProductVersionName), "UnpackProductVersionName. NULL data pointer",
         "UnpackProductVersionName. Invalid out pointer",
         "UnpackProductVersionName. Data-variant not of type VT_BSTR"},
        {[](ControllerObject& o, VARIANT* data, bool nullOut) {
             LONG present = 0;
             return o.UnpackIsOptionPresent(data, nullOut ? nullptr : &present);
         },
         "UnpackIsOptionPresent. NULL data-variant", "", "UnpackIsOptionPresent. Non-BSTR variant."},
        {[](ControllerObject& o, VARIANT* data, bool nullOut) {
             TavSysEnergyState state{};
             return o.UnpackSysEnergyState(data, nullOut ? nullptr : &state);
         },
         "UnpackEnergyState. NULL data-variant", "", "UnpackEnergyState. Invalid argument."},
    };
    ControllerObject* fresh = MakeUninitialised();
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.nullData);
        TestVariant text = TestVariant::Text("-Name \"x\"");
        TestVariant number = TestVariant::Number(1);
        EXPECT_EQ(c.unpack(*fresh, text.Get(), false), E_ABORT);
        EXPECT_TRUE(HasError("TavController used before Initialized", fresh));
        EXPECT_EQ(c.unpack(*object, nullptr, true), E_INVALIDARG);
        EXPECT_TRUE(HasError(c.nullData));
        EXPECT_EQ(c.unpack(*object, number.Get(), true), E_POINTER);
        EXPECT_TRUE(HasError(c.nullOut));
        EXPECT_EQ(c.unpack(*object, number.Get(), false), E_FAIL);
        EXPECT_TRUE(HasError(c.notText));
    }
}

// The Sync reads show the plain replies; these are the edges of each grammar.
TEST_F(IdentityDecodingTest, TextRepliesDecodeAtTheirEdges) {
    struct Case {
        BstrUnpack unpack;
        std::string reply;
        HRESULT hr;
        std::string decodedOrError;
    };
    const std::string badGuid = "UnpackSystemID - Bad GUID format";
    const Case cases[] = {
        {&ControllerObject::UnpackControllerName, "-Name \"\"", S_OK, ""},
        {&ControllerObject::UnpackControllerName, "-Name \"" + std::string(300, 'c') + "\"", S_OK,
         std::string(256, 'c')},
        {&ControllerObject::UnpackControllerName, "-Name Cell", E_FAIL, "UnpackControllerName failed."},
        {&ControllerObject::UnpackControllerID, "-ID \"\"", S_OK, ""},
        {&ControllerObject::UnpackControllerID, "-Id \"42\"", E_FAIL, "UnpackControllerID failed."},
        {&ControllerObject::UnpackSystemID, "{0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F}", E_FAIL, badGuid},
        {&ControllerObject::UnpackSystemID, "{0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F9A}", E_FAIL, badGuid},
        {&ControllerObject::UnpackSystemID, "0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F9}", E_FAIL, badGuid},
        {&ControllerObject::UnpackSystemID, "{0A1B2C3D-4E5F-6071-8293-A4B5C6D7E8F9", E_FAIL, badGuid},
        {&ControllerObject::UnpackSystemID, "{0A1B2C3D+4E5F-6071-8293-A4B5C6D7E8F9}", E_FAIL,
         "UnpackSystemID - Invalid GUID"},
        {&ControllerObject::UnpackVersionName, "-Name ", S_OK, ""},
        {&ControllerObject::UnpackVersionName, "-Name", E_FAIL, "UnpackVersionName. Bad format."},
        {&ControllerObject::UnpackProductVersionName, "-name 3.1", E_FAIL, "UnpackProductVersionName. Bad format."},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply.substr(0, 40));
        TestVariant data = TestVariant::Text(c.reply);
        TestBstr stale("stale");
        BSTR out = stale.Get();
        EXPECT_EQ((object->*c.unpack)(data.Get(), &out), c.hr);
        if (SUCCEEDED(c.hr)) {
            ASSERT_NE(out, nullptr);
            EXPECT_EQ(Narrow(OleStringView(out, SysStringLen(out))), c.decodedOrError);
            SysFreeString(out);
        } else {
            EXPECT_EQ(out, nullptr) << "a failed decoding left a string";
            EXPECT_TRUE(HasError(c.decodedOrError));
        }
    }
}

TEST_F(IdentityDecodingTest, EnergyStateWordsIgnoreCase) {
    const std::tuple<const char*, HRESULT, TavSysEnergyState, const char*> cases[] = {
        {"-sysenergy notpaused", S_OK, TavSysEnergyStateNotPaused, ""},
        {"-sysenergy PAUSED", S_OK, TavSysEnergyStatePaused, ""},
        {"-sysenergy Blocked", S_OK, TavSysEnergyStateBlocked, ""},
        {"-sysenergy pausing x", S_OK, TavSysEnergyStatePausing, ""},
        {"-sysenergy pausedandmore", E_FAIL, {}, "UnpackEnergyState. Unsupported value."},
        {"-sysenergy ", E_FAIL, {}, "UnpackEnergyState. Unsupported format."},
    };
    ControllerObject* object = Make();
    for (const auto& [reply, hr, expected, error] : cases) {
        TestVariant data = TestVariant::Text(reply);
        TavSysEnergyState state{};
        EXPECT_EQ(object->UnpackSysEnergyState(data.Get(), &state), hr) << reply;
        EXPECT_TRUE(SUCCEEDED(hr) ? state == expected : HasError(error)) << reply;
    }
}

TEST_F(IdentityDecodingTest, OptionPresenceQuotesABadReply) {
    ControllerObject* object = Make();
    TestVariant bad = TestVariant::Text("-OptionPresent yes");
    LONG present = 7;
    EXPECT_EQ(object->UnpackIsOptionPresent(bad.Get(), &present), E_FAIL);
    EXPECT_TRUE(HasError("UnpackIsOptionPresent. Bad result string: -OptionPresent yes"));
    EXPECT_EQ(present, 7) << "the value is scanned in place, not cleared first";
}

}  // namespace
}  // namespace tav::test
