// IPC slots: connecting, the queue rules message by message, receiving,
// disconnecting and the controller's closing notice.
#include "core/text/format.h"
#include "operations/ipc/slot_replies.h"
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr HRESULT kQueueTooLarge = static_cast<HRESULT>(0xC0048430);
constexpr HRESULT kRefused = static_cast<HRESULT>(0xC0040404);
constexpr HRESULT kNoMessage = static_cast<HRESULT>(0xC0040403);
constexpr HRESULT kInvalidSlot = static_cast<HRESULT>(0xC004AB00);

class SlotsTest : public ControllerTest {
protected:
    // Connects slot `id` with room for maxMsg messages; the fake controller
    // answers with the object's proxy id.
    short ConnectSlot(ControllerObject& object, short id, short maxMsg) {
        Component().ClearScript();
        Script("Connect", "-SlotId " + std::to_string(id) + " -ProxySlotId " +
                              std::to_string(ipc::ProxyId(object)) + " -name Cell -MaxMsg " + std::to_string(maxMsg) +
                              " -MaxSize 64");
        short slot = -1;
        const TestBstr name("Cell");
        EXPECT_EQ(object.Connect(nullptr, name.Get(), maxMsg, 64, &slot), S_OK);
        return slot;
    }

    HRESULT Deliver(short slot, const std::string& body, short service = 4) {
        TavIPCHeaderInternal header{};
        header.ipcParams.msgType = TavIPCMessageType;
        header.ipcParams.did = slot;
        header.ipcParams.sid = 77;
        header.ipcParams.cmd = 5;
        header.bodySize = static_cast<LONG>(body.size());
        header.service = service;
        return Component().DeliverIpcMessage(header, std::vector<BYTE>(body.begin(), body.end()));
    }

    // The level reports sent so far, as their argument texts.
    std::vector<std::string> Reports() {
        std::vector<std::string> reports;
        for (const RecordedCommand2& call : Component().Command2Calls()) {
            if (call.command == "QueueStatus") {
                reports.push_back(call.args);
            }
        }
        return reports;
    }

    static std::string Body(const TavIPCOutParams& out) {
        return std::string(reinterpret_cast<const char*>(out.Data), SysStringByteLen(out.Data));
    }
};

TEST_F(SlotsTest, ConnectAnnouncesItsProxyOnceAndSendsTheSlotRequest) {
    ControllerObject* object = Make();
    EXPECT_EQ(ConnectSlot(*object, 5, 3), 5);
    EXPECT_EQ(LastCommand().command, "Connect");
    EXPECT_EQ(LastCommand().args, "-Name Cell -MaxMsg 3 -MaxSize 64 -SlotId -1");
    EXPECT_NE(Component().IpcSink(), nullptr);
    EXPECT_EQ(ConnectSlot(*object, 6, 199), 6);
    std::vector<std::string> announcements;
    for (const RecordedCommand2& call : Component().Command2Calls()) {
        announcements.push_back(call.command + " " + call.args);
    }
    EXPECT_EQ(announcements, std::vector<std::string>{"CtrlCmd -ProxyId " + std::to_string(ipc::ProxyId(*object))});
}

