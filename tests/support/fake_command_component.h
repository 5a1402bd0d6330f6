#pragma once
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "TavSiblings.h"
#include "support/com_double.h"
#include "support/test_text.h"

namespace tav::test {

// What the command component answers to one command.
struct ScriptedReply {
    HRESULT status = S_OK;
    VARTYPE vt = VT_EMPTY;
    OleString text;         // VT_BSTR
    bool nullText = false;  // VT_BSTR holding a NULL BSTR
    LONG number = 0;        // VT_I4

    static ScriptedReply Text(std::string_view text, HRESULT status = S_OK);
    static ScriptedReply Text(OleStringView text, HRESULT status = S_OK);
    static ScriptedReply NullText(HRESULT status = S_OK);
    static ScriptedReply Number(LONG value, HRESULT status = S_OK);
    static ScriptedReply Empty(HRESULT status = S_OK);

    // Fills data (which must be empty) with this reply's VARIANT.
    void FillVariant(VARIANT* data) const;
};

// TavInParams as the controller object passed it: the pointer and, when it
// was not NULL, a copy of its fields at the time of the call.
struct PassedParams {
    TavInParams* pointer = nullptr;
    std::optional<TavInParams> fields;

    bool IsNull() const { return pointer == nullptr; }
    bool IsAsync() const { return fields && fields->callType != Sync; }
};

// One Execute call.
struct RecordedCommand {
    std::string verb;
    std::string url;
    std::string command;
    std::string args;
    OleString rawArgs;  // the argument text as sent, unit for unit
    PassedParams params;
};

// One ITavCommand2::ExecuteEx call.
struct RecordedCommand2 {
    PassedParams params;
    std::optional<TavInParams> params2;
    ULONG clientValue = 0;
    std::string url;
    std::string command;
    std::string args;
};

// One Subscribe or SubscribeConnectionEvents call.
struct RecordedSubscription {
    PassedParams params;
    TavEventParams eventParams{};  // the copy the controller object passed
    bool connectionEvents = false;
    IUnknown* helper = nullptr;
    std::string eventName;
    std::optional<std::string> eventArgs;  // nullopt: passed NULL
    LONG kind = 0;
    ULONG cookie = 0;  // what the component answered
};

struct RecordedUnsubscription {
    PassedParams params;
    ULONG cookie = 0;
};

struct RecordedIpcSend {
    PassedParams params;
    TavIPCHeaderInternal header{};
    std::vector<BYTE> data;
    LONG size = 0;
};

// One ITavFile call: the operation's name and its string arguments in order
// (the URL first).
struct RecordedFileCall {
    std::string operation;
    PassedParams params;
    std::vector<std::string> texts;
};

// Operations of the command component whose failure a test can choose.
enum class ComOperation {
    Execute,
    ExecuteEx,
    Subscribe,
    SubscribeConnectionEvents,
    Unsubscribe,
    ConnectIPCSink,
    SendIPCMessage,
    CopyFileToController,
    CopyFileFromController,
    CreateControllerDirectory,
    DeleteControllerFile,
    GetControllerFileSize,
    CheckLink,
};

// The command component TavComCtrl as the controller object sees it. Execute
// answers from a script keyed by command name; a Sync call gets the reply in
// its record, an Async call with a callback gets it later on a thread of the
// component's own (JoinDeliveries waits for them). Every call is recorded.
// All members are safe to use from several threads.
class FakeCommandComponent final : public ITavComCtrl, public ITavCommand2, public ITavFile, public ITavComError {
public:
    struct Offers {
        bool command2 = true;
        bool file = true;
        bool errorInterface = true;
    };
    static Ref<FakeCommandComponent> Make(Offers offers);
    static Ref<FakeCommandComponent> Make() { return Make(Offers{}); }

    // --- Script ---
    // Replies to command (its name, such as "SystemClock"). Several replies to
    // one command are used in turn; the last one keeps answering.
    void Script(std::string_view command, std::string_view replyText, HRESULT status = S_OK);
    void Script(std::string_view command, ScriptedReply reply);
    // The reply to every command without a script (initially S_OK, VT_EMPTY).
    void SetDefaultReply(ScriptedReply reply);
    // The operation fails with hr (S_OK: succeeds again) and errorText becomes
    // the component's error text. For Execute, command limits the failure to
    // that command name (empty: every command).
    void Fail(ComOperation operation, HRESULT hr, std::string_view errorText, std::string_view command = {});
    void FailExecute(HRESULT hr, std::string_view errorText) { Fail(ComOperation::Execute, hr, errorText); }
    // The text that ITavComError serves (empty: a NULL BSTR).
    void SetErrorText(std::string_view text);
    void SetNextCookie(ULONG cookie);
    void SetFileSize(ULONG size);
    void SetExecuteExResult(ULONG result);
    // Forgets the scripts, the chosen failures and the default reply.
    void ClearScript();

