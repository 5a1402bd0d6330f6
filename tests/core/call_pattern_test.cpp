// The call pattern that every command operation shares, seen through the
// clock operations, the first ones written in it.
#include "operations/controller/filetime.h"
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr HRESULT kRefused = static_cast<HRESULT>(0xC0048430);

class CallPatternTest : public ControllerTest {};

TEST_F(CallPatternTest, ParamsWithoutCallbackPassWhateverRiidSays) {
    GUID wrongIid = IID_IUnknown;
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 1");
    for (GUID* riid : {static_cast<GUID*>(nullptr), &wrongIid}) {
        TavInParams rip{};
        rip.riid = riid;
        rip.callType = Sync;
        FILETIME clock{};
        EXPECT_EQ(object->GetSystemClock(&rip, &clock), S_OK) << (riid ? "wrong riid" : "NULL riid");
        EXPECT_EQ(TicksOf(clock), kUnixEpochTicks + kTicksPerSecond);
    }
}

TEST_F(CallPatternTest, CallbackWithoutRiidIsRefused) {
    ControllerObject* object = Make();
    TavInParams rip = SyncCall();
    rip.riid = nullptr;
    FILETIME clock{};
    EXPECT_EQ(object->GetSystemClock(&rip, &clock), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetSystemClock: Invalid TavInParams"));
    EXPECT_EQ(CommandCount(), 0u);
    EXPECT_EQ(Callback().Count(), 0u);
}

// A success status other than zero still decodes, and a Sync call that
// succeeds leaves the callback alone.
TEST_F(CallPatternTest, SuccessfulSyncCallDecodesAndDoesNotCallTheCallback) {
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 3", S_FALSE);
    TavInParams rip = SyncCall(3);
    FILETIME clock{};
    EXPECT_EQ(object->GetSystemClock(&rip, &clock), S_OK);
    EXPECT_EQ(TicksOf(clock), kUnixEpochTicks + 3 * kTicksPerSecond);
    EXPECT_EQ(Callback().Count(), 0u);
}

// A failing reply status is returned as it is, whatever the reply holds, and
// the reply's text (or a fixed one) becomes the last error.
TEST_F(CallPatternTest, FailedReplyStatusIsReturnedWithTheReplyText) {
    struct Case {
        const char* name;
        ScriptedReply reply;
        const char* adopted;
    };
    const Case cases[] = {
        {"text", ScriptedReply::Text("No access", kRefused), "No access"},
        {"number", ScriptedReply::Number(5, kRefused), "Controller error, no errinfo available; "},
        {"empty", ScriptedReply::Empty(kRefused), "Controller error, no errinfo available; "},
        {"NULL BSTR", ScriptedReply::NullText(kRefused), ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        ControllerObject* object = Make();
        Component().ClearScript();
        Script("SystemClock", c.reply);
        FILETIME clock{1, 2};
        EXPECT_EQ(object->GetSystemClock(nullptr, &clock), kRefused);
        EXPECT_TRUE(HasAdoptedError(c.adopted, object));
        EXPECT_EQ(clock.dwLowDateTime, 1u);
        EXPECT_EQ(clock.dwHighDateTime, 2u);
    }
}

// An Async call returns once sent; the reply reaches the callback from the
// component's thread and the client decodes it with the Unpack operation.
TEST_F(CallPatternTest, AsyncReplyArrivesAtTheCallbackAndDecodesWithUnpack) {
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 60");
    TavInParams rip = AsyncCall(0xBEEF);
    FILETIME clock{1, 2};
    EXPECT_EQ(object->GetSystemClock(&rip, &clock), S_OK);
    EXPECT_EQ(clock.dwLowDateTime, 1u);
    EXPECT_EQ(clock.dwHighDateTime, 2u);

    ASSERT_TRUE(Callback().WaitFor(1));
    const ReceivedReply reply = Callback().Last();
    EXPECT_EQ(reply.status, S_OK);
    EXPECT_EQ(reply.userDef, 0xBEEFu);
    EXPECT_NE(reply.thread, std::this_thread::get_id());
    TestVariant data = TestVariant::Text(reply.text);
    EXPECT_EQ(object->UnpackSystemClock(data.Get(), &clock), S_OK);
    EXPECT_EQ(TicksOf(clock), kUnixEpochTicks + 60 * kTicksPerSecond);
}

TEST_F(CallPatternTest, AsyncCallWithoutCallbackIsSentAndReturns) {
    ControllerObject* object = Make();
    TavInParams rip{};
    rip.callType = Async;
    FILETIME clock{1, 2};
    EXPECT_EQ(object->GetSystemClock(&rip, &clock), S_OK);
    EXPECT_EQ(CommandCount(), 1u);
    EXPECT_EQ(clock.dwLowDateTime, 1u);
}

// A failure of Execute in an Async call is the caller's to hear of at once,
// through the result and the callback.
TEST_F(CallPatternTest, AsyncExecuteFailureTellsTheCallback) {
    ControllerObject* object = Make();
    Component().FailExecute(E_ACCESSDENIED, "Link down");
    TavInParams rip = AsyncCall(4);
    EXPECT_EQ(object->Restart(&rip, WarmStart), E_ACCESSDENIED);
    EXPECT_TRUE(HasAdoptedError("Link down"));
    ASSERT_EQ(Callback().Count(), 1u);
    EXPECT_EQ(Callback().Last().status, E_ACCESSDENIED);
    EXPECT_EQ(Callback().Last().userDef, 4u);
    EXPECT_EQ(Callback().Last().text, ErrorText());
}

// The callback record of a failure is zero-filled apart from its fields.
TEST_F(CallPatternTest, FailureRecordForTheCallbackIsClean) {
    ControllerObject* object = MakeUninitialised();
    TavInParams rip = AsyncCall(77);
    EXPECT_EQ(object->Restart(&rip, ColdStart), E_ABORT);
    ASSERT_EQ(Callback().Count(), 1u);
    const ReceivedReply reply = Callback().Last();
    EXPECT_EQ(reply.reserved, 0u);
    EXPECT_EQ(reply.reserved2, 0u);
    EXPECT_EQ(reply.userDef, 77u);
    EXPECT_EQ(reply.thread, std::this_thread::get_id()) << "told on the caller's thread";
}

// A decoding failure on the Sync path is the reply's: the callback is not told.
TEST_F(CallPatternTest, SyncDecodingFailureIsNotToldToTheCallback) {
    ControllerObject* object = Make();
    Script("SystemClock", "-clock 5");
    TavInParams rip = SyncCall();
    FILETIME clock{};
    EXPECT_EQ(object->GetSystemClock(&rip, &clock), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSystemClock. Unsupported time-format."));
    EXPECT_EQ(Callback().Count(), 0u);
}

TEST_F(CallPatternTest, ComponentWithoutErrorInterfaceOrTextLeavesOnlyTheSuffix) {
    for (const bool errorInterface : {false, true}) {
        SCOPED_TRACE(errorInterface ? "no error text" : "no error interface");
        UseComponents({.errorInterface = errorInterface});
        ControllerObject* object = Make();
        Component().FailExecute(E_ACCESSDENIED, errorInterface ? "" : "never read");
        EXPECT_EQ(object->Restart(nullptr, WarmStart), E_ACCESSDENIED);
        EXPECT_TRUE(HasAdoptedError(""));
    }
}

}  // namespace
}  // namespace tav::test
