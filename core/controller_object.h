#pragma once
#include <memory>

#include "TavController.h"
#include "TavSiblings.h"
#include "core/call.h"
#include "core/error_info.h"
#include "core/reply.h"
#include "operations/ipc/ipc_state.h"
#include "tav/bstr.h"
#include "tav/com_ptr.h"
#include "tav/platform.h"

namespace tav {

// The one controller object behind all seventeen classes. The classes differ
// only in the class version stamped at construction, which decides what
// QueryInterface answers and gates the newer features.
class ControllerObject : public ITavController6,
                         public ITavBackupRestore2,
                         public ITavLANAdaptor2,
                         public ITavBoot3,
                         public ITavSubscribe,
                         public ITavPanel4,
                         public ITavUser3,
                         public ITavUAS,
                         public ITavMastership,
                         public ITavVirtualTime,
                         public ITavHelperBase,
                         public ITavDynamicDevices2,
                         public ITavFileManagement,
                         public ITavSystemDiagnostics,
                         public ITavPositionalSafetyController,
                         public ITavDorvel,
                         public ITavIPC,
                         public ITavIPCInformation,
                         public ITavLumeret2,
                         public ITavControllerTime,
                         public ITavSafety {
public:
    static constexpr LONG kNewestVersion = 17;

    // Creates an object of class version 1..17, aggregated when outer is set
    // (then riid must be IID_IUnknown and the inner unknown is returned).
    static HRESULT Create(LONG version, IUnknown* outer, REFIID riid, void** object);

    // IUnknown, delegating to the controlling unknown.
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;

#define TAV_CONTROLLER_METHOD(interface_, name, params, args) HRESULT STDMETHODCALLTYPE name params override;
#include "controller_methods.inc"
#undef TAV_CONTROLLER_METHOD

    LONG Version() const { return version_; }
    bool Initialised() const { return initialised_ != 0; }
    ErrorInfo& Errors() { return errors_; }
    BSTR Url() const { return url_.Get(); }
    ITavComCtrl* CommandComponent() const { return command_.Get(); }
    ITavCommand2* Command2() const { return command2_.Get(); }
    ITavUser3* UserComponent() const { return user_.Get(); }
    ITavMastership* MastershipComponent() const { return mastership_.Get(); }
    // The object's own number among the controller objects of the process,
    // handed on with ITavCommand2 calls; its IPC proxy id derives from it.
    ULONG ClientValue() const { return clientValue_; }
    ipc::IpcState& Ipc() { return ipc_; }

    // The call pattern and the reply checks of every operation.
    Call Command(TavInParams* rip) { return Call(*this, rip); }
    Reply Decode(VARIANT* data) { return Reply(*this, data); }

    // Answers riid when the class version has it; otherwise E_NOINTERFACE.
    HRESULT FindInterface(REFIID riid, void** object);

    // A command of the object's own (the IPC slots' queue reports and proxy
    // control) through ITavCommand2: Sync, with an internal TavInParams and
    // no callback, so no client is ever told of it. Its reply is not read;
    // *result, when given, receives the component's 32-bit result. Records
    // no error text; E_NOINTERFACE without ITavCommand2 (class versions
    // below 8).
    HRESULT InternalCommand(OleStringView command, OleStringView args, ULONG* result = nullptr);

    // An operation handed slot for slot to a sibling component: the
    // initialised check, the call with the arguments unchanged, the
    // component's error text adopted on failure. The two sites tell the two
    // failures apart.
    template <class I, class Method, class... Args>
    HRESULT Forward(I* component, ErrorSite beforeInit, ErrorSite failed, Method method, Args... args) {
        if (!Initialised() || component == nullptr) {
            return errors_.Set(E_ABORT, beforeInit, OLESTR("TavController used before Initialized"));
        }
        const HRESULT hr = (component->*method)(args...);
        if (FAILED(hr)) {
            errors_.AdoptFromComponent(hr, component, failed);
        }
        return hr;
    }

protected:
    // Objects are made by Create, as the interface-guarding subclass of
    // controller_interfaces.cpp, and destroyed by their last Release.
    explicit ControllerObject(LONG version, IUnknown* outer);
    virtual ~ControllerObject();

private:
    static ControllerObject* Allocate(LONG version, IUnknown* outer);
    ControllerObject(const ControllerObject&) = delete;
    ControllerObject& operator=(const ControllerObject&) = delete;

    // The non-delegating unknown: the object's own identity and lifetime.
    class Inner : public IUnknown {
    public:
        explicit Inner(ControllerObject* owner) : owner_(owner) {}
        HRESULT STDMETHODCALLTYPE QueryInterface(REFIID riid, void** object) override;
        ULONG STDMETHODCALLTYPE AddRef() override;
        ULONG STDMETHODCALLTYPE Release() override;
        ControllerObject& Owner() { return *owner_; }

    private:
        ControllerObject* owner_;
    };

    void ReleaseComponents();

    // Object state, in this order.
    ErrorInfo errors_;
    Bstr url_;
    ComPtr<ITavComCtrl> command_;
    ComPtr<ITavCommand2> command2_;
    ComPtr<ITavUser3> user_;
    ComPtr<ITavMastership> mastership_;
    ComPtr<ITavFile> file_;
    BYTE initialised_ = 0;
    const LONG version_;
    const ULONG clientValue_;
    ipc::IpcState ipc_;

    Inner inner_;
    IUnknown* controlling_;
    LONG volatile references_ = 0;
};

}  // namespace tav
