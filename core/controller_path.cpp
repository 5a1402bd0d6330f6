#include "core/controller_path.h"

#include <algorithm>

#include "core/call.h"
#include "core/controller_object.h"
#include "core/text/char_class.h"

namespace tav {

bool HasControllerPrefix(OleStringView path) {
    return path.size() >= kControllerPrefix.size() &&
           std::equal(kControllerPrefix.begin(), kControllerPrefix.end(), path.begin(),
                      [](OLECHAR prefix, OLECHAR c) { return prefix == text::ToLowerAscii(c); });
}

bool IsBlank(OleStringView path) {
    return std::all_of(path.begin(), path.end(), [](OLECHAR c) { return text::IsSpace(c); });
}

Call& Call::ControllerPathOnly(BSTR path, const ControllerPathTexts& texts, OleStringView* sent) {
    if (failed()) {
        return *this;
    }
    const OleStringView text = ViewOf(path);
    if (IsBlank(text)) {
        Fail(E_INVALIDARG, OLESTR(""));
    } else if (!HasControllerPrefix(text)) {
        Fail(E_INVALIDARG, ViewOf(texts.notControllerPath));
    } else if (text.find(OLECHAR(u'\\')) != OleStringView::npos) {
        Fail(E_INVALIDARG, ViewOf(texts.backslash));
    } else if (IsBlank(text.substr(kControllerPrefix.size()))) {
        Fail(E_INVALIDARG, ViewOf(texts.empty));
    } else {
        *sent = text.substr(kControllerPrefix.size());
    }
    return *this;
}

Call& Call::ControllerOrLocalPath(BSTR path, const OLECHAR* backslashText, OleStringView* converted) {
    if (failed()) {
        return *this;
    }
    const OleStringView text = ViewOf(path);
    if (!HasControllerPrefix(text)) {
        *converted = text;
    } else if (text.find(OLECHAR(u'\\')) != OleStringView::npos) {
        Fail(E_INVALIDARG, ViewOf(backslashText));
    } else {
        *converted = text.substr(kControllerPrefix.size());
    }
    return *this;
}

}  // namespace tav
