// The safety controller's status words and its configuration information.
#include <functional>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class SafetyConfigurationTest : public ControllerTest {};

using StatusUnpack = std::function<HRESULT(ControllerObject&, VARIANT*, LONG* out)>;

template <class E>
StatusUnpack Status(HRESULT (STDMETHODCALLTYPE ControllerObject::*unpack)(VARIANT*, E*)) {
    return [unpack](ControllerObject& o, VARIANT* data, LONG* out) {
        E value = static_cast<E>(77);
        const HRESULT hr = (o.*unpack)(data, out != nullptr ? &value : nullptr);
        if (out != nullptr) {
            *out = value;
        }
        return hr;
    };
}

struct StatusDecoder {
    const char* name;
    StatusUnpack unpack;
    const char* key;
    std::vector<std::pair<const char*, LONG>> words;
    LONG fallback;
};

std::vector<StatusDecoder> StatusDecoders() {
    return {
        {"UnpackConfigStatus", Status(&ControllerObject::UnpackConfigStatus), "-confstatus",
         {{"loaded", 1}, {"validated", 2}, {"locked", 3}, {"mismatch", 4}},
         VantorConfigError},
        {"UnpackLoadOperationStatus", Status(&ControllerObject::UnpackLoadOperationStatus), "-loadstatus",
         {{"ok", 1}, {"error", 0}},
         VantorLoadConfigDeclined},
        {"UnpackSafetyModeStatus", Status(&ControllerObject::UnpackSafetyModeStatus), "-modestat",
         {{"active", 1}, {"commissioning", 2}, {"service", 3}},
         VantorSafetyModeError},
    };
}

// An unknown word reads as the decoder's own default: a refusal for the
// load status, an error for the others.
TEST_F(SafetyConfigurationTest, StatusWordsDecodeWithTheirDefaults) {
    ControllerObject* object = Make();
    for (const StatusDecoder& d : StatusDecoders()) {
        SCOPED_TRACE(d.name);
        for (const auto& [word, value] : d.words) {
            TestVariant reply = TestVariant::Text(std::string(d.key) + " " + word);
            LONG out = -1;
            ASSERT_EQ(d.unpack(*object, reply.Get(), &out), S_OK) << word;
            EXPECT_EQ(out, value) << word;
        }
        for (const char* unknown : {"busy", "Loaded", "ok2"}) {
            TestVariant reply = TestVariant::Text(std::string(d.key) + " " + unknown);
            LONG out = -1;
            ASSERT_EQ(d.unpack(*object, reply.Get(), &out), S_OK);
            EXPECT_EQ(out, d.fallback) << unknown;
        }
        TestVariant noWord = TestVariant::Text(std::string(d.key) + "   ");
        LONG out = -1;
        EXPECT_EQ(d.unpack(*object, noWord.Get(), &out), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + " failed."));
        EXPECT_EQ(out, 0) << "cleared, not the default";
        TestVariant number = TestVariant::Number(1);
        EXPECT_EQ(d.unpack(*object, number.Get(), &out), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Invalid argument."));
        EXPECT_EQ(d.unpack(*object, number.Get(), nullptr), E_POINTER);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Invalid out pointer"));
        EXPECT_EQ(d.unpack(*object, nullptr, nullptr), E_INVALIDARG);
        EXPECT_TRUE(HasError(std::string(d.name) + ". NULL data-variant"));
    }
}

TEST_F(SafetyConfigurationTest, StatusGettersSendTheirCommands) {
    struct Case {
        std::function<HRESULT(ControllerObject&, TavInParams*, bool nullOut)> call;
        const char* command;
        const char* name;
        const char* reply;
    };
    const Case cases[] = {
        {[](ControllerObject& o, TavInParams* r, bool n) {
             TavVantorConfigStatus s{};
             return o.GetConfigStatus(r, n ? nullptr : &s);
         },
         "VantorConfigStatus", "GetConfigStatus", "-confstatus locked"},
        {[](ControllerObject& o, TavInParams* r, bool n) {
             TavVantorLoadConfigStatus s{};
             return o.GetLoadOperationStatus(r, n ? nullptr : &s);
         },
         "VantorLoadOperationStatus", "GetLoadOperationStatus", "-loadstatus ok"},
        {[](ControllerObject& o, TavInParams* r, bool n) {
             TavVantorSafetyMode s{};
             return o.GetSafeyModeStatus(r, n ? nullptr : &s);
         },
         "SafetyModeStatus", "GetSafeyModeStatus", "-modestat service"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        ExpectCallPattern({.call = c.call,
                           .invalidParams = std::string(c.name) + ": Invalid TavInParams",
                           .beforeInit = "TavController used before Initialized",
                           .nullOut = std::string(c.name) + " - Invalid out-parameter."});
        ControllerObject* object = Make();
        Script(c.command, c.reply);
        ASSERT_EQ(c.call(*object, nullptr, false), S_OK);
        EXPECT_EQ(LastCommand().verb, "Get");
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, "");
    }
}

// The configuration record, freed field by field.
struct ConfigInfo {
    TavVantorConfigInfo info{};
    ~ConfigInfo() {
        for (BSTR text : {info.creationInfo.creationDate, info.creationInfo.createdBy,
                          info.creationInfo.configurationName, info.validationInfo.validationDate,
                          info.validationInfo.validatedBy, info.lockInfo.lockDate, info.lockInfo.lockedBy}) {
            SysFreeString(text);
        }
    }
};

