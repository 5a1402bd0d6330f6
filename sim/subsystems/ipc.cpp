// Inter-process messaging: slots, routing, flow control, slot information.
#include "sim/subsystems/ipc.h"

#include <chrono>
#include <condition_variable>
#include <deque>
#include <thread>
#include <map>
#include <mutex>
#include <vector>

#include "sim/arguments.h"
#include "sim/command_table.h"
#include "sim/status_codes.h"

namespace tav::sim {
namespace ipc {
namespace {

constexpr LONG kMaxMsgSize = 4096;
constexpr LONG kMaxPackageSize = 1024;
constexpr LONG kMaxBodySize = 4000;
constexpr std::size_t kHeldPerSlot = 1000;
constexpr short kClientMessage = 4;
constexpr short kSlotClosed = 3;
constexpr HRESULT kStatusQueueFull = static_cast<HRESULT>(0xC0040404u);

struct Message {
    TavIPCHeaderInternal header{};
    std::vector<byte> body;
};

struct Slot {
    Text name;
    std::uint32_t owner = 0;  // 0: the controller's own (the echo slot)
    short proxy = 0;
    short maxMsg = 0;
    short maxSize = 0;
    bool full = false;        // the owner reported its queue full
    std::chrono::steady_clock::time_point fullSince;
    bool flushing = false;    // someone is handing held messages over
    std::deque<Message> held; // kept while the owner's queue is full
};

// Where a message goes, decided under the router's lock and carried out
// after it.
struct Route {
    bool deliver = false;
    std::uint32_t owner = 0;
};

void Flush(ControllerModel& controller, short slotId);

class Router {
public:
    Router();
    ~Router() {
        {
            std::lock_guard lock(mutex);
            stopping_ = true;
        }
        wake_.notify_all();
        if (retrier_.joinable()) {
            retrier_.join();
        }
    }

    // A full report and a report of room can cross on their way from the
    // client, and a client reports room only at one level: so a slot that
    // stays full with messages held is offered its next message again after
    // a while. A client that has no room refuses it and it stays held.
    void RetryLater(ControllerModel& controller) {
        std::lock_guard lock(mutex);
        if (!retrier_.joinable() && !stopping_) {
            retrier_ = std::thread([this, &controller] { Retry(controller); });
        }
        wake_.notify_all();
    }

    std::mutex mutex;
    std::map<short, Slot> slots_;
    std::map<std::uint32_t, short> proxies_;
    short nextId_ = 2;

    Slot* Find(short id) {
        const auto found = slots_.find(id);
        return found == slots_.end() ? nullptr : &found->second;
    }
    short NewId() {
        while (slots_.count(nextId_) != 0 || nextId_ <= kEchoSlot) {
            nextId_ = nextId_ == 32767 ? 2 : static_cast<short>(nextId_ + 1);
        }
        return nextId_++;
    }

private:
    static constexpr std::chrono::milliseconds kRetryAfter{20};

    void Retry(ControllerModel& controller) {
        std::unique_lock lock(mutex);
        while (!stopping_) {
            std::vector<short> due;
            bool waiting = false;
            for (auto& [id, slot] : slots_) {
                if (slot.full && !slot.held.empty() && !slot.flushing) {
                    waiting = true;
                    if (std::chrono::steady_clock::now() - slot.fullSince >= kRetryAfter) {
                        slot.full = false;
                        slot.flushing = true;
                        due.push_back(id);
                    }
                }
            }
            if (!due.empty()) {
                lock.unlock();
                for (short id : due) {
                    Flush(controller, id);
                }
                lock.lock();
                continue;
            }
            if (waiting) {
                wake_.wait_for(lock, kRetryAfter / 2);
            } else {
                wake_.wait(lock);
            }
        }
    }

