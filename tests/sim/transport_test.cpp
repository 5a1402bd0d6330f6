// Execute Sync and Async, time-outs, the fault switches and the component's
// error text.
#include "sim/status_codes.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

using TransportTest = SimTest;

// A delay within the caller's time-out only slows the reply.
TEST_F(TransportTest, SyncCallReturnsTheReplyWithTheCallersUserDef) {
    controller_->Faults().SetDelay(T(""), 120ms);
    TavInParams rip{};
    rip.callType = Sync;
    rip.timeOut = 5000;
    rip.userDef = 4711;
    const auto start = std::chrono::steady_clock::now();
    const Outcome reply = Execute("Get", "State", "", &rip);
    EXPECT_GE(Since(start), 120ms);
    EXPECT_EQ(S_OK, reply.hr);
    EXPECT_EQ(S_OK, reply.status);
    EXPECT_EQ("STAND_BY", reply.text);
    EXPECT_EQ(4711u, reply.userDef);
}

TEST_F(TransportTest, AsyncCallReturnsAtOnceAndRepliesOnAWorkerThreadInOrder) {
    controller_->Faults().SetDelay(T("CtrlName"), 800ms);
    Ref<ReplyRecorder> callback = ReplyRecorder::Make();
    TavInParams first = AsyncParams(callback.get(), 1);
    TavInParams second = AsyncParams(callback.get(), 2);
    const auto start = std::chrono::steady_clock::now();
    const Outcome sent = Execute("Set", "CtrlName", "-Name \"async\"", &first);
    // "At once" is half the delay: room for a slow emulator or sanitizer.
    EXPECT_LT(Since(start), 400ms);
    EXPECT_EQ(S_OK, sent.hr);
    EXPECT_EQ(VT_EMPTY, sent.type);
    EXPECT_EQ(S_OK, Execute("Get", "State", "", &second).hr);

    ASSERT_TRUE(callback->WaitFor(2));
    const auto replies = callback->Replies();
    EXPECT_GE(Since(start), 800ms);
    EXPECT_EQ(1u, replies[0].userDef);
    EXPECT_EQ(S_OK, replies[0].status);
    EXPECT_EQ(VT_EMPTY, replies[0].vt);
    EXPECT_EQ(2u, replies[1].userDef);
    EXPECT_EQ("STAND_BY", replies[1].text);
    EXPECT_NE(std::this_thread::get_id(), replies[0].thread);
    EXPECT_EQ("-Name \"async\"", Get("CtrlName").text);
}

TEST_F(TransportTest, AsyncCallWithoutCallbackIsStillCarriedOut) {
    TavInParams rip{};
    rip.callType = Async;
    ASSERT_EQ(S_OK, Execute("Set", "CtrlName", "-Name \"fire and forget\"", &rip).hr);
    for (int i = 0; i < 100 && Get("CtrlName").text != "-Name \"fire and forget\""; ++i) {
        std::this_thread::sleep_for(10ms);
    }
    EXPECT_EQ("-Name \"fire and forget\"", Get("CtrlName").text);
}

// A reply slower than the caller's time-out is a time-out failure, after
// the time-out and not after the delay, and the command is not carried out.
TEST_F(TransportTest, SlowReplyTimesOutSyncAndAsync) {
    controller_->Faults().SetDelay(T("CtrlName"), 2000ms);
    TavInParams sync{};
    sync.callType = Sync;
    sync.timeOut = 100;
    auto start = std::chrono::steady_clock::now();
    const Outcome reply = Execute("Set", "CtrlName", "-Name \"late\"", &sync);
    EXPECT_GE(Since(start), 100ms);
    EXPECT_LT(Since(start), 1500ms);
    EXPECT_EQ(S_OK, reply.hr);
    EXPECT_EQ(kStatusTimedOut, reply.status);
    EXPECT_NE(std::string::npos, reply.text.find("100 ms")) << reply.text;

    Ref<ReplyRecorder> callback = ReplyRecorder::Make();
    TavInParams async = AsyncParams(callback.get(), 9);
    async.timeOut = 100;
    start = std::chrono::steady_clock::now();
    ASSERT_EQ(S_OK, Execute("Set", "CtrlName", "-Name \"late\"", &async).hr);
    ASSERT_TRUE(callback->WaitFor(1));
    EXPECT_LT(Since(start), 1500ms);
    EXPECT_EQ(kStatusTimedOut, callback->Replies()[0].status);
    EXPECT_EQ(9u, callback->Replies()[0].userDef);

    controller_->Faults().SetDelay(T("CtrlName"), 0ms);
    EXPECT_NE("-Name \"late\"", Get("CtrlName").text);
}

