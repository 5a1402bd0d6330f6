#pragma once
#include <source_location>
#include <type_traits>
#include <utility>

#include "TavController.h"
#include "TavSiblings.h"
#include "core/controller_path.h"
#include "core/error_site.h"
#include "core/text/ole_string.h"
#include "tav/com_ptr.h"
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

// The TavInParams check: with a callback, riid must name ITavCommandCallback.
// A NULL record or a NULL callback passes without riid being read.
bool ValidInParams(const TavInParams* rip);

// True when a call with these parameters returns before its reply arrives.
inline bool IsAsync(const TavInParams* rip) { return rip != nullptr && rip->callType != Sync; }

// Steps 5 to 8 of the call pattern, after the command was handed to the
// command component: the Async return, or the Sync reply's status and decode.
class SentCommand {
public:
    SentCommand(ControllerObject& object, TavInParams* rip, HRESULT hr);
    SentCommand(SentCommand&&) = default;

    // Operations without a reply value.
    [[nodiscard]] HRESULT StatusOnly(Where where = Where::current());
    // Operations whose Sync reply is decoded by their Unpack operation; decode
    // is called with the reply VARIANT and must call that operation through the
    // object's interface so that an override is honoured.
    template <class F>
    [[nodiscard]] HRESULT Decode(F&& decode, Where where = Where::current()) {
        HRESULT result;
        if (Finished(&result, where)) {
            return result;
        }
        return std::forward<F>(decode)(reply_.Data());
    }
    // As Decode, but a Sync reply with a failure status is decoded too (its
    // text may carry the controller's findings) before its status is
    // returned.
    template <class F>
    [[nodiscard]] HRESULT DecodeEvenOnFailure(F&& decode, Where where = Where::current()) {
        HRESULT result;
        if (!Finished(&result, where)) {
            return std::forward<F>(decode)(reply_.Data());
        }
        if (FAILED(hr_) || IsAsync(rip_)) {
            return result;
        }
        static_cast<void>(std::forward<F>(decode)(reply_.Data()));
        // Whatever the decoding recorded, the reply's error is the last one.
        return RecordReplyFailure(where);
    }
    // The raw Sync reply, for the few operations that read it themselves.
    template <class F>
    [[nodiscard]] HRESULT WithReply(F&& use, Where where = Where::current()) {
        HRESULT result;
        if (Finished(&result, where)) {
            return result;
        }
        return std::forward<F>(use)(reply_.Record());
    }
    // Free text handed on as the controller wrote it: the Sync reply's own
    // string becomes the caller's, without a copy. A reply that holds no
    // string fails with E_FAIL and notText (reported from a line of its own).
    [[nodiscard]] HRESULT TakeText(BSTR* out, const OLECHAR* notText, Where where = Where::current());

    CommandReply& Reply() { return reply_; }
    friend class Call;

private:
    // True when the call ends here (a failure, an Async call, or a Sync reply
    // with a failure status), with its result in *result.
    bool Finished(HRESULT* result, Where where);
    HRESULT RecordReplyFailure(Where where);

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
// After the first failure every later step is skipped.
//
// A check that may only be evaluated once an earlier one has passed (a field
// read through a pointer that an earlier step checks) is given as a callable,
// which runs only while nothing has failed, or has a step of its own
// (RetrievalParams); a plain bool is evaluated before the chain runs.
class Call {
public:
    Call(ControllerObject& object, TavInParams* rip);

    // Step 1: with a callback, riid must name ITavCommandCallback.
    [[nodiscard]] Call& ValidParams(const OLECHAR* text, Where where = Where::current());
    // Step 2.
    template <class T>
    [[nodiscard]] Call& OutPointer(T* out, const OLECHAR* text, Where where = Where::current()) {
        return Require(out != nullptr, E_POINTER, text, where);
    }
    // Step 2 for several out-pointers: the first NULL one fails with text.
    template <class... T>
    [[nodiscard]] Call& OutPointers(SitedText text, T*... outs) {
        if (!failed() && (false || ... || (outs == nullptr))) {
            Fail(E_POINTER, ViewOf(text.text), text.site);
        }
        return *this;
    }
    // Out-values cleared once their pointers are known good (NULL, 0).
    template <class... T>
    [[nodiscard]] Call& Clear(T*... outs) {
        if (!failed()) {
            ((*outs = T{}), ...);
        }
        return *this;
    }
    // Step 3.
    [[nodiscard]] Call& Initialised(const OLECHAR* text, Where where = Where::current());
    // Step 4: the operation's own checks.
    [[nodiscard]] Call& Require(bool ok, HRESULT hr, const OLECHAR* text, Where where = Where::current());
    template <class Check, class = std::enable_if_t<std::is_invocable_r_v<bool, Check>>>
    [[nodiscard]] Call& Require(Check&& check, HRESULT hr, const OLECHAR* text, Where where = Where::current()) {
        return failed() ? *this : Require(std::forward<Check>(check)(), hr, text, where);
    }
    // The retrieval record of a list operation: present (else E_INVALIDARG
    // with nullText), then asking for everything, which each list writes as
    // its own number (else E_INVALIDARG with modeText, reported from a line
    // of its own).
    [[nodiscard]] Call& RetrievalParams(const TavRetrievalParams* params, LONG retrieveAll, const OLECHAR* nullText,
                                        const OLECHAR* modeText, Where where = Where::current());
    // A path that must be a controller path ("ctrl:" in any case, no
    // backslash, something after the prefix); *sent views it without its
    // prefix. A blank path fails with an empty text, the others with the
    // operation's own.
    [[nodiscard]] Call& ControllerPathOnly(BSTR path, const ControllerPathTexts& texts, OleStringView* sent);
    // A path that may be a controller path or a local one: a NULL path is
    // empty, a local path stays as it is, a controller path loses its prefix
    // and must hold no backslash (else backslashText).
    [[nodiscard]] Call& ControllerOrLocalPath(BSTR path, const OLECHAR* backslashText, OleStringView* converted);
    // A call into a sibling component as a step of its own (a file copied
    // before the command that names it): on failure, its result with text.
    template <class F, class = std::enable_if_t<std::is_invocable_r_v<HRESULT, F>>>
    [[nodiscard]] Call& Invoke(F&& call, OleStringView text, Where where = Where::current()) {
        if (!failed()) {
            const HRESULT hr = std::forward<F>(call)();
            if (FAILED(hr)) {
                Fail(hr, text, where);
            }
        }
        return *this;
    }

