#pragma once
#include "core/error_site.h"
#include "core/text/ole_string.h"
#include "tav/lock.h"
#include "tav/platform.h"
#include "TavController.h"

namespace tav {

// The last-error text of one controller object, shared by all its interfaces
// and threads. Each new error replaces the previous one; success leaves it.
class ErrorInfo {
public:
    ErrorInfo();
    ~ErrorInfo();
    ErrorInfo(const ErrorInfo&) = delete;
    ErrorInfo& operator=(const ErrorInfo&) = delete;

    // A failure detected on this side: message, then ":TavControllerImpl[line]; ".
    HRESULT Set(HRESULT hr, ErrorSite site, OleStringView message);
    // The same with the short suffix "TavControllerImpl[line];" that the
    // subscription type check writes.
    HRESULT SetWithShortSuffix(HRESULT hr, ErrorSite site, OleStringView message);
    // A failure of a sibling component: its own text (fetched through its
    // error interface, when it has one), then "TavControllerImpl[line]; ".
    HRESULT AdoptFromComponent(HRESULT hr, IUnknown* component, ErrorSite site);
    // A Sync reply with a negative status: its BSTR data, or a fixed text.
    HRESULT SetFromReply(const TavCommandReply& reply, ErrorSite site);

    // GetLastErrorInfo: a fresh copy, NULL when nothing was recorded.
    HRESULT CopyTo(BSTR* out) const;
    // SetLastErrorInfo: adopts a BSTR VARIANT, else empties the text.
    HRESULT SetFromVariant(const VARIANT* data);
    // The current text, for the callback of a failed call.
    OleString Text() const;

private:
    void Replace(OleString text);

    BSTR text_ = nullptr;
    mutable CriticalSection lock_;
};

}  // namespace tav