TEST_F(TransportTest, FailingTransportFailsExecuteWithTheComponentsErrorText) {
    const HRESULT down = HRESULT_FROM_WIN32(1722);
    controller_->Faults().FailTransport(down, T("the cable is cut"));
    const Outcome reply = Execute("Get", "State");
    EXPECT_EQ(down, reply.hr);
    EXPECT_EQ("the cable is cut; ", ErrorTextOf(command_.Get()));

    Ref<ReplyRecorder> callback = ReplyRecorder::Make();
    TavInParams async = AsyncParams(callback.get(), 1);
    EXPECT_EQ(down, Execute("Get", "State", "", &async).hr);

    controller_->Faults().RestoreTransport();
    EXPECT_EQ(S_OK, Execute("Get", "State").hr);
    EXPECT_FALSE(callback->WaitFor(1, 100ms));
}

TEST_F(TransportTest, FailingCommandAnswersItsStatusAndIsNotCarriedOut) {
    controller_->Faults().FailCommand(T("CtrlName"), E_ACCESSDENIED, T("write protected"));
    const Outcome set = Set("CtrlName", "-Name \"blocked\"");
    EXPECT_EQ(S_OK, set.hr);
    EXPECT_EQ(E_ACCESSDENIED, set.status);
    EXPECT_EQ("write protected; ", set.text);
    EXPECT_EQ(S_OK, Get("State").status);

    controller_->Faults().ClearCommandFailure(T("CtrlName"));
    EXPECT_EQ(S_OK, Get("CtrlName").status);
    EXPECT_NE("-Name \"blocked\"", Get("CtrlName").text);
}

TEST_F(TransportTest, GarbledCommandAnswersHalfItsReplyAndAMark) {
    const std::string whole = Get("CtrlName").text;
    controller_->Faults().GarbleReplies(T("CtrlName"));
    const Outcome garbled = Get("CtrlName");
    EXPECT_EQ(S_OK, garbled.status);
    EXPECT_EQ(whole.substr(0, whole.size() / 2) + "\x7f", garbled.text);
    EXPECT_EQ(S_OK, Set("CtrlName", "-Name \"kept\"").status);  // a reply without text is left alone

    controller_->Faults().ClearGarbling(T("CtrlName"));
    EXPECT_EQ("-Name \"kept\"", Get("CtrlName").text);
}

TEST_F(TransportTest, AsynchronousRequestsPastTheLimitAreRefusedNotQueued) {
    controller_->Faults().SetDelay(T("State"), 10s);  // the first one holds the worker
    Ref<ReplyRecorder> callback = ReplyRecorder::Make();
    TavInParams async = AsyncParams(callback.get(), 1);
    int accepted = 0;
    for (int i = 0; i < 300; ++i) {
        const Outcome outcome = Execute("Get", "State", "", &async);
        if (outcome.hr == S_OK) {
            ++accepted;
        } else {
            EXPECT_EQ(kStatusBusy, outcome.hr);
            EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find("256 asynchronous requests are waiting"));
        }
    }
    EXPECT_GE(accepted, 256);
    EXPECT_LE(accepted, 257);
}