    // --- Records ---
    std::vector<RecordedCommand> Commands() const;
    RecordedCommand LastCommand() const;  // an empty record when nothing was sent
    size_t CommandCount() const;
    std::vector<RecordedCommand2> Command2Calls() const;
    std::vector<RecordedSubscription> Subscriptions() const;
    std::vector<RecordedUnsubscription> Unsubscriptions() const;
    std::vector<RecordedIpcSend> IpcSends() const;
    std::vector<RecordedFileCall> FileCalls() const;
    // The sink given to ConnectIPCSink (a reference is held until DropIpcSink).
    IUnknown* IpcSink() const;
    void DropIpcSink();
    // Hands a message to that sink as the controller would; E_NOINTERFACE
    // without a sink that answers _ITavIPCMessages.
    HRESULT DeliverIpcMessage(TavIPCHeaderInternal header, std::vector<BYTE> data);
    void ClearRecords();

    // Waits until every Async reply handed out so far has been delivered.
    void JoinDeliveries();

    // ITavComCtrl
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    TAV_TEST_DOUBLE_REFCOUNT
    HRESULT STDMETHODCALLTYPE Execute(TavInParams* rip, TavCommandReply* reply, BSTR verb, BSTR url, BSTR command,
                                      BSTR args) override;
    HRESULT STDMETHODCALLTYPE Subscribe(TavInParams* rip, TavEventParams* params, IUnknown* helper, BSTR eventName,
                                        BSTR eventArgs, LONG kind, ULONG* cookie) override;
    HRESULT STDMETHODCALLTYPE SubscribeConnectionEvents(TavInParams* rip, TavEventParams* params,
                                                        ULONG* cookie) override;
    HRESULT STDMETHODCALLTYPE Unsubscribe(TavInParams* rip, ULONG cookie) override;
    HRESULT STDMETHODCALLTYPE ConnectIPCSink(IUnknown* sink) override;
    HRESULT STDMETHODCALLTYPE SendIPCMessage(TavInParams* rip, TavIPCHeaderInternal* header, BYTE* data,
                                             LONG size) override;
    // ITavCommand2
    HRESULT STDMETHODCALLTYPE ExecuteEx(TavInParams* rip, TavCommandReply* reply, TavInParams* rip2,
                                        ULONG clientValue, BSTR url, BSTR command, BSTR args,
                                        ULONG* result) override;
    // ITavFile
    HRESULT STDMETHODCALLTYPE CopyFileToController(TavInParams* rip, BSTR url, BSTR localPath,
                                                   BSTR ctrlPath) override;
    HRESULT STDMETHODCALLTYPE CopyFileFromController(TavInParams* rip, BSTR url, BSTR ctrlPath,
                                                     BSTR localPath) override;
    HRESULT STDMETHODCALLTYPE CreateControllerDirectory(TavInParams* rip, BSTR url, BSTR ctrlDir) override;
    HRESULT STDMETHODCALLTYPE DeleteControllerFile(TavInParams* rip, BSTR url, BSTR ctrlPath) override;
    HRESULT STDMETHODCALLTYPE GetControllerFileSize(TavInParams* rip, BSTR url, BSTR ctrlPath,
                                                    ULONG* size) override;
    HRESULT STDMETHODCALLTYPE CheckLink(TavInParams* rip, TavCommandReply* reply) override;
    // ITavComError
    HRESULT STDMETHODCALLTYPE GetLastErrorInfo(BSTR* errorText) override;

private:
    struct Failure {
        HRESULT hr = S_OK;
        std::string command;
        std::string text;
    };

    explicit FakeCommandComponent(Offers offers) : offers_(offers) {}
    ~FakeCommandComponent();

    // Under lock_: the failure chosen for operation (and command), or S_OK;
    // a failure makes its text the component's error text.
    HRESULT FailureFor(ComOperation operation, std::string_view command = {});
    ScriptedReply ReplyFor(const std::string& command);
    void Deliver(TavInParams* rip, const ScriptedReply& reply);
    HRESULT RecordFileCall(ComOperation operation, const char* name, TavInParams* rip,
                           std::initializer_list<BSTR> texts);

    RefCount refs_;
    const Offers offers_;
    mutable std::mutex lock_;
    std::map<std::string, std::vector<ScriptedReply>> script_;
    ScriptedReply defaultReply_;
    std::map<ComOperation, Failure> failures_;
    std::string errorText_;
    ULONG nextCookie_ = 1;
    ULONG fileSize_ = 0;
    ULONG executeExResult_ = 0;
    std::vector<RecordedCommand> commands_;
    std::vector<RecordedCommand2> command2Calls_;
    std::vector<RecordedSubscription> subscriptions_;
    std::vector<RecordedUnsubscription> unsubscriptions_;
    std::vector<RecordedIpcSend> ipcSends_;
    std::vector<RecordedFileCall> fileCalls_;
    IUnknown* ipcSink_ = nullptr;
    std::mutex deliveriesLock_;
    std::vector<std::thread> deliveries_;
};

}  // namespace tav::test
