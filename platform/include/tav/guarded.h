// No exception may leave a COM method or an exported function: these turn
// one into its HRESULT. Memory exhaustion becomes E_OUTOFMEMORY, anything
// else (a thread that cannot be started, say) E_UNEXPECTED.
#pragma once
#include <new>

#include "tav/platform.h"

namespace tav {

// The result of the exception being handled; call it inside a catch block.
inline HRESULT ResultOfException() noexcept {
    try {
        throw;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (...) {
        return E_UNEXPECTED;
    }
}

// Runs body, a callable returning an HRESULT, so that no exception leaves it.
template <typename Body>
HRESULT Guarded(Body&& body) noexcept {
    try {
        return body();
    } catch (...) {
        return ResultOfException();
    }
}

}  // namespace tav
