#include "support/reply_recorder.h"

#include "support/test_text.h"

namespace tav::test {

HRESULT ReplyRecorder::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (IsEqualIID(riid, IID_IUnknown) || IsEqualIID(riid, IID_ITavCommandCallback)) {
        *object = static_cast<ITavCommandCallback*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

HRESULT ReplyRecorder::OnCommandReply(TavCommandReply* reply) {
    ReceivedReply copy;
    copy.status = reply->status;
    copy.reserved = reply->reserved;
    copy.userDef = reply->userDef;
    copy.reserved2 = reply->reserved2;
    copy.vt = reply->data.vt;
    if (copy.vt == VT_BSTR) {
        copy.text = Narrow(reply->data.bstrVal);
        copy.nullText = reply->data.bstrVal == nullptr;
    } else if (copy.vt == VT_I4) {
        copy.number = reply->data.lVal;
    }
    copy.thread = std::this_thread::get_id();
    {
        std::lock_guard<std::mutex> hold(lock_);
        replies_.push_back(std::move(copy));
    }
    arrived_.notify_all();
    return S_OK;
}

bool ReplyRecorder::WaitFor(size_t count, std::chrono::milliseconds timeOut) const {
    std::unique_lock<std::mutex> hold(lock_);
    return arrived_.wait_for(hold, timeOut, [&] { return replies_.size() >= count; });
}

size_t ReplyRecorder::Count() const {
    std::lock_guard<std::mutex> hold(lock_);
    return replies_.size();
}

std::vector<ReceivedReply> ReplyRecorder::Replies() const {
    std::lock_guard<std::mutex> hold(lock_);
    return replies_;
}

ReceivedReply ReplyRecorder::Last() const {
    std::lock_guard<std::mutex> hold(lock_);
    return replies_.empty() ? ReceivedReply() : replies_.back();
}

namespace {
// The interface identifier a TavInParams points at must outlive the call.
GUID callbackIid = IID_ITavCommandCallback;
}  // namespace

TavInParams AsyncParams(ITavCommandCallback* callback, ULONG userDef) {
    TavInParams params{};
    params.riid = &callbackIid;
    params.pCallback = callback;
    params.callType = Async;
    params.userDef = userDef;
    return params;
}

TavInParams SyncParams(ITavCommandCallback* callback, ULONG userDef) {
    TavInParams params = AsyncParams(callback, userDef);
    params.callType = Sync;
    return params;
}

}  // namespace tav::test
