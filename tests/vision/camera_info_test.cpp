// A camera's information by name: nineteen fields in one grammar.
#include <algorithm>
#include <array>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class CameraInfoTest : public ControllerTest {};

// The nineteen out-values of UnpackCameraInfo2, freed when they go.
struct CameraInfo {
    std::array<TestBstr, 15> texts;  // in the order of the reply, without the three numbers and the status
    LONG currDhcp = 5;
    LONG confDhcp = 5;
    ULONG index = 5;
    TavCameraStatus status = static_cast<TavCameraStatus>(5);

    HRESULT Unpack(ControllerObject& o, VARIANT* data) {
        auto t = [this](std::size_t i) { return texts[i].Out(); };
        return o.UnpackCameraInfo2(data, t(0), t(1), t(2), t(3), t(4), t(5), &currDhcp, t(6), t(7), t(8), t(9), t(10),
                                   t(11), &confDhcp, t(12), &index, t(13), &status, t(14));
    }
    bool AllCleared() const {
        return std::all_of(texts.begin(), texts.end(), [](const TestBstr& text) { return text.IsNull(); }) &&
               currDhcp == 0 && confDhcp == 0 && index == 0 && status == 0;
    }
};

std::string InfoReply(const std::string& status = "Running", const std::string& dnsServer = "-currDNSServer\"10.0.0.2\"") {
    return "-currIPAddress \"10.0.0.20\" -currSubnetMask \"255.0.0.0\" -currDefaultGateway \"10.0.0.1\" "
           "-currHostName \"cam-7\" " + dnsServer + " -currDNSSuffix \"cell.local\" -currIsDHCPEnabled 1 "
           "-confIPAddress \"10.0.0.21\" -confSubnetMask \"255.255.0.0\" -confDefaultGateway \"10.0.0.3\" "
           "-confHostName \"cam-7b\" -confDNSServer \"10.0.0.4\" -ConfDNSSuffix \"lab.local\" -confIsDHCPEnabled 0 "
           "-confCameraName \"Gripper\" -cameraIdx 3 -macAddress\"00:1A:2B:3C:4D:5E\"  -Status \"" + status +
           "  -username \"operator one\"";
}

TEST_F(CameraInfoTest, EveryFieldLandsInItsOutValue) {
    ControllerObject* object = Make();
    TestVariant reply = TestVariant::Text(InfoReply());
    CameraInfo info;
    ASSERT_EQ(info.Unpack(*object, reply.Get()), S_OK);
    // A %40s value runs to the next blank and keeps its closing quote.
    const char* expected[] = {"10.0.0.20\"", "255.0.0.0\"", "10.0.0.1\"", "cam-7\"", "10.0.0.2\"", "cell.local\"",
                              "10.0.0.21\"", "255.255.0.0\"", "10.0.0.3\"", "cam-7b\"", "10.0.0.4\"", "lab.local\"",
                              "Gripper\"", "00:1A:2B:3C:4D:5E\"", "operator one"};
    for (std::size_t i = 0; i < info.texts.size(); ++i) {
        EXPECT_EQ(info.texts[i].Text(), expected[i]) << i;
    }
    EXPECT_EQ(info.currDhcp, 1);
    EXPECT_EQ(info.confDhcp, 0);
    EXPECT_EQ(info.index, 3u);
    EXPECT_EQ(info.status, CameraStatus_Running);
}

