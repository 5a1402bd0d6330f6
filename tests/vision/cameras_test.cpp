// The camera operations besides their information: order of checks, the
// texts sent, status words.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class CamerasTest : public ControllerTest {};

// Initialisation is checked before the arguments.
TEST_F(CamerasTest, InitialisationComesBeforeTheArguments) {
    ControllerObject* fresh = MakeUninitialised();
    const TestBstr tooLong(std::string(33, 'c'));
    struct Case {
        std::function<HRESULT(ControllerObject&)> call;
        const char* beforeInit;
    };
    const Case cases[] = {
        {[](ControllerObject& o) { return o.IsCameraValid(nullptr, nullptr, nullptr); },
         "IsCameraValid. TavController used before Initialized"},
        {[](ControllerObject& o) { return o.GetCameraStatus(nullptr, nullptr, nullptr); },
         "GetCameraStatus. TavController used before Initialized"},
        {[](ControllerObject& o) { return o.GetNumberOfCameras(nullptr, nullptr); },
         "GetNumberOfCameras. TavController used before Initialized"},
        {[&](ControllerObject& o) { return o.SetCameraName(nullptr, 1, tooLong.Get()); },
         "TavController used before Initialized"},
        {[&](ControllerObject& o) { return o.SetCameraState(nullptr, tooLong.Get(), CameraStatus_Unknown); },
         "TavController used before Initialized"},
        {[](ControllerObject& o) { return o.RefreshCameras(nullptr); }, "RefreshCameras. TavController used before Initialized"},
        {[&](ControllerObject& o) { return o.FlashCameraLED(nullptr, tooLong.Get()); },
         "TavController used before Initialized"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(c.call(*fresh), E_ABORT) << c.beforeInit;
        EXPECT_TRUE(HasError(c.beforeInit, fresh));
    }
}

TEST_F(CamerasTest, ArgumentTextsAndRefusals) {
    struct Case {
        std::function<HRESULT(ControllerObject&)> call;
        const char* command;
        const char* args;
    };
    const TestBstr name("Gripper cam"), exact(std::string(32, 'x'));
    const Case cases[] = {
        {[&](ControllerObject& o) { return o.SetCameraName(nullptr, 4294967295u, exact.Get()); }, "LMCameraName",
         "-Camera xxxxxxxxxxxxxxxxxxxxxxxxxxxxxxxx -Idx 4294967295"},
        {[&](ControllerObject& o) { return o.SetCameraState(nullptr, name.Get(), CameraStatus_Running); },
         "LMCameraState", "-Camera Gripper cam -State 2"},
        {[&](ControllerObject& o) { return o.SetCameraState(nullptr, name.Get(), CameraStatus_Program); },
         "LMCameraState", "-Camera Gripper cam -State 1"},
        {[&](ControllerObject& o) {
             return o.SetCameraIPSettings(nullptr, name.Get(), TestBstr("10.0.0.9").Get(), TestBstr("bad").Get(),
                                          nullptr);
         },
         "LMCameraIPSettings", "-Camera Gripper cam -Address 10.0.0.9 -Subnetmask bad -Gateway "},
        {[&](ControllerObject& o) { return o.SetCameraDHCP(nullptr, name.Get()); }, "LMCameraDHCP",
         "-Camera Gripper cam"},
        {[&](ControllerObject& o) {
             return o.SetCameraDNSSettings(nullptr, name.Get(), TestBstr("10.0.0.1").Get(), TestBstr("cell").Get());
         },
         "LMCameraDNSSettings", "-Camera Gripper cam -DNSServer 10.0.0.1 -DNSSuffix cell"},
        {[&](ControllerObject& o) { return o.FlashCameraLED(nullptr, name.Get()); }, "LMFlashCameraLED",
         "-Camera Gripper cam"},
        {[](ControllerObject& o) { return o.RefreshCameras(nullptr); }, "LMRefreshCameras", ""},
        {[](ControllerObject& o) {
             return o.SetCameraUserCredentials(nullptr, 3, TestBstr("op").Get(), TestBstr("p w").Get());
         },
         "LMUserCredentials", "-Username op -Password p w -CameraIdx 3"},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.args);
        ASSERT_EQ(c.call(*object), S_OK);
        EXPECT_EQ(LastCommand().verb, "Set");
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
    const TestBstr tooLong(std::string(33, 'x'));
    const std::pair<std::function<HRESULT()>, const char*> refusals[] = {
        {[&] { return object->SetCameraName(nullptr, 0, tooLong.Get()); }, "SetCameraName invalid argument"},
        {[&] { return object->SetCameraState(nullptr, tooLong.Get(), CameraStatus_Running); },
         "SetCameraRunning invalid argument"},
        {[&] { return object->SetCameraState(nullptr, name.Get(), CameraStatus_Unconfigured); },
         "Set camera state. Not valid camera state"},
        {[&] { return object->SetCameraIPSettings(nullptr, tooLong.Get(), nullptr, nullptr, nullptr); },
         "SetCameraIPSettings invalid argument"},
        {[&] { return object->SetCameraDHCP(nullptr, tooLong.Get()); }, "SetCameraDHCP invalid argument"},
        {[&] { return object->SetCameraDNSSettings(nullptr, tooLong.Get(), nullptr, nullptr); },
         "SetCameraDNSSettings invalid argument"},
        {[&] { return object->FlashCameraLED(nullptr, tooLong.Get()); }, "FlashCameraLED invalid argument"},
    };
    const size_t sent = CommandCount();
    for (const auto& [call, error] : refusals) {
        EXPECT_EQ(call(), E_INVALIDARG) << error;
        EXPECT_TRUE(HasError(error));
    }
    EXPECT_EQ(CommandCount(), sent);
    TavInParams foreign = ForeignCallback();
    EXPECT_EQ(object->SetCameraState(&foreign, name.Get(), CameraStatus_Running), E_INVALIDARG);
    EXPECT_TRUE(HasError("SetCameraRunning: Invalid TavInParams"));
}

TEST_F(CamerasTest, StatusRepliesUseTheirOwnVocabulary) {
    const std::pair<const char*, TavCameraStatus> cases[] = {
        {"Disconnected", CameraStatus_Disconnected}, {"Standby", CameraStatus_Program},
        {"Program", CameraStatus_Unknown},          {"Running", CameraStatus_Running},
        {"Unconfigured", CameraStatus_Unconfigured}, {"Unknown", CameraStatus_Unknown},
        {"running", CameraStatus_Unknown},          {"Running ", CameraStatus_Unknown},
    };
    ControllerObject* object = Make();
    for (const auto& [word, status] : cases) {
        TestVariant reply = TestVariant::Text(word);
        TavCameraStatus out = CameraStatus_Disconnected;
        ASSERT_EQ(object->UnpackCameraStatus(reply.Get(), &out), S_OK) << word;
        EXPECT_EQ(out, status) << word;
    }
    TestVariant number = TestVariant::Number(2);
    TavCameraStatus out{};
    EXPECT_EQ(object->UnpackCameraStatus(number.Get(), &out), E_FAIL);
    EXPECT_TRUE(HasError("UnpackCameraStatus. Non-BSTR argument."));
    EXPECT_EQ(object->UnpackCameraStatus(nullptr, &out), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackCameraStatus. NULL VARIANT"));
}

TEST_F(CamerasTest, ValidityAndCountReplies) {
    ControllerObject* object = Make();
    Script("LMIsCameraValid", "-CameraValid 1");
    LONG valid = 0;
    ASSERT_EQ(object->IsCameraValid(nullptr, TestBstr("cam").Get(), &valid), S_OK);
    EXPECT_EQ(LastCommand().args, "-Camera cam");
    EXPECT_EQ(valid, 1);
    TestVariant bad = TestVariant::Text("-CameraValid x");
    EXPECT_EQ(object->UnpackIsCameraValid(bad.Get(), &valid), E_FAIL);
    EXPECT_TRUE(HasError("UnpackIsCameraValid. Bad result string: -CameraValid x"));
    EXPECT_EQ(object->IsCameraValid(nullptr, nullptr, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("IsCameraValid. Invalid out-pointer"));

    Script("LMNumberOfCameras", "-CameraCount 3");
    ULONG count = 0;
    ASSERT_EQ(object->GetNumberOfCameras(nullptr, &count), S_OK);
    EXPECT_EQ(count, 3u);
    TestVariant noCount = TestVariant::Text("-Count 3");
    EXPECT_EQ(object->UnpackNumberOfCameras(noCount.Get(), &count), E_FAIL);
    EXPECT_TRUE(HasError("UnpackNumberOfCameras failed."));
    EXPECT_EQ(object->UnpackNumberOfCameras(noCount.Get(), nullptr), E_POINTER);
    EXPECT_TRUE(HasError("UnpackNumberOfCameras. Invalid out pointer"));
}

}  // namespace
}  // namespace tav::test
