#include "inproc_servers.h"

#include <dlfcn.h>

#include <mutex>
#include <vector>

#include "tav/com_api.h"

namespace tav::posix {
namespace {

struct LoadedServer {
    void* library;
    LPFNGETCLASSOBJECT getClassObject;
    LPFNCANUNLOADNOW canUnloadNow;  // NULL: the module stays loaded
};

// Loading, asking and unloading happen under one lock, so that a module is
// never unloaded while another thread is inside its DllGetClassObject. The
// lock is recursive because a server may create other objects while asked.
class LoadedServers {
public:
    static LoadedServers& Instance() {
        static LoadedServers* servers = new LoadedServers;
        return *servers;
    }

    HRESULT GetClassObject(const std::string& path, REFCLSID clsid, REFIID iid, void** object) {
        std::lock_guard lock(mutex_);
        const LoadedServer* server = nullptr;
        HRESULT hr = Load(path, server);
        if (FAILED(hr)) return hr;
        return server->getClassObject(clsid, iid, object);
    }

    void FreeUnused() {
        std::lock_guard lock(mutex_);
        for (auto server = servers_.begin(); server != servers_.end();) {
            if (server->canUnloadNow != nullptr && server->canUnloadNow() == S_OK) {
                dlclose(server->library);
                server = servers_.erase(server);
            } else {
                ++server;
            }
        }
    }

private:
    HRESULT Load(const std::string& path, const LoadedServer*& server) {
        void* library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
        if (library == nullptr) return CO_E_DLLNOTFOUND;
        for (const LoadedServer& loaded : servers_) {
            if (loaded.library == library) {
                dlclose(library);  // keep one reference per module, ours
                server = &loaded;
                return S_OK;
            }
        }
        auto getClassObject = reinterpret_cast<LPFNGETCLASSOBJECT>(dlsym(library, "DllGetClassObject"));
        if (getClassObject == nullptr) {
            dlclose(library);
            return CO_E_ERRORINDLL;
        }
        auto canUnloadNow = reinterpret_cast<LPFNCANUNLOADNOW>(dlsym(library, "DllCanUnloadNow"));
        try {
            servers_.push_back(LoadedServer{library, getClassObject, canUnloadNow});
        } catch (...) {
            dlclose(library);
            return E_OUTOFMEMORY;
        }
        server = &servers_.back();
        return S_OK;
    }

    std::recursive_mutex mutex_;
    std::vector<LoadedServer> servers_;
};

}  // namespace

HRESULT GetClassObjectFromServer(const std::string& path, REFCLSID clsid, REFIID iid, void** object) {
    return LoadedServers::Instance().GetClassObject(path, clsid, iid, object);
}

}  // namespace tav::posix

extern "C" {

void CoFreeUnusedLibraries(void) { tav::posix::LoadedServers::Instance().FreeUnused(); }

void CoFreeUnusedLibrariesEx(DWORD, DWORD) { CoFreeUnusedLibraries(); }

}  // extern "C"
