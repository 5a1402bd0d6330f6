#include "core/interface_table.h"

#include "core/controller_object.h"

namespace tav {
namespace {

// Every member of a family is answered with the family's one pointer.
template <class Family>
void* As(ControllerObject* object) {
    return static_cast<Family*>(object);
}

#define TAV_ENTRY(iface, since, family) {&IID_##iface, #iface, since, &As<family>}

constexpr InterfaceEntry kInterfaces[] = {
    TAV_ENTRY(ITavController, 1, ITavController6),
    TAV_ENTRY(ITavBackupRestore, 1, ITavBackupRestore2),
    TAV_ENTRY(ITavLANAdaptor, 1, ITavLANAdaptor2),
    TAV_ENTRY(ITavBoot, 1, ITavBoot3),
    TAV_ENTRY(ITavSubscribe, 1, ITavSubscribe),
    TAV_ENTRY(ITavPanel, 1, ITavPanel4),
    TAV_ENTRY(ITavUser, 1, ITavUser3),
    TAV_ENTRY(ITavUAS, 1, ITavUAS),
    TAV_ENTRY(ITavMastership, 1, ITavMastership),
    TAV_ENTRY(ITavVirtualTime, 1, ITavVirtualTime),
    TAV_ENTRY(ITavHelperBase, 1, ITavHelperBase),
    TAV_ENTRY(ITavDynamicDevices, 1, ITavDynamicDevices2),
    TAV_ENTRY(ITavController2, 2, ITavController6),
    TAV_ENTRY(ITavFileManagement, 3, ITavFileManagement),
    TAV_ENTRY(ITavController3, 3, ITavController6),
    TAV_ENTRY(ITavSystemDiagnostics, 4, ITavSystemDiagnostics),
    TAV_ENTRY(ITavPositionalSafetyController, 5, ITavPositionalSafetyController),
    TAV_ENTRY(ITavLANAdaptor2, 6, ITavLANAdaptor2),
    TAV_ENTRY(ITavDorvel, 6, ITavDorvel),
    TAV_ENTRY(ITavPanel2, 7, ITavPanel4),
    TAV_ENTRY(ITavIPC, 8, ITavIPC),
    TAV_ENTRY(ITavIPCInformation, 8, ITavIPCInformation),
    TAV_ENTRY(ITavDynamicDevices2, 9, ITavDynamicDevices2),
    TAV_ENTRY(ITavUser2, 10, ITavUser3),
    TAV_ENTRY(ITavLumeret, 11, ITavLumeret2),
    TAV_ENTRY(ITavController4, 12, ITavController6),
    TAV_ENTRY(ITavLumeret2, 12, ITavLumeret2),
    TAV_ENTRY(ITavControllerTime, 13, ITavControllerTime),
    TAV_ENTRY(ITavUser3, 14, ITavUser3),
    TAV_ENTRY(ITavSafety, 15, ITavSafety),
    TAV_ENTRY(ITavPanel3, 15, ITavPanel4),
    TAV_ENTRY(ITavController5, 15, ITavController6),
    TAV_ENTRY(ITavBoot2, 15, ITavBoot3),
    TAV_ENTRY(ITavBackupRestore2, 16, ITavBackupRestore2),
    TAV_ENTRY(ITavController6, 16, ITavController6),
    TAV_ENTRY(ITavBoot3, 16, ITavBoot3),
    TAV_ENTRY(ITavPanel4, 17, ITavPanel4),
};

#undef TAV_ENTRY

}  // namespace

std::span<const InterfaceEntry> ControllerInterfaces() { return kInterfaces; }

}  // namespace tav
