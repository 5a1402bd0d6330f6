// Operations whose subsystem has not been built yet. Every controller
// operation that no source file defines answers E_NOTIMPL from here, so the
// vtables are complete and what remains is listed in one generated file:
// <build>/core/generated/pending_operations.inc.
#include "core/controller_object.h"

namespace tav {

#define TAV_CONTROLLER_METHOD(interface_, name, params, args) \
    HRESULT STDMETHODCALLTYPE ControllerObject::name params { return E_NOTIMPL; }
#include "pending_operations.inc"
#undef TAV_CONTROLLER_METHOD

}  // namespace tav
