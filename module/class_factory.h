#pragma once
#include <cstddef>
#include <new>

#include "tav/platform.h"

namespace tav {

// The class object of one class row. The row keeps one reference for as
// long as the module caches it; every reference beyond that one, like every
// LockServer lock, holds a module lock, so the module cannot be unloaded
// under a client that still holds the class object.
class ClassFactory final : public IClassFactory {
public:
    // Returns nullptr when memory is exhausted; the caller owns the one
    // reference the object starts with.
    static ClassFactory* Create(LONG classVersion);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;

    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE LockServer(BOOL lock) override;

    LONG ClassVersion() const { return classVersion_; }

    // From the module's allocator, so that allocation-failure tests reach it.
    static void* operator new(std::size_t size, const std::nothrow_t&) noexcept;
    static void operator delete(void* block) noexcept;

private:
    explicit ClassFactory(LONG classVersion) : classVersion_(classVersion) {}
    ~ClassFactory() = default;
    ClassFactory(const ClassFactory&) = delete;
    ClassFactory& operator=(const ClassFactory&) = delete;

    const LONG classVersion_;
    LONG volatile references_ = 1;
};

}  // namespace tav
