// Event delivery end to end: the motors state of the virtual controller is
// changed through sim::ControllerModel, and each change reaches every client
// sink subscribed through the module's Subscribe to "State" events, on the
// command component's delivery thread. Measured for 1 and for 16 subscribers
// (one controller object, one subscription per sink), as events per second
// of wall-clock time from the first change until the last OnChange has
// returned; the changing thread and the delivery thread run side by side.
// The CPU time of the whole process is reported too: on a loaded machine it
// holds up better than the wall clock, which then also counts the time the
// delivery thread waits for a core.
//
// The floor does what any delivery of those events has to do, in a plain
// loop on one thread: per change and subscriber the event text made from the
// state, its BSTR in a VARIANT, the sink's OnChange, and freeing the text.
#include <benchmark/benchmark.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "TavController.h"
#include "bench_support.h"
#include "core/text/ole_string.h"
#include "sim/controller_registry.h"
#include "tav/com_ptr.h"
#include "tav/variant.h"

namespace {

using tav::ComPtr;
using tav::OleString;
using tav::OleStringView;

constexpr std::int64_t kSubscriberCounts[] = {1, 16};
// Changes per timed iteration; even, so that each iteration ends where it
// began.
constexpr int kChanges = 2'000;
constexpr const OLECHAR* kWords[] = {OLESTR("POWER_ON"), OLESTR("STAND_BY")};

// Counts the events of all sinks and tells the waiting thread when the last
// one expected has arrived; records their texts while checking.
class Tally {
public:
    void Expect(std::int64_t events, bool record) {
        std::lock_guard hold(mutex_);
        received_.store(0, std::memory_order_relaxed);
        expected_ = events;
        done_ = false;
        record_ = record;
        texts_.clear();
    }

    void Arrived(const TavEventData& event) {
        if (record_) {
            std::lock_guard hold(mutex_);
            texts_.emplace_back(event.userDef,
                                event.Data.vt == VT_BSTR ? tav::ViewOf(event.Data.bstrVal) : OleStringView());
        }
        if (received_.fetch_add(1, std::memory_order_acq_rel) + 1 == expected_) {
            std::lock_guard hold(mutex_);
            done_ = true;
            arrived_.notify_all();
        }
    }

    bool WaitForAll() {
        std::unique_lock hold(mutex_);
        return arrived_.wait_for(hold, std::chrono::seconds(30), [this] { return done_; });
    }

    std::int64_t Received() const { return received_.load(); }
    // Each event's subscriber (its userDef) and text, as they arrived.
    std::vector<std::pair<ULONG, OleString>> Texts() {
        std::lock_guard hold(mutex_);
        return texts_;
    }

private:
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::atomic<std::int64_t> received_{0};
    std::int64_t expected_ = 0;
    bool done_ = false;
    bool record_ = false;
    std::vector<std::pair<ULONG, OleString>> texts_;
};

Tally TheTally;

// A client's sink: it looks at the event, as a client does, and counts it.
class Sink final : public _ITavObjectEvents {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID__ITavObjectEvents)) {
            *object = static_cast<_ITavObjectEvents*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references_; }
    ULONG STDMETHODCALLTYPE Release() override {
        const ULONG left = --references_;
        if (left == 0) {
            delete this;
        }
        return left;
    }
    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* data) override {
        if (data == nullptr || data->Data.vt != VT_BSTR) {
            return E_INVALIDARG;
        }
        TheTally.Arrived(*data);
        return S_OK;
    }

private:
    std::atomic<ULONG> references_{0};
};

class Client : public tav::bench::Client {
public:
    Client() {
        if (Failure() != nullptr) {
            return;
        }
        model_ = tav::sim::ControllerAt(tav::sim::kDefaultUrl);
        if (!model_ || FAILED(QueryTo(Controller(), subscribe_))) {
            Fail("cannot reach the virtual controller's model or the controller's ITavSubscribe");
        }
    }

    tav::sim::ControllerModel& Model() const { return *model_; }
    ITavSubscribe* Subscriptions() const { return subscribe_.Get(); }

private:
    std::shared_ptr<tav::sim::ControllerModel> model_;
    ComPtr<ITavSubscribe> subscribe_;
};

Client* TheClient = nullptr;

// count sinks subscribed to "State" events for as long as it lives.
class Subscribers {
public:
    explicit Subscribers(std::int64_t count) {
        for (std::int64_t i = 0; i < count; ++i) {
            ComPtr<_ITavObjectEvents> sink(new Sink);
            TavEventParams params{};
            params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
            params.pSink = sink.Get();
            params.subscriptionType = state;
            params.userDef = static_cast<ULONG>(i);
            ULONG cookie = 0;
            if (FAILED(TheClient->Subscriptions()->Subscribe(nullptr, &params, &cookie))) {
                return;
            }
            sinks_.push_back(std::move(sink));
            cookies_.push_back(cookie);
        }
    }
    Subscribers(const Subscribers&) = delete;
    Subscribers& operator=(const Subscribers&) = delete;
    ~Subscribers() {
        for (const ULONG cookie : cookies_) {
            TheClient->Subscriptions()->Unsubscribe(nullptr, cookie);
        }
    }

    std::int64_t Count() const { return static_cast<std::int64_t>(cookies_.size()); }
    const std::vector<ComPtr<_ITavObjectEvents>>& Sinks() const { return sinks_; }

private:
    std::vector<ComPtr<_ITavObjectEvents>> sinks_;
    std::vector<ULONG> cookies_;
};