TEST_F(CameraInfoTest, StatusWordsOfTheInfoVocabulary) {
    ControllerObject* object = Make();
    const std::pair<const char*, TavCameraStatus> known[] = {{"Disconnected", CameraStatus_Disconnected},
                                                             {"Program", CameraStatus_Program},
                                                             {"Unconfigured", CameraStatus_Unconfigured},
                                                             {"Unknown", CameraStatus_Unknown}};
    for (const auto& [word, status] : known) {
        TestVariant reply = TestVariant::Text(InfoReply(word));
        CameraInfo info;
        ASSERT_EQ(info.Unpack(*object, reply.Get()), S_OK) << word;
        EXPECT_EQ(info.status, status) << word;
    }
    // The status reply's "Standby" is no word of the info replies, and a word
    // with its closing quote runs on into it.
    for (const char* word : {"Standby", "Running\""}) {
        TestVariant reply = TestVariant::Text(InfoReply(word));
        CameraInfo info;
        EXPECT_EQ(info.Unpack(*object, reply.Get()), E_FAIL) << word;
        EXPECT_TRUE(HasError("UnpackCameraInfo2 received unexpected camera status."));
        EXPECT_TRUE(info.AllCleared()) << "nothing handed out for a refused reply";
    }
}

TEST_F(CameraInfoTest, TheGrammarIsMatchedAsItStands) {
    ControllerObject* object = Make();
    const std::string refused[] = {
        InfoReply("Running", "-currDNSServer \"10.0.0.2\""),  // no blank before that quote
        InfoReply().substr(0, InfoReply().find("-username")),
        InfoReply().substr(0, InfoReply().size() - 13) + "\"\"",  // an empty user name
    };
    for (const std::string& text : refused) {
        TestVariant reply = TestVariant::Text(text);
        CameraInfo info;
        EXPECT_EQ(info.Unpack(*object, reply.Get()), E_FAIL) << text;
        EXPECT_TRUE(HasError("UnpackCameraInfo2 failed."));
        EXPECT_TRUE(info.AllCleared());
    }
    // 41 characters do not fit a field of 40: the field ends early and the
    // next key does not match.
    std::string wide = InfoReply();
    wide.replace(wide.find("cam-7\""), 5, std::string(41, 'c'));
    TestVariant reply = TestVariant::Text(wide);
    CameraInfo info;
    EXPECT_EQ(info.Unpack(*object, reply.Get()), E_FAIL);
}

