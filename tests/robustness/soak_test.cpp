// Mixed load over time against the virtual controller while its fault
// switches flip: sixteen threads call operations of every subsystem, Sync and
// Async, on objects they share and on objects they make and drop. Every call
// must end in success or in a failure with a code that some layer specifies
// and an error text that names its site; memory must stay flat.
//
// TAV_SOAK_SECONDS sets the length (default 60), TAV_SOAK_FLIPS_PER_SECOND how
// often a fault switch changes (default 50).
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <functional>
#if defined(__GLIBC__)
#include <malloc.h>
#endif
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "TavController.h"
#include "core/text/convert.h"
#include "module/server_exports.h"
#include "support/com_double.h"
#include "sim/controller_registry.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav::robustness {
namespace {

using Clock = std::chrono::steady_clock;

double Setting(const char* name, double fallback) {
    const char* value = std::getenv(name);
    return value != nullptr && *value != '\0' ? std::atof(value) : fallback;
}

#if defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define TAV_SANITIZED_HEAP 1
#endif
#endif
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define TAV_SANITIZED_HEAP 1
#endif

// Memory in use in KiB (0 where it cannot be read). The C library's own
// count of its heap where there is one: under qemu-user the resident size is
// mostly the emulator's translated code, which grows as new paths run. The
// sanitizers' heaps keep no such count, so there it is the resident size.
long ResidentKiB() {
#if defined(__GLIBC__) && !defined(TAV_SANITIZED_HEAP)
    const struct mallinfo2 heap = mallinfo2();
    return static_cast<long>((heap.uordblks + heap.hblkhd) / 1024);
#else
    std::ifstream statm("/proc/self/statm");
    long pages = 0, resident = 0;
    if (!(statm >> pages >> resident)) return 0;
    return resident * 4;
#endif
}

// Counts what the controller delivers; the component's threads may hold it
// after its object is gone, so it lives until its last reference goes.
class Listener final : public ITavCommandCallback, public _ITavObjectEvents {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_ITavCommandCallback)) {
            *object = static_cast<ITavCommandCallback*>(this);
        } else if (IsEqualIID(riid, IID__ITavObjectEvents)) {
            *object = static_cast<_ITavObjectEvents*>(this);
        } else {
            *object = nullptr;
            return E_NOINTERFACE;
        }
        AddRef();
        return S_OK;
    }
    TAV_TEST_DOUBLE_REFCOUNT
    HRESULT STDMETHODCALLTYPE OnCommandReply(TavCommandReply* reply) override {
        // A reply's text is read, as a client decoding it would.
        if (reply->data.vt == VT_BSTR && reply->data.bstrVal != nullptr) {
            textUnits += SysStringLen(reply->data.bstrVal);
        }
        ++replies;
        return S_OK;
    }
    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* data) override {
        if (data->Data.vt == VT_BSTR && data->Data.bstrVal != nullptr) textUnits += SysStringLen(data->Data.bstrVal);
        ++events;
        return S_OK;
    }

    std::atomic<long> replies{0};
    std::atomic<long> events{0};
    std::atomic<long> textUnits{0};

private:
    test::RefCount refs_;
};

ComPtr<ITavController> MakeController(const OleString& url) {
    ComPtr<IClassFactory> factory;
    ComPtr<ITavController> controller;
    if (FAILED(DllGetClassObject(CLSID_TavController17, IID_IClassFactory, reinterpret_cast<void**>(&factory))) ||
        FAILED(factory->CreateInstance(nullptr, IID_ITavController, reinterpret_cast<void**>(&controller)))) {
        return {};
    }
    Bstr bound(url.c_str());
    if (FAILED(controller->Init(bound.Get()))) return {};
    return controller;
}

template <typename I>
ComPtr<I> View(const ComPtr<ITavController>& controller) {
    ComPtr<I> view;
    controller.As(view);
    return view;
}

