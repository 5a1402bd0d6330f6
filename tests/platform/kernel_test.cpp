#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include "platform_test_support.h"
#include "tav/lock.h"
#include "tav/semaphore.h"

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

TEST(CriticalSection, IsRecursiveAndExcludesOtherThreads) {
    tav::CriticalSection section;
    long unguarded = 0;  // plain on purpose: the section must be what keeps it right
    {
        tav::CriticalSectionLock outer(section);
        tav::CriticalSectionLock inner(section);  // would deadlock if not recursive
        std::thread other([&] { EXPECT_FALSE(section.TryEnter()); });
        other.join();
    }
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&] {
            for (int i = 0; i < 10000; ++i) {
                tav::CriticalSectionLock lock(section);
                ++unguarded;
            }
        });
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(unguarded, 40000);
}

TEST(Interlocked, CountsExactlyAcrossThreads) {
    LONG volatile counter = 0;
    LONG volatile lastWritten = 0;
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&] {
            for (int i = 0; i < 20000; ++i) {
                InterlockedIncrement(&counter);
                InterlockedIncrement(&counter);
                InterlockedDecrement(&counter);
            }
        });
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(counter, 80000);
    EXPECT_EQ(InterlockedExchange(&lastWritten, 5), 0);
    EXPECT_EQ(InterlockedCompareExchange(&lastWritten, 9, 4), 5);  // no match: unchanged
    EXPECT_EQ(InterlockedCompareExchange(&lastWritten, 9, 5), 5);
    EXPECT_EQ(lastWritten, 9);
    EXPECT_EQ(InterlockedDecrement(&lastWritten), 8);
}

TEST(Semaphore, WaitOnAnEmptySemaphoreLastsAboutItsTimeout) {
    tav::Semaphore semaphore;
    ASSERT_EQ(semaphore.Create(0, 1), S_OK);
    auto start = Clock::now();
    EXPECT_EQ(semaphore.Wait(0), WAIT_TIMEOUT);
    EXPECT_LT(Clock::now() - start, milliseconds(50));
    start = Clock::now();
    EXPECT_EQ(semaphore.Wait(100), WAIT_TIMEOUT);
    auto waited = Clock::now() - start;
    EXPECT_GE(waited, milliseconds(90));
    EXPECT_LT(waited, milliseconds(2000));
}

TEST(Semaphore, CountsReleasesAndRefusesToPassItsMaximumOrBadCounts) {
    tav::Semaphore semaphore;
    ASSERT_EQ(semaphore.Create(1, 3), S_OK);
    LONG previous = -1;
    EXPECT_TRUE(semaphore.Release(2, &previous));
    EXPECT_EQ(previous, 1);
    EXPECT_FALSE(semaphore.Release(1));  // would be 4
    for (int i = 0; i < 3; ++i) EXPECT_EQ(semaphore.Wait(0), WAIT_OBJECT_0);
    EXPECT_EQ(semaphore.Wait(0), WAIT_TIMEOUT);

    tav::Semaphore invalid;
    EXPECT_TRUE(FAILED(invalid.Create(2, 1)));
    EXPECT_FALSE(invalid.IsValid());
    EXPECT_EQ(invalid.Wait(0), WAIT_FAILED);
}

TEST(Semaphore, ReleaseWakesAWaitingThread) {
    tav::Semaphore semaphore;
    ASSERT_EQ(semaphore.Create(0, 10), S_OK);
    std::atomic<int> taken{0};
    std::vector<std::thread> waiters;
    for (int t = 0; t < 3; ++t)
        waiters.emplace_back([&] {
            if (semaphore.Wait(5000) == WAIT_OBJECT_0) ++taken;
        });
    std::this_thread::sleep_for(milliseconds(20));
    EXPECT_TRUE(semaphore.Release(3));
    for (auto& waiter : waiters) waiter.join();
    EXPECT_EQ(taken, 3);
    EXPECT_EQ(semaphore.Wait(0), WAIT_TIMEOUT);
}

TEST(Module, FileNameOfTheExecutableAndOfTheModuleHoldingAnAddress) {
    OLECHAR path[4096];
    DWORD length = GetModuleFileNameW(nullptr, path, 4096);
    ASSERT_GT(length, 0u);
    tav::test::OleString executable(path, length);
    EXPECT_NE(executable.find(OLESTR("tav_platform_tests")), tav::test::OleString::npos);

    HMODULE module = nullptr;
    static int anchor;
    ASSERT_TRUE(GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                                   reinterpret_cast<LPCWSTR>(&anchor), &module));
    EXPECT_EQ(GetModuleFileNameW(module, path, 4096), length);
    EXPECT_EQ(tav::test::OleString(path, length), executable);

    // Too small a buffer: the path is cut and the buffer size returned.
    EXPECT_EQ(GetModuleFileNameW(module, path, 5), 5u);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
}

TEST(TextConversion, AnsiCodePageIsLatin1) {
    const char text[] = "Caf\xe9 \xb0";
    OLECHAR wide[16];
    int count = MultiByteToWideChar(CP_ACP, 0, text, -1, wide, 16);
    ASSERT_EQ(count, 7);  // the terminator counts
    EXPECT_EQ(tav::test::OleString(wide), OLESTR("Caf\u00e9 \u00b0"));
    EXPECT_EQ(MultiByteToWideChar(CP_ACP, 0, text, 4, nullptr, 0), 4);
    EXPECT_EQ(MultiByteToWideChar(CP_ACP, 0, text, -1, wide, 3), 0);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
}

}  // namespace
