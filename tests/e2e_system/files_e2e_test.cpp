// Storage devices, copies on the controller, the diagnostics file and the
// screen dump end to end.
#include <vector>

#include "system_fixture.h"

namespace tav::e2e {
namespace {

class FilesE2eTest : public SystemFixture {
protected:
    struct Device {
        std::string name;
        TavStorageDeviceType type;
        LONG enabled, readOnly, shown;
        bool operator==(const Device&) const = default;
    };
    std::vector<Device> Devices2() {
        TavRetrievalParams retrieval{};
        retrieval.noOfElts = -2;
        ComPtr<IEnumStorageDevices2> devices;
        EXPECT_EQ(As<ITavDynamicDevices2>()->GetStorageDevices2(nullptr, &retrieval, &devices), S_OK)
            << LastError();
        std::vector<Device> all;
        TavStorageDevice2 device{};
        ULONG fetched = 0;
        while (devices && devices->RemNext(1, &device, &fetched) == S_OK && fetched == 1) {
            all.push_back({text::Narrow(OleStringView(device.deviceName, SysStringLen(device.deviceName))),
                           device.deviceType, device.bEnabled, device.bReadOnly, device.bShowDevice});
            SysFreeString(device.deviceName);
        }
        return all;
    }
    ULONG Devices1Count() {
        TavRetrievalParams retrieval{};
        retrieval.noOfElts = -2;
        ComPtr<IEnumStorageDevices> devices;
        EXPECT_EQ(As<ITavDynamicDevices2>()->GetStorageDevices(nullptr, &retrieval, &devices), S_OK)
            << LastError();
        return static_cast<ULONG>(retrieval.noOfElts);
    }
    HRESULT Status(bool diagnostics) {
        HRESULT result = E_UNEXPECTED;
        const HRESULT hr = diagnostics ? As<ITavSystemDiagnostics>()->GetDiagnosticsInfoStatus(nullptr, &result)
                                       : As<ITavDorvel>()->GetDorvelScreenDumpStatus(nullptr, &result);
        EXPECT_EQ(hr, S_OK);
        return result;
    }
};

TEST_F(FilesE2eTest, DevicesFollowWhatIsPluggedIn) {
    EXPECT_EQ(Devices2(), (std::vector<Device>{{"hd0a", StorageDeviceType_Fixed, 1, 0, 1}}));
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("usb1"), {.readOnly = true}));
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("net"), {.kind = sim::DeviceKind::Remote, .shown = false}));
    EXPECT_FALSE(sim::PlugDevice(*Model(), OLESTR("usb1"))) << "already plugged";
    EXPECT_FALSE(sim::PlugDevice(*Model(), OLESTR("a;b")));
    EXPECT_EQ(Devices2(), (std::vector<Device>{{"hd0a", StorageDeviceType_Fixed, 1, 0, 1},
                                               {"net", StorageDeviceType_Remote, 1, 0, 0},
                                               {"usb1", StorageDeviceType_Removable, 1, 1, 1}}));
    EXPECT_EQ(Devices1Count(), 3u);
    ASSERT_TRUE(sim::UnplugDevice(*Model(), OLESTR("usb1")));
    EXPECT_FALSE(sim::UnplugDevice(*Model(), OLESTR("usb1")));
    EXPECT_FALSE(Exists("usb1"));
    EXPECT_EQ(Devices1Count(), 2u);
}

TEST_F(FilesE2eTest, CopiesAreDoneOrRefusedWithTheirCause) {
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("ro"), {.readOnly = true, .serviceContent = false}));
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("tiny"), {.capacity = 16, .serviceContent = false}));
    auto files = As<ITavFileManagement>();
    struct Case {
        bool folder;
        const char* from;
        const char* to;
        HRESULT hr;
        const char* created;  // a file the copy made
    };
    const Case cases[] = {
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/hd0a/temp/copy.mod", S_OK, "hd0a/temp/copy.mod"},
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/hd0a/temp", S_OK, "hd0a/temp/main.mod"},
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/hd0a/temp/copy.mod", S_OK, "hd0a/temp/copy.mod"},
        {true, "ctrl:/hd0a/MainSystem/SYSPAR", "ctrl:/hd0a/temp/SYSPAR", S_OK, "hd0a/temp/SYSPAR/SIO.cfg"},
        {true, "ctrl:/hd0a/MainSystem/SYSPAR", "ctrl:/hd0a/temp/SYSPAR", sim::kStatusNotAllowed, ""},
        {false, "ctrl:/hd0a/MainSystem/HOME/none.mod", "ctrl:/hd0a/temp/x", sim::kStatusNotFound, ""},
        {false, "ctrl:/hd0a/MainSystem/HOME", "ctrl:/hd0a/temp/x", sim::kStatusBadArgument, ""},
        {true, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/hd0a/temp/x", sim::kStatusBadArgument, ""},
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/hd0a/nofolder/x", sim::kStatusPathNotFound, ""},
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/ro/x", sim::kStatusWriteProtected, ""},
        {false, "ctrl:/hd0a/MainSystem/HOME/main.mod", "ctrl:/tiny/x", sim::kStatusDiskFull, ""},
        {true, "ctrl:/hd0a/MainSystem", "ctrl:/hd0a/MainSystem/HOME/again", sim::kStatusBadArgument, ""},
        {false, "C:/local/file.txt", "ctrl:/hd0a/temp/y", sim::kStatusPathNotFound, ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.from) + " -> " + c.to);
        const Bstr from = Wide(c.from), to = Wide(c.to);
        EXPECT_EQ(c.folder ? files->CopyDirectory(nullptr, from.Get(), to.Get())
                           : files->CopyFile(nullptr, from.Get(), to.Get()),
                  c.hr)
            << LastError();
        if (*c.created != '\0') {
            EXPECT_TRUE(Exists(c.created));
        }
    }
    EXPECT_FALSE(Exists("ro/x"));
    EXPECT_FALSE(Exists("tiny/x"));
}

