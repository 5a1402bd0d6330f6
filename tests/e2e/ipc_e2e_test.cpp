// Messages between two controller objects through the virtual controller:
// slots, routing, the echo slot, flow control and the controller closing a
// slot.
#include <cstring>
#include <string>
#include <thread>

#include "sim/controller_registry.h"
#include "sim/subsystems/ipc.h"
#include "virtual_controller_fixture.h"

namespace tav::e2e {
namespace {

class IpcEndToEndTest : public VirtualControllerTest {
protected:
    static TavInParams Sync(ULONG timeOut = 0) {
        TavInParams rip{};
        rip.callType = ::Sync;
        rip.timeOut = timeOut;
        return rip;
    }

    short Connect(ITavIPC* ipc, const char* name, short maxMsg = 4, short maxSize = 256) {
        TavInParams rip = Sync();
        short slot = 0;
        Bstr text(text::Widen(name));
        EXPECT_EQ(ipc->Connect(&rip, text.Get(), maxMsg, maxSize, &slot), S_OK) << LastError();
        return slot;
    }

    static HRESULT Send(ITavIPC* ipc, short from, short to, const std::string& body, short userDef = 0) {
        TavInParams rip = Sync();
        TavIPCParams params{};
        params.sid = from;
        params.did = to;
        params.userDef = userDef;
        std::string copy = body;
        return ipc->Send(&rip, &params, reinterpret_cast<byte*>(copy.data()), static_cast<LONG>(copy.size()));
    }

    // The IPC interface of another controller object on this test's controller.
    ComPtr<ITavIPC> Other() {
        ComPtr<ITavController> object;
        EXPECT_EQ(Make(17, object), S_OK);
        ComPtr<ITavIPC> ipc;
        EXPECT_EQ(object.As(ipc), S_OK);
        return ipc;
    }

