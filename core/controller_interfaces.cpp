// What a client calls: every interface operation of the controller object,
// entered through one guard so that no exception crosses an interface. The
// operations themselves are the ControllerObject members under operations/;
// calls among them (a Sync call decoding through its Unpack operation) go
// through these same entries, so an override is honoured.
#include <new>

#include "core/controller_object.h"
#include "tav/guarded.h"

namespace tav {
namespace {

class GuardedController final : public ControllerObject {
public:
    GuardedController(LONG version, IUnknown* outer) : ControllerObject(version, outer) {}

#define TAV_CONTROLLER_METHOD(interface_, name, params, args) \
    HRESULT STDMETHODCALLTYPE name params override try {      \
        return ControllerObject::name args;                   \
    } catch (...) {                                           \
        return ResultOfException();                           \
    }
#include "controller_methods.inc"
#undef TAV_CONTROLLER_METHOD
};

}  // namespace

ControllerObject* ControllerObject::Allocate(LONG version, IUnknown* outer) {
    return new (std::nothrow) GuardedController(version, outer);
}

}  // namespace tav
