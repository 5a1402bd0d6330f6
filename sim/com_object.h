#pragma once
#include <atomic>

#include "tav/platform.h"

namespace tav::sim {

// Live objects and server locks of the virtual controller: its module may be
// unloaded when both are zero.
LONG LiveObjectsAndLocks();
void LockServer(bool lock);

// Counts one live object for as long as it exists, and keeps its references.
class ObjectLifetime {
public:
    ObjectLifetime();
    ~ObjectLifetime();
    ObjectLifetime(const ObjectLifetime&) = delete;
    ObjectLifetime& operator=(const ObjectLifetime&) = delete;

    ULONG AddRef() { return ++references_; }
    ULONG Release() { return --references_; }

private:
    std::atomic<ULONG> references_{0};
};

// AddRef and Release of a COM object whose ObjectLifetime is lifetime_; the
// last Release deletes it.
#define TAV_SIM_REFERENCE_COUNT                                            \
    ULONG STDMETHODCALLTYPE AddRef() override { return lifetime_.AddRef(); } \
    ULONG STDMETHODCALLTYPE Release() override {                           \
        const ULONG left = lifetime_.Release();                            \
        if (left == 0) {                                                   \
            delete this;                                                   \
        }                                                                  \
        return left;                                                       \
    }

// Hands out `object` as riid through QueryInterface (which adds the caller's
// reference) and drops the creator's reference.
template <typename T>
HRESULT HandOut(T* object, REFIID riid, void** result) {
    object->AddRef();
    const HRESULT hr = object->QueryInterface(riid, result);
    object->Release();
    return hr;
}

}  // namespace tav::sim
