// The storage device lists and their enumerators.
#include <vector>

#include "support/controller_test.h"

namespace tav::test {
namespace {

class StorageDevicesTest : public ControllerTest {};

struct Device {
    std::string name;
    TavStorageDeviceType type;
    LONG enabled, readOnly, shown;
    bool operator==(const Device&) const = default;
};

std::vector<Device> Drain(IEnumStorageDevices2* devices) {
    std::vector<Device> all;
    TavStorageDevice2 device{};
    while (devices->RemNext(1, &device, nullptr) == S_OK) {
        all.push_back({Narrow(device.deviceName), device.deviceType, device.bEnabled, device.bReadOnly,
                       device.bShowDevice});
        SysFreeString(device.deviceName);
    }
    return all;
}

TEST_F(StorageDevicesTest, ListsDecodeIntoEnumerators) {
    ControllerObject* object = Make();
    TestVariant reply =
        TestVariant::Text("-noelts 3\tHD0a;Fixed;1;0;1\tUSB 1;Removable;1;1;0\tnet;fixed;0;0;1\t");
    TavRetrievalParams retrieval{};
    IEnumStorageDevices2* devices = nullptr;
    ASSERT_EQ(object->UnpackStorageDevices2(reply.Get(), &retrieval, &devices), S_OK);
    EXPECT_EQ(Drain(devices), (std::vector<Device>{{"HD0a", StorageDeviceType_Fixed, 1, 0, 1},
                                                   {"USB 1", StorageDeviceType_Removable, 1, 1, 0},
                                                   {"net", StorageDeviceType_Unknown, 0, 0, 1}}));
    devices->Release();
    EXPECT_EQ(retrieval.noOfElts, 3);
    EXPECT_EQ(retrieval.bLast, 1);

    TestVariant empty = TestVariant::Text("-noelts 0\t");
    IEnumStorageDevices* first = nullptr;
    ASSERT_EQ(object->UnpackStorageDevices(empty.Get(), &retrieval, &first), S_OK);
    EXPECT_EQ(retrieval.noOfElts, 0);
    first->Release();
}

TEST_F(StorageDevicesTest, ElementsThatDoNotFitAreRefusedWithTheRestOfTheReply) {
    struct Case {
        std::string reply;
        const char* error;
    };
    const Case cases[] = {
        {"-noelts 2\tHD0a;Fixed;1;0\tUSB1;Removable;1\t", "UnpackStorageDevices. Could not parse out element: USB1;Removable;1\t"},
        {"-noelts 1\t" + std::string(31, 'n') + ";Fixed;1;0\t",
         "UnpackStorageDevices. Could not parse out element: nnnnnnnnnnnnnnnnnnnnnnnnnnnnnnn;Fixed;1;0\t"},
        {"-noelts 1\tHD0a;" + std::string(21, 't') + ";1;0\t",
         "UnpackStorageDevices. Could not parse out element: HD0a;ttttttttttttttttttttt;1;0\t"},
        {"-noelts 3\tHD0a;Fixed;1;0\t", "UnpackStorageDevices. Could not parse out element: "},
        {"-noelts x\t", "UnpackStorageDevices. Can not parse data: -noelts x\t"},
    };
    ControllerObject* object = Make();
    for (const Case& c : cases) {
        SCOPED_TRACE(c.reply);
        TestVariant reply = TestVariant::Text(c.reply);
        TavRetrievalParams retrieval{};
        IEnumStorageDevices* devices = reinterpret_cast<IEnumStorageDevices*>(1);
        EXPECT_EQ(object->UnpackStorageDevices(reply.Get(), &retrieval, &devices), E_FAIL);
        EXPECT_TRUE(HasError(c.error));
        EXPECT_EQ(devices, nullptr);
    }
}

TEST_F(StorageDevicesTest, OnlyRetrieveAllIsAsked) {
    ControllerObject* object = Make();
    Script("StorageDevice2", "-noelts 1\tHD0a;Fixed;1;0;1\t");
    TavRetrievalParams retrieval{};
    IEnumStorageDevices2* devices = reinterpret_cast<IEnumStorageDevices2*>(1);
    for (const LONG count : {0, 10, -1}) {
        retrieval.noOfElts = count;
        EXPECT_EQ(object->GetStorageDevices2(nullptr, &retrieval, &devices), E_INVALIDARG);
        EXPECT_TRUE(HasError("GetStorageDevice - Only the RetrieveAll retrieval mode is supported."));
        EXPECT_EQ(devices, nullptr);
    }
    EXPECT_EQ(CommandCount(), 0u);
    retrieval.noOfElts = -2;
    ASSERT_EQ(object->GetStorageDevices2(nullptr, &retrieval, &devices), S_OK);
    EXPECT_EQ(LastCommand().command, "StorageDevice2");
    EXPECT_EQ(Drain(devices).size(), 1u);
    devices->Release();
    EXPECT_EQ(object->GetStorageDevices2(nullptr, nullptr, &devices), E_POINTER);

    ControllerObject* fresh = MakeUninitialised();
    EXPECT_EQ(fresh->GetStorageDevices(nullptr, nullptr, nullptr), E_ABORT) << "initialisation before pointers";
    EXPECT_TRUE(HasError("Helper used before initialized.", fresh));
}

}  // namespace
}  // namespace tav::test
