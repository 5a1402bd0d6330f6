#include "unpack/decoder_table.h"

#include <cstdio>
#include <cstdlib>

#include "module/server_exports.h"
#include "sim/virtual_controller.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"

namespace tav::fuzz {
namespace {

struct Session {
    Session() {
        CoInitializeEx(nullptr, COINIT_MULTITHREADED);
        registration = sim::RegisterInProcess();
        ComPtr<IClassFactory> factory;
        ComPtr<ITavController> controller;
        const Bstr url(OLESTR("/fuzz"));
        if (!registration ||
            FAILED(DllGetClassObject(CLSID_TavController17, IID_IClassFactory, reinterpret_cast<void**>(&factory))) ||
            FAILED(factory->CreateInstance(nullptr, IID_ITavController, reinterpret_cast<void**>(&controller))) ||
            FAILED(controller->Init(url.Get()))) {
            std::fprintf(stderr, "no initialised controller object to decode with\n");
            std::abort();
        }
        object = controller;
    }
    sim::InProcessRegistration registration;
    ComPtr<IUnknown> object;
};

// The interface as a client gets it, once per interface.
template <typename I>
I* As() {
    static I* const face = [] {
        I* view = nullptr;
        if (FAILED(QueryTo(DecodingObject(), &view))) std::abort();
        view->Release();  // the object outlives every row
        return view;
    }();
    return face;
}

// The violation record's arrays get room for a few elements each; a reply
// with more reports its count and fills what fits.
HRESULT DecodeViolation(VARIANT* data, robustness::OutValues& out) {
    constexpr LONG axes = 6, three = 3, flags = 4;
    return As<ITavSafety>()->UnpackSafetyViolationStatus(
        data, axes, out.Number<LONG>(), out.Array<double>(axes), axes, out.Number<LONG>(), out.Array<double>(axes),
        three, out.Number<LONG>(), out.Array<double>(three), three, out.Number<LONG>(), out.Array<double>(three),
        flags, out.Number<LONG>(), out.Array<double>(flags), out.Number<ULONG>(),
        out.Number<TavVantorViolationType>(), out.Number<ULONG>(), out.Number<LONG>(), out.Number<short>(),
        out.Number<short>(), flags, out.Number<LONG>(), out.Array<LONG>(flags), flags, out.Number<LONG>(),
        out.Array<LONG>(flags), flags, out.Number<LONG>(), out.Array<LONG>(flags), flags, out.Number<LONG>(),
        out.Array<LONG>(flags), flags, out.Number<LONG>(), out.Array<LONG>(flags), flags, out.Number<LONG>(),
        out.Array<LONG>(flags), flags, out.Number<LONG>(), out.Array<LONG>(flags), flags, out.Number<LONG>(),
        out.Array<LONG>(flags));
}

const DecoderRow kRows[] = {
    {"UnpackSystemClock", "Get", "SystemClock", "", "-time_t 1700000000",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackSystemClock(d, o.Time()); }},
    {"UnpackVersionInfo", "Get", "VersionInfo", "-Type System", "TavOS 7.4.2 build 118",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackVersionInfo(d, o.String()); }},
    {"UnpackControllerName", "Get", "CtrlName", "", "-Name \"cell 7\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackControllerName(d, o.String()); }},
    {"UnpackControllerID", "Get", "CtrlID", "", "-ID \"12-34567\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackControllerID(d, o.String()); }},
    {"UnpackSystemID", "Get", "GUID", "", "-GUID {0F1E2D3C-4B5A-6978-8796-A5B4C3D2E1F0}",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackSystemID(d, o.String()); }},
    {"UnpackEnvironmentVariable", "Get", "EnvironmentVar", "HOME", "-Value \"/hd0a\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackEnvironmentVariable(d, o.String()); }},
    {"UnpackIsOptionPresent", "Get", "IsOptionPresent", "-Option \"Multitasking\"", "-OptionPresent 1",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController>()->UnpackIsOptionPresent(d, o.Number<LONG>()); }},
    {"UnpackConnectedTavAPIClients", "Get", "ConnectedClients", "", "<clients><client id=\"1\"/></clients>",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController4>()->UnpackConnectedTavAPIClients(d, o.String()); }},
    {"UnpackSysEnergyState", "Get", "SysEnergyState", "", "-sysenergy resuming",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavController4>()->UnpackSysEnergyState(d, o.Number<TavSysEnergyState>());
     }},
    {"UnpackVersionName", "Get", "VersionName", "", "-Name \"TavOS 7.4\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController5>()->UnpackVersionName(d, o.String()); }},
    {"UnpackProductVersionName", "Get", "ProductVersionName", "-Name \"TavOS\"", "-Name \"7.4.2\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavController6>()->UnpackProductVersionName(d, o.String()); }},
    {"UnpackControllerState", "Get", "State", "", "RUN",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPanel>()->UnpackControllerState(d, o.Number<TavControllerState>());
     }},
    {"UnpackOperationMode", "Get", "Mode", "", "AUTO",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavPanel>()->UnpackOperationMode(d, o.Number<TavOperationMode>()); }},
    {"UnpackSpeedRatio", "Get", "SpeedAdjust", "", "50",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavPanel>()->UnpackSpeedRatio(d, o.Number<short>()); }},
    {"UnpackCollisionDetectState", "Get", "ColdetState", "", "TRIGGERED",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPanel>()->UnpackCollisionDetectState(d, o.Number<TavCollisionDetectState>());
     }},
    {"UnpackAutoConditions", nullptr, nullptr, nullptr, "-auto_ch 1 -noelts 2\tBlk;1;7\tDeact;0;8\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPanel>()->UnpackAutoConditions(d, o.Number<LONG>(), o.Enumerator<IEnumAutoCondition>());
     },
     robustness::OutValues::kKeepsFilledOnFailure},
    {"UnpackOperationMode2", "Get", "Mode", "", "AUTO_CH -auto_ch 1 -noelts 1\tRunMode;0;250\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPanel2>()->UnpackOperationMode2(d, o.Number<TavOperationMode>(),
                                                       o.Enumerator<IEnumAutoCondition2>(), o.Number<ULONG>());
     },
     robustness::OutValues::kKeepsFilledOnFailure},
    {"UnpackOPModePinCodeLockState", "Get", "OPModePinCodeLockState", "", "-lockstate locked",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPanel3>()->UnpackOPModePinCodeLockState(d, o.Number<TavOPModeLockState>());
     }},
    {"UnpackSlotInformation", "Get", "SlotInfo", "",
     "-noelts,all,mark,cc 2,1,7,9\tRobotPlanner;3;10;512;1\tEcho;1;200;4096;0\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavIPCInformation>()->UnpackSlotInformation(d, o.Retrieval(), o.Enumerator<IEnumSlots>());
     }},
    {"UnpackRestoreErrorInfo", nullptr, nullptr, nullptr, "-RestoreErrInfo \"other system id\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBackupRestore>()->UnpackRestoreErrorInfo(d, o.String()); }, robustness::OutValues::kNullOnSuccess},
    {"UnpackBackupEvent", nullptr, nullptr, nullptr, "-BackupEvent Finished -SeqNr 3",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavBackupRestore>()->UnpackBackupEvent(d, o.Number<TavBackupEvent>(), o.Number<ULONG>());
     }},
    {"UnpackBackupState", "Get", "BackupState", "", "-BackupState None",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavBackupRestore>()->UnpackBackupState(d, o.Number<TavBackupState>());
     }},
    {"UnpackCompress", nullptr, nullptr, nullptr, "-File \"/hd0a/backup.tgz\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBackupRestore>()->UnpackCompress(d, o.String()); }},
    {"UnpackVersionInfoFromBackup", "Get", "VersionInfoFromBackup", "-BackupPath \"/hd0a/BACKUP/B1\"",
     "-Name \"B1\" -Version 7.4.2",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBackupRestore>()->UnpackVersionInfoFromBackup(d, o.String()); }},
    {"UnpackConfigStatus", "Get", "VantorConfigStatus", "", "-confstatus ok",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavSafety>()->UnpackConfigStatus(d, o.Number<TavVantorConfigStatus>());
     }},
    {"UnpackLoadOperationStatus", "Get", "VantorLoadOperationStatus", "", "-loadstatus done",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavSafety>()->UnpackLoadOperationStatus(d, o.Number<TavVantorLoadConfigStatus>());
     }},
    {"UnpackSafetyModeStatus", "Get", "SafetyModeStatus", "", "-modestat normal",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavSafety>()->UnpackSafetyModeStatus(d, o.Number<TavVantorSafetyMode>());
     }},
    {"UnpackSafetyConfigurationInfo", "Get", "SafetyConf", "",
     "-minv 1\t-majv 2\t-islocked 1\t-lockdt 2024-01-03\t-lockby locker\t-valid 1\t-vdate 2024-01-02\t-vby tester\t-crdate 2024-01-01\t-crby author\t"
     "-cnfnm cell\t-csum 000102030405060708090A0B0C0D0E0F101112131415161718191A1B1C1D1E1F\t",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavSafety>()->UnpackSafetyConfigurationInfo(d, o.ConfigInfo()); },
     robustness::OutValues::kKeepsFilledOnFailure},
    {"UnpackSafetyViolationStatus", "Get", "VantorViolationInfo", "-driver_module 0 -last_violation 1", 
     "-vnumber 7 -violationtype stz -instanceid 3 -isunsync 0 -tool 1 -drive 2 -axes 6[1.5,2,3,4,5,6, -speed 6[0,0,0,0,0,0, -tcp 3[1,2,3, -fpos 3[1,2,3, -forient 4[1,0,0,0, -ssv 4[1010 -toolposvs 4[0000 -toolposas 4[1111 -uarmvs 4[0100 -toolspeedvs 4[0000 -toolspeedas 4[0000 -axisrangevs 4[0000 -axisrangeas 4[0000",
     DecodeViolation, robustness::OutValues::kKeepsFilledOnFailure},
    {"UnpackPSCUnitStatus", "Get", "PSCUnitStatus", "", "-noelts 2\t1;0;0\t2;3;-2147467259\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavPositionalSafetyController>()->UnpackPSCUnitStatus(d, o.Retrieval(),
                                                                          o.Enumerator<IEnumTavPSCUnits>());
     }},
    {"UnpackVTState", "Get", "VTState", "", "-VTState Stop",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavVirtualTime>()->UnpackVTState(d, o.Number<TavVTState>()); }},
    {"UnpackVTTime", "Get", "VTTime", "", "-time 10",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavVirtualTime>()->UnpackVTTime(d, o.Number<ULONG>()); }},
    {"UnpackVTSpeed", "Get", "VTSpeed", "", "-speed 1",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavVirtualTime>()->UnpackVTSpeed(d, o.Number<ULONG>()); }},
    {"UnpackSystemName", "Get", "SystemName", "", "-Name \"SYS_A\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBoot>()->UnpackSystemName(d, o.String()); }},
    {"UnpackSelectedSystem", "Get", "SelectSystem", "", "-Name \"SYS_A\"",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBoot>()->UnpackSelectedSystem(d, o.String()); }},
    {"UnpackSystemNameList", "Get", "SystemList", "", "-NoOfElements 2 -Names SYS_A,SYS_B",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavBoot>()->UnpackSystemNameList(d, o.Retrieval(), o.Enumerator<ITavEnumBSTR>());
     }},
    {"UnpackBootDevice", "Get", "BootDevice", "", "-Name hd0a",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBoot>()->UnpackBootDevice(d, o.String()); }},
    {"UnpackNoOfSpannedFiles", "Get", "SpannedFiles", "", "-FileCount 2",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBoot>()->UnpackNoOfSpannedFiles(d, o.Number<ULONG>()); }},
    {"UnpackLoadBootImage", "Set", "LoadBootImage", "", "-IsDone 1",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavBoot>()->UnpackLoadBootImage(d, o.Number<LONG>()); }},
    {"UnpackLANAdaptorIPMethod", "Get", "LANAdaptorMethod", "", "-Method DHCP",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavLANAdaptor>()->UnpackLANAdaptorIPMethod(d, o.Number<IPMethod>());
     }},
    {"UnpackLANAdaptorIPConfig", "Get", "LANAdaptorIP", "", "-Address 1.2.3.4 -Submask 255.0.0.0 -Gateway unspec",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavLANAdaptor>()->UnpackLANAdaptorIPConfig(d, o.String(), o.String(), o.String());
     }},
    {"UnpackLANAdaptorInfo", "Get", "LANAdaptorInfo", "",
     "-Address 1.2.3.4 -Submask 255.0.0.0 -Gateway unspec -Mac 00:11:22:33:44:55",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavLANAdaptor>()->UnpackLANAdaptorInfo(d, o.String(), o.String(), o.String(), o.String());
     }},
    {"UnpackLANAdaptorIP", "Get", "LANAdaptor", "",
     "-Method FIXIP -Address 10.0.0.5 -Submask 255.0.0.0 -Gateway unspec",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavLANAdaptor2>()->UnpackLANAdaptorIP(d, o.Number<IPMethod>(), o.String(), o.String(),
                                                          o.String());
     }},
    {"UnpackIsCameraValid", "Get", "LMIsCameraValid", "-Camera cam1", "-CameraValid 1",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavLumeret>()->UnpackIsCameraValid(d, o.Number<LONG>()); }},
    {"UnpackCameraStatus", "Get", "LMCameraStatus", "-Camera cam1", "-CameraStatus Connected",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavLumeret>()->UnpackCameraStatus(d, o.Number<TavCameraStatus>());
     }},
    {"UnpackNumberOfCameras", "Get", "LMNumberOfCameras", "", "-CameraCount 3",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavLumeret>()->UnpackNumberOfCameras(d, o.Number<ULONG>()); }},
    {"UnpackCameraInfoUsingIndex", "Get", "LMCameraInfoUsingIndex", "-CameraIdx 0", 
     "-currIPAddress \"10.0.0.9 -currSubnetMask \"255.0.0.0 -currDefaultGateway \"10.0.0.1 -currHostName \"cam1 -currDNSServer \"10.0.0.2 -currDNSSuffix \"local -currIsDHCPEnabled 0 -confIPAddress \"10.0.0.9 -confSubnetMask \"255.0.0.0 -confDefaultGateway \"10.0.0.1 -confHostName \"cam1 -confDNSServer \"10.0.0.2 -confDNSSuffix \"local -confIsDHCPEnabled 0 -confCameraName \"cam1 -cameraName \"cam1 -macAddress \"00:11:22:33:44:55 -Status \"Running\"",
     [](VARIANT* d, robustness::OutValues& o) {
         BSTR* s[15];
         for (BSTR*& slot : s) slot = o.String();
         return As<ITavLumeret>()->UnpackCameraInfoUsingIndex(d, s[0], s[1], s[2], s[3], s[4], s[5],
                                                              o.Number<LONG>(), s[6], s[7], s[8], s[9], s[10],
                                                              s[11], o.Number<LONG>(), s[12], s[13], s[14],
                                                              o.Number<TavCameraStatus>());
     }},
    {"UnpackCameraInfo", "Get", "LMCameraInfo", "-Camera cam1", 
     "-currIPAddress \"10.0.0.9 -currSubnetMask \"255.0.0.0 -currDefaultGateway \"10.0.0.1 -currHostName \"cam1 -currDNSServer\"10.0.0.2 -currDNSSuffix \"local -currIsDHCPEnabled 0 -confIPAddress \"10.0.0.9 -confSubnetMask \"255.0.0.0 -confDefaultGateway \"10.0.0.1 -confHostName \"cam1 -confDNSServer \"10.0.0.2 -ConfDNSSuffix \"local -confIsDHCPEnabled 0 -confCameraName \"cam1 -cameraIdx 0 -macAddress\"00:11:22:33:44:55  -Status \"Running\"",
     [](VARIANT* d, robustness::OutValues& o) {
         BSTR* s[14];
         for (BSTR*& slot : s) slot = o.String();
         return As<ITavLumeret>()->UnpackCameraInfo(d, s[0], s[1], s[2], s[3], s[4], s[5], o.Number<LONG>(), s[6],
                                                    s[7], s[8], s[9], s[10], s[11], o.Number<LONG>(), s[12],
                                                    o.Number<ULONG>(), s[13], o.Number<TavCameraStatus>());
     }},
    {"UnpackCameraInfo2", "Get", "LMCameraInfo2", "-Camera cam1", 
     "-currIPAddress \"10.0.0.9 -currSubnetMask \"255.0.0.0 -currDefaultGateway \"10.0.0.1 -currHostName \"cam1 -currDNSServer\"10.0.0.2 -currDNSSuffix \"local -currIsDHCPEnabled 0 -confIPAddress \"10.0.0.9 -confSubnetMask \"255.0.0.0 -confDefaultGateway \"10.0.0.1 -confHostName \"cam1 -confDNSServer \"10.0.0.2 -ConfDNSSuffix \"local -confIsDHCPEnabled 0 -confCameraName \"cam1 -cameraIdx 0 -macAddress\"00:11:22:33:44:55  -Status \"Running  -username \"operator\"",
     [](VARIANT* d, robustness::OutValues& o) {
         BSTR* s[15];
         for (BSTR*& slot : s) slot = o.String();
         return As<ITavLumeret2>()->UnpackCameraInfo2(d, s[0], s[1], s[2], s[3], s[4], s[5], o.Number<LONG>(),
                                                      s[6], s[7], s[8], s[9], s[10], s[11], o.Number<LONG>(), s[12],
                                                      o.Number<ULONG>(), s[13], o.Number<TavCameraStatus>(), s[14]);
     }},
    {"UnpackCameraInfoUsingIndex2", "Get", "LMCameraInfoUsingIndex2", "-CameraIdx 0", 
     "-currIPAddress \"10.0.0.9 -currSubnetMask \"255.0.0.0 -currDefaultGateway \"10.0.0.1 -currHostName \"cam1 -currDNSServer \"10.0.0.2 -currDNSSuffix \"local -currIsDHCPEnabled 0 -confIPAddress \"10.0.0.9 -confSubnetMask \"255.0.0.0 -confDefaultGateway \"10.0.0.1 -confHostName \"cam1 -confDNSServer \"10.0.0.2 -confDNSSuffix \"local -confIsDHCPEnabled 0 -confCameraName \"cam1 -cameraName \"cam1 -macAddress \"00:11:22:33:44:55 -Status \"Running -username \"operator\"",
     [](VARIANT* d, robustness::OutValues& o) {
         BSTR* s[16];
         for (BSTR*& slot : s) slot = o.String();
         return As<ITavLumeret2>()->UnpackCameraInfoUsingIndex2(d, s[0], s[1], s[2], s[3], s[4], s[5],
                                                                o.Number<LONG>(), s[6], s[7], s[8], s[9], s[10],
                                                                s[11], o.Number<LONG>(), s[12], s[13], s[14],
                                                                o.Number<TavCameraStatus>(), s[15]);
     }},
    {"UnpackTimeZone", "Get", "TimeZone", "", "-timezone CET",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavControllerTime>()->UnpackTimeZone(d, o.String()); }, robustness::OutValues::kTypeCheckedFirst | robustness::OutValues::kNullOnSuccess},
    {"UnpackTimeServer", "Get", "TimeServer", "", "-timeserver ntp",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavControllerTime>()->UnpackTimeServer(d, o.String()); }, robustness::OutValues::kTypeCheckedFirst | robustness::OutValues::kNullOnSuccess},
    {"UnpackTestTimeServer", "Set", "TestTimeServer", "-timeserver \"ntp\"", "-time_t 5",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavControllerTime>()->UnpackTestTimeServer(d, o.Time()); }},
    {"UnpackManualModePrivRequestEvent", nullptr, nullptr, nullptr, "",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavUser>()->UnpackManualModePrivRequestEvent(d, o.Login(), o.Number<ULONG>(),
                                                                 o.Number<TavManualModePrivileges>());
     },
     robustness::OutValues::kNullOnSuccess},
    {"UnpackManualModePrivilegesState", nullptr, nullptr, nullptr, "",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavUser>()->UnpackManualModePrivilegesState(d, 1, o.Number<TavManualModePrivilegesState>(),
                                                                o.Login(), o.Number<LONG>());
     },
     robustness::OutValues::kNullOnSuccess},
    {"UnpackPendingManualModePrivRequest", nullptr, nullptr, nullptr, "",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavUser2>()->UnpackPendingManualModePrivRequest(d, o.Login(), o.Number<ULONG>(),
                                                                   o.Number<TavManualModePrivileges>());
     },
     robustness::OutValues::kNullOnSuccess},
    {"UnpackCurrentMaster", nullptr, nullptr, nullptr, "",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavMastership>()->UnpackCurrentMaster(d, 1, o.Number<TavMastershipStatus>(), o.Login(),
                                                          o.Number<LONG>());
     },
     robustness::OutValues::kNullOnSuccess},
    {"UnpackStorageDevices", "Get", "StorageDevice", "", "-noelts 1\tHD0a;Fixed;1;0\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavDynamicDevices>()->UnpackStorageDevices(d, o.Retrieval(), o.Enumerator<IEnumStorageDevices>());
     }},
    {"UnpackStorageDevices2", "Get", "StorageDevice2", "", "-noelts 1\tHD0a;Fixed;1;0;1\t",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavDynamicDevices2>()->UnpackStorageDevices2(d, o.Retrieval(),
                                                                 o.Enumerator<IEnumStorageDevices2>());
     }},
    {"UnpackDiagnosticsInfoStatus", "Get", "SystemDiagnostics", "", "-pstatus 0",
     [](VARIANT* d, robustness::OutValues& o) {
         return As<ITavSystemDiagnostics>()->UnpackDiagnosticsInfoStatus(d, o.Number<HRESULT>());
     }},
    {"UnpackDorvelScreenDump", "Get", "Dorvel", "", "-pstatus 0",
     [](VARIANT* d, robustness::OutValues& o) { return As<ITavDorvel>()->UnpackDorvelScreenDump(d, o.Number<HRESULT>()); }},
};

}  // namespace

std::span<const DecoderRow> DecoderRows() { return kRows; }

IUnknown* DecodingObject() {
    static Session* const session = new Session;  // lives as long as the process
    return session->object.Get();
}

}  // namespace tav::fuzz
