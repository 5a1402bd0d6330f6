#pragma once
#include <source_location>
#include <type_traits>
#include <utility>

#include "TavController.h"
#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

class ControllerObject;

using Where = std::source_location;

// The reply record of one command; its VARIANT is cleared when it goes.
class CommandReply {
public:
    CommandReply();
    ~CommandReply();
    CommandReply(CommandReply&& other) noexcept;
    CommandReply(const CommandReply&) = delete;
    CommandReply& operator=(const CommandReply&) = delete;
    CommandReply& operator=(CommandReply&&) = delete;

    TavCommandReply& Record() { return record_; }
    VARIANT* Data() { return &record_.data; }
    void Clear();

private:
    TavCommandReply record_;
};

// Steps 5 to 8 of the call pattern, after the command was handed to the
// command component: the Async return, or the Sync reply's status and decode.
class SentCommand {
public:
    SentCommand(ControllerObject& object, TavInParams* rip, HRESULT hr);
    SentCommand(SentCommand&&) = default;

    // Operations without a reply value.
    HRESULT StatusOnly(Where where = Where::current());
    // Operations whose Sync reply is decoded by their Unpack operation; decode
    // is called with the reply VARIANT and must call that operation through the
    // object's interface so that an override is honoured.
    template <class F>
    HRESULT Decode(F&& decode, Where where = Where::current()) {
        HRESULT result;
        if (Finished(&result, where)) {
            return result;
        }
        return std::forward<F>(decode)(reply_.Data());
    }
    // The raw Sync reply, for the few operations that hand it on as it is.
    template <class F>
    HRESULT WithReply(F&& use, Where where = Where::current()) {
        HRESULT result;
        if (Finished(&result, where)) {
            return result;
        }
        return std::forward<F>(use)(reply_.Record());
    }

    CommandReply& Reply() { return reply_; }
    friend class Call;

private:
    // True when the call ends here (a failure, an Async call, or a Sync reply
    // with a failure status), with its result in *result.
    bool Finished(HRESULT* result, Where where);

    ControllerObject& object_;
    TavInParams* rip_;
    HRESULT hr_;
    CommandReply reply_;
};

enum class Verb { Get, Set };

// The call pattern of every command operation: TavInParams, out-pointers,
// initialised flag, the operation's own checks, then the send. Each step
// records its own text with the line of the statement that states it, and
// the steps after the TavInParams check also tell the caller's callback.
class Call {
public:
    Call(ControllerObject& object, TavInParams* rip);

    // Step 1: with a callback, riid must name ITavCommandCallback.
    Call& ValidParams(const OLECHAR* text, Where where = Where::current());
    // Step 2.
    template <class T>
    Call& OutPointer(T* out, const OLECHAR* text, Where where = Where::current()) {
        return Require(out != nullptr, E_POINTER, text, where);
    }
    // Step 3.
    Call& Initialised(const OLECHAR* text, Where where = Where::current());
    // Step 4: the operation's own checks.
    Call& Require(bool ok, HRESULT hr, const OLECHAR* text, Where where = Where::current());
    template <class Check, class = std::enable_if_t<std::is_invocable_r_v<bool, Check>>>
    Call& Require(Check&& check, HRESULT hr, const OLECHAR* text, Where where = Where::current()) {
        return failed() ? *this : Require(std::forward<Check>(check)(), hr, text, where);
    }

    // Steps 5 and 6: build the command and hand it to the command component.
    SentCommand Get(OleStringView command, OleStringView args = {}, Where where = Where::current());
    SentCommand Set(OleStringView command, OleStringView args = {}, Where where = Where::current());
    SentCommand Send(Verb verb, OleStringView command, OleStringView args, Where where = Where::current());
    // The same, to a URL other than the stored one.
    SentCommand SendTo(BSTR url, Verb verb, OleStringView command, OleStringView args,
                       Where where = Where::current());

    bool failed() const { return FAILED(hr_); }
    HRESULT Result() const { return hr_; }
    TavInParams* Params() const { return rip_; }
    // Records a failure found by the operation itself after the TavInParams
    // check, and tells the callback.
    HRESULT Fail(HRESULT hr, OleStringView text, Where where = Where::current());

private:
    ControllerObject& object_;
    TavInParams* rip_;
    HRESULT hr_ = S_OK;
};

// Tells the caller's callback (when there is one) of hr, with a copy of the
// last-error text when hr is a failure; returns hr.
HRESULT NotifyCallback(ControllerObject& object, TavInParams* rip, HRESULT hr);

// The TavInParams check: with a callback, riid must name ITavCommandCallback.
// A NULL record or a NULL callback passes without riid being read.
bool ValidInParams(const TavInParams* rip);

// True when a call with these parameters returns before its reply arrives.
inline bool IsAsync(const TavInParams* rip) { return rip != nullptr && rip->callType != Sync; }

}  // namespace tav