// The first generation's grammars and their borrowed texts.
TEST_F(CameraInfoTest, FirstGenerationDecodersKeepTheirTexts) {
    ControllerObject* object = Make();
    const std::string byIndex =
        "-currIPAddress \"1.1.1.1\" -currSubnetMask \"2\" -currDefaultGateway \"3\" -currHostName \"h\" "
        "-currDNSServer \"d\" -currDNSSuffix \"s\" -currIsDHCPEnabled 0 -confIPAddress \"4\" -confSubnetMask \"5\" "
        "-confDefaultGateway \"6\" -confHostName \"h2\" -confDNSServer \"d2\" -confDNSSuffix \"s2\" "
        "-confIsDHCPEnabled 1 -confCameraName \"Conf\" -cameraName \"Cam\" -macAddress \"m\" -Status \"";
    std::array<TestBstr, 15> t;
    LONG d1 = 0, d2 = 0;
    TavCameraStatus status{};
    auto byIndexUnpack = [&](const std::string& reply) {
        TestVariant data = TestVariant::Text(reply);
        return object->UnpackCameraInfoUsingIndex(data.Get(), t[0].Out(), t[1].Out(), t[2].Out(), t[3].Out(),
                                                  t[4].Out(), t[5].Out(), &d1, t[6].Out(), t[7].Out(), t[8].Out(),
                                                  t[9].Out(), t[10].Out(), t[11].Out(), &d2, t[12].Out(), t[13].Out(),
                                                  t[14].Out(), &status);
    };
    ASSERT_EQ(byIndexUnpack(byIndex + "Program\""), S_OK);
    EXPECT_EQ(status, CameraStatus_Program);
    EXPECT_EQ(t[13].Text(), "Cam\"");
    EXPECT_EQ(d2, 1);
    EXPECT_EQ(byIndexUnpack(byIndex + "Standby\""), E_FAIL);
    EXPECT_TRUE(HasError("UnpackCameraInfoUsingIndex received unexpected camera status."));
    EXPECT_EQ(byIndexUnpack(byIndex + "\""), E_FAIL) << "an empty status";
    EXPECT_TRUE(HasError("UnpackLANAdaptorIPConfig failed."));

    std::string byName = byIndex;
    byName.replace(byName.find("-currDNSServer \""), 16, "-currDNSServer\"");
    byName.replace(byName.find("-confDNSSuffix"), 14, "-ConfDNSSuffix");
    byName.replace(byName.find("-cameraName \"Cam\""), 18, "-cameraIdx 7");
    byName.replace(byName.find("-macAddress \"m\" -Status"), 24, "-macAddress\"m\"  -Status");
    ULONG index = 0;
    auto byNameUnpack = [&](const std::string& reply) {
        TestVariant data = TestVariant::Text(reply);
        return object->UnpackCameraInfo(data.Get(), t[0].Out(), t[1].Out(), t[2].Out(), t[3].Out(), t[4].Out(),
                                        t[5].Out(), &d1, t[6].Out(), t[7].Out(), t[8].Out(), t[9].Out(), t[10].Out(),
                                        t[11].Out(), &d2, t[12].Out(), &index, t[14].Out(), &status);
    };
    ASSERT_EQ(byNameUnpack(byName + "Running\""), S_OK);
    EXPECT_EQ(index, 7u);
    EXPECT_EQ(status, CameraStatus_Running);
    EXPECT_EQ(byNameUnpack(byName + "Busy\""), E_FAIL);
    EXPECT_TRUE(HasError("UnpackCameraInfo received unexpected camera status."));
    EXPECT_EQ(byNameUnpack(byIndex + "Running\""), E_FAIL) << "the by-index grammar is not the by-name one";
    EXPECT_TRUE(HasError("UnpackLANAdaptorIPConfig failed."));
    TestVariant number = TestVariant::Number(1);
    EXPECT_EQ(object->UnpackCameraInfo(number.Get(), t[0].Out(), t[1].Out(), t[2].Out(), t[3].Out(), t[4].Out(),
                                       t[5].Out(), &d1, t[6].Out(), t[7].Out(), t[8].Out(), t[9].Out(), t[10].Out(),
                                       t[11].Out(), &d2, t[12].Out(), &index, t[14].Out(), nullptr),
              E_POINTER);
    EXPECT_TRUE(HasError("UnpackCameraInfoUsingIndex. Invalid out pointer"));
}

TEST_F(CameraInfoTest, GetCameraInfo2ChecksInitialisationBeforeTheName) {
    ControllerObject* fresh = MakeUninitialised();
    CameraInfo info;
    auto get = [&](ControllerObject& o, TavInParams* rip, BSTR name) {
        auto t = [&](std::size_t i) { return info.texts[i].Out(); };
        return o.GetCameraInfo2(rip, name, t(0), t(1), t(2), t(3), t(4), t(5), &info.currDhcp, t(6), t(7), t(8), t(9),
                                t(10), t(11), &info.confDhcp, t(12), &info.index, t(13), &info.status, t(14));
    };
    EXPECT_EQ(get(*fresh, nullptr, nullptr), E_ABORT);
    EXPECT_TRUE(HasError("TavController used before Initialized", fresh));
    ControllerObject* object = Make();
    TavInParams foreign = ForeignCallback();
    EXPECT_EQ(get(*object, &foreign, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetCameraInfo2. Invalid argument."));
    EXPECT_EQ(get(*object, nullptr, nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetCameraInfo2: Empty camera name"));
    EXPECT_EQ(CommandCount(), 0u);

    Script("LMCameraInfo2", InfoReply());
    TestBstr name("Gripper cam");
    ASSERT_EQ(get(*object, nullptr, name.Get()), S_OK);
    EXPECT_EQ(LastCommand().verb, "Get");
    EXPECT_EQ(LastCommand().args, "-Camera Gripper cam");
    EXPECT_EQ(info.texts[14].Text(), "operator one");
}

}  // namespace
}  // namespace tav::test