const std::string kChecksum = "00112233445566778899aabbccddeeffFFEEDDCCBBAA99887766554433221100";

std::string ConfigReply(bool locked, std::string vdate = " 2026-11-01 10:00") {
    std::string reply = std::string("-minv 2\t-majv 7\t-islocked ") + (locked ? "1" : "0") + "\t";
    if (locked) {
        reply += "-lockdt 2026-11-03 08:00\t-lockby Anna Berg\t";
    }
    return reply + "-valid 1\t-vdate" + vdate + "\t-vby Ove\t-crdate 2026-10-30\t-crby Ada\t-cnfnm cell7.xml\t-csum " +
           kChecksum + "\t";
}

TEST_F(SafetyConfigurationTest, ConfigurationInfoIsReadFieldByField) {
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text(ConfigReply(true));
    ConfigInfo c;
    ASSERT_EQ(object->UnpackSafetyConfigurationInfo(reply.Get(), &c.info), S_OK);
    EXPECT_EQ(c.info.configVersion.minorVersion, 2);
    EXPECT_EQ(c.info.configVersion.majorVersion, 7);
    EXPECT_EQ(c.info.lockInfo.isLocked, 1);
    EXPECT_EQ(Narrow(c.info.lockInfo.lockDate), "2026-11-03 08:00");
    EXPECT_EQ(Narrow(c.info.lockInfo.lockedBy), "Anna Berg");
    EXPECT_EQ(c.info.validationInfo.isValidated, 1);
    // A value runs from just after its key to the tab.
    EXPECT_EQ(Narrow(c.info.validationInfo.validationDate), " 2026-11-01 10:00");
    EXPECT_EQ(Narrow(c.info.validationInfo.validatedBy), " Ove");
    EXPECT_EQ(Narrow(c.info.creationInfo.creationDate), " 2026-10-30");
    EXPECT_EQ(Narrow(c.info.creationInfo.createdBy), " Ada");
    EXPECT_EQ(Narrow(c.info.creationInfo.configurationName), " cell7.xml");
    EXPECT_EQ(c.info.checksum.csum[0], 0x00);
    EXPECT_EQ(c.info.checksum.csum[1], 0x11);
    EXPECT_EQ(c.info.checksum.csum[15], 0xFF);
    EXPECT_EQ(c.info.checksum.csum[16], 0xFF);
    EXPECT_EQ(c.info.checksum.csum[31], 0x00);
}

TEST_F(SafetyConfigurationTest, UnlockedAndOverlongFieldsAreEmptyNotMissing) {
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text(ConfigReply(false, std::string(" ") + std::string(39, 'd')));
    ConfigInfo c;
    ASSERT_EQ(object->UnpackSafetyConfigurationInfo(reply.Get(), &c.info), S_OK);
    EXPECT_EQ(c.info.lockInfo.isLocked, 0);
    ASSERT_NE(c.info.lockInfo.lockDate, nullptr);
    EXPECT_EQ(Narrow(c.info.lockInfo.lockDate), "");
    ASSERT_NE(c.info.lockInfo.lockedBy, nullptr);
    ASSERT_NE(c.info.validationInfo.validationDate, nullptr);
    EXPECT_EQ(Narrow(c.info.validationInfo.validationDate), "") << "40 characters are too many";
    EXPECT_EQ(Narrow(c.info.validationInfo.validatedBy), " Ove");
}

TEST_F(SafetyConfigurationTest, EachMissingPieceHasItsText) {
    auto without = [](std::string reply, const std::string& piece, const std::string& with = "") {
        const std::size_t at = reply.find(piece);
        return reply.replace(at, piece.size(), with);
    };
    const std::string good = ConfigReply(false);
    struct Case {
        std::string reply;
        const char* error;
    };
    const Case cases[] = {
        {"-minv 2\t-majv x", "UnpackSafetyConfigurationInfo failed."},
        {without(good, "-valid 1\t"), "UnpackSafetyConfigurationInfo failed no vdate."},
        {without(good, "-vdate"), "UnpackSafetyConfigurationInfo failed no vdate."},
        {without(good, "-vby"), "UnpackSafetyConfigurationInfo failed no vby."},
        {without(good, "-crdate"), "UnpackSafetyConfigurationInfo failed no crdate."},
        {without(good, "-crby"), "UnpackSafetyConfigurationInfo failed no crby."},
        {without(good, "-cnfnm"), "UnpackSafetyConfigurationInfo failed no cnfname."},
        {without(good, "-csum"), "UnpackSafetyConfigurationInfo failed no csum."},
        // A creation date without its tab reports with the text clients know.
        {good.substr(0, good.find("-crdate")) + "-crdate 2026-10-30", "UnpackSafetyConfigurationInfo failed no vby."},
        {without(good, kChecksum, kChecksum.substr(0, 63) + "g"), "UnpackSafetyConfigurationInfo csum failed."},
        {without(good, kChecksum, kChecksum.substr(0, 40) + "\t"), "UnpackSafetyConfigurationInfo csum failed."},
    };
    ControllerObject* object = Make();
    std::set<int> lines;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        ConfigInfo info;
        EXPECT_EQ(object->UnpackSafetyConfigurationInfo(reply.Get(), &info.info), E_FAIL);
        EXPECT_TRUE(HasError(c.error));
        lines.insert(Error().line);
    }
    EXPECT_EQ(lines.size(), std::size(cases) - 1) << "the two checksum failures share their statement";
}

}  // namespace
}  // namespace tav::test
