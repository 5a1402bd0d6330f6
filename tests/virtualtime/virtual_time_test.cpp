// Virtual time: the commands with their borrowed texts, and the replies.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class VirtualTimeTest : public ControllerTest {};

// Each command's text; one row of each operation also carries the texts
// of its call pattern.
TEST_F(VirtualTimeTest, EveryOperationFollowsTheCallPatternAndSendsItsText) {
    struct Case {
        std::function<HRESULT(ControllerObject&, TavInParams*, bool nullOut)> call;
        const char* verb;
        const char* command;
        const char* args;
        const char* invalidParams = nullptr;
        const char* beforeInit = nullptr;
        const char* nullOut = nullptr;
    };
    TavVTState state{};
    ULONG value = 0;
    const Case cases[] = {
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetState(r, n ? nullptr : &state); }, "Get",
         "VTState", "", "VTGetState: Invalid TavInParams", "VTGetState. TavController used before Initialized",
         "VTGetState: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetState(r, VTStop); }, "Set", "VTState", "VTStop"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetState(r, VTFreeRun); }, "Set", "VTState",
         "VTFreeRun", "VTSetState: Invalid TavInParams", "VTSetState. Helper used before initialized."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetState(r, VTRunSlice); }, "Set", "VTState",
         "VTRunSlice"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetState(r, VTNextEvent); }, "Set", "VTState",
         "VTNextEvent"},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetTimeSlice(r, n ? nullptr : &value); }, "Get",
         "VTTimeSlice", "", "VTGetTimeSlice: Invalid TavInParams",
         "VTGetTimeSlice. TavController used before Initialized", "VTGetTimeSlice: Invalid out-pointer"},
        // The time slice setter reports a missing Init with the state setter's text.
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetTimeSlice(r, 4294967295u); }, "Set",
         "VTTimeSlice", "-time 4294967295", "VTSetTimeSlice: Invalid TavInParams",
         "VTSetState. Helper used before initialized."},
        // The time getter reports with the time slice getter's texts.
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetTime(r, n ? nullptr : &value); }, "Get",
         "VTTime", "", "VTGetTimeSlice: Invalid TavInParams", "VTGetTimeSlice. TavController used before Initialized",
         "VTGetTimeSlice: Invalid out-pointer"},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTRun(r); }, "Set", "VTRun", "",
         "VTRun: Invalid TavInParams", "VTRun. Helper used before initialized."},
        {[](ControllerObject& o, TavInParams* r, bool) { return o.VTSetSpeed(r, 4294967295u); }, "Set", "VTSpeed",
         "-speed 4294967295", "VTSetSpeed: Invalid TavInParams", "VTSetSpeed. Helper used before initialized."},
        {[&](ControllerObject& o, TavInParams* r, bool n) { return o.VTGetSpeed(r, n ? nullptr : &value); }, "Get",
         "VTSpeed", "", "VTGetSpeed: Invalid TavInParams", "VTGetSpeed. TavController used before Initialized",
         "VTGetSpeed: Invalid out-pointer"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.command) + " " + c.args);
        if (c.invalidParams != nullptr) {
            ExpectCallPattern({c.call, c.invalidParams, c.beforeInit,
                               c.nullOut ? std::optional<std::string>(c.nullOut) : std::nullopt});
        }
        Script("VTState", "-VTState Stop");
        Script("VTTimeSlice", "-time 10");
        Script("VTTime", "-time 10");
        Script("VTSpeed", "-speed 1");
        ControllerObject* object = Make();
        ASSERT_EQ(c.call(*object, nullptr, false), S_OK);
        EXPECT_EQ(LastCommand().verb, c.verb);
        EXPECT_EQ(LastCommand().command, c.command);
        EXPECT_EQ(LastCommand().args, c.args);
    }
    ControllerObject* object = Make();
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
