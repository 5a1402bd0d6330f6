#include "tavctl/reply_waiter.h"

#include <new>

namespace tavctl {

ReplyWaiter* ReplyWaiter::New() { return new ReplyWaiter(); }

HRESULT ReplyWaiter::QueryInterface(REFIID riid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (riid == IID_IUnknown || riid == IID_ITavCommandCallback) {
        *object = static_cast<ITavCommandCallback*>(this);
        AddRef();
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

ULONG ReplyWaiter::AddRef() { return ++references_; }

ULONG ReplyWaiter::Release() {
    const ULONG left = --references_;
    if (left == 0) {
        delete this;
    }
    return left;
}

HRESULT ReplyWaiter::OnCommandReply(TavCommandReply* reply) {
    if (reply == nullptr) {
        return E_POINTER;
    }
    try {
        CallbackReply copy;
        copy.status = reply->status;
        copy.userDef = reply->userDef;
        copy.data.CopyFrom(reply->data);
        {
            std::lock_guard lock(mutex_);
            replies_.push_back(std::move(copy));
        }
        arrived_.notify_all();
        return S_OK;
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    }
}

std::optional<CallbackReply> ReplyWaiter::Wait(std::chrono::milliseconds limit) {
    std::unique_lock lock(mutex_);
    if (!arrived_.wait_for(lock, limit, [this] { return !replies_.empty(); })) {
        return std::nullopt;
    }
    CallbackReply first = std::move(replies_.front());
    replies_.pop_front();
    return first;
}

}  // namespace tavctl
