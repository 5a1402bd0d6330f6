// Messages per second from ITavIPC::Send on one object, through the virtual
// controller, to ITavIPC::Receive on another: one producer thread, one
// consumer, 64-byte bodies. The floor does only the unavoidable work of any
// such path in the same process: one BSTR per message, handed from one thread
// to the other through a lock-free single-producer single-consumer ring.
#include <benchmark/benchmark.h>

#include <array>
#include <atomic>
#include <cstdio>
#include <cstring>
#include <thread>

#include "bench_support.h"

namespace tav::bench {
namespace {

constexpr LONG kBodySize = 64;
constexpr short kQueue = 199;

short Connect(ITavIPC* ipc, const OLECHAR* name) {
    TavInParams rip{};
    rip.callType = Sync;
    Bstr text(name);
    short slot = 0;
    return SUCCEEDED(ipc->Connect(&rip, text.Get(), kQueue, 256, &slot)) ? slot : short{-1};
}

void SendThroughTheModule(benchmark::State& state) {
    Client producer(CLSID_TavController17);
    Client consumer(CLSID_TavController17);
    ComPtr<ITavIPC> sender;
    ComPtr<ITavIPC> receiver;
    if (producer.Failure() != nullptr || consumer.Failure() != nullptr ||
        FAILED(ComPtr<ITavController>(producer.Controller()).As(sender)) ||
        FAILED(ComPtr<ITavController>(consumer.Controller()).As(receiver))) {
        state.SkipWithError("cannot make the two objects");
        return;
    }
    const short from = Connect(sender.Get(), OLESTR("bench_source"));
    const short to = Connect(receiver.Get(), OLESTR("bench_sink"));
    if (from < 0 || to < 0) {
        state.SkipWithError("cannot connect the slots");
        return;
    }
    const std::int64_t total = state.max_iterations;
    std::atomic<bool> failed{false};
    std::thread producing([&] {
        TavInParams rip{};
        rip.callType = Sync;
        TavIPCParams params{};
        params.sid = from;
        params.did = to;
        std::array<byte, kBodySize> body{};
        for (std::int64_t i = 0; i < total; ++i) {
            std::memcpy(body.data(), &i, sizeof i);
            // A full slot's messages are held at the controller up to a
            // bound; beyond it the sender is refused and tries again.
            HRESULT hr;
            while ((hr = sender->Send(&rip, &params, body.data(), kBodySize)) == static_cast<HRESULT>(0xC0040404)) {
                std::this_thread::yield();
            }
            if (FAILED(hr)) {
                failed = true;
                return;
            }
        }
    });
    TavInParams rip{};
    rip.callType = Sync;
    rip.timeOut = 5000;
    std::int64_t expected = 0;
    for (auto _ : state) {
        TavIPCOutParams out{};
        if (FAILED(receiver->Receive(&rip, to, &out))) {
            state.SkipWithError("a message did not arrive");
            break;
        }
        std::int64_t sequence = -1;
        std::memcpy(&sequence, out.Data, sizeof sequence);
        SysFreeString(out.Data);
        if (sequence != expected++) {
            state.SkipWithError("messages out of order");
            break;
        }
    }
    producing.join();
    if (failed) {
        state.SkipWithError("Send failed");
    }
    state.SetItemsProcessed(state.iterations());
    state.counters["msg_per_s"] = benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}

// The floor's ring: one slot per message, indices only ever grow.
class Ring {
public:
    bool Push(BSTR message) {
        const std::size_t head = head_.load(std::memory_order_relaxed);
        if (head - tail_.load(std::memory_order_acquire) == slots_.size()) {
            return false;
        }
        slots_[head % slots_.size()] = message;
        head_.store(head + 1, std::memory_order_release);
        return true;
    }
    BSTR Pop() {
        const std::size_t tail = tail_.load(std::memory_order_relaxed);
        if (head_.load(std::memory_order_acquire) == tail) {
            return nullptr;
        }
        BSTR message = slots_[tail % slots_.size()];
        tail_.store(tail + 1, std::memory_order_release);
        return message;
    }

private:
    std::array<BSTR, 256> slots_{};
    alignas(64) std::atomic<std::size_t> head_{0};
    alignas(64) std::atomic<std::size_t> tail_{0};
};

void Floor(benchmark::State& state) {
    Ring ring;
    const std::int64_t total = state.max_iterations;
    std::thread producing([&] {
        std::array<char, kBodySize> body{};
        for (std::int64_t i = 0; i < total; ++i) {
            std::memcpy(body.data(), &i, sizeof i);
            BSTR message = SysAllocStringByteLen(body.data(), kBodySize);
            while (!ring.Push(message)) {
                std::this_thread::yield();
            }
        }
    });
    for (auto _ : state) {
        BSTR message;
        while ((message = ring.Pop()) == nullptr) {
            std::this_thread::yield();
        }
        benchmark::DoNotOptimize(message);
        SysFreeString(message);
    }
    producing.join();
    state.SetItemsProcessed(state.iterations());
    state.counters["msg_per_s"] = benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}

BENCHMARK(SendThroughTheModule)->Name("SendReceive")->UseRealTime()->Iterations(200000)->Repetitions(3)->ReportAggregatesOnly(false);
BENCHMARK(Floor)->Name("Floor")->UseRealTime()->Iterations(200000)->Repetitions(3)->ReportAggregatesOnly(false);

}  // namespace
}  // namespace tav::bench

int main(int argc, char** argv) {
    tav::ComScope com;
    benchmark::Initialize(&argc, argv);
    tav::bench::MedianReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    const double module = reporter.MedianRealTime("SendReceive");
    const double floor = reporter.MedianRealTime("Floor");
    if (module > 0 && floor > 0) {
        std::printf("\nmessages per second (wall-clock medians): SendReceive %.0f, Floor %.0f; SendReceive / Floor "
                    "time per message: %.2f\n",
                    1e9 / module, 1e9 / floor, module / floor);
    }
    benchmark::Shutdown();
    return 0;
}
