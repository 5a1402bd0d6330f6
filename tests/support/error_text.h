#pragma once
#include <string>
#include <string_view>

namespace tav::test {

// A last-error text taken apart: the message (or adopted text), whether the
// suffix began with a colon, and the line it names.
struct ErrorParts {
    bool wellFormed = false;  // ends in "TavControllerImpl[<line>]; "
    std::string message;
    bool colon = false;
    int line = 0;
};

ErrorParts ParseError(std::string_view text);

}  // namespace tav::test
