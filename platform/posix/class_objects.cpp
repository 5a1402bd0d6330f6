#include "class_objects.h"

#include <mutex>
#include <new>
#include <vector>

#include "tav/com_api.h"

namespace tav::posix {
namespace {

struct Registration {
    DWORD cookie;
    CLSID clsid;
    IUnknown* classObject;
    DWORD context;
};

class Registrations {
public:
    static Registrations& Instance() {
        static Registrations* registrations = new Registrations;
        return *registrations;
    }

    DWORD Add(REFCLSID clsid, IUnknown* classObject, DWORD context) {
        std::lock_guard lock(mutex_);
        DWORD cookie = nextCookie_++;
        entries_.push_back(Registration{cookie, clsid, classObject, context});
        return cookie;
    }

    // Hands back the class object of the registration, which now belongs to the caller.
    IUnknown* Remove(DWORD cookie) {
        std::lock_guard lock(mutex_);
        for (auto entry = entries_.begin(); entry != entries_.end(); ++entry) {
            if (entry->cookie != cookie) continue;
            IUnknown* classObject = entry->classObject;
            entries_.erase(entry);
            return classObject;
        }
        return nullptr;
    }

    // The most recent registration wins, as a later registration hides an earlier one.
    IUnknown* Find(REFCLSID clsid, DWORD context) {
        std::lock_guard lock(mutex_);
        for (auto entry = entries_.rbegin(); entry != entries_.rend(); ++entry) {
            if (entry->clsid == clsid && (entry->context & context) != 0) {
                entry->classObject->AddRef();
                return entry->classObject;
            }
        }
        return nullptr;
    }

private:
    std::mutex mutex_;
    std::vector<Registration> entries_;
    DWORD nextCookie_ = 1;
};

}  // namespace

IUnknown* FindRegisteredClassObject(REFCLSID clsid, DWORD context) {
    return Registrations::Instance().Find(clsid, context);
}

}  // namespace tav::posix

using namespace tav::posix;

extern "C" {

// Every registration behaves as REGCLS_MULTIPLEUSE: there are no other
// processes to hand a single-use class object to.
HRESULT CoRegisterClassObject(REFCLSID rclsid, LPUNKNOWN pUnk, DWORD dwClsContext, DWORD, LPDWORD lpdwRegister) {
    if (pUnk == nullptr || lpdwRegister == nullptr) return E_INVALIDARG;
    *lpdwRegister = 0;
    pUnk->AddRef();
    try {
        *lpdwRegister = Registrations::Instance().Add(rclsid, pUnk, dwClsContext);
    } catch (const std::bad_alloc&) {
        pUnk->Release();
        return E_OUTOFMEMORY;
    }
    return S_OK;
}

HRESULT CoRevokeClassObject(DWORD dwRegister) {
    IUnknown* classObject = Registrations::Instance().Remove(dwRegister);
    if (classObject == nullptr) return E_INVALIDARG;
    classObject->Release();  // outside the lock: the last Release may call back into us
    return S_OK;
}

}  // extern "C"