    // A call into a sibling component as a step of its own whose failure
    // takes over the component's error text, as a failed Execute does.
    template <class F, class = std::enable_if_t<std::is_invocable_r_v<HRESULT, F>>>
    [[nodiscard]] Call& InvokeComponent(IUnknown* component, F&& call, Where where = Where::current()) {
        if (!failed()) {
            const HRESULT hr = Delivered(std::forward<F>(call)(), component, where);
            if (FAILED(hr)) {
                hr_ = hr;
            }
        }
        return *this;
    }

    // Steps 5 and 6: build the command and hand it to the command component.
    [[nodiscard]] SentCommand Get(OleStringView command, OleStringView args = {}, Where where = Where::current());
    [[nodiscard]] SentCommand Set(OleStringView command, OleStringView args = {}, Where where = Where::current());
    [[nodiscard]] SentCommand Send(Verb verb, OleStringView command, OleStringView args,
                                   Where where = Where::current());
    // The same with an argument text built only when every step before has
    // passed: args() returns it.
    template <class Args, class = std::enable_if_t<std::is_invocable_r_v<OleString, Args>>>
    [[nodiscard]] SentCommand Send(Verb verb, OleStringView command, Args&& args, Where where = Where::current()) {
        if (failed()) {
            return SendTo(StoredUrl(), verb, command, OleStringView(), where);
        }
        const OleString text = std::forward<Args>(args)();
        return SendTo(StoredUrl(), verb, command, text, where);
    }
    // The same, to a URL other than the stored one.
    [[nodiscard]] SentCommand SendTo(BSTR url, Verb verb, OleStringView command, OleStringView args,
                                     Where where = Where::current());
    // The same steps through the command component's file interface:
    // call(file, reply) makes the call; a failure takes over the file
    // interface's error text, as a failed Execute does.
    template <class F>
    [[nodiscard]] SentCommand ThroughFile(F&& call, const OLECHAR* noFileText, Where where = Where::current()) {
        SentCommand sent(object_, rip_, hr_);
        if (!failed()) {
            const ComPtr<ITavFile> file = FileInterface(noFileText);
            sent.hr_ = file ? Delivered(std::forward<F>(call)(*file, sent.reply_.Record()), file.Get(), where) : hr_;
        }
        return sent;
    }
    // An IPC message handed to the command component, which carries it to
    // the controller; its result, with the component's text on failure.
    [[nodiscard]] HRESULT SendMessage(TavIPCHeaderInternal* header, byte* data, LONG size,
                                      Where where = Where::current());

    bool failed() const { return FAILED(hr_); }
    HRESULT Result() const { return hr_; }
    TavInParams* Params() const { return rip_; }
    // Records a failure found by the operation itself after the TavInParams
    // check, and tells the callback.
    HRESULT Fail(HRESULT hr, OleStringView text, Where where = Where::current());
    HRESULT Fail(HRESULT hr, OleStringView text, ErrorSite site);

private:
    BSTR StoredUrl() const;
    // The command component's file interface, asked for each time so that
    // the call sees the component as it is now; null with the failure
    // recorded (at a line of its own) when it has none.
    ComPtr<ITavFile> FileInterface(const OLECHAR* noFileText);
    // hr of a call into component: a failure takes over the component's
    // error text and is told to the callback.
    HRESULT Delivered(HRESULT hr, IUnknown* component, Where where);

    ControllerObject& object_;
    TavInParams* rip_;
    HRESULT hr_ = S_OK;
};

// Tells the caller's callback (when there is one) of hr, with a copy of the
// last-error text when hr is a failure; returns hr.
HRESULT NotifyCallback(ControllerObject& object, TavInParams* rip, HRESULT hr);


}  // namespace tav
