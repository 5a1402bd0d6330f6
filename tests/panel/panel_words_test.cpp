// The one-word decoders of the panel: their tables (exact, case-sensitive,
// whole words; "AUTO_CH" a prefix in version 2 only).
#include "support/controller_test.h"

namespace tav::test {
namespace {

constexpr int kUntouched = 7;  // no decoder gives 7, yet each of these enums can hold it
constexpr int kUnknown = -1;

struct Decoder {
    const char* name;
    std::function<HRESULT(ControllerObject&, VARIANT*, int* value)> unpack;
    std::string unknown;  // the text for an unknown word, "@" standing for the word
};

template <class E, class Run>
auto Through(Run run) {
    return [run](ControllerObject& object, VARIANT* data, int* value) {
        E out = static_cast<E>(kUntouched);
        const HRESULT hr = run(object, data, &out);
        *value = static_cast<int>(out);
        return hr;
    };
}

const Decoder kState{
    "State", Through<TavControllerState>([](auto& o, auto* v, auto* s) { return o.UnpackControllerState(v, s); }),
    "UnpackControllerState. Unsupported state:@"};
const Decoder kMode{"Mode",
                    Through<TavOperationMode>([](auto& o, auto* v, auto* m) { return o.UnpackOperationMode(v, m); }),
                    "UnpackOperationMode. Unsupported mode @."};
const Decoder kMode2{"Mode2", Through<TavOperationMode>([](auto& o, auto* v, auto* m) {
                         return o.UnpackOperationMode2(v, m, nullptr, nullptr);
                     }),
                     "UnpackOperationMode. Unsupported mode @."};
const Decoder kCollision{"Coldet", Through<TavCollisionDetectState>([](auto& o, auto* v, auto* s) {
                             return o.UnpackCollisionDetectState(v, s);
                         }),
                         "UnpackCollisionDetectState. Invalid argument."};

class PanelWordsTest : public ControllerTest {};

TEST_F(PanelWordsTest, WordsDecodeByTable) {
    const std::string list = "AUTO_CH -auto_ch 0 -noelts 0\t";
    const std::pair<const Decoder&, std::vector<std::pair<std::string, int>>> tables[] = {
        {kState, {{"STAND_BY", MotorsOff}, {"POWER_ON", MotorsOff}, {"RUN", MotorsOn}, {"POWER_OFF", MotorsOn},
                  {"INIT", InitState}, {"GUARD_STOP", GuardStop}, {"EM_STOP", EmergencyStop},
                  {"STB_EM_RESET", EmergencyStopReset}, {"GRD_EM_RESET", EmergencyStopReset}, {"SYS_FAIL", SysFail},
                  {"run", kUnknown}, {"RUN ", kUnknown}, {"", kUnknown}}},
        {kMode, {{"AUTO", Auto}, {"INIT", InitOp}, {"MANR", Manr}, {"MANF", Manf}, {"AUTO_CH", AutoChange},
                 {"MANF_CH", ManfChange}, {"UNDEF", UndefinedMode}, {list, kUnknown}, {"auto", kUnknown}}},
        {kMode2, {{"AUTO", Auto}, {"INIT", InitOp}, {"MANR", Manr}, {"MANF", Manf}, {"AUTO_CH", AutoChange},
                  {list, AutoChange}, {"AUTO_CHANGED", AutoChange}, {"MANF_CH", ManfChange},
                  {"UNDEF", UndefinedMode}, {"AUTO_C", kUnknown}, {"MANF_CH ", kUnknown}}},
        {kCollision, {{"INIT", CollisionDetect_Init}, {"TRIGGERED", CollisionDetect_Triggered},
                      {"CONFIRMED", CollisionDetect_Confirmed}, {"TRIGGERED_ACK", CollisionDetect_TriggeredAck},
                      {"TRIGGERED_AC", kUnknown}}},
    };
    ControllerObject* object = Make();
    for (const auto& [decoder, words] : tables) {
        for (const auto& [word, expected] : words) {
            SCOPED_TRACE(std::string(decoder.name) + " \"" + word + "\"");
            TestVariant data = TestVariant::Text(word);
            int value = 0;
            EXPECT_EQ(decoder.unpack(*object, data.Get(), &value), expected == kUnknown ? E_FAIL : S_OK);
            EXPECT_EQ(value, expected == kUnknown ? kUntouched : expected);
            std::string error = decoder.unknown;
            if (const size_t at = error.find('@'); at != std::string::npos) error.replace(at, 1, word);
            EXPECT_TRUE(expected != kUnknown || HasError(error));
        }
    }
}

}  // namespace
}  // namespace tav::test