    static HRESULT Receive(ITavIPC* ipc, short slot, std::string& body, TavIPCParams* params = nullptr,
                           ULONG timeOut = 0) {
        TavInParams rip = Sync(timeOut);
        TavIPCOutParams out{};
        const HRESULT hr = ipc->Receive(&rip, slot, &out);
        if (SUCCEEDED(hr)) {
            body.assign(reinterpret_cast<const char*>(out.Data), SysStringByteLen(out.Data));
            SysFreeString(out.Data);
            if (params != nullptr) {
                *params = out.ipcParams;
            }
        }
        return hr;
    }
};

TEST_F(IpcEndToEndTest, MessagesReachTheSlotOfAnotherObject) {
    ComPtr<ITavIPC> sender = As<ITavIPC>();
    ComPtr<ITavIPC> receiver = Other();

    const short from = Connect(sender.Get(), "cell_a");
    const short to = Connect(receiver.Get(), "cell_b");
    ASSERT_NE(from, to);
    ASSERT_EQ(Send(sender.Get(), from, to, "pick 12", 7), S_OK) << LastError();

    std::string body;
    TavIPCParams params{};
    ASSERT_EQ(Receive(receiver.Get(), to, body, &params), S_OK);
    EXPECT_EQ(body, "pick 12");
    EXPECT_EQ(params.sid, from);
    EXPECT_EQ(params.did, to);
    EXPECT_EQ(params.userDef, 7);
    EXPECT_EQ(Receive(receiver.Get(), to, body, nullptr, 10), static_cast<HRESULT>(0xC0040403));
}

// The echo slot answers the sender; a full queue holds its answers at the
// controller until there is room.
TEST_F(IpcEndToEndTest, AFullQueueHoldsMessagesAtTheControllerUntilThereIsRoom) {
    ComPtr<ITavIPC> ipc = As<ITavIPC>();
    const short slot = Connect(ipc.Get(), "slow", 3);
    // Three fill the queue, the fourth enters its margin, the rest wait at
    // the controller and arrive, in order, as the queue drains.
    for (int i = 0; i < 8; ++i) {
        ASSERT_EQ(Send(ipc.Get(), slot, sim::ipc::kEchoSlot, std::to_string(i)), S_OK) << i << LastError();
    }
    for (int i = 0; i < 8; ++i) {
        std::string body;
        TavIPCParams params{};
        ASSERT_EQ(Receive(ipc.Get(), slot, body, &params, 1000), S_OK) << i;
        EXPECT_EQ(body, std::to_string(i));
        EXPECT_EQ(params.sid, sim::ipc::kEchoSlot) << "the echo slot answers the sender";
    }
}

TEST_F(IpcEndToEndTest, SlotsAreRefusedOrClosedByTheirRules) {
    ComPtr<ITavIPC> first = As<ITavIPC>();
    ComPtr<ITavIPC> second = Other();
    const short slot = Connect(first.Get(), "owned");

    TavInParams rip = Sync();
    short taken = 0;
    Bstr name(OLESTR("owned"));
    EXPECT_TRUE(FAILED(second->Connect(&rip, name.Get(), 4, 64, &taken)));
    EXPECT_TRUE(FAILED(second->Disconnect(&rip, slot)));
    EXPECT_TRUE(FAILED(Send(second.Get(), 0, 999, "nobody")));

    // The controller closes the slot: the owner forgets it.
    auto controller = sim::ControllerAt(Url());
    ASSERT_TRUE(controller);
    EXPECT_TRUE(sim::ipc::CloseSlot(*controller, slot));
    std::string body;
    EXPECT_EQ(Receive(first.Get(), slot, body), static_cast<HRESULT>(0xC004AB00));

    const short again = Connect(second.Get(), "owned");
    EXPECT_EQ(first->Disconnect(&rip, again), static_cast<HRESULT>(0xC0049003)) << LastError();
    EXPECT_EQ(second->Disconnect(&rip, again), S_OK) << LastError();
}

TEST_F(IpcEndToEndTest, ConcurrentSendersLoseNothing) {
    ComPtr<ITavIPC> ipc = As<ITavIPC>();
    const short slot = Connect(ipc.Get(), "sink", 8);
    constexpr int kSenders = 4;
    constexpr int kEach = 200;
    std::vector<std::thread> senders;
    for (int s = 0; s < kSenders; ++s) {
        senders.emplace_back([&, s] {
            ComPtr<ITavIPC> sender = Other();
            for (int i = 0; i < kEach; ++i) {
                ASSERT_EQ(Send(sender.Get(), 0, slot, std::to_string(s)), S_OK);
            }
        });
    }
    int counts[kSenders] = {};
    for (int i = 0; i < kSenders * kEach; ++i) {
        std::string body;
        ASSERT_EQ(Receive(ipc.Get(), slot, body, nullptr, 5000), S_OK) << i;
        ++counts[std::stoi(body)];
    }
    for (auto& sender : senders) {
        sender.join();
    }
    for (int count : counts) {
        EXPECT_EQ(count, kEach);
    }
}

TEST_F(IpcEndToEndTest, AFastProducerLosesNothingAndKeepsItsOrder) {
    ComPtr<ITavIPC> receiver = As<ITavIPC>();
    ComPtr<ITavIPC> sender = Other();
    for (short queue : {short{3}, short{199}}) {
        const short slot = Connect(receiver.Get(), queue == 3 ? "small" : "large", queue);
        constexpr int kMessages = 5000;
        std::thread producer([&] {
            // The controller holds a bounded number for a full slot and
            // refuses more; the sender tries again.
            for (int i = 0; i < kMessages; ++i) {
                HRESULT hr;
                while ((hr = Send(sender.Get(), 0, slot, std::to_string(i))) == static_cast<HRESULT>(0xC0040404)) {
                    std::this_thread::yield();
                }
                ASSERT_EQ(hr, S_OK);
            }
        });
        for (int i = 0; i < kMessages; ++i) {
            std::string body;
            ASSERT_EQ(Receive(receiver.Get(), slot, body, nullptr, 5000), S_OK) << "queue " << queue << " at " << i;
            ASSERT_EQ(body, std::to_string(i));
        }
        producer.join();
    }
}

}  // namespace
}  // namespace tav::e2e