TEST_F(SlotsTest, ConnectRefusesWhatItCannotSend) {
    ControllerObject* object = Make();
    short slot = 0;
    const TestBstr name(std::string(50, 'n'));
    Script("Connect", "-SlotId 1 -ProxySlotId " + std::to_string(ipc::ProxyId(*object)) + " -name n -MaxMsg 1 -MaxSize 1");
    ASSERT_EQ(object->Connect(nullptr, name.Get(), 1, 1, &slot), S_OK);
    EXPECT_EQ(LastCommand().args, "-Name " + std::string(38, 'n') + " -MaxMsg 1 -MaxSize 1 -SlotId -1");
    const size_t sent = CommandCount();
    EXPECT_EQ(object->Connect(nullptr, name.Get(), 200, 1, &slot), kQueueTooLarge);
    EXPECT_TRUE(HasError("TavController cannot create queues that large"));
    EXPECT_EQ(object->Connect(nullptr, TestBstr("").Get(), 1, 1, &slot), E_INVALIDARG);
    EXPECT_EQ(object->Connect(nullptr, TestBstr("Zelle \xE4\xB8\xAD").Get(), 1, 1, &slot),
              static_cast<HRESULT>(0xC0040408));
    EXPECT_EQ(object->Connect(nullptr, name.Get(), 1, 1, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("Connect. Invalid out-parameter."));
    TavInParams foreign = ForeignCallback();
    EXPECT_EQ(object->Connect(&foreign, name.Get(), 1, 1, &slot), E_INVALIDARG);
    EXPECT_TRUE(HasError("TavController::Connect. Invalid argument."));
    EXPECT_EQ(CommandCount(), sent);
}

TEST_F(SlotsTest, ConnectRepliesAreChecked) {
    ControllerObject* object = Make();
    const std::string proxy = std::to_string(ipc::ProxyId(*object));
    const std::pair<std::string, const char*> cases[] = {
        {"-SlotId 4 -ProxySlotId " + proxy + " -name Cell -MaxMsg 3", "UnpackConnect. Invalid argument."},
        {"-SlotId 4 -ProxySlotId 9999 -name Cell -MaxMsg 3 -MaxSize 4", "UnpackConnect. Invalid proxy id."},
    };
    for (const auto& [reply, error] : cases) {
        Component().ClearScript();
        Script("Connect", reply);
        short slot = 33;
        EXPECT_EQ(object->Connect(nullptr, TestBstr("Cell").Get(), 3, 4, &slot), reply.find("9999") != std::string::npos ? E_UNEXPECTED : E_FAIL);
        EXPECT_TRUE(HasError(error));
        EXPECT_EQ(slot, 33);
    }
    EXPECT_EQ(ConnectSlot(*object, 4, 3), 4);
    short again = 0;
    EXPECT_EQ(object->Connect(nullptr, TestBstr("Cell").Get(), 3, 4, &again), E_UNEXPECTED);
    EXPECT_TRUE(HasError("UnpackConnect. Error insert new slot in list."));
}

// With maxMsg 3 a fourth message still enters (after a full report), a fifth
// is refused after a second one; draining reports room again.
TEST_F(SlotsTest, QueuesKeepAMarginOfOneAndReportTheirLevel) {
    ControllerObject* object = Make();
    const short slot = ConnectSlot(*object, 8, 3);
    Component().ClearRecords();
    for (const char* body : {"one", "two", "three"}) {
        EXPECT_EQ(Deliver(slot, body), S_OK);
    }
    EXPECT_TRUE(Reports().empty());
    EXPECT_EQ(Deliver(slot, "four"), S_OK);
    EXPECT_EQ(Reports(), std::vector<std::string>{"-SlotId 8 -Level 3 -QFull"});
    EXPECT_EQ(Deliver(slot, "five"), kRefused);
    EXPECT_EQ(Reports(), (std::vector<std::string>{"-SlotId 8 -Level 3 -QFull", "-SlotId 8 -Level 4 -QFull"}));

    TavInParams rip = SyncCall();
    rip.pCallback = nullptr;
    rip.timeOut = 0;
    std::vector<std::string> received;
    for (int i = 0; i < 4; ++i) {
        TavIPCOutParams out{};
        ASSERT_EQ(object->Receive(&rip, slot, &out), S_OK);
        EXPECT_EQ(out.ipcParams.did, slot);
        EXPECT_EQ(out.ipcParams.sid, 77);
        received.push_back(Body(out));
        SysFreeString(out.Data);
    }
    EXPECT_EQ(received, (std::vector<std::string>{"one", "two", "three", "four"}));
    // The receive that found maxMsg - 1 queued told the controller first.
    EXPECT_EQ(Reports().back(), "-SlotId 8 -Level 2");
    EXPECT_EQ(Deliver(slot, "six"), S_OK);
    EXPECT_EQ(Reports().back(), "-SlotId 8 -Level 0") << "room again, once";
    const size_t reports = Reports().size();
    EXPECT_EQ(Deliver(slot, "seven"), S_OK);
    EXPECT_EQ(Reports().size(), reports);
}

TEST_F(SlotsTest, ReceiveChecksItsSlotFirstAndRefusesCallbacks) {
    ControllerObject* object = Make();
    EXPECT_EQ(object->Receive(nullptr, 12, nullptr), kInvalidSlot) << "even with a NULL header";
    EXPECT_TRUE(HasError("Receive: Invalid slott id."));
    const short slot = ConnectSlot(*object, 12, 5);
    EXPECT_EQ(object->Receive(nullptr, slot, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("Receive: Invalid param."));
    TavIPCOutParams out{};
    TavInParams async = AsyncCall();
    EXPECT_EQ(object->Receive(&async, slot, &out), E_INVALIDARG);
    EXPECT_TRUE(HasError("Receive: Use of callback is not supported."));
    TavInParams withCallback = SyncCall();
    EXPECT_EQ(object->Receive(&withCallback, slot, &out), E_INVALIDARG);
    TavInParams quick{};
    quick.callType = Sync;
    quick.timeOut = 0;
    EXPECT_EQ(object->Receive(&quick, slot, &out), kNoMessage);
    EXPECT_EQ(out.Data, nullptr) << "untouched";
}

TEST_F(SlotsTest, DisconnectAndTheClosingNoticeRemoveTheSlot) {
    ControllerObject* object = Make();
    const short slot = ConnectSlot(*object, 3, 5);
    const std::string proxy = std::to_string(ipc::ProxyId(*object));
    ASSERT_EQ(Deliver(slot, "left behind"), S_OK);

    Script("Disconnect", "-SlotId 3 -ProxySlotId -2");
    EXPECT_EQ(object->Disconnect(nullptr, slot), S_OK);
    EXPECT_EQ(LastCommand().args, "-slotid 3");
    TavInParams quick{};
    quick.callType = Sync;
    TavIPCOutParams out{};
    ASSERT_EQ(object->Receive(&quick, slot, &out), S_OK) << "-2: nothing is done";
    SysFreeString(out.Data);

    Component().ClearScript();
    Script("Disconnect", "-SlotId 3 -ProxySlotId " + proxy);
    ASSERT_EQ(Deliver(slot, "freed with the slot"), S_OK);
    EXPECT_EQ(object->Disconnect(nullptr, slot), S_OK);
    EXPECT_EQ(object->Receive(&quick, slot, &out), kInvalidSlot);
    EXPECT_EQ(object->Disconnect(nullptr, slot), E_UNEXPECTED);
    EXPECT_TRUE(HasError("UnpackConnect. Could not find the slotid."));

    const short other = ConnectSlot(*object, 9, 5);
    EXPECT_EQ(Deliver(other, "", 3), S_OK) << "the controller closed slot 9";
    EXPECT_EQ(object->Receive(&quick, other, &out), kInvalidSlot);
    EXPECT_EQ(Deliver(42, "", 3), S_OK) << "a notice for no slot of ours";
}

TEST_F(SlotsTest, SendBuildsTheClientHeader) {
    ControllerObject* object = Make();
    TavIPCParams params{TavIPCPackageType, 4, 2, 17, 6, -9};
    byte body[] = {'h', 'i'};
    TavInParams rip = SyncCall(5);
    ASSERT_EQ(object->Send(&rip, &params, body, 2), S_OK);
    ASSERT_EQ(Component().IpcSends().size(), 1u);
    const RecordedIpcSend sent = Component().IpcSends()[0];
    EXPECT_EQ(sent.header.ipcParams.did, 4);
    EXPECT_EQ(sent.header.ipcParams.userData, -9);
    EXPECT_EQ(sent.header.bodySize, 2);
    EXPECT_EQ(sent.header.service, 4);
    EXPECT_EQ(sent.params.pointer, &rip);
    EXPECT_EQ(object->Send(&rip, nullptr, body, 2), E_POINTER);
    EXPECT_TRUE(HasError("SendSysUserEvent: Invalid arguments."));
    EXPECT_EQ(object->Send(&rip, &params, nullptr, 2), E_POINTER);
    EXPECT_EQ(object->Send(&rip, &params, body, -1), E_INVALIDARG);
    EXPECT_TRUE(HasError("Send. Invalid parameter."));
    TavInParams foreign = ForeignCallback();
    EXPECT_EQ(object->Send(&foreign, &params, body, 2), E_INVALIDARG);
    EXPECT_TRUE(HasError("TavController::Send. Invalid argument."));
}

// Messages arrive while clients wait; releasing the object frees every
// slot, message and semaphore (LeakSanitizer checks at exit).
TEST_F(SlotsTest, AWaitingReceiveGetsAMessageDeliveredMeanwhile) {
    ControllerObject* object = Make();
    const short slot = ConnectSlot(*object, 2, 10);
    TavIPCOutParams out{};
    HRESULT received = E_FAIL;
    std::thread receiver([&] { received = object->Receive(nullptr, slot, &out); });
    ASSERT_EQ(Deliver(slot, "late"), S_OK);
    receiver.join();
    EXPECT_EQ(received, S_OK);
    EXPECT_EQ(Body(out), "late");
    SysFreeString(out.Data);
    for (int i = 0; i < 5; ++i) {
        ASSERT_EQ(Deliver(slot, "never received"), S_OK);
    }
}

TEST_F(SlotsTest, DisconnectWakesAWaitingReceive) {
    ControllerObject* object = Make();
    const short slot = ConnectSlot(*object, 2, 10);
    Script("Disconnect", "-SlotId 2 -ProxySlotId " + std::to_string(ipc::ProxyId(*object)));
    TavIPCOutParams out{};
    HRESULT received = S_OK;
    std::thread receiver([&] { received = object->Receive(nullptr, slot, &out); });
    // Usually the receive waits by now; if not, it finds the slot gone.
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_EQ(object->Disconnect(nullptr, slot), S_OK);
    receiver.join();
    EXPECT_TRUE(received == kNoMessage || received == kInvalidSlot) << std::hex << received;
}

}  // namespace
}  // namespace tav::test
