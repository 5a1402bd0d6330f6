// The ways a command leaves the object besides Execute, and the steps of
// the call pattern that later operations lean on: a check that waits for the
// one before it, the retrieval record, a reply string handed over whole,
// internal commands and message sends.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class TransportsTest : public ControllerTest {};

// A check given as a callable is not evaluated once an earlier step has
// failed, so it may read through a pointer that step checked.
TEST_F(TransportsTest, ALazyCheckRunsOnlyAfterTheStepsBeforeIt) {
    ControllerObject* object = Make();
    TavRetrievalParams* missing = nullptr;
    bool evaluated = false;
    const HRESULT hr = object->Command(nullptr)
                           .Require(missing != nullptr, E_POINTER, OLESTR("Op: Invalid pointer"))
                           .Require(
                               [&] {
                                   evaluated = true;
                                   return missing->noOfElts == -1;
                               },
                               E_INVALIDARG, OLESTR("Op: only RetrieveAll"))
                           .Result();
    EXPECT_EQ(hr, E_POINTER);
    EXPECT_FALSE(evaluated);
}

TEST_F(TransportsTest, RetrievalParamsAreCheckedForPresenceThenMode) {
    ControllerObject* object = Make();
    TavRetrievalParams all{};
    all.noOfElts = -1;
    TavRetrievalParams some = all;
    some.noOfElts = 10;
    auto check = [&](TavRetrievalParams* params) {
        TavInParams rip = SyncCall(3);
        return object->Command(&rip)
            .RetrievalParams(params, -1, OLESTR("Op: Invalid params"), OLESTR("Op: only RetrieveAll"))
            .Result();
    };
    EXPECT_EQ(check(&all), S_OK);
    EXPECT_EQ(check(nullptr), E_INVALIDARG);
    EXPECT_TRUE(HasError("Op: Invalid params"));
    const int nullLine = Error().line;
    EXPECT_EQ(Callback().Last().status, E_INVALIDARG);
    EXPECT_EQ(check(&some), E_INVALIDARG);
    EXPECT_TRUE(HasError("Op: only RetrieveAll"));
    EXPECT_NE(Error().line, nullLine);
}

// Free text is handed over as the controller's own string; anything but a
// string fails, after the reply status.
TEST_F(TransportsTest, TheReplyStringIsHandedOverWhole) {
    ControllerObject* object = Make();
    auto take = [&](BSTR* out) {
        return object->Command(nullptr).Get(OLESTR("Users")).TakeText(out, OLESTR("Get: Bad VARIANT received"));
    };
    TestBstr text;
    Script("Users", "<users><user name=\"a b\"/></users>");
    ASSERT_EQ(take(text.Out()), S_OK);
    EXPECT_EQ(text.Text(), "<users><user name=\"a b\"/></users>");

    Component().ClearScript();
    Script("Users", ScriptedReply::Text(std::string_view()));
    ASSERT_EQ(take(text.Out()), S_OK);
    EXPECT_FALSE(text.IsNull()) << "an empty reply is an empty string";

    Component().ClearScript();
    Script("Users", ScriptedReply::Number(7));
    EXPECT_EQ(take(text.Out()), E_FAIL);
    EXPECT_TRUE(HasError("Get: Bad VARIANT received"));
    const int badLine = Error().line;

    Component().ClearScript();
    Script("Users", "Access denied", static_cast<HRESULT>(0xC0040001));
    EXPECT_EQ(take(text.Out()), static_cast<HRESULT>(0xC0040001));
    EXPECT_TRUE(HasAdoptedError("Access denied"));
    EXPECT_NE(Error().line, badLine);
}

TEST_F(TransportsTest, WithoutAFileInterfaceTheCallFailsBeforeSending) {
    UseComponents({.file = false});
    ControllerObject* object = MakeUninitialised();
    // Init needs the file interface; the call asks for it again each time.
    EXPECT_EQ(object->Init(TestBstr("/ctrl").Get()), E_FAIL);
    const HRESULT hr =
        object->Command(nullptr)
            .ThroughFile([&](ITavFile& file, TavCommandReply& reply) { return file.CheckLink(nullptr, &reply); },
                         OLESTR("Op. Could not QI ITavFile"))
            .StatusOnly();
    EXPECT_EQ(hr, E_FAIL);
    EXPECT_TRUE(HasError("Op. Could not QI ITavFile", object));
}

TEST_F(TransportsTest, InternalCommandsGoThroughCommand2WithoutACallbackAndNeedIt) {
    ControllerObject* object = Make();
    Component().SetExecuteExResult(17);
    ULONG result = 0;
    EXPECT_EQ(object->InternalCommand(OLESTR("QueueStatus"), OLESTR("-SlotId 3 -Level 4 -QFull"), &result), S_OK);
    EXPECT_EQ(result, 17u);
    ASSERT_EQ(Component().Command2Calls().size(), 1u);
    const RecordedCommand2 call = Component().Command2Calls()[0];
    EXPECT_EQ(call.command, "QueueStatus");
    EXPECT_EQ(call.args, "-SlotId 3 -Level 4 -QFull");
    EXPECT_EQ(call.url, kUrl);
    ASSERT_TRUE(call.params.fields);
    EXPECT_EQ(call.params.fields->pCallback, nullptr);
    EXPECT_EQ(call.params.fields->callType, Sync);
    EXPECT_EQ(CommandCount(), 0u) << "nothing goes through Execute";

    Component().Fail(ComOperation::ExecuteEx, E_ACCESSDENIED, "refused");
    EXPECT_EQ(object->InternalCommand(OLESTR("CtrlCmd"), OLESTR("-ProxyId 2")), E_ACCESSDENIED);

    UseComponents({.command2 = false});
    EXPECT_EQ(Make(7)->InternalCommand(OLESTR("QueueStatus"), OLESTR("")), E_NOINTERFACE);
}

TEST_F(TransportsTest, MessagesGoToTheCommandComponentWhichMayRefuseThem) {
    ControllerObject* object = Make();
    TavIPCHeaderInternal header{};
    header.ipcParams.did = 5;
    header.bodySize = 3;
    header.service = 4;
    byte body[] = {1, 2, 3};
    TavInParams rip = SyncCall(8);
    EXPECT_EQ(object->Command(&rip).SendMessage(&header, body, 3), S_OK);
    ASSERT_EQ(Component().IpcSends().size(), 1u);
    EXPECT_EQ(Component().IpcSends()[0].header.ipcParams.did, 5);
    EXPECT_EQ(Component().IpcSends()[0].data, (std::vector<BYTE>{1, 2, 3}));

    Component().Fail(ComOperation::SendIPCMessage, E_ACCESSDENIED, "Slot 5 is full");
    EXPECT_EQ(object->Command(&rip).SendMessage(&header, body, 3), E_ACCESSDENIED);
    EXPECT_TRUE(HasAdoptedError("Slot 5 is full"));
    EXPECT_EQ(Callback().Last().status, E_ACCESSDENIED);
}

}  // namespace
}  // namespace tav::test