TEST_F(TransportTest, BadCallsFailExecuteAndLeaveAText) {
    const Bstr verb = B("Get");
    const Bstr command = B("State");
    const Bstr url{TextView(url_)};
    EXPECT_EQ(E_POINTER, command_->Execute(nullptr, nullptr, verb.Get(), url.Get(), command.Get(), nullptr));
    EXPECT_NE("", ErrorTextOf(command_.Get()));

    TavCommandReply reply{};
    const Bstr noController = B("sim");
    EXPECT_EQ(E_INVALIDARG,
              command_->Execute(nullptr, &reply, verb.Get(), noController.Get(), command.Get(), nullptr));
    EXPECT_NE(std::string::npos, ErrorTextOf(command_.Get()).find("\"sim\"")) << ErrorTextOf(command_.Get());

    tav::test::SinkRef notACallback;
    TavInParams rip{};
    rip.pCallback = notACallback.sink;
    rip.callType = Async;
    EXPECT_EQ(E_NOINTERFACE, command_->Execute(&rip, &reply, verb.Get(), url.Get(), command.Get(), nullptr));
}

TEST_F(TransportTest, ReleasingTheComponentAbandonsPendingRepliesAndTheirCallbacks) {
    controller_->Faults().SetDelay(T("State"), 5000ms);
    Ref<ReplyRecorder> callback = ReplyRecorder::Make();
    TavInParams rip = AsyncParams(callback.get(), 1);
    ASSERT_EQ(S_OK, Execute("Get", "State", "", &rip).hr);
    ASSERT_EQ(S_OK, Execute("Get", "State", "", &rip).hr);
    EXPECT_GT(callback->References(), 1u);

    const auto start = std::chrono::steady_clock::now();
    command_ = nullptr;
    EXPECT_LT(Since(start), 2000ms);
    EXPECT_EQ(1u, callback->References());
    EXPECT_EQ(0u, callback->Count());
}

TEST_F(TransportTest, CheckLinkAnswersSuccessWhileTheTransportIsUp) {
    ComPtr<ITavFile> file;
    ASSERT_EQ(S_OK, command_.As(file));
    TavCommandReply reply{};
    EXPECT_EQ(E_UNEXPECTED, file->CheckLink(nullptr, &reply));  // no controller yet

    ASSERT_EQ(S_OK, Get("State").status);
    reply.status = E_FAIL;
    EXPECT_EQ(S_OK, file->CheckLink(nullptr, &reply));
    EXPECT_EQ(S_OK, reply.status);

    controller_->Faults().FailTransport();
    EXPECT_EQ(kStatusLinkDown, file->CheckLink(nullptr, &reply));
}

TEST_F(TransportTest, ComponentsAnswerTheirInterfacesOnly) {
    ComPtr<ITavCommand2> command2;
    ComPtr<ITavFile> file;
    ComPtr<ITavComError> error;
    ComPtr<ITavUser3> notOffered;
    EXPECT_EQ(S_OK, command_.As(command2));
    EXPECT_EQ(S_OK, command_.As(file));
    EXPECT_EQ(S_OK, command_.As(error));
    EXPECT_EQ(E_NOINTERFACE, command_.As(notOffered));

    ComPtr<ITavUserComponent> user;
    ASSERT_EQ(S_OK, CoCreateInstance(CLSID_TavUser, nullptr, CLSCTX_INPROC_SERVER, IID_ITavUserComponent,
                                     reinterpret_cast<void**>(&user)));
    ComPtr<ITavUser3> user3;
    ComPtr<ITavMastership> mastership;
    EXPECT_EQ(S_OK, user.As(user3));
    EXPECT_EQ(S_OK, user.As(mastership));
    // Before Initialize it has no command component to send through.
    EXPECT_EQ(E_UNEXPECTED, user3->LogonUser(nullptr));
    EXPECT_NE(std::string::npos, ErrorTextOf(user.Get()).find("LogonUser: not initialized")) << ErrorTextOf(user.Get());
}

}  // namespace
}  // namespace tav::sim::test
