#include "tavctl/event_printer.h"


namespace tavctl {

EventPrinter* EventPrinter::New(Decoder decoder, Printer printer) {
    return new EventPrinter(std::move(decoder), std::move(printer));
}

HRESULT EventPrinter::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (riid == IID_IUnknown || riid == IID__ITavObjectEvents) {
        *object = static_cast<_ITavObjectEvents*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

ULONG EventPrinter::AddRef() { return ++references_; }

ULONG EventPrinter::Release() {
    const ULONG left = --references_;
    if (left == 0) {
        delete this;
    }
    return left;
}

HRESULT EventPrinter::OnChange(TavEventData* data) {
    if (data == nullptr) {
        return E_POINTER;
    }
    try {
        printer_(decoder_(data->userDef, &data->Data, data->time));
        {
            std::lock_guard lock(mutex_);
            ++count_;
        }
        arrived_.notify_all();
        return S_OK;
    } catch (...) {
        return E_OUTOFMEMORY;
    }
}

std::size_t EventPrinter::WaitFor(std::size_t count, std::chrono::steady_clock::time_point deadline) {
    std::unique_lock lock(mutex_);
    arrived_.wait_until(lock, deadline, [&] { return count_ >= count; });
    return count_;
}

}  // namespace tavctl
