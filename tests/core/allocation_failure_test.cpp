// Each allocation of an operation fails in turn: every run must end in a
// result the operation can give, leak nothing (LeakSanitizer checks at exit)
// and leave the object usable.
#include <functional>
#include <set>

#include "operations/controller/filetime.h"
#include "support/controller_test.h"
#include "tav/fault_injection.h"

namespace tav::test {
namespace {

class AllocationFailureTest : public ControllerTest {
protected:
    void SetUp() override {
        ControllerTest::SetUp();
        if (!TavFailAllocationAt(0)) {
            GTEST_SKIP() << "allocation failures cannot be injected on this platform";
        }
    }

    // Runs operation with each of its allocations failing in turn and returns
    // the results of the runs in which the failure struck.
    std::vector<HRESULT> ResultsWithFailures(const std::function<HRESULT()>& operation,
                                             const std::function<void()>& afterEach = [] {}) {
        std::vector<HRESULT> results;
        HRESULT last = S_OK;
        const long runs = ForEachAllocationFailure([&] { last = operation(); },
                                                   [&] {
                                                       results.push_back(last);
                                                       afterEach();
                                                   });
        EXPECT_EQ(runs, static_cast<long>(results.size()));
        return results;
    }
};

::testing::AssertionResult AllWithin(const std::vector<HRESULT>& results, std::set<HRESULT> allowed) {
    for (size_t i = 0; i < results.size(); ++i) {
        if (allowed.count(results[i]) == 0) {
            return ::testing::AssertionFailure() << "allocation " << i + 1 << " failing gave 0x" << std::hex
                                                 << static_cast<uint32_t>(results[i]);
        }
    }
    return ::testing::AssertionSuccess();
}

// The command component's own reply string may be the one that fails; the
// operation then sees a reply without text and says so.
TEST_F(AllocationFailureTest, SyncReadDecodesOrReportsOutOfMemory) {
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 5");
    FILETIME clock{};
    const auto results = ResultsWithFailures([&] { return object->GetSystemClock(nullptr, &clock); });
    EXPECT_GE(results.size(), 3u) << "the verb, command and argument strings";
    EXPECT_TRUE(AllWithin(results, {E_OUTOFMEMORY, E_FAIL}));
    EXPECT_EQ(results.front(), E_OUTOFMEMORY);
    EXPECT_EQ(object->GetSystemClock(nullptr, &clock), S_OK);
    EXPECT_EQ(TicksOf(clock), kUnixEpochTicks + 5 * kTicksPerSecond);
}

// The strings of a command that could not be built and a command that the
// component could not deliver are two failures; their texts name two lines.
TEST_F(AllocationFailureTest, UnbuiltAndUndeliveredCommandsReportDistinctLines) {
    ControllerObject* object = Make();
    TavFailAllocationAt(1);
    EXPECT_EQ(object->Restart(nullptr, WarmStart), E_OUTOFMEMORY);
    EXPECT_TRUE(HasError("SysAllocString failed"));
    const int unbuilt = Error().line;
    Component().FailExecute(E_ACCESSDENIED, "Link down");
    EXPECT_EQ(object->Restart(nullptr, WarmStart), E_ACCESSDENIED);
    EXPECT_NE(Error().line, unbuilt);
}

TEST_F(AllocationFailureTest, WritesReportOutOfMemory) {
    ControllerObject* object = Make();
    const std::function<HRESULT()> writes[] = {
        [&] { return object->SetSystemClock(nullptr, FileTimeOf(kUnixEpochTicks)); },
        [&] { return object->Restart(nullptr, PStart); },
    };
    for (const auto& write : writes) {
        const auto results = ResultsWithFailures(write);
        EXPECT_GE(results.size(), 3u);
        EXPECT_TRUE(AllWithin(results, {E_OUTOFMEMORY}));
        EXPECT_EQ(write(), S_OK);
    }
}

TEST_F(AllocationFailureTest, AsyncCallAndItsDeliveryLeakNothing) {
    ControllerObject* object = Make();
    Script("SystemClock", "-time_t 5");
    TavInParams rip = AsyncCall(1);
    FILETIME clock{};
    const auto results = ResultsWithFailures([&] {
        const HRESULT hr = object->GetSystemClock(&rip, &clock);
        Component().JoinDeliveries();
        return hr;
    });
    EXPECT_TRUE(AllWithin(results, {S_OK, E_OUTOFMEMORY}));
}

// Telling the callback of a failure copies the error text; when that copy
// fails the callback is still told, and the caller still gets the code.
TEST_F(AllocationFailureTest, FailureNotificationSurvives) {
    ControllerObject* object = Make();
    TavInParams rip = SyncCall(2);
    const auto results = ResultsWithFailures([&] { return object->GetSystemClock(&rip, nullptr); });
    EXPECT_GE(results.size(), 1u);
    EXPECT_TRUE(AllWithin(results, {E_POINTER}));
    EXPECT_EQ(Callback().Count(), results.size() + 1) << "told in every run, the last one without a failure too";
}

TEST_F(AllocationFailureTest, ErrorTextCopyReportsOutOfMemory) {
    ControllerObject* object = Make();
    object->GetSystemClock(nullptr, nullptr);
    TestBstr text;
    const auto results = ResultsWithFailures([&] { return object->GetLastErrorInfo(text.Out()); });
    ASSERT_EQ(results.size(), 1u);
    EXPECT_EQ(results[0], E_OUTOFMEMORY) << "a text that exists was reported as none";
}

TEST_F(AllocationFailureTest, ClientSetTextLeavesNoneOrTheNewOne) {
    ControllerObject* object = Make();
    TestVariant data = TestVariant::Text("client text");
    const auto results = ResultsWithFailures([&] { return object->SetLastErrorInfo(data.Get()); },
                                             [&] {
                                                 const std::string text = ErrorText(object);
                                                 EXPECT_TRUE(text.empty() || text == "client text") << text;
                                             });
    EXPECT_TRUE(AllWithin(results, {S_OK, E_OUTOFMEMORY}));
}

// A failed Init, whichever allocation failed, leaves the object as it was
// before: not initialised, holding nothing, and able to Init again.
TEST_F(AllocationFailureTest, InitFailsCleanlyAndCanBeRepeated) {
    TestBstr url{std::string_view(kUrl)};
    ControllerObject* object = nullptr;
    std::set<HRESULT> seen;
    ForEachAllocationFailure(
        [&] {
            object = MakeUninitialised();
            seen.insert(object->Init(url.Get()));
        },
        [&] {
            if (object->Restart(nullptr, WarmStart) != E_ABORT) {
                return;  // the failure struck after Init had succeeded
            }
            EXPECT_EQ(Component().References(), 2u);
            EXPECT_EQ(User().References(), 2u);
            EXPECT_EQ(object->Init(url.Get()), S_OK) << ErrorText(object);
        });
    EXPECT_TRUE(seen.count(E_OUTOFMEMORY)) << "the stored URL is an allocation of its own";
}

}  // namespace
}  // namespace tav::test
