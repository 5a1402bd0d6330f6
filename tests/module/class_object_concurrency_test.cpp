// Many threads asking for the class objects at once, for the
// ThreadSanitizer build: each class still gets exactly one class object.
#include <gtest/gtest.h>

#include <condition_variable>
#include <mutex>
#include <thread>
#include <vector>

#include "module/class_objects.h"
#include "module_test_support.h"

namespace tav::test {
namespace {

// Lets the threads go together once all have arrived. Not std::latch: with
// MinGW's libstdc++ (GCC 12) its wait can miss the last arrival and hang.
class StartGate {
public:
    explicit StartGate(int threads) : expected_(threads) {}
    void ArriveAndWait() {
        std::unique_lock hold(lock_);
        if (++arrived_ == expected_) {
            open_.notify_all();
        } else {
            open_.wait(hold, [this] { return arrived_ == expected_; });
        }
    }

private:
    const int expected_;
    int arrived_ = 0;
    std::mutex lock_;
    std::condition_variable open_;
};

TEST(ClassObjectConcurrency, SimultaneousFirstUseMakesOneClassObjectPerClass) {
    constexpr int kThreads = 8;
    for (int round = 0; round < 5; ++round) {
        ReleaseClassObjects();
        StartGate start(kThreads);
        std::vector<std::vector<IUnknown*>> seen(kThreads, std::vector<IUnknown*>(kClasses.size()));
        std::vector<std::thread> threads;
        for (int t = 0; t < kThreads; ++t) {
            threads.emplace_back([&, t] {
                start.ArriveAndWait();
                // Half the threads walk the table backwards, so rows are contended from both ends.
                for (size_t k = 0; k < kClasses.size(); ++k) {
                    const size_t row = t % 2 == 0 ? k : kClasses.size() - 1 - k;
                    DllGetClassObject(*kClasses[row].clsid, IID_IUnknown, reinterpret_cast<void**>(&seen[t][row]));
                }
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        for (size_t row = 0; row < kClasses.size(); ++row) {
            ASSERT_NE(seen[0][row], nullptr) << kClasses[row].name;
            for (int t = 1; t < kThreads; ++t) {
                EXPECT_EQ(seen[t][row], seen[0][row]) << kClasses[row].name << " thread " << t;
            }
            for (int t = 0; t < kThreads; ++t) {
                seen[t][row]->Release();
            }
        }
    }
    EXPECT_EQ(DllCanUnloadNow(), S_OK);
}

}  // namespace
}  // namespace tav::test
