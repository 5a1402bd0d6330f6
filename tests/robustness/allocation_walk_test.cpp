// Every operation of the controller object, each of its allocations failing
// in turn (N = 1, 2, ... until a run reaches no failure): each run must end
// in a result the operation may give under memory pressure, leave its
// out-values as that result allows, leak nothing (LeakSanitizer), and the
// run without a failure must give the operation's normal result, which shows
// that the object still works. The table has one row per operation, made
// from the operations' own list, so an operation added later is walked too;
// the arguments come from the parameter types, and the few operations that
// need particular ones say so below.
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "robustness/support/out_values.h"
#include "support/controller_test.h"
#include "tav/bstr.h"
#include "tav/fault_injection.h"
#include "unpack/decoder_table.h"

namespace tav::test {
namespace {

using robustness::OutValues;

// The arguments and out-values of one call, made before the failure is armed
// so that only the operation's own allocations are counted.
class Call {
public:
    // nullResult: a success may hand out a NULL string (the component's
    // own reply text was the allocation that failed).
    Call(const char* replyText, unsigned quirks, bool nullResult) : outs_(nullResult, quirks) {
        VariantInit(&reply_);
        reply_.vt = VT_BSTR;
        reply_.bstrVal = SysAllocString(Widen(replyText).c_str());
        for (int i = 0; i < kInputs; ++i) ins_.emplace_back(OLESTR("ctrl:/hd0a/TEMP/file.txt"));
    }
    ~Call() { VariantClear(&reply_); }
    Call(const Call&) = delete;
    Call& operator=(const Call&) = delete;

    OutValues& Outs() { return outs_; }
    // The input strings are made before the failure is armed.
    BSTR Url() { return url_.Get(); }
    BSTR In() { return ins_.at(nextInput_++).Get(); }
    void* Record() { return records_.emplace_back().data(); }

    template <typename T>
    T Arg() {
        using P = std::remove_pointer_t<T>;
        if constexpr (std::is_same_v<T, TavInParams*>) {
            return nullptr;  // Sync, no callback
        } else if constexpr (std::is_same_v<T, BSTR>) {
            return In();
        } else if constexpr (std::is_same_v<T, BSTR*>) {
            return outs_.String();
        } else if constexpr (std::is_same_v<T, VARIANT*>) {
            return &reply_;
        } else if constexpr (std::is_same_v<T, FILETIME>) {
            return FILETIME{0xD53E8000u, 0x019DB1DEu};  // 2000-01-01
        } else if constexpr (std::is_same_v<T, FILETIME*>) {
            return outs_.Time();
        } else if constexpr (std::is_same_v<T, TavLoginInfo*>) {
            return outs_.Login();
        } else if constexpr (std::is_same_v<T, TavVantorConfigInfo*>) {
            return outs_.ConfigInfo();
        } else if constexpr (std::is_same_v<T, TavRetrievalParams*>) {
            return outs_.Retrieval();
        } else if constexpr (std::is_pointer_v<P> && std::is_base_of_v<IUnknown, std::remove_pointer_t<P>>) {
            return outs_.Enumerator<std::remove_pointer_t<P>>();
        } else if constexpr (std::is_same_v<T, double*>) {
            return outs_.Array<double>(1);
        } else if constexpr (std::is_pointer_v<T> && (std::is_arithmetic_v<P> || std::is_enum_v<P>)) {
            return outs_.Number<P>();
        } else if constexpr (std::is_pointer_v<T>) {
            return static_cast<T>(Record());  // records and buffers, zero-filled
        } else if constexpr (std::is_enum_v<T>) {
            return static_cast<T>(1);
        } else {
            static_assert(std::is_arithmetic_v<T>);
            return static_cast<T>(1);  // also the capacity of every array
        }
    }