bool KnownFailure(HRESULT hr) {
    switch (static_cast<std::uint32_t>(hr)) {
        case 0x80004005u:  // E_FAIL: a reply that does not match its grammar
        case 0x8007000Eu:  // E_OUTOFMEMORY
        case 0x80004001u:  // E_NOTIMPL
        case 0x80070057u:  // E_INVALIDARG: refused by the controller's own check
            return true;
        default:
            // The controller's statuses and the transport's failures.
            return (static_cast<std::uint32_t>(hr) & 0xFFFF0000u) == 0xC0040000u;
    }
}

bool NamesItsSite(OleStringView text) {
    const std::size_t open = text.rfind(OLESTR("TavControllerImpl["));
    return open != OleStringView::npos && text.size() >= 3 && text.compare(text.size() - 3, 3, OLESTR("]; ")) == 0;
}

// One operation of one subsystem, called on a controller; nonzero call types
// make it Async with the listener as callback.
using Operation = std::function<HRESULT(const ComPtr<ITavController>&, TavInParams*)>;

std::vector<Operation> MixedOperations() {
    return {
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            Bstr name;
            return c->GetControllerName(rip, name.Receive());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            Bstr name(OLESTR("soak cell"));
            return c->SetControllerName(rip, name.Get());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            FILETIME clock{};
            return c->GetSystemClock(rip, &clock);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavControllerState state{};
            return View<ITavPanel>(c)->GetControllerState(rip, &state);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavOperationMode mode{};
            ComPtr<IEnumAutoCondition2> conditions;
            ULONG cycle = 0;
            return View<ITavPanel2>(c)->GetOperationMode2(rip, &mode, &conditions, &cycle);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            short ratio = 0;
            return View<ITavPanel>(c)->GetSpeedRatio(rip, &ratio);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavBackupState state{};
            return View<ITavBackupRestore>(c)->GetBackupState(rip, &state);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavVantorConfigStatus status{};
            return View<ITavSafety>(c)->GetConfigStatus(rip, &status);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavVTState state{};
            return View<ITavVirtualTime>(c)->VTGetState(rip, &state);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            Bstr name;
            return View<ITavBoot>(c)->GetSystemName(rip, name.Receive());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            IPMethod method{};
            Bstr address, mask, gateway;
            return View<ITavLANAdaptor2>(c)->GetLANAdaptorIP(rip, &method, address.Receive(), mask.Receive(),
                                                             gateway.Receive());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            ULONG cameras = 0;
            return View<ITavLumeret>(c)->GetNumberOfCameras(rip, &cameras);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            Bstr zone;
            return View<ITavControllerTime>(c)->GetTimeZone(rip, zone.Receive());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavRetrievalParams retrieval{};
            retrieval.noOfElts = -2;
            ComPtr<IEnumStorageDevices2> devices;
            return View<ITavDynamicDevices2>(c)->GetStorageDevices2(rip, &retrieval, &devices);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavRetrievalParams retrieval{};
            retrieval.noOfElts = -2;
            ComPtr<IEnumSlots> slots;
            return View<ITavIPCInformation>(c)->GetSlotInformation(rip, &retrieval, &slots);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            HRESULT result = S_OK;
            return View<ITavSystemDiagnostics>(c)->GetDiagnosticsInfoStatus(rip, &result);
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            Bstr xml;
            return View<ITavController4>(c)->GetConnectedTavAPIClients(rip, xml.Receive());
        },
        [](const ComPtr<ITavController>& c, TavInParams* rip) {
            TavMastershipStatus status{};
            TavLoginInfo login{};
            LONG me = 0;
            const HRESULT hr = View<ITavMastership>(c)->GetCurrentMaster(rip, ResourceKESTO, &status, &login,
                                                                       &me);
            SysFreeString(login.userAlias);
            SysFreeString(login.location);
            SysFreeString(login.application);
            return hr;
        },
    };
}

class SoakTest : public ::testing::Test {
protected:
    void SetUp() override {
        CoInitializeEx(nullptr, COINIT_MULTITHREADED);
        registration_ = sim::RegisterInProcess();
        ASSERT_TRUE(registration_) << std::hex << registration_.Result();
    }
    void TearDown() override {
        registration_.Revoke();
        CoUninitialize();
    }

private:
    sim::InProcessRegistration registration_;
};

