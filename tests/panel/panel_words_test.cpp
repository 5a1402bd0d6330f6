// The one-word decoders of the panel: their tables (exact, case-sensitive,
// whole words; "AUTO_CH" a prefix in version 2 only) and their checks in order.
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr int kUntouched = 7;  // no decoder gives 7, yet each of these enums can hold it
constexpr int kUnknown = -1;

struct Decoder {
    const char* name;
    std::function<HRESULT(ControllerObject&, VARIANT*, int* value, bool nullOut)> unpack;
    std::string nullVariant, nonBstr, unknown;  // in unknown, "@" stands for the word
};

template <class E, class Run>
auto Through(Run run) {
    return [run](ControllerObject& object, VARIANT* data, int* value, bool nullOut) {
        E out = static_cast<E>(kUntouched);
        const HRESULT hr = run(object, data, nullOut ? nullptr : &out);
        *value = static_cast<int>(out);
        return hr;
    };
}

const Decoder kState{
    "State", Through<TavControllerState>([](auto& o, auto* v, auto* s) { return o.UnpackControllerState(v, s); }),
    "UnpackControllerState. NULL VARIANT", "UnpackControllerState. Non-BSTR argument.",
    "UnpackControllerState. Unsupported state:@"};
const Decoder kMode{"Mode",
                    Through<TavOperationMode>([](auto& o, auto* v, auto* m) { return o.UnpackOperationMode(v, m); }),
                    "UnpackOperationMode. NULL data-variant", "UnpackOperationMode. Non-BSTR argument.",
                    "UnpackOperationMode. Unsupported mode @."};
const Decoder kMode2{"Mode2", Through<TavOperationMode>([](auto& o, auto* v, auto* m) {
                         return o.UnpackOperationMode2(v, m, nullptr, nullptr);
                     }),
                     "UnpackOperationMode2. NULL data-variant", "UnpackOperationMode2. Non-BSTR argument.",
                     "UnpackOperationMode. Unsupported mode @."};
const Decoder kCollision{"Coldet", Through<TavCollisionDetectState>([](auto& o, auto* v, auto* s) {
                             return o.UnpackCollisionDetectState(v, s);
                         }),
                         "UnpackCollisionDetectState. NULL VARIANT", "UnpackCollisionDetectState. Non-BSTR argument.",
                         "UnpackCollisionDetectState. Invalid argument."};

class PanelWordsTest : public ControllerTest {};

TEST_F(PanelWordsTest, WordsDecodeByTable) {
    const std::string list = "AUTO_CH -auto_ch 0 -noelts 0\t";
    const std::tuple<const Decoder&, std::string, int> cases[] = {
        {kState, "STAND_BY", MotorsOff},
        {kState, "POWER_ON", MotorsOff},
        {kState, "RUN", MotorsOn},
        {kState, "POWER_OFF", MotorsOn},
        {kState, "INIT", InitState},
        {kState, "GUARD_STOP", GuardStop},
        {kState, "EM_STOP", EmergencyStop},
        {kState, "STB_EM_RESET", EmergencyStopReset},
        {kState, "GRD_EM_RESET", EmergencyStopReset},
        {kState, "SYS_FAIL", SysFail},
        {kState, "run", kUnknown},
        {kState, "RUN ", kUnknown},
        {kState, "", kUnknown},
        {kMode, "AUTO", Auto},
        {kMode, "INIT", InitOp},
        {kMode, "MANR", Manr},
        {kMode, "MANF", Manf},
        {kMode, "AUTO_CH", AutoChange},
        {kMode, "MANF_CH", ManfChange},
        {kMode, "UNDEF", UndefinedMode},
        {kMode, list, kUnknown},
        {kMode, "auto", kUnknown},
        {kMode2, "AUTO", Auto},
        {kMode2, "INIT", InitOp},
        {kMode2, "MANR", Manr},
        {kMode2, "MANF", Manf},
        {kMode2, "AUTO_CH", AutoChange},
        {kMode2, list, AutoChange},
        {kMode2, "AUTO_CHANGED", AutoChange},
        {kMode2, "MANF_CH", ManfChange},
        {kMode2, "UNDEF", UndefinedMode},
        {kMode2, "AUTO_C", kUnknown},
        {kMode2, "MANF_CH ", kUnknown},
        {kCollision, "INIT", CollisionDetect_Init},
        {kCollision, "TRIGGERED", CollisionDetect_Triggered},
        {kCollision, "CONFIRMED", CollisionDetect_Confirmed},
        {kCollision, "TRIGGERED_ACK", CollisionDetect_TriggeredAck},
        {kCollision, "TRIGGERED_AC", kUnknown},
    };
    ControllerObject* object = Make();
    for (const auto& [decoder, word, expected] : cases) {
        SCOPED_TRACE(std::string(decoder.name) + " \"" + word + "\"");
        TestVariant data = TestVariant::Text(word);
        int value = 0;
        EXPECT_EQ(decoder.unpack(*object, data.Get(), &value, false), expected == kUnknown ? E_FAIL : S_OK);
        EXPECT_EQ(value, expected == kUnknown ? kUntouched : expected);
        if (expected == kUnknown) {
            std::string error = decoder.unknown;
            if (const size_t at = error.find('@'); at != std::string::npos) {
                error.replace(at, 1, word);
            }
            EXPECT_TRUE(HasError(error));
        }
    }
}

TEST_F(PanelWordsTest, ChecksRunInOrder) {
    for (const Decoder* decoder : {&kState, &kMode, &kMode2, &kCollision}) {
        SCOPED_TRACE(decoder->name);
        TestVariant word = TestVariant::Text("INIT");
        TestVariant number = TestVariant::Number(1);
        int value = 0;
        EXPECT_EQ(decoder->unpack(*MakeUninitialised(), word.Get(), &value, false), E_ABORT);
        EXPECT_TRUE(HasError("TavController used before Initialized"));
        ControllerObject* object = Make();
        EXPECT_EQ(decoder->unpack(*object, nullptr, &value, true), E_INVALIDARG);
        EXPECT_TRUE(HasError(decoder->nullVariant));
        EXPECT_EQ(decoder->unpack(*object, number.Get(), &value, true), E_POINTER);
        EXPECT_TRUE(HasError(""));
        EXPECT_EQ(decoder->unpack(*object, number.Get(), &value, false), E_FAIL);
        EXPECT_TRUE(HasError(decoder->nonBstr));
        EXPECT_EQ(value, kUntouched);
    }
}

}  // namespace
}  // namespace tav::test