    std::condition_variable wake_;
    bool stopping_ = false;
    std::thread retrier_;
};

Slot NewSlot(TextView name, std::uint32_t owner, short proxy, short maxMsg, short maxSize) {
    Slot slot;
    slot.name = Text(name);
    slot.owner = owner;
    slot.proxy = proxy;
    slot.maxMsg = maxMsg;
    slot.maxSize = maxSize;
    return slot;
}

Router::Router() { slots_[kEchoSlot] = NewSlot(kEchoSlotName, 0, 0, 200, static_cast<short>(kMaxBodySize)); }

Router& RouterOf(ControllerModel& controller) { return controller.Shared<Router>(); }

void MarkFull(Slot& slot) {
    if (!slot.full) {
        slot.fullSince = std::chrono::steady_clock::now();
    }
    slot.full = true;
}

HRESULT Deliver(ControllerModel& controller, std::uint32_t owner, TavIPCHeaderInternal header, const byte* data,
                LONG size) {
    const ComPtr<_ITavIPCMessages> sink = controller.Links().MessageSinkOf(owner);
    if (!sink) {
        return kStatusNotFound;
    }
    return sink->OnMessage(&header, const_cast<byte*>(data), size);
}

// Hands the messages held for a slot over while its owner has room; the one
// who set `flushing` does it.
void Flush(ControllerModel& controller, short slotId) {
    Router& router = RouterOf(controller);
    for (;;) {
        Message message;
        std::uint32_t owner = 0;
        {
            std::lock_guard lock(router.mutex);
            Slot* slot = router.Find(slotId);
            if (slot == nullptr || slot->full || slot->held.empty()) {
                if (slot != nullptr) {
                    slot->flushing = false;
                }
                return;
            }
            message = std::move(slot->held.front());
            slot->held.pop_front();
            owner = slot->owner;
        }
        const HRESULT hr =
            Deliver(controller, owner, message.header, message.body.data(), static_cast<LONG>(message.body.size()));
        if (hr == kStatusQueueFull) {
            std::lock_guard lock(router.mutex);
            if (Slot* slot = router.Find(slotId)) {
                slot->held.push_front(std::move(message));
                MarkFull(*slot);
                slot->flushing = false;
            }
        }
        if (hr == kStatusQueueFull) {
            router.RetryLater(controller);
            return;
        }
    }
}

// Takes one message for `slotId` in; under the router's lock. Messages reach
// a slot's owner one at a time, in order, by whoever finds nobody handing
// them over (`route.deliver`): so the owner's reports of a full queue take
// effect before the next message goes out, and a queue never overflows.
HRESULT Admit(Router& router, short slotId, const TavIPCHeaderInternal& header, const byte* data, LONG size,
              Route& route, Text& error) {
    Slot* slot = router.Find(slotId);
    if (slot == nullptr) {
        error = Concat({OLESTR("SendIPCMessage: no slot "), Decimal(slotId)});
        return kStatusNotFound;
    }
    if (size > slot->maxSize) {
        error = Concat({OLESTR("SendIPCMessage: a message of "), Decimal(size), OLESTR(" bytes is larger than slot "),
                        slot->name, OLESTR(" takes ("), Decimal(slot->maxSize), OLESTR(")")});
        return kStatusBadArgument;
    }
    if (slot->held.size() >= kHeldPerSlot) {
        error = Concat({OLESTR("SendIPCMessage: the queue of slot "), slot->name, OLESTR(" is full")});
        return kStatusQueueFull;
    }
    slot->held.push_back(Message{header, std::vector<byte>(data, data + size)});
    route.owner = slot->owner;
    route.deliver = !slot->full && !slot->flushing;
    slot->flushing = slot->flushing || route.deliver;
    return S_OK;
}

short SlotArgument(const Arguments& arguments) {
    auto id = arguments.Signed(OLESTR("-SlotId"));
    if (!id) {
        id = arguments.Signed(OLESTR("-slotid"));
    }
    return id && *id >= -32768 && *id <= 32767 ? static_cast<short>(*id) : short{-32768};
}

Text SlotReply(short id, short proxy) {
    return Concat({OLESTR("-SlotId "), Decimal(id), OLESTR(" -ProxySlotId "), Decimal(proxy)});
}

Reply SetProxy(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto proxy = arguments ? arguments->Signed(OLESTR("-ProxyId")) : std::nullopt;
    if (!proxy || *proxy < 1 || *proxy > 32767) {
        return BadArguments(command, OLESTR("-ProxyId 1..32767"));
    }
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    router.proxies_[command.caller.clientId] = static_cast<short>(*proxy);
    return Done();
}

Reply Connect(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto name = arguments ? arguments->Find(OLESTR("-Name")) : std::nullopt;
    const auto maxMsg = arguments ? arguments->Signed(OLESTR("-MaxMsg")) : std::nullopt;
    const auto maxSize = arguments ? arguments->Signed(OLESTR("-MaxSize")) : std::nullopt;
    if (!name || name->empty() || !maxMsg || !maxSize) {
        return BadArguments(command, OLESTR("-Name <slot> -MaxMsg <n> -MaxSize <n>"));
    }
    const std::int32_t messages = *maxMsg;
    const std::int32_t size = *maxSize;
    if (messages < 1 || messages > 32767 || size < 1 || size > kMaxBodySize) {
        return Refuse(kStatusBadArgument, Concat({OLESTR("Connect: a slot holds 1 to 32767 messages of 1 to "),
                                                  Decimal(kMaxBodySize), OLESTR(" bytes")}));
    }
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    const auto proxy = router.proxies_.find(command.caller.clientId);
    if (proxy == router.proxies_.end()) {
        return Refuse(kStatusNotAllowed, OLESTR("Connect: the client has announced no proxy (CtrlCmd -ProxyId)"));
    }
    for (auto& [id, slot] : router.slots_) {
        if (slot.name == *name) {
            if (slot.owner != command.caller.clientId) {
                return Refuse(kStatusNotAllowed, OLESTR("Connect: slot ") + Quoted(*name) +
                                                     OLESTR(" is connected by another client"));
            }
            return Refuse(kStatusNotAllowed, OLESTR("Connect: slot ") + Quoted(*name) + OLESTR(" is already connected"));
        }
    }
    const short id = router.NewId();
    router.slots_[id] = NewSlot(*name, command.caller.clientId, proxy->second, static_cast<short>(messages),
                                static_cast<short>(size));
    return Answer(Concat({SlotReply(id, proxy->second), OLESTR(" -name "), *name, OLESTR(" -MaxMsg "),
                          Decimal(messages), OLESTR(" -MaxSize "), Decimal(size)}));
}

Reply Disconnect(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const short id = arguments ? SlotArgument(*arguments) : short{-32768};
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    const Slot* slot = router.Find(id);
    if (slot == nullptr || slot->owner == 0) {
        return Refuse(kStatusNotFound, OLESTR("Disconnect: no slot ") + Quoted(command.args) + OLESTR(" to close"));
    }
    if (slot->owner != command.caller.clientId) {
        return Refuse(kStatusNotAllowed, OLESTR("Disconnect: slot ") + Quoted(slot->name) +
                                             OLESTR(" belongs to another client"));
    }
    const short proxy = slot->proxy;
    router.slots_.erase(id);
    return Answer(SlotReply(id, proxy));
}

Reply QueueStatus(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    if (!arguments || !arguments->Signed(OLESTR("-Level"))) {
        return BadArguments(command, OLESTR("-SlotId <id> -Level <n> [-QFull]"));
    }
    const short id = SlotArgument(*arguments);
    Router& router = RouterOf(controller);
    bool flush = false;
    {
        std::lock_guard lock(router.mutex);
        Slot* slot = router.Find(id);
        if (slot == nullptr || slot->owner != command.caller.clientId) {
            return Refuse(kStatusNotFound, OLESTR("QueueStatus: the client owns no slot ") + Decimal(id));
        }
        if (arguments->Has(OLESTR("-QFull"))) {
            MarkFull(*slot);
        } else {
            slot->full = false;
        }
        flush = !slot->full && !slot->held.empty() && !slot->flushing;
        slot->flushing = slot->flushing || flush;
    }
    if (flush) {
        Flush(controller, id);
    } else {
        router.RetryLater(controller);
    }
    return Done();
}

Reply SlotInfo(ControllerModel& controller, const Command&) {
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    Text text = Concat({OLESTR("-noelts,all,mark,cc "), Decimal(router.slots_.size()), OLESTR(",1,0,0\t")});
    for (const auto& [id, slot] : router.slots_) {
        text += Concat({slot.name, OLESTR(";"), Decimal(id), OLESTR(";"), Decimal(slot.maxMsg), OLESTR(";"),
                        Decimal(slot.maxSize), OLESTR(";"), Decimal(slot.owner == 0 ? 1 : 0), OLESTR("\t")});
    }
    return Answer(std::move(text));
}

Reply SlotName(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const short id = arguments ? SlotArgument(*arguments) : short{-32768};
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    const Slot* slot = router.Find(id);
    if (slot == nullptr) {
        return Refuse(kStatusNotFound, OLESTR("SlotName: no slot ") + Quoted(command.args));
    }
    return Answer(OLESTR("-SlotName ") + slot->name);
}

Reply SlotIdOf(ControllerModel& controller, const Command& command) {
    const auto arguments = Arguments::Parse(command.args);
    const auto name = arguments ? arguments->Find(OLESTR("-Name")) : std::nullopt;
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    for (const auto& [id, slot] : router.slots_) {
        if (name && slot.name == *name) {
            return Answer(OLESTR("-SlotId ") + Decimal(id));
        }
    }
    return Refuse(kStatusNotFound, OLESTR("SlotId: no slot named ") + Quoted(name ? *name : command.args));
}

Reply MaxProperties(ControllerModel&, const Command&) {
    return Answer(Concat({OLESTR("-MaxMsgSize "), Decimal(kMaxMsgSize), OLESTR(" -MaxPackageSize "),
                          Decimal(kMaxPackageSize), OLESTR(" -MaxBodySize "), Decimal(kMaxBodySize)}));
}

constexpr CommandRow kRows[] = {
    {OLESTR("Set"), OLESTR("CtrlCmd"), SetProxy},
    {OLESTR("Set"), OLESTR("Connect"), Connect},
    {OLESTR("Set"), OLESTR("Disconnect"), Disconnect},
    {OLESTR("Set"), OLESTR("QueueStatus"), QueueStatus},
    {OLESTR("Get"), OLESTR("SlotInfo"), SlotInfo},
    {OLESTR("Get"), OLESTR("SlotName"), SlotName},
    {OLESTR("Get"), OLESTR("SlotId"), SlotIdOf},
    {OLESTR("Get"), OLESTR("IPCMaxProperties"), MaxProperties},
};

}  // namespace

HRESULT RouteMessage(ControllerModel& controller, const Caller& caller, const TavIPCHeaderInternal& header,
                     const byte* data, LONG size, Text& error) {
    if (size < 0 || (data == nullptr && size > 0) || size > kMaxBodySize) {
        error = OLESTR("SendIPCMessage: a message body of 0 to ") + Decimal(kMaxBodySize) + OLESTR(" bytes expected");
        return kStatusBadArgument;
    }
    TavIPCHeaderInternal sent = header;
    sent.service = kClientMessage;
    sent.bodySize = size;
    sent.uasUid = caller.clientId;
    Router& router = RouterOf(controller);
    Route route;
    short target = header.ipcParams.did;
    {
        std::lock_guard lock(router.mutex);
        if (target == kEchoSlot) {
            // The echo slot answers at once, to the slot the message names
            // as its source.
            target = header.ipcParams.sid;
            sent.ipcParams.did = header.ipcParams.sid;
            sent.ipcParams.sid = kEchoSlot;
        }
        const HRESULT hr = Admit(router, target, sent, data, size, route, error);
        if (FAILED(hr)) {
            return hr;
        }
    }
    if (route.deliver) {
        Flush(controller, target);
    } else {
        router.RetryLater(controller);
    }
    return S_OK;
}

bool CloseSlot(ControllerModel& controller, short slotId) {
    Router& router = RouterOf(controller);
    std::uint32_t owner = 0;
    {
        std::lock_guard lock(router.mutex);
        const Slot* slot = router.Find(slotId);
        if (slot == nullptr || slot->owner == 0) {
            return false;
        }
        owner = slot->owner;
        router.slots_.erase(slotId);
    }
    TavIPCHeaderInternal notice{};
    notice.ipcParams.did = slotId;
    notice.service = kSlotClosed;
    Deliver(controller, owner, notice, nullptr, 0);
    return true;
}

void ClientGone(ControllerModel& controller, std::uint32_t clientId) {
    Router& router = RouterOf(controller);
    std::lock_guard lock(router.mutex);
    std::erase_if(router.slots_, [clientId](const auto& entry) { return entry.second.owner == clientId; });
    router.proxies_.erase(clientId);
}

}  // namespace ipc

const Subsystem& IpcSubsystem() {
    static constexpr Subsystem subsystem{ipc::kRows};
    return subsystem;
}

}  // namespace tav::sim
