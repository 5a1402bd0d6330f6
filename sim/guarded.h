#pragma once
#include <new>
#include <system_error>

#include "tav/platform.h"

namespace tav::sim {

// Runs a COM method's body so that no exception leaves it: memory exhaustion
// becomes E_OUTOFMEMORY, anything else (a thread that cannot be started)
// E_UNEXPECTED.
template <typename Body>
HRESULT Guarded(Body&& body) noexcept {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (...) {
        return E_UNEXPECTED;
    }
}

}  // namespace tav::sim
