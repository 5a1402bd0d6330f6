// Virtual time: the commands with their borrowed texts, and the replies.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class VirtualTimeTest : public ControllerTest {};

TEST_F(VirtualTimeTest, EveryOperationFollowsTheCallPatternWithItsTexts) {
    TavVTState state{};
    ULONG value = 0;
    const CallPattern patterns[] = {
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetState(r, n ? nullptr : &state); },
         "VTGetState: Invalid TavInParams", "VTGetState. TavController used before Initialized",
         "VTGetState: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetState(r, VTFreeRun); },
         "VTSetState: Invalid TavInParams", "VTSetState. Helper used before initialized.", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetTimeSlice(r, n ? nullptr : &value); },
         "VTGetTimeSlice: Invalid TavInParams", "VTGetTimeSlice. TavController used before Initialized",
         "VTGetTimeSlice: Invalid out-pointer"},
        // The time slice setter reports a missing Init with the state setter's text.
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetTimeSlice(r, 10); },
         "VTSetTimeSlice: Invalid TavInParams", "VTSetState. Helper used before initialized.", std::nullopt},
        // The time getter reports with the time slice getter's texts.
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetTime(r, n ? nullptr : &value); },
         "VTGetTimeSlice: Invalid TavInParams", "VTGetTimeSlice. TavController used before Initialized",
         "VTGetTimeSlice: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTRun(r); }, "VTRun: Invalid TavInParams",
         "VTRun. Helper used before initialized.", std::nullopt},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetSpeed(r, 2); }, "VTSetSpeed: Invalid TavInParams",
         "VTSetSpeed. Helper used before initialized.", std::nullopt},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetSpeed(r, n ? nullptr : &value); },
         "VTGetSpeed: Invalid TavInParams", "VTGetSpeed. TavController used before Initialized",
         "VTGetSpeed: Invalid out-pointer"},
    };
    Script("VTState", "-VTState Stop");
    Script("VTTimeSlice", "-time 10");
    Script("VTTime", "-time 10");
    Script("VTSpeed", "-speed 1");
    for (const CallPattern& pattern : patterns) {
        SCOPED_TRACE(pattern.invalidParams);
        ExpectCallPattern(pattern);
    }
}

TEST_F(VirtualTimeTest, SendsTheCommandTexts) {
    struct Case {
        std::function<HRESULT(ControllerObject&)> call;
        const char* verb;
        const char* command;
        const char* args;
    };
    TavVTState state{};
    ULONG value = 0;
    const Case cases[] = {
        {[&](ControllerObject& o) { return o.VTGetState(nullptr, &state); }, "Get", "VTState", ""},
        {[](ControllerObject& o) { return o.VTSetState(nullptr, VTStop); }, "Set", "VTState", "VTStop"},
        {[](ControllerObject& o) { return o.VTSetState(nullptr, VTFreeRun); }, "Set", "VTState", "VTFreeRun"},
        {[](ControllerObject& o) { return o.VTSetState(nullptr, VTRunSlice); }, "Set", "VTState", "VTRunSlice"},
        {[](ControllerObject& o) { return o.VTSetState(nullptr, VTNextEvent); }, "Set", "VTState", "VTNextEvent"},
        {[&](ControllerObject& o) { return o.VTGetTimeSlice(nullptr, &value); }, "Get", "VTTimeSlice", ""},
        {[](ControllerObject& o) { return o.VTSetTimeSlice(nullptr, 4294967295u); }, "Set", "VTTimeSlice",
         "-time 4294967295"},
        {[&](ControllerObject& o) { return o.VTGetTime(nullptr, &value); }, "Get", "VTTime", ""},
        {[](ControllerObject& o) { return o.VTRun(nullptr); }, "Set", "VTRun", ""},
        {[](ControllerObject& o) { return o.VTSetSpeed(nullptr, 4294967295u); }, "Set", "VTSpeed",
         "-speed 4294967295"},
        {[&](ControllerObject& o) { return o.VTGetSpeed(nullptr, &value); }, "Get", "VTSpeed", ""},
    };
    Script("VTState", "-VTState Stop");
    Script("VTTimeSlice", "-time 10");
    Script("VTTime", "-time 10");
    Script("VTSpeed", "-speed 1");
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.command) + " " + c.args);
        ASSERT_EQ(c.call(*object), S_OK);
        EXPECT_EQ(LastCommand().verb, c.verb);
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
    EXPECT_EQ(object->VTSetState(nullptr, static_cast<TavVTState>(4)), E_INVALIDARG);
    EXPECT_TRUE(HasError("VTSetState - Unknown state"));
    EXPECT_EQ(object->VTSetState(nullptr, static_cast<TavVTState>(-1)), E_INVALIDARG);
}

TEST_F(VirtualTimeTest, StateRepliesAreWholeTexts) {
    const std::pair<const char*, TavVTState> known[] = {{"-VTState Stop", VTStop},
                                                        {"-VTState FreeRun", VTFreeRun},
                                                        {"-VTState RunSlice", VTRunSlice},
                                                        {"-VTState NextEvent", VTNextEvent}};
    ControllerObject* object = Make();
    for (const auto& [text, value] : known) {
        TestVariant reply = TestVariant::Text(text);
        TavVTState state = value == VTStop ? VTFreeRun : VTStop;
        ASSERT_EQ(object->UnpackVTState(reply.Get(), &state), S_OK) << text;
        EXPECT_EQ(state, value);
    }
    for (const char* text : {"FreeRun", "-VTState VTFreeRun", "-VTState FreeRun ", "-VTState  FreeRun"}) {
        TestVariant reply = TestVariant::Text(text);
        TavVTState state = VTNextEvent;
        EXPECT_EQ(object->UnpackVTState(reply.Get(), &state), E_FAIL) << text;
        EXPECT_TRUE(HasError(std::string("UnpackVTState. Unknown state ") + text + "."));
        EXPECT_EQ(state, VTNextEvent);
    }
}

TEST_F(VirtualTimeTest, TimeAndSpeedRepliesNeedTheirNumber) {
    struct Decoder {
        HRESULT (STDMETHODCALLTYPE ControllerObject::*unpack)(VARIANT*, ULONG*);
        const char* key;
        const char* name;
    };
    ControllerObject* object = Make();
    for (const Decoder& d : {Decoder{&ControllerObject::UnpackVTTime, "-time", "UnpackVTTime"},
                             Decoder{&ControllerObject::UnpackVTSpeed, "-speed", "UnpackVTSpeed"}}) {
        SCOPED_TRACE(d.name);
        TestVariant good = TestVariant::Text(std::string(d.key) + " 4294967295");
        ULONG value = 0;
        ASSERT_EQ((object->*d.unpack)(good.Get(), &value), S_OK);
        EXPECT_EQ(value, 4294967295u);
        const std::string missing = std::string(d.key) + " ";
        TestVariant bad = TestVariant::Text(missing);
        value = 7;
        EXPECT_EQ((object->*d.unpack)(bad.Get(), &value), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Could not parse: " + missing + "."));
        EXPECT_EQ(value, 7u);
        TestVariant number = TestVariant::Number(3);
        EXPECT_EQ((object->*d.unpack)(number.Get(), &value), E_FAIL);
        EXPECT_TRUE(HasError(std::string(d.name) + ". Non-BSTR argument."));
        EXPECT_EQ((object->*d.unpack)(nullptr, &value), E_INVALIDARG);
        EXPECT_TRUE(HasError(std::string(d.name) + ". NULL data-variant"));
        EXPECT_EQ((object->*d.unpack)(number.Get(), nullptr), E_POINTER);
    }
}

}  // namespace
}  // namespace tav::test
