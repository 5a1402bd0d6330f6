#pragma once
// Collects every TavEventData delivered to it, with a copy of its data so
// that the test thread can decode it afterwards. The controller's threads
// may hold it after a test ends, so it lives on the heap.
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "TavController.h"
#include "core/text/convert.h"
#include "support/com_double.h"
#include "tav/variant.h"

namespace tav::test {

struct ReceivedEvent {
    ULONG userDef = 0;
    VARTYPE type = VT_EMPTY;
    UINT byteLength = 0;  // of a BSTR
    std::string text;     // of a BSTR, read as wide characters
    std::string bytes;    // of a BSTR, read as bytes
    FILETIME time{};
    HRESULT status = E_UNEXPECTED;
    ULONG eventId = 0;
    std::shared_ptr<Variant> data;
};

class EventSink final : public _ITavObjectEvents {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override {
        if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID__ITavObjectEvents)) {
            *object = static_cast<_ITavObjectEvents*>(this);
            AddRef();
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    TAV_TEST_DOUBLE_REFCOUNT

    HRESULT STDMETHODCALLTYPE OnChange(TavEventData* event) override {
        if (onChange) {
            onChange();
        }
        ReceivedEvent received;
        received.userDef = event->userDef;
        received.type = event->Data.vt;
        received.time = event->time;
        received.status = event->status;
        received.eventId = event->eventId;
        received.data = std::make_shared<Variant>();
        received.data->CopyFrom(event->Data);
        if (event->Data.vt == VT_BSTR && event->Data.bstrVal != nullptr) {
            const BSTR text = event->Data.bstrVal;
            received.byteLength = SysStringByteLen(text);
            received.text = text::Narrow(OleStringView(text, SysStringLen(text)));
            received.bytes.assign(reinterpret_cast<const char*>(text), received.byteLength);
        }
        std::lock_guard hold(mutex_);
        events_.push_back(std::move(received));
        arrived_.notify_all();
        return S_OK;
    }

    // True when `count` events arrived within `limit`.
    bool WaitFor(size_t count, std::chrono::milliseconds limit = std::chrono::seconds(10)) {
        std::unique_lock hold(mutex_);
        return arrived_.wait_for(hold, limit, [&] { return events_.size() >= count; });
    }
    std::vector<ReceivedEvent> All() {
        std::lock_guard hold(mutex_);
        return events_;
    }
    size_t Count() {
        std::lock_guard hold(mutex_);
        return events_.size();
    }

    // What a client does inside its handler (set before subscribing).
    std::function<void()> onChange;

private:
    ~EventSink() = default;

    RefCount refs_;
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::vector<ReceivedEvent> events_;
};

// Owns one reference to a new sink.
struct SinkRef {
    SinkRef() : sink(new EventSink) {}
    ~SinkRef() { sink->Release(); }
    SinkRef(const SinkRef&) = delete;
    SinkRef& operator=(const SinkRef&) = delete;
    EventSink* operator->() const { return sink; }
    EventSink* sink;
};

}  // namespace tav::test

namespace tav::e2e {
using test::EventSink;
using test::ReceivedEvent;
using test::SinkRef;
}  // namespace tav::e2e
