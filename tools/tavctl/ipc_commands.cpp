// Inter-process messages: slots, sending and receiving, the slot list and a
// round-trip measurement against the controller's echo slot.
#include <algorithm>
#include <chrono>
#include <cstdio>

#include "tavctl/list_reader.h"
#include "tavctl/verb.h"

namespace tavctl {
namespace {

using IpcInfo = ITavIPCInformation;

// A slot by its id, or by its name through GetSlotId.
short SlotArgument(Verb& v, const char* what, const std::string& word) {
    if (!word.empty() && (std::isdigit(static_cast<unsigned char>(word[0])) || word[0] == '-')) {
        return v.NumberFrom<short>(what, word);
    }
    const auto info = v.Interface<IpcInfo>();
    const tav::Bstr name = Verb::ToBstr(word);
    short id = 0;
    TavInParams rip = v.session.SyncParams();
    if (const HRESULT hr = info->GetSlotId(&rip, name.Get(), &id); FAILED(hr)) {
        throw CommandFailed{v.session.Fail("GetSlotId(" + word + ")", hr)};
    }
    return id;
}

short ConnectSlot(Verb& v, ITavIPC* ipc, const std::string& name, short maxMsg, short maxSize) {
    const tav::Bstr text = Verb::ToBstr(name);
    short slot = 0;
    TavInParams rip = v.session.SyncParams();
    if (const HRESULT hr = ipc->Connect(&rip, text.Get(), maxMsg, maxSize, &slot); FAILED(hr)) {
        throw CommandFailed{v.session.Fail("Connect", hr)};
    }
    return slot;
}

int Connect(Verb& v) {
    const short maxMsg = v.NumberOption<short>("--max-msg").value_or(10);
    const short maxSize = v.NumberOption<short>("--max-size").value_or(1024);
    const std::string name = v.Word("NAME");
    v.End();
    const auto ipc = v.Interface<ITavIPC>();
    const short slot = ConnectSlot(v, ipc.Get(), name, maxMsg, maxSize);
    v.session.Show(Value::Number(slot));
    return kExitOk;
}

int Disconnect(Verb& v) {
    const short slot = v.Number<short>("SLOT");
    v.End();
    return v.Set("Disconnect", &ITavIPC::Disconnect, slot);
}

int Send(Verb& v) {
    const auto from = v.NumberOption<short>("--from");
    const bool package = v.Flag("--package");
    const auto userData = v.NumberOption<LONG>("--user-data");
    const std::string target = v.Word("SLOT");
    const short command = v.Number<short>("CMD");
    std::string text = v.Word("TEXT");
    v.End();
    TavIPCParams params{};
    params.msgType = package ? TavIPCPackageType : TavIPCMessageType;
    params.did = SlotArgument(v, "SLOT", target);
    params.sid = from.value_or(0);
    params.cmd = command;
    params.userData = userData.value_or(0);
    const auto ipc = v.Interface<ITavIPC>();
    return v.session.Write("Send", [&](TavInParams* rip) {
        return ipc->Send(rip, &params, reinterpret_cast<byte*>(text.data()), static_cast<LONG>(text.size()));
    });
}

// A received message: its header and its body, which the caller frees.
class Received {
public:
    ~Received() { SysFreeString(out.Data); }
    TavIPCOutParams out{};
};

// A body holds the bytes as they were sent, not 16-bit text.
Value BodyValue(BSTR body) {
    if (body == nullptr) {
        return Value::Null();
    }
    return Value::Text(std::string(reinterpret_cast<const char*>(body), SysStringByteLen(body)));
}

Record MessageRecord(const TavIPCOutParams& message) {
    return {{"type", Show(message.ipcParams.msgType)},
            {"did", Show(message.ipcParams.did)},
            {"sid", Show(message.ipcParams.sid)},
            {"cmd", Show(message.ipcParams.cmd)},
            {"userDef", Show(message.ipcParams.userDef)},
            {"userData", Show(message.ipcParams.userData)},
            {"data", BodyValue(message.Data)}};
}

int Receive(Verb& v) {
    const auto timeout = v.NumberOption<ULONG>("--timeout");
    const short slot = v.Number<short>("SLOT");
    v.End();
    const auto ipc = v.Interface<ITavIPC>();
    TavInParams rip = v.session.SyncParams();
    rip.timeOut = timeout.value_or(rip.timeOut);
    Received message;
    if (const HRESULT hr = ipc->Receive(&rip, slot, &message.out); FAILED(hr)) {
        return v.session.Fail("Receive", hr);
    }
    v.session.Show(MessageRecord(message.out));
    return kExitOk;
}

int Slots(Verb& v) {
    v.End();
    const auto info = v.Interface<IpcInfo>();
    return ReadList<IEnumSlots, TavIPCSlot>(
        v, "GetSlotInformation", -1,
        [&](TavInParams* rip, TavRetrievalParams* params, IEnumSlots** slots) {
            return info->GetSlotInformation(rip, params, slots);
        },
        [&](VARIANT* data, TavRetrievalParams* params, IEnumSlots** slots) {
            return info->UnpackSlotInformation(data, params, slots);
        },
        [](TavIPCSlot& slot) {
            Record row{{"name", TextValue(slot.slotName)},
                       {"id", Show(slot.slotId)},
                       {"queue", Show(slot.queueSize)},
                       {"maxMessageSize", Show(slot.maxMessageSize)},
                       {"remote", AsBoolean(slot.remote_accessible)}};
            SysFreeString(slot.slotName);
            return row;
        });
}

int SlotName(Verb& v) {
    const short slot = v.Number<short>("ID");
    v.End();
    return v.GetOnly("GetSlotName", &IpcInfo::GetSlotName, slot);
}

int SlotId(Verb& v) {
    const auto name = v.Text("NAME");
    v.End();
    return v.GetOnly("GetSlotId", &IpcInfo::GetSlotId, name.Get());
}

int Sizes(Verb& v) {
    v.End();
    const auto info = v.Interface<IpcInfo>();
    LONG message = 0;
    LONG package = 0;
    TavInParams rip = v.session.SyncParams();
    if (const HRESULT hr = info->GetMaxMessageSize(&rip, &message); FAILED(hr)) {
        return v.session.Fail("GetMaxMessageSize", hr);
    }
    rip = v.session.SyncParams();
    if (const HRESULT hr = info->GetMaxPackageSize(&rip, &package); FAILED(hr)) {
        return v.session.Fail("GetMaxPackageSize", hr);
    }
    v.session.Show(Record{{"maxMessageSize", Show(message)}, {"maxPackageSize", Show(package)}});
    return kExitOk;
}

std::string Milliseconds(double seconds) {
    char text[32];
    std::snprintf(text, sizeof text, "%.3f", seconds * 1000);
    return text;
}

// N messages to the echo slot, one at a time: each is timed from Send until
// Receive hands back its echo.
int Ping(Verb& v) {
    const ULONG count = v.NumberOption<ULONG>("--count").value_or(100);
    const short size = v.NumberOption<short>("--size").value_or(16);
    const std::string echo = v.Option("--echo").value_or("Echo");
    v.End();
    if (count == 0 || count > 1000000 || size < 1) {
        throw UsageError{"--count wants 1 to 1000000 messages and --size at least 1 byte"};
    }
    const auto ipc = v.Interface<ITavIPC>();
    const short target = SlotArgument(v, "--echo", echo);
    const short slot = ConnectSlot(v, ipc.Get(), "tavctl-ping", 10, std::max<short>(size, 16));
    std::string body(static_cast<std::size_t>(size), 'p');
    std::vector<double> times;
    times.reserve(count);
    int status = kExitOk;
    const auto began = std::chrono::steady_clock::now();
    for (ULONG i = 0; i < count; ++i) {
        TavIPCParams params{};
        params.msgType = TavIPCMessageType;
        params.did = target;
        params.sid = slot;
        params.cmd = 1;
        params.userData = static_cast<LONG>(i);
        const auto sent = std::chrono::steady_clock::now();
        TavInParams rip = v.session.SyncParams();
        HRESULT hr = ipc->Send(&rip, &params, reinterpret_cast<byte*>(body.data()), static_cast<LONG>(body.size()));
        if (FAILED(hr)) {
            status = v.session.Fail("Send", hr);
            break;
        }
        Received echoed;
        rip = v.session.SyncParams();
        hr = ipc->Receive(&rip, slot, &echoed.out);
        if (FAILED(hr)) {
            status = v.session.Fail("Receive", hr);
            break;
        }
        times.push_back(std::chrono::duration<double>(std::chrono::steady_clock::now() - sent).count());
    }
    const double total = std::chrono::duration<double>(std::chrono::steady_clock::now() - began).count();
    TavInParams rip = v.session.SyncParams();
    ipc->Disconnect(&rip, slot);
    if (status != kExitOk) {
        return status;
    }
    std::sort(times.begin(), times.end());
    auto percentile = [&](double p) {
        return times[std::min(times.size() - 1, static_cast<std::size_t>(p * static_cast<double>(times.size())))];
    };
    v.session.Show(Record{{"messages", Value::Unsigned(times.size())},
                          {"perSecond", Value::Unsigned(static_cast<unsigned long long>(static_cast<double>(times.size()) / total))},
                          {"p50ms", Value{Value::Kind::Number, Milliseconds(percentile(0.50))}},
                          {"p90ms", Value{Value::Kind::Number, Milliseconds(percentile(0.90))}},
                          {"p99ms", Value{Value::Kind::Number, Milliseconds(percentile(0.99))}},
                          {"maxms", Value{Value::Kind::Number, Milliseconds(times.back())}}});
    return kExitOk;
}

constexpr VerbEntry kIpc[] = {
    {"connect", "NAME [--max-msg N] [--max-size N]", "connect a message slot and print its id (Connect)", Connect,
     "The slot lives as long as this controller object: in a batch, until the end.\n"
     "--max-msg (default 10) and --max-size (default 1024) size its queue.\n"},
    {"disconnect", "SLOT", "disconnect a slot (Disconnect)", Disconnect},
    {"send", "SLOT CMD TEXT [--from SLOT] [--package] [--user-data N]", "send a message (Send)", Send,
     "SLOT is the destination's id or name; --from names the sending slot (one\n"
     "connected earlier in the batch).\n"},
    {"receive", "SLOT [--timeout MS]", "wait for a message on a connected slot (Receive)", Receive},
    {"slots", "", "list the controller's slots (GetSlotInformation)", Slots},
    {"name", "ID", "print a slot's name (GetSlotName)", SlotName},
    {"id", "NAME", "print a slot's id (GetSlotId)", SlotId},
    {"sizes", "", "print the largest message and package sizes (GetMaxMessageSize, GetMaxPackageSize)", Sizes},
    {"ping", "[--count N] [--size BYTES] [--echo SLOT]",
     "send N messages to the echo slot and print the round-trip rate and latency percentiles", Ping},
};

}  // namespace

std::span<const GroupEntry> IpcGroups() {
    static constexpr GroupEntry kGroups[] = {{"ipc", "Inter-process message slots", kIpc}};
    return kGroups;
}

}  // namespace tavctl