// The model's changes of one round, starting from kWords[0].
void ChangeModel(int changes) {
    for (int i = 1; i <= changes; ++i) {
        TheClient->Model().SetMotorsState(kWords[i % 2]);
    }
}

// The floor's events of one round: what a delivery of each change to each
// sink cannot do without.
void FloorRound(const std::vector<ComPtr<_ITavObjectEvents>>& sinks, int changes) {
    tav::sim::Text state = kWords[0];
    for (int i = 1; i <= changes; ++i) {
        state = kWords[i % 2];
        for (const ComPtr<_ITavObjectEvents>& sink : sinks) {
            const tav::sim::Text text = state;
            tav::Variant payload;
            if (FAILED(payload.SetString(text))) {
                continue;
            }
            TavEventData event{};
            event.userDef = static_cast<ULONG>(&sink - sinks.data());
            event.Data = *payload.Get();
            sink->OnChange(&event);
        }
    }
}

// Null when every sink got one event per change, in order, with the state's
// word; `round` runs the changes.
template <class Round>
const char* DeliveredInOrder(std::int64_t subscribers, Round round) {
    constexpr int kChecked = 8;
    TheTally.Expect(kChecked * subscribers, true);
    round(kChecked);
    if (!TheTally.WaitForAll()) {
        return "not every event arrived";
    }
    // Each sink's events come in the order of the changes; the sinks' turns
    // may interleave.
    std::vector<int> seen(static_cast<size_t>(subscribers), 0);
    for (const auto& [subscriber, text] : TheTally.Texts()) {
        if (subscriber >= seen.size()) {
            return "an event names no subscriber";
        }
        int& next = seen[subscriber];
        if (next == kChecked || text != kWords[(next + 1) % 2]) {
            return "a sink's events are not the changes in order";
        }
        ++next;
    }
    return nullptr;
}

void Delivery(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    if (TheClient->Failure() != nullptr) {
        state.SkipWithError(TheClient->Failure());
        return;
    }
    TheClient->Model().SetMotorsState(kWords[0]);
    Subscribers subscribers(count);
    if (subscribers.Count() != count) {
        state.SkipWithError("Subscribe refuses a State subscription");
        return;
    }
    if (const char* why = DeliveredInOrder(count, ChangeModel)) {
        state.SkipWithError(why);
        return;
    }
    for (auto _ : state) {
        TheTally.Expect(kChanges * count, false);
        ChangeModel(kChanges);
        if (!TheTally.WaitForAll()) {
            state.SkipWithError("events were lost");
            return;
        }
    }
    state.SetItemsProcessed(state.iterations() * kChanges * count);
}

void Floor(benchmark::State& state) {
    const std::int64_t count = state.range(0);
    std::vector<ComPtr<_ITavObjectEvents>> sinks;
    for (std::int64_t i = 0; i < count; ++i) {
        sinks.emplace_back(new Sink);
    }
    if (const char* why = DeliveredInOrder(count, [&](int changes) { FloorRound(sinks, changes); })) {
        state.SkipWithError(why);
        return;
    }
    for (auto _ : state) {
        TheTally.Expect(kChanges * count, false);
        FloorRound(sinks, kChanges);
        benchmark::DoNotOptimize(TheTally.Received());
    }
    state.SetItemsProcessed(state.iterations() * kChanges * count);
}

class RatioReporter : public tav::bench::MedianReporter {
public:
    void Finalize() override {
        ConsoleReporter::Finalize();
        std::ostream& out = GetOutputStream();
        out << "\nEvent delivery against its floor, same process (the CPU time is the whole process's):\n"
            << "  subscribers   delivered events/s   floor events/s   wall-clock delivery/floor"
               "   CPU ns/event delivery   floor   delivery/floor\n";
        for (const std::int64_t count : kSubscriberCounts) {
            const double delivery = MedianRealTime("Delivery/" + std::to_string(count));
            const double floor = MedianRealTime("Floor/" + std::to_string(count));
            const double deliveryCpu = Median("Delivery/" + std::to_string(count));
            const double floorCpu = Median("Floor/" + std::to_string(count));
            if (delivery <= 0 || floor <= 0 || deliveryCpu <= 0 || floorCpu <= 0) {
                continue;
            }
            // The times are per iteration, in nanoseconds.
            const double events = static_cast<double>(kChanges * count);
            char line[200];
            std::snprintf(line, sizeof line, "  %11lld   %18.0f   %14.0f   %25.2f   %21.0f   %5.0f   %14.2f\n",
                          static_cast<long long>(count), events / delivery * 1e9, events / floor * 1e9,
                          delivery / floor, deliveryCpu / events, floorCpu / events, deliveryCpu / floorCpu);
            out << line;
        }
    }
};

}  // namespace

int main(int argc, char** argv) {
    return tav::bench::RunWithClient<Client, RatioReporter>(argc, argv, TheClient, [](Client&) {
        for (const std::int64_t count : kSubscriberCounts) {
            benchmark::RegisterBenchmark("Delivery", Delivery)->Arg(count)->MeasureProcessCPUTime()->UseRealTime();
            benchmark::RegisterBenchmark("Floor", Floor)->Arg(count)->MeasureProcessCPUTime()->UseRealTime();
        }
    });
}
