// The language of the controller's texts.
#include "core/controller_object.h"
#include "core/text/format.h"
#include "operations/controller/latin1.h"

namespace tav {

HRESULT ControllerObject::SetLanguage(TavInParams* rip, BSTR language) {
    const OleStringView text = ViewOf(language);
    return Command(rip)
        .ValidParams(OLESTR("SetLanguage: Invalid TavInParams"))
        .Initialised(OLESTR("TavController used before Initialized"))
        .Require(IsLatin1(text), kTextNotLatin1, OLESTR(""))
        .Set(OLESTR("Language"), text::Format(OLESTR("-Language \"%s\""), text))
        .StatusOnly();
}

}  // namespace tav