// The fault switches of one controller, flipped at random.
void FlipFaults(sim::ControllerModel& controller, std::mt19937& random) {
    static const OLECHAR* const kCommands[] = {OLESTR("CtrlName"), OLESTR("SystemClock"), OLESTR("State"),
                                               OLESTR("Mode"),     OLESTR("SpeedAdjust"), OLESTR("SlotInfo")};
    auto& faults = controller.Faults();
    const OLECHAR* command = kCommands[random() % std::size(kCommands)];
    switch (random() % 8) {
        case 0:
            faults.FailTransport();
            break;
        case 1:
            faults.RestoreTransport();
            break;
        case 2:
            faults.FailCommand(command);
            break;
        case 3:
            faults.ClearCommandFailure(command);
            break;
        case 4:
            faults.SetDelay(command, std::chrono::milliseconds(random() % 20));
            break;
        case 5:
            faults.GarbleReplies(command);
            break;
        case 6:
            faults.ClearGarbling(command);
            break;
        default:
            faults.Clear();
            break;
    }
}

TEST_F(SoakTest, SixteenThreadsOfMixedOperationsWhileFaultsFlip) {
    const double seconds = Setting("TAV_SOAK_SECONDS", 60);
    const double flipsPerSecond = Setting("TAV_SOAK_FLIPS_PER_SECOND", 50);
    constexpr int kThreads = 16;
    constexpr int kShared = 4;
    const OleString url = text::Widen("/soak");
    auto controller = sim::ControllerAt(url);
    ASSERT_TRUE(controller);

    std::vector<ComPtr<ITavController>> shared;
    for (int i = 0; i < kShared; ++i) {
        shared.push_back(MakeController(url));
        ASSERT_TRUE(shared.back());
    }
    ComPtr<Listener> listener;
    listener.Attach(new Listener);
    const std::vector<Operation> operations = MixedOperations();

    std::atomic<bool> stop{false};
    std::atomic<long> calls{0}, failures{0}, unknown{0}, unsited{0};
    std::atomic<long> byOperation[32] = {};
    const auto started = Clock::now();
    const long residentAtStart = ResidentKiB();
    long residentAfterWarmUp = 0;

    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            std::mt19937 random(static_cast<unsigned>(t) * 7919u + 1u);
            ComPtr<ITavController> own;
            while (!stop.load()) {
                // Every so often the thread's own object goes and a new one comes.
                if (!own || random() % 64 == 0) own = MakeController(url);
                const ComPtr<ITavController>& target = random() % 2 ? shared[random() % kShared] : own;
                if (!target) continue;
                const std::size_t which = random() % operations.size();
                TavInParams rip{};
                rip.riid = const_cast<GUID*>(&IID_ITavCommandCallback);
                rip.pCallback = static_cast<ITavCommandCallback*>(listener.Get());
                rip.callType = random() % 3 == 0 ? Async : Sync;
                rip.timeOut = 50;
                const HRESULT hr = operations[which](target, random() % 4 == 0 ? nullptr : &rip);
                ++calls;
                ++byOperation[which];
                if (SUCCEEDED(hr)) continue;
                ++failures;
                if (!KnownFailure(hr)) {
                    if (unknown++ < 5) ADD_FAILURE() << "operation " << which << " gave 0x" << std::hex << hr;
                    continue;
                }
                ComPtr<ITavHelperBase> helper;
                Bstr text;
                if (SUCCEEDED(target.As(helper)) && SUCCEEDED(helper->GetLastErrorInfo(text.Receive())) &&
                    !NamesItsSite(text.View())) {
                    if (unsited++ < 5) ADD_FAILURE() << "operation " << which << ": " << text::Narrow(text.View());
                }
            }
        });
    }

    std::mt19937 random(12345);
    const auto flipEvery = std::chrono::duration<double>(flipsPerSecond > 0 ? 1.0 / flipsPerSecond : seconds);
    while (Clock::now() - started < std::chrono::duration<double>(seconds)) {
        std::this_thread::sleep_for(flipEvery);
        if (flipsPerSecond > 0) FlipFaults(*controller, random);
        if (residentAfterWarmUp == 0 && Clock::now() - started > std::chrono::duration<double>(seconds / 10)) {
            residentAfterWarmUp = ResidentKiB();
        }
    }
    stop = true;
    for (auto& thread : threads) thread.join();
    controller->Faults().Clear();
    shared.clear();
    const long residentAtEnd = ResidentKiB();

    std::printf("soak: %.0f s, %d threads, %.0f fault flips/s: %ld calls (%ld failed as specified), "
                "%ld async replies delivered\n",
                seconds, kThreads, flipsPerSecond, calls.load(), failures.load(), listener->replies.load());
    std::printf("soak: memory in use %ld KiB at the start, %ld KiB after the first tenth, %ld KiB at the end\n",
                residentAtStart, residentAfterWarmUp, residentAtEnd);
    for (std::size_t i = 0; i < operations.size(); ++i) EXPECT_GT(byOperation[i].load(), 0) << "operation " << i;
    EXPECT_EQ(unknown.load(), 0);
    EXPECT_EQ(unsited.load(), 0);
    // Flat: what the first tenth built up (caches, the sanitizers' own
    // bookkeeping) may stay, the rest of the run may add little.
    if (residentAfterWarmUp > 0) {
        EXPECT_LT(residentAtEnd - residentAfterWarmUp, 32 * 1024 + residentAfterWarmUp / 4);
    }
}

