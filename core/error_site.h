#pragma once
#include <source_location>

#include "tav/platform.h"

namespace tav {

// Where a failure was detected. Every error text ends in the reporting unit's
// name and the line of the statement that detected the failure, so that two
// failures of one operation never read alike.
struct ErrorSite {
    int line;

    // The one place where a source location becomes an error site.
    static constexpr ErrorSite From(const std::source_location& where) {
        return ErrorSite{static_cast<int>(where.line())};
    }
    static constexpr ErrorSite Here(std::source_location where = std::source_location::current()) {
        return From(where);
    }
};

// An error text with the line of the statement that passes it, taken
// implicitly: for the steps whose last arguments are a list of out-values,
// after which no location argument can follow.
struct SitedText {
    const OLECHAR* text;
    ErrorSite site;

    SitedText(const OLECHAR* text, std::source_location where = std::source_location::current())  // NOLINT
        : text(text), site(ErrorSite::From(where)) {}
};

// The name that every error suffix carries.
inline constexpr const char kErrorSource[] = "TavControllerImpl";

}  // namespace tav
