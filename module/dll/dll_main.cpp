// The module's entry point. Elsewhere than on Windows a shared object has
// none: the module's static state serves, and its destruction at unload
// releases the cached class objects.
#ifdef _WIN32
#include "module/module_state.h"

extern "C" BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID) {
    switch (reason) {
    case DLL_PROCESS_ATTACH:
        tav::AttachModule(instance);
        break;
    case DLL_PROCESS_DETACH:
        tav::DetachModule();
        break;
    default:
        break;
    }
    return TRUE;
}
#endif
