// The operating panel's state machine: motors, operation mode with its auto
// conditions, acknowledgements and collision detection.
#include "sim/status_codes.h"
#include "sim_test_support.h"

namespace tav::sim::test {
namespace {

// One command and what Get State, Get Mode and Get ColdetState answer after it.
struct Step {
    const char* command;
    const char* args;
    HRESULT status;
    const char* state;
    const char* mode;
    const char* collision = "INIT";
};

class PanelTest : public SimTest {
protected:
    void Play(std::initializer_list<Step> steps) {
        int number = 0;
        for (const Step& step : steps) {
            SCOPED_TRACE("step " + std::to_string(++number) + ": " + step.command + " " + step.args);
            const Outcome reply = Set(step.command, step.args);
            ASSERT_EQ(S_OK, reply.hr);
            EXPECT_EQ(step.status, reply.status) << reply.text;
            EXPECT_EQ(step.state, Get("State").text);
            EXPECT_EQ(step.mode, Get("Mode").text);
            EXPECT_EQ(step.collision, Get("ColdetState").text);
        }
    }
};

constexpr const char* kThreeConditions = "AUTO_CH -auto_ch 1 -noelts 3\tBlk;1;1\tSpeedOvr;1;2\tRunMode;0;3\t";

TEST_F(PanelTest, ChangeToAutoWaitsForEveryConditionToBeAnswered) {
    Play({
        {"State", "RUN", S_OK, "RUN", "MANR"},
        {"OPMode", "-opmode auto", S_OK, "STAND_BY", kThreeConditions},
        {"State", "RUN", kStatusNotAllowed, "STAND_BY", kThreeConditions},
        {"AutoCondAck", "-AutoCondAck Keep -ID 3", kStatusNotAllowed, "STAND_BY", kThreeConditions},
        {"AutoCondAck", "-AutoCondAck Reset -ID 9", kStatusNotFound, "STAND_BY", kThreeConditions},
        {"AutoCondAck", "-AutoCondAck Reset -ID 3", S_OK, "STAND_BY",
         "AUTO_CH -auto_ch 1 -noelts 2\tBlk;1;1\tSpeedOvr;1;2\t"},
        {"AutoCondAck", "-AutoCondAck Keep -ID 1", S_OK, "STAND_BY", "AUTO_CH -auto_ch 1 -noelts 1\tSpeedOvr;1;2\t"},
        {"AutoCondAck", "-AutoCondAck Reset -ID 2", S_OK, "STAND_BY", "AUTO"},
        {"AutoCondAck", "-AutoCondAck Reset -ID 2", kStatusNotAllowed, "STAND_BY", "AUTO"},
        {"State", "RUN", S_OK, "RUN", "AUTO"},
    });
    controller_->Read([](const ModelState& state) {
        ASSERT_EQ(3u, state.answers.size());
        EXPECT_EQ(3u, state.answers[0].id);
        EXPECT_FALSE(state.answers[0].kept);
        EXPECT_TRUE(state.answers[1].kept);
    });
}

TEST_F(PanelTest, AckAutoAnswersTheRemainingConditionsAtOnce) {
    Play({
        {"Ack", "AUTO", kStatusNotAllowed, "STAND_BY", "MANR"},
        {"OPMode", "-opmode auto", S_OK, "STAND_BY", kThreeConditions},
        {"OPMode", "-opmode auto", S_OK, "STAND_BY", kThreeConditions},
        {"Ack", "AUTO", S_OK, "STAND_BY", "AUTO"},
        {"OPMode", "-opmode manr", S_OK, "STAND_BY", "MANR"},
    });
}

TEST_F(PanelTest, WithoutConditionsTheChangeWaitsForAckAuto) {
    controller_->SetAutoConditions({});
    Play({
        {"OPMode", "-opmode auto", S_OK, "STAND_BY", "AUTO_CH -auto_ch 1 -noelts 0\t"},
        {"Ack", "AUTO", S_OK, "STAND_BY", "AUTO"},
    });
}

// A restart drops a pending change.
TEST_F(PanelTest, ManualFullSpeedWaitsForAckManf) {
    Play({
        {"OPMode", "-opmode manf", S_OK, "STAND_BY", "MANF_CH"},
        {"Restart", "WARM", S_OK, "STAND_BY", "MANR"},
        {"OPMode", "-opmode manf", S_OK, "STAND_BY", "MANF_CH"},
        {"Ack", "MANF", S_OK, "STAND_BY", "MANF"},
        {"Ack", "MANF", kStatusNotAllowed, "STAND_BY", "MANF"},
        {"State", "RUN", S_OK, "RUN", "MANF"},
        {"OPMode", "-opmode manf", S_OK, "RUN", "MANF"},
    });
}

TEST_F(PanelTest, CollisionBlocksMotorsOnUntilAcknowledged) {
    ASSERT_EQ(S_OK, Set("State", "RUN").status);
    controller_->TriggerCollision();
    Play({
        {"State", "RUN", kStatusNotAllowed, "STAND_BY", "MANR", "TRIGGERED"},
        {"Ack", "COLDET", S_OK, "STAND_BY", "MANR", "TRIGGERED_ACK"},
        {"Ack", "COLDET", kStatusNotAllowed, "STAND_BY", "MANR", "TRIGGERED_ACK"},
        {"StateUsingKeyLess", "RUN", S_OK, "RUN", "MANR", "INIT"},
        {"StateUsingKeyLess", "STAND_BY", kStatusBadArgument, "RUN", "MANR", "INIT"},
        {"State", "STAND_BY", S_OK, "STAND_BY", "MANR", "INIT"},
    });
}

TEST_F(PanelTest, EmergencyStopRefusesBothStateRequests) {
    ASSERT_TRUE(controller_->SetMotorsState(T("EM_STOP")));
    EXPECT_FALSE(controller_->SetMotorsState(T("FLYING")));
    Play({
        {"State", "RUN", kStatusNotAllowed, "EM_STOP", "MANR"},
        {"State", "STAND_BY", kStatusNotAllowed, "EM_STOP", "MANR"},
    });
    ASSERT_TRUE(controller_->SetMotorsState(T("STB_EM_RESET")));
    Play({{"State", "STAND_BY", S_OK, "STAND_BY", "MANR"}});
}

}  // namespace
}  // namespace tav::sim::test
