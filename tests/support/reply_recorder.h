#pragma once
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "TavController.h"
#include "support/com_double.h"

namespace tav::test {

// One TavCommandReply as a callback received it.
struct ReceivedReply {
    HRESULT status = S_OK;
    ULONG reserved = 0;
    ULONG userDef = 0;
    ULONG reserved2 = 0;
    VARTYPE vt = VT_EMPTY;
    std::string text;  // the BSTR data, when vt is VT_BSTR
    bool nullText = false;
    LONG number = 0;  // the VT_I4 data
    std::thread::id thread;
};

// The caller's ITavCommandCallback: keeps a copy of every reply, from any
// thread, and lets the test wait for them.
class ReplyRecorder final : public ITavCommandCallback {
public:
    static Ref<ReplyRecorder> Make() { return Ref<ReplyRecorder>(new ReplyRecorder); }

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    HRESULT STDMETHODCALLTYPE OnCommandReply(TavCommandReply* reply) override;
    TAV_TEST_DOUBLE_REFCOUNT

    // True once count replies have arrived, false after the time-out.
    bool WaitFor(size_t count, std::chrono::milliseconds timeOut = std::chrono::seconds(10)) const;
    size_t Count() const;
    std::vector<ReceivedReply> Replies() const;
    ReceivedReply Last() const;  // a default record when none arrived

private:
    ReplyRecorder() = default;
    ~ReplyRecorder() = default;

    RefCount refs_;
    mutable std::mutex lock_;
    mutable std::condition_variable arrived_;
    std::vector<ReceivedReply> replies_;
};

// The TavInParams a client fills for a call with this callback.
TavInParams AsyncParams(ITavCommandCallback* callback, ULONG userDef = 0);
TavInParams SyncParams(ITavCommandCallback* callback = nullptr, ULONG userDef = 0);

}  // namespace tav::test
