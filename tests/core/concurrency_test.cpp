// One object called from many threads at once, as the threading model "Both"
// allows: the error text under its lock, the reference counts, and replies
// arriving on the component's threads. Meant for the ThreadSanitizer build.
#include <atomic>
#include <thread>
#include <vector>

#include "core/module_lock.h"
#include "operations/controller/filetime.h"
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr int kThreads = 8;
constexpr int kRounds = 200;

class ConcurrencyTest : public ControllerTest {};

TEST_F(ConcurrencyTest, ManyThreadsShareOneObject) {
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 9");
    TestVariant clientText = TestVariant::Text("client text");
    std::atomic<int> wrong{0};
    std::atomic<int> asyncSent{0};

    auto work = [&](int thread) {
        for (int round = 0; round < kRounds; ++round) {
            FILETIME clock{};
            switch ((thread + round) % 6) {
            case 0:
                if (object->GetSystemClock(nullptr, &clock) != S_OK ||
                    TicksOf(clock) != kUnixEpochTicks + 9 * kTicksPerSecond) {
                    ++wrong;
                }
                break;
            case 1:
                if (object->GetSystemClock(nullptr, nullptr) != E_POINTER) ++wrong;
                break;
            case 2: {
                TestBstr text;
                if (object->GetLastErrorInfo(text.Out()) != S_OK) ++wrong;
                break;
            }
            case 3:
                if (object->SetLastErrorInfo(clientText.Get()) != S_OK) ++wrong;
                break;
            case 4: {
                IUnknown* unknown = nullptr;
                if (object->QueryInterface(IID_ITavController3, reinterpret_cast<void**>(&unknown)) != S_OK) {
                    ++wrong;
                } else {
                    unknown->AddRef();
                    unknown->Release();
                    unknown->Release();
                }
                break;
            }
            case 5: {
                TavInParams rip = AsyncCall(static_cast<ULONG>(thread));
                if (object->GetSystemClock(&rip, &clock) != S_OK) ++wrong;
                ++asyncSent;
                break;
            }
            }
        }
    };
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
        threads.emplace_back(work, i);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    Component().JoinDeliveries();

    EXPECT_EQ(wrong.load(), 0);
    EXPECT_EQ(Callback().Count(), static_cast<size_t>(asyncSent.load()));
    const std::string text = ErrorText(object);
    EXPECT_TRUE(text == "client text" || HasError("GetSystemClock: Invalid out-pointer", object)) << text;
}

// Objects made and dropped on many threads keep the module's lock count.
TEST_F(ConcurrencyTest, ObjectsComeAndGoOnManyThreads) {
    auto work = [] {
        for (int round = 0; round < kRounds; ++round) {
            void* made = nullptr;
            if (SUCCEEDED(ControllerObject::Create(1 + round % 17, nullptr, IID_ITavHelperBase, &made))) {
                static_cast<ITavHelperBase*>(made)->Release();
            }
        }
    };
    const LONG before = ModuleLock::Count();
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
        threads.emplace_back(work);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(ModuleLock::Count(), before);
}

}  // namespace
}  // namespace tav::test
