#include "com_client.h"

#include "conformance_support.h"

namespace tav::conformance {

HRESULT CreateByProgId(const std::wstring& progId, ComPtr<IUnknown>& object, IUnknown* outer) {
    CLSID clsid = {};
    const HRESULT hr = CLSIDFromProgID(progId.c_str(), &clsid);
    if (FAILED(hr)) {
        return hr;
    }
    return CoCreateInstance(clsid, outer, CLSCTX_INPROC_SERVER, IID_IUnknown, reinterpret_cast<void**>(&object));
}

bool ControllerModuleLoaded() { return GetModuleHandleW(Modules().controller.c_str()) != nullptr; }

}  // namespace tav::conformance
