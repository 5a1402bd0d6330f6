#pragma once
// A component's last error text, served through ITavComError.
#include <mutex>

#include "sim/text.h"
#include "tav/platform.h"

namespace tav::sim {

class LastError {
public:
    // Records text (in the form ErrorText gives it) and returns hr.
    HRESULT Record(HRESULT hr, TextView text) {
        Text recorded = ErrorText(text);
        std::lock_guard lock(mutex_);
        text_ = std::move(recorded);
        return hr;
    }

    // GetLastErrorInfo: a copy for the caller, NULL when nothing was recorded.
    HRESULT CopyTo(BSTR* errorText) const {
        if (errorText == nullptr) {
            return E_POINTER;
        }
        std::lock_guard lock(mutex_);
        *errorText = nullptr;
        if (text_.empty()) {
            return S_OK;
        }
        *errorText = SysAllocStringLen(text_.data(), static_cast<UINT>(text_.size()));
        return *errorText == nullptr ? E_OUTOFMEMORY : S_OK;
    }

private:
    mutable std::mutex mutex_;
    Text text_;
};

}  // namespace tav::sim