    template <typename... A>
    HRESULT Synthesised(HRESULT (STDMETHODCALLTYPE ControllerObject::*operation)(A...), ControllerObject& object) {
        return (object.*operation)(Arg<A>()...);
    }

private:
    static constexpr int kInputs = 8;
    OutValues outs_;
    int nextInput_ = 0;
    VARIANT reply_;
    std::deque<Bstr> ins_;
    Bstr url_{OLESTR("/ctrl")};
    std::deque<std::array<std::uint64_t, 64>> records_;
};

struct Row {
    std::string name;
    std::function<HRESULT(ControllerObject&, Call&)> call;
};

std::vector<Row> Operations() {
    return {
#define TAV_CONTROLLER_METHOD(interface_, name, params, args) \
    {#name, [](ControllerObject& object, Call& call) { return call.Synthesised(&ControllerObject::name, object); }},
#include "controller_methods.inc"
#undef TAV_CONTROLLER_METHOD
    };
}

const fuzz::DecoderRow* DecoderOf(const std::string& name) {
    for (const auto& row : fuzz::DecoderRows()) {
        if (name == row.name) return &row;
    }
    return nullptr;
}

// What an operation gives without any failure, where that is not S_OK.
const std::map<std::string, HRESULT>& NormalResults() {
    static const std::map<std::string, HRESULT> results = {
        {"Compress", E_NOTIMPL},   {"Decompress", E_NOTIMPL},   // not provided
        {"GetUASConfiguration", E_NOTIMPL}, {"SetUASConfiguration", E_NOTIMPL},
        // Refused for the arguments made from their types (an address, a
        // mode, a slot, a state of 1): walked as far as the refusal.
        {"SetLANAdaptorIPConfig", E_INVALIDARG}, {"SetLANAdaptorIP", E_INVALIDARG}, {"SetOPMode", E_INVALIDARG},
        {"SetControllerStateKeyLess", E_INVALIDARG}, {"SetCameraState", E_INVALIDARG},
        {"GetSlotInformation", E_INVALIDARG},
        // Slots need a connection first; a slot never connected is refused.
        {"Connect", E_FAIL}, {"Receive", static_cast<HRESULT>(0xC004AB00)},
    };
    return results;
}

// Operations whose arguments cannot come from their types alone.
const std::map<std::string, std::function<HRESULT(ControllerObject&, Call&)>>& Particular() {
    static const std::map<std::string, std::function<HRESULT(ControllerObject&, Call&)>> calls = {
        // A second Init with the URL of the first does nothing.
        {"Init", [](ControllerObject& object, Call& call) { return object.Init(call.Url()); }},
    };
    return calls;
}

class AllocationWalk : public ControllerTest, public ::testing::WithParamInterface<Row> {
protected:
    void SetUp() override {
        ControllerTest::SetUp();
        if (!TavFailAllocationAt(0)) GTEST_SKIP() << "allocation failures cannot be injected on this platform";
        // Every command is answered with a reply that its decoder accepts.
        for (const auto& row : fuzz::DecoderRows()) {
            if (row.command != nullptr && *row.example != '\0') Script(row.command, row.example);
        }
        // Commands whose decoders have no interface slot of their own.
        const std::pair<const char*, const char*> more[] = {
            {"SystemStartupClock", "-time_t 5"},
            {"SystemInfo", "TavOS 7.4.2"},
            {"InboxState", "-state Loaded"},
            {"InboxIsBusy", "-busy true"},
            {"InboxPath", "-path \"/hd0a/inbox\""},
            {"InboxVersion", "-version \"7.4\""},
            {"UASUsers", "<users><user name=\"a\"/></users>"},
            {"UASGrants", "<grants/>"},
            {"VTTimeSlice", "-time 10"},
            {"IPCMaxProperties", "-MaxMsgSize 100 -MaxPackageSize 200 -MaxBodySize 300"},
            {"SlotName", "-SlotName planner"},
            {"SlotId", "-SlotId 14"},
            {"Connect", "-SlotId 14"},
            {"Disconnect", "-SlotId 14 -ProxySlotId -2"},
        };
        for (const auto& [command, reply] : more) Script(command, reply);
    }
};

TEST_P(AllocationWalk, EachAllocationFails) {
    const Row& row = GetParam();
    ControllerObject* object = Make();
    const fuzz::DecoderRow* decoder = DecoderOf(row.name);
    const char* reply = decoder != nullptr ? decoder->example : "";
    const bool unpack = row.name.rfind("Unpack", 0) == 0;
    const unsigned quirks = (decoder != nullptr ? decoder->quirks : OutValues::kNone) |
                            (unpack ? OutValues::kNone : OutValues::kUntouchedOnFailure);
    const auto particular = Particular().find(row.name);
    const auto& operation = particular == Particular().end() ? row.call : particular->second;
    const auto normal = NormalResults().find(row.name);
    const HRESULT expected = normal == NormalResults().end() ? S_OK : normal->second;

    auto call = std::make_unique<Call>(reply, quirks, !unpack);
    HRESULT hr = S_OK;
    long step = 0;
    const long steps = ForEachAllocationFailure([&] { hr = operation(*object, *call); },
                                                [&] {
                                                    ++step;
                                                    // A reply handed in whole leaves nothing to fail but
                                                    // what the decoder allocates.
                                                    const std::set<HRESULT> allowed =
                                                        unpack ? std::set<HRESULT>{E_OUTOFMEMORY, expected}
                                                               : std::set<HRESULT>{E_OUTOFMEMORY, E_FAIL, expected};
                                                    EXPECT_TRUE(allowed.count(hr))
                                                        << "allocation " << step << " failing gave 0x" << std::hex
                                                        << static_cast<uint32_t>(hr) << ": " << ErrorText(object);
                                                    const std::string fault = call->Outs().Check(hr);
                                                    EXPECT_EQ(fault, "") << "allocation " << step << " failing";
                                                    call = std::make_unique<Call>(reply, quirks, !unpack);
                                                });
    // The run that reached no failure is the object working normally again.
    EXPECT_EQ(hr, expected) << "without a failure: " << ErrorText(object);
    EXPECT_EQ(call->Outs().Check(hr), "") << "without a failure";
    call.reset();
    RecordProperty("allocations", static_cast<int>(steps));
}

INSTANTIATE_TEST_SUITE_P(Operations, AllocationWalk, ::testing::ValuesIn(Operations()),
                         [](const ::testing::TestParamInfo<Row>& info) { return info.param.name; });

}  // namespace
}  // namespace tav::test