TEST_F(FilesE2eTest, DiagnosticsFileIsWrittenWithItsEvents) {
    SinkRef sink;
    ULONG cookie = 0;
    ASSERT_EQ(Subscribe(sink.sink, SystemDiagnosticsInfoEvent, &cookie), S_OK);
    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Diagnostics, kLongJob);
    auto diagnostics = As<ITavSystemDiagnostics>();
    ASSERT_EQ(diagnostics->SaveDiagnosticsInfo(nullptr, Wide("ctrl:/hd0a/diagnostics/d1.txt").Get()), S_OK);
    EXPECT_EQ(Status(true), static_cast<HRESULT>(0x8000000A)) << "pending";
    EXPECT_EQ(diagnostics->SaveDiagnosticsInfo(nullptr, Wide("ctrl:/hd0a/diagnostics/d2.txt").Get()),
              sim::kStatusNotAllowed);
    ASSERT_TRUE(WaitUntil([&] { return Status(true) != static_cast<HRESULT>(0x8000000A); }));
    EXPECT_EQ(Status(true), S_OK);
    EXPECT_EQ(Read("hd0a/diagnostics/d1.txt").rfind("Controller diagnostics\n", 0), 0u);

    ASSERT_TRUE(sink->WaitFor(2));
    std::vector<HRESULT> told;
    for (const ReceivedEvent& event : sink->All()) {
        HRESULT result = E_UNEXPECTED;
        EXPECT_EQ(diagnostics->UnpackDiagnosticsInfoStatus(event.data->Get(), &result), S_OK) << event.text;
        told.push_back(result);
    }
    EXPECT_EQ(told.front(), static_cast<HRESULT>(0x8000000A));
    EXPECT_EQ(told.back(), S_OK);

    // A job that cannot write its file ends in the write's own result code.
    sim::jobs::SetDuration(*Model(), sim::jobs::Job::Diagnostics, 5ms);
    struct Case {
        const char* path;
        HRESULT result;
    };
    ASSERT_TRUE(sim::PlugDevice(*Model(), OLESTR("ro"), {.readOnly = true, .serviceContent = false}));
    const Case cases[] = {{"ctrl:/hd0a/nofolder/d.txt", sim::kStatusPathNotFound},
                          {"ctrl:/ro/d.txt", sim::kStatusWriteProtected},
                          {"ctrl:/hd0a/diagnostics", static_cast<HRESULT>(0x80070005)},
                          {"ctrl:/hd0a/diagnostics/d1.txt", S_OK}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path);
        ASSERT_EQ(diagnostics->SaveDiagnosticsInfo(nullptr, Wide(c.path).Get()), S_OK);
        ASSERT_TRUE(WaitUntil([&] { return Status(true) != static_cast<HRESULT>(0x8000000A); }));
        EXPECT_EQ(Status(true), c.result);
    }
}

TEST_F(FilesE2eTest, ScreenDumpsGoToFilesOfTheirOwn) {
    SinkRef sink;
    ULONG cookie = 0;
    ASSERT_EQ(Subscribe(sink.sink, DorvelScreenDumpEvent, &cookie), S_OK);
    auto dorvel = As<ITavDorvel>();
    for (int dump = 1; dump <= 2; ++dump) {
        ASSERT_EQ(dorvel->ReqDorvelScreenDump(nullptr), S_OK);
        ASSERT_TRUE(WaitUntil([&] { return Status(false) != static_cast<HRESULT>(0x8000000A); }));
        EXPECT_EQ(Status(false), S_OK);
        EXPECT_EQ(Read("hd0a/temp/ScreenDump" + std::to_string(dump) + ".bmp").substr(0, 2), "BM");
    }
    ASSERT_TRUE(sink->WaitFor(4));
    EXPECT_EQ(sink->All()[3].text, "-pstatus 0");
}

}  // namespace
}  // namespace tav::e2e
