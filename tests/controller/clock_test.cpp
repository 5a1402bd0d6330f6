// Clock and restart: the command texts, the range of the clock, the restart
// words, and the reply decoding conventions through UnpackSystemClock.
#include <map>
#include <set>
#include <string>

#include "operations/controller/filetime.h"
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr uint64_t kFirstTicks = kUnixEpochTicks;                           // 1970-01-01 00:00:00
constexpr uint64_t kLastTicks = 159394408950000000ull;                      // 2106-02-07 06:28:15
constexpr FILETIME kUntouched{0xAAAAAAAAu, 0x55555555u};

bool Untouched(const FILETIME& time) {
    return time.dwLowDateTime == kUntouched.dwLowDateTime && time.dwHighDateTime == kUntouched.dwHighDateTime;
}

class ClockTest : public ControllerTest {};

TEST_F(ClockTest, EveryOperationFollowsTheCallPattern) {
    const CallPattern patterns[] = {
        {[](ControllerObject& o, TavInParams* rip, bool nullOut) {
             FILETIME clock{};
             return o.GetSystemClock(rip, nullOut ? nullptr : &clock);
         },
         "GetSystemClock: Invalid TavInParams", "GetSystemClock. Helper used before initialized.",
         "GetSystemClock: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* rip, bool nullOut) {
             FILETIME clock{};
             return o.GetSystemStartupClock(rip, nullOut ? nullptr : &clock);
         },
         "GetSystemStartupClock: Invalid TavInParams", "GetSystemStartupClock. Helper used before initialized.", ""},
        {[](ControllerObject& o, TavInParams* rip, bool) { return o.SetSystemClock(rip, FileTimeOf(kFirstTicks)); },
         "SetSystemClock: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
        {[](ControllerObject& o, TavInParams* rip, bool) { return o.Restart(rip, WarmStart); },
         "Restart: Invalid TavInParams", "TavController used before Initialized", std::nullopt},
    };
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

TEST_F(ClockTest, ClockReadsAreSentAndDecoded) {
    struct Case {
        const char* command;
        HRESULT (ControllerObject::*read)(TavInParams*, FILETIME*);
    };
    for (const Case& c : {Case{"SystemClock", &ControllerObject::GetSystemClock},
                          Case{"SystemStartupClock", &ControllerObject::GetSystemStartupClock}}) {
        SCOPED_TRACE(c.command);
        ControllerObject* object = Make();
        Script(c.command, "-time_t 4294967295");
        FILETIME clock = kUntouched;
        EXPECT_EQ((object->*c.read)(nullptr, &clock), S_OK);
        EXPECT_EQ(TicksOf(clock), kLastTicks);
        const RecordedCommand sent = LastCommand();
        EXPECT_EQ(sent.verb, "Get");
        EXPECT_EQ(sent.command, c.command);
        EXPECT_EQ(sent.args, "");
        EXPECT_EQ(sent.url, "/ctrl");
    }
}

TEST_F(ClockTest, SetSystemClockSendsWholeSecondsWithinTheControllerRange) {
    struct Case {
        const char* name;
        uint64_t ticks;
        const char* args;   // nullptr: refused
        const char* error;
    };
    const char* below = "SetSystemClock - Clock below valid range for controller (Unix time_t)";
    const char* above = "SetSystemClock - Clock above valid range for controller (Unix time_t)";
    const Case cases[] = {
        {"first second", kFirstTicks, "-time_t 0", nullptr},
        {"fraction dropped", kFirstTicks + kTicksPerSecond - 1, "-time_t 0", nullptr},
        {"one second", kFirstTicks + kTicksPerSecond, "-time_t 1", nullptr},
        {"last second", kLastTicks, "-time_t 4294967295", nullptr},
        {"one tick early", kFirstTicks - 1, nullptr, below},
        {"year 1601", 0, nullptr, below},
        {"one tick late", kLastTicks + 1, nullptr, above},
        {"largest FILETIME", UINT64_MAX, nullptr, above},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        Component().ClearRecords();
        const HRESULT hr = object->SetSystemClock(nullptr, FileTimeOf(c.ticks));
        if (c.args != nullptr) {
            EXPECT_EQ(hr, S_OK);
            EXPECT_EQ(LastCommand().verb, "Set");
            EXPECT_EQ(LastCommand().command, "SystemClock");
            EXPECT_EQ(LastCommand().args, c.args);
        } else {
            EXPECT_EQ(hr, E_INVALIDARG);
            EXPECT_TRUE(HasError(c.error));
            EXPECT_EQ(CommandCount(), 0u);
        }
    }
    EXPECT_EQ(object->SetSystemClock(nullptr, FileTimeOf(0)), E_INVALIDARG);
    const int belowLine = Error().line;
    EXPECT_EQ(object->SetSystemClock(nullptr, FileTimeOf(UINT64_MAX)), E_INVALIDARG);
    EXPECT_NE(Error().line, belowLine);
}

TEST_F(ClockTest, RangeIsCheckedOnlyOnceInitialised) {
    ControllerObject* object = MakeUninitialised();
    EXPECT_EQ(object->SetSystemClock(nullptr, FileTimeOf(0)), E_ABORT);
    EXPECT_EQ(object->Restart(nullptr, static_cast<TavRestartMode>(7)), E_ABORT);
}

TEST_F(ClockTest, RestartSendsTheModeWordAlone) {
    const std::pair<TavRestartMode, const char*> words[] = {
        {WarmStart, "WARM"},    {ColdStart, "COLD"},    {PStart, "P_START"}, {IStart, "I_START"},
        {XStart, "X_START"},    {SStart, "S_START"},    {BStart, "B_START"}};
    ControllerObject* object = Make();
    for (const auto& [mode, word] : words) {
        EXPECT_EQ(object->Restart(nullptr, mode), S_OK) << word;
        EXPECT_EQ(LastCommand().verb, "Set");
        EXPECT_EQ(LastCommand().command, "Restart");
        EXPECT_EQ(LastCommand().args, word);
    }
}

TEST_F(ClockTest, RestartRefusesUnknownModesBeforeSending) {
    ControllerObject* object = Make();
    for (int mode : {7, -1, 0x7FFFFFFF}) {
        SCOPED_TRACE(mode);
        TavInParams rip = SyncCall(5);
        EXPECT_EQ(object->Restart(&rip, static_cast<TavRestartMode>(mode)), E_INVALIDARG);
        EXPECT_TRUE(HasError("Restart. Unknown restart mode"));
        EXPECT_EQ(Callback().Last().status, E_INVALIDARG);
    }
    EXPECT_EQ(CommandCount(), 0u);
    EXPECT_EQ(Callback().Count(), 3u);
}

// The checks of every Unpack operation, in their order, with their texts,
// each failure on a line of its own.
TEST_F(ClockTest, UnpackSystemClockChecksInOrder) {
    enum class Data { Null, Text, Number, NullText };
    struct Case {
        const char* name;
        bool initialised;
        Data data;
        const char* text;
        bool nullOut;
        HRESULT hr;
        const char* error;
    };
    const Case cases[] = {
        {"before Init", false, Data::Text, "-time_t 1", false, E_ABORT, "TavController used before Initialized"},
        {"before Init, nothing valid", false, Data::Null, "", true, E_ABORT, "TavController used before Initialized"},
        {"NULL VARIANT", true, Data::Null, "", false, E_INVALIDARG, "UnpackSystemClock. NULL data-variant"},
        {"NULL VARIANT and out-pointer", true, Data::Null, "", true, E_INVALIDARG,
         "UnpackSystemClock. NULL data-variant"},
        {"NULL out-pointer", true, Data::Text, "-time_t 1", true, E_POINTER, ""},
        {"NULL out-pointer, non-BSTR", true, Data::Number, "", true, E_POINTER, ""},
        {"VT_I4", true, Data::Number, "", false, E_FAIL, "UnpackSystemClock. Invalid argument."},
        {"other key", true, Data::Text, "-time 1", false, E_FAIL, "UnpackSystemClock. Unsupported time-format."},
        {"no number", true, Data::Text, "-time_t x", false, E_FAIL, "UnpackSystemClock. Unsupported time-format."},
        {"empty text", true, Data::Text, "", false, E_FAIL, "UnpackSystemClock. Unsupported time-format."},
        {"NULL BSTR", true, Data::NullText, "", false, E_FAIL, "UnpackSystemClock. Unsupported time-format."},
    };
    std::map<std::string, int> lineOfError;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        ControllerObject* object = c.initialised ? Make() : MakeUninitialised();
        TestVariant data = c.data == Data::Number     ? TestVariant::Number(1)
                           : c.data == Data::NullText ? TestVariant::NullBstr()
                                                      : TestVariant::Text(c.text);
        FILETIME clock = kUntouched;
        EXPECT_EQ(object->UnpackSystemClock(c.data == Data::Null ? nullptr : data.Get(), c.nullOut ? nullptr : &clock),
                  c.hr);
        EXPECT_TRUE(HasError(c.error, object));
        EXPECT_TRUE(Untouched(clock)) << "a failed decoding wrote the clock";
        const int line = Error(object).line;
        EXPECT_EQ(lineOfError.emplace(c.error, line).first->second, line);
    }
    std::set<int> lines;
    for (const auto& [error, line] : lineOfError) {
        EXPECT_TRUE(lines.insert(line).second) << "\"" << error << "\" reports another failure's line";
    }
}

TEST_F(ClockTest, UnpackSystemClockConvertsControllerSeconds) {
    const std::pair<const char*, uint64_t> cases[] = {
        {"-time_t 0", kFirstTicks},
        {"-time_t 1", kFirstTicks + kTicksPerSecond},
        {"-time_t 4294967295", kLastTicks},
        {"-time_t   17 and more", kFirstTicks + 17 * kTicksPerSecond},
    };
    ControllerObject* object = Make();
    for (const auto& [text, ticks] : cases) {
        TestVariant data = TestVariant::Text(text);
        FILETIME clock = kUntouched;
        EXPECT_EQ(object->UnpackSystemClock(data.Get(), &clock), S_OK) << text;
        EXPECT_EQ(TicksOf(clock), ticks) << text;
    }
}

}  // namespace
}  // namespace tav::test
