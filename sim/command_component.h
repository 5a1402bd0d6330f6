#pragma once
#include "sim/last_error.h"
#include <atomic>
#include <memory>
#include <mutex>

#include "TavSiblings.h"
#include "sim/com_object.h"
#include "sim/controller_binding.h"
#include "sim/controller_model.h"
#include "sim/subscription_hub.h"
#include "sim/task_queue.h"
#include "tav/com_ptr.h"

namespace tav::sim {

// The command component (class TavComCtrl) of the virtual controller: carries
// commands to the controller of their URL, Sync or Async, and its
// subscriptions. It serves one controller for its subscriptions: the one the
// user component binds it to, or else the one of its first command.
class CommandComponent final : public ITavComCtrl,
                               public ITavCommand2,
                               public ITavFile,
                               public ITavComError,
                               public IControllerBinding {
public:
    static HRESULT Create(IUnknown* outer, REFIID riid, void** object);

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    TAV_SIM_REFERENCE_COUNT

    // ITavComCtrl
    HRESULT STDMETHODCALLTYPE Execute(TavInParams* rip, TavCommandReply* reply, BSTR verb, BSTR url, BSTR command,
                                      BSTR args) override;
    HRESULT STDMETHODCALLTYPE Subscribe(TavInParams* rip, TavEventParams* params, IUnknown* helper, BSTR eventName,
                                        BSTR eventArgs, LONG kind, ULONG* cookie) override;
    HRESULT STDMETHODCALLTYPE SubscribeConnectionEvents(TavInParams* rip, TavEventParams* params,
                                                        ULONG* cookie) override;
    HRESULT STDMETHODCALLTYPE Unsubscribe(TavInParams* rip, ULONG cookie) override;
    HRESULT STDMETHODCALLTYPE ConnectIPCSink(IUnknown* sink) override;
    HRESULT STDMETHODCALLTYPE SendIPCMessage(TavInParams* rip, TavIPCHeaderInternal* header, byte* data,
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
    HRESULT STDMETHODCALLTYPE GetControllerFileSize(TavInParams* rip, BSTR url, BSTR ctrlPath, ULONG* size) override;
    HRESULT STDMETHODCALLTYPE CheckLink(TavInParams* rip, TavCommandReply* reply) override;

    // ITavComError
    HRESULT STDMETHODCALLTYPE GetLastErrorInfo(BSTR* errorText) override;

    // IControllerBinding
    HRESULT STDMETHODCALLTYPE BindController(BSTR url) override;
    HRESULT STDMETHODCALLTYPE GetClientId(ULONG* clientId) override;

private:
    CommandComponent();
    ~CommandComponent();

    // Records the component's error text and returns hr.
    HRESULT Fail(HRESULT hr, Text text);

    // The controller of url, which also becomes the bound one if none is.
    std::shared_ptr<ControllerModel> Reach(TextView url);
    std::shared_ptr<SubscriptionHub> Hub();

    HRESULT Carry(TavInParams* rip, TavCommandReply* reply, TextView verb, BSTR url, BSTR command, BSTR args,
                  ULONG clientValue, TextView operation);
    // Hands the connected message sink to the bound controller, so that
    // messages for this client's slots reach it.
    void LinkMessageSink();
    HRESULT AddSubscription(TavEventParams* params, TextView eventName, BSTR eventArgs, LONG kind, ULONG* cookie,
                            TextView operation);
    // Runs work(FileSystem&, Text& error) on the files of the controller at
    // url; false from it fails the operation with the error text.
    template <typename F>
    HRESULT OnFiles(BSTR url, TextView operation, F&& work);

    ObjectLifetime lifetime_;
    std::mutex mutex_;
    LastError lastError_;
    std::shared_ptr<ControllerModel> bound_;
    std::atomic<ControllerModel*> boundDirect_{nullptr};
    std::atomic<std::uint32_t> clientId_{0};
    std::shared_ptr<SubscriptionHub> hub_;
    ComPtr<_ITavIPCMessages> messageSink_;
    TaskQueue replies_;
};

}  // namespace tav::sim
