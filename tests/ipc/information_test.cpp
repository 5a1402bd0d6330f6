// What the controller tells of its slots: sizes, the list, names and ids.
#include "support/controller_test.h"

namespace tav::test {
namespace {

class IpcInformationTest : public ControllerTest {};

TEST_F(IpcInformationTest, TheMessageSizeIsTheLargestBody) {
    ControllerObject* object = Make();
    Script("IPCMaxProperties", "-MaxMsgSize 100 -MaxPackageSize 200 -MaxBodySize 300");
    LONG size = 0;
    ASSERT_EQ(object->GetMaxMessageSize(nullptr, &size), S_OK);
    EXPECT_EQ(size, 300);
    EXPECT_EQ(LastCommand().verb, "Get");
    EXPECT_EQ(LastCommand().args, "-CmdType 0");
    ASSERT_EQ(object->GetMaxPackageSize(nullptr, &size), S_OK);
    EXPECT_EQ(size, 200);

    Component().ClearScript();
    Script("IPCMaxProperties", "-MaxMsgSize 100 -MaxPackageSize 200");
    size = 7;
    EXPECT_EQ(object->GetMaxMessageSize(nullptr, &size), E_FAIL);
    EXPECT_TRUE(HasError("UnpackIPCMaxPoperties failed."));
    EXPECT_EQ(size, 0) << "cleared before the reply was read";
    EXPECT_EQ(object->GetMaxPackageSize(nullptr, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("TavController::GetIPCMaxPoperties. Invalid argument."));
}

TEST_F(IpcInformationTest, SlotListsBecomeEnumerators) {
    ControllerObject* object = Make();
    Script("SlotInfo", "-noelts,all,mark,cc 2,1,7,9\tRobotPlanner;3;10;512;1\tEcho;1;200;4096;0\t");
    TavRetrievalParams retrieval{};
    retrieval.noOfElts = -1;
    IEnumSlots* slots = nullptr;
    ASSERT_EQ(object->GetSlotInformation(nullptr, &retrieval, &slots), S_OK);
    EXPECT_EQ(LastCommand().command, "SlotInfo");
    std::vector<std::string> seen;
    TavIPCSlot slot{};
    while (slots->RemNext(1, &slot, nullptr) == S_OK) {
        seen.push_back(Narrow(slot.slotName) + "/" + std::to_string(slot.slotId) + "/" + std::to_string(slot.queueSize) +
                       "/" + std::to_string(slot.maxMessageSize) + "/" + std::to_string(slot.remote_accessible));
        SysFreeString(slot.slotName);
    }
    slots->Release();
    EXPECT_EQ(seen, (std::vector<std::string>{"RobotPlanner/3/10/512/1", "Echo/1/200/4096/0"}));
    EXPECT_EQ(retrieval.noOfElts, 2);
    EXPECT_EQ(retrieval.bLast, 1);
    EXPECT_EQ(retrieval.mark, 7u);
    EXPECT_EQ(retrieval.cursor.cursor[0], 9u);
}

TEST_F(IpcInformationTest, SlotListsRefuseWhatDoesNotFit) {
    ControllerObject* object = Make();
    const std::pair<std::string, const char*> cases[] = {
        {"-noelts 2\tA;1;1;1;1\t", "UnpackSlotInformation - Could not parse out retrieval parameters"},
        {"-noelts,all,mark,cc 1,1,0,0\t" + std::string(39, 'n') + ";1;1;1;1\t",
         "UnpackSlotInformation - Could not parse out element: nnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnn;1;1;1;1\t"},
        {"-noelts,all,mark,cc 2,1,0,0\tA;1;1;1;1\tB;2\t",
         "UnpackSlotInformation - Could not parse out element: B;2\t"},
    };
    for (const auto& [reply, error] : cases) {
        TestVariant data = TestVariant::Text(reply);
        TavRetrievalParams retrieval{};
        IEnumSlots* slots = reinterpret_cast<IEnumSlots*>(1);
        EXPECT_EQ(object->UnpackSlotInformation(data.Get(), &retrieval, &slots), E_FAIL);
        EXPECT_TRUE(HasError(error));
        EXPECT_EQ(slots, nullptr);
    }
    TestVariant number = TestVariant::Number(1);
    TavRetrievalParams retrieval{};
    IEnumSlots* slots = nullptr;
    EXPECT_EQ(object->UnpackSlotInformation(number.Get(), &retrieval, &slots), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSlotInformation. Non-BSTR VARIANT"));
    EXPECT_EQ(object->UnpackSlotInformation(nullptr, &retrieval, &slots), E_INVALIDARG);
    EXPECT_TRUE(HasError("UnpackSlotInformation. NULL VARIANT"));
}

TEST_F(IpcInformationTest, OnlyRetrieveAllIsAsked) {
    ControllerObject* object = Make();
    IEnumSlots* slots = nullptr;
    TavRetrievalParams retrieval{};
    retrieval.noOfElts = -2;
    EXPECT_EQ(object->GetSlotInformation(nullptr, &retrieval, &slots), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetSlotInformation: Invalid TavRetrievalParams, only RetrieveAll supported"));
    EXPECT_EQ(object->GetSlotInformation(nullptr, nullptr, &slots), E_INVALIDARG);
    EXPECT_TRUE(HasError("GetSlotInformations: Invalid TavRetreivalParams"));
    EXPECT_EQ(object->GetSlotInformation(nullptr, &retrieval, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("GetSlotInformation: Invalid pointer to interface IEnumSlots"));
    EXPECT_EQ(CommandCount(), 0u);
}

TEST_F(IpcInformationTest, NamesAndIdsTranslate) {
    ControllerObject* object = Make();
    Script("SlotName", "-SlotName " + std::string(40, 's'));
    TestBstr name;
    ASSERT_EQ(object->GetSlotName(nullptr, 12, name.Out()), S_OK);
    EXPECT_EQ(LastCommand().args, "-SlotId 12");
    EXPECT_EQ(name.Text(), std::string(38, 's')) << "38 characters at most";

    Script("SlotId", "-SlotId 14");
    short id = 0;
    ASSERT_EQ(object->GetSlotId(nullptr, TestBstr(std::string(40, 'x')).Get(), &id), S_OK);
    EXPECT_EQ(LastCommand().args, "-Name " + std::string(38, 'x'));
    EXPECT_EQ(id, 14);

    Component().ClearScript();
    Script("SlotName", "-SlotName");
    Script("SlotId", "-SlotId x");
    EXPECT_EQ(object->GetSlotName(nullptr, 1, name.Out()), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSlotName failed."));
    EXPECT_EQ(object->GetSlotId(nullptr, TestBstr("a").Get(), &id), E_FAIL);
    EXPECT_TRUE(HasError("UnpackSlotId failed."));
    EXPECT_EQ(object->GetSlotName(nullptr, 1, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("GetSlotName: Invalid pointer"));
    EXPECT_EQ(object->GetSlotId(nullptr, nullptr, nullptr), E_POINTER);
    EXPECT_TRUE(HasError("GetSlotId: Invalid pointer"));
}

}  // namespace
}  // namespace tav::test