// Objects are released while their asynchronous replies and events are still
// on their way: what arrives later must find nothing freed.
TEST_F(SoakTest, ObjectsReleasedWhileRepliesAndEventsAreInFlight) {
    const double seconds = Setting("TAV_SOAK_SECONDS", 60) / 4;
    const OleString url = text::Widen("/soak-release");
    auto controller = sim::ControllerAt(url);
    ASSERT_TRUE(controller);
    controller->Faults().SetDelay(OLESTR(""), std::chrono::milliseconds(5));
    ComPtr<Listener> listener;
    listener.Attach(new Listener);

    std::atomic<bool> stop{false};
    std::atomic<long> released{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            std::mt19937 random(static_cast<unsigned>(t) + 99u);
            while (!stop.load()) {
                ComPtr<ITavController> object = MakeController(url);
                if (!object) continue;
                TavEventParams params{};
                params.riid = const_cast<GUID*>(&IID__ITavObjectEvents);
                params.pSink = static_cast<_ITavObjectEvents*>(listener.Get());
                params.subscriptionType = random() % 2 ? state : mode;
                ULONG cookie = 0;
                View<ITavSubscribe>(object)->Subscribe(nullptr, &params, &cookie);
                TavInParams rip{};
                rip.riid = const_cast<GUID*>(&IID_ITavCommandCallback);
                rip.pCallback = static_cast<ITavCommandCallback*>(listener.Get());
                rip.callType = Async;
                for (int i = 0; i < 4; ++i) {
                    Bstr name;
                    object->GetControllerName(&rip, name.Receive());
                    TavControllerState state{};
                    View<ITavPanel>(object)->GetControllerState(&rip, &state);
                }
                // Events raised now reach the sink of an object on its way out.
                controller->SetMotorsState(random() % 2 ? OLESTR("motoron") : OLESTR("motoroff"));
                object.Reset();
                ++released;
            }
        });
    }
    std::this_thread::sleep_for(std::chrono::duration<double>(seconds));
    stop = true;
    for (auto& thread : threads) thread.join();
    controller->Faults().Clear();
    // Whatever is still queued is delivered or dropped before the component goes.
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
    std::printf("release: %ld objects released with replies and events in flight; %ld replies and %ld events "
                "delivered\n",
                released.load(), listener->replies.load(), listener->events.load());
    EXPECT_GT(released.load(), 0);
}

}  // namespace
}  // namespace tav::robustness
