#include "support/error_text.h"

#include <regex>

namespace tav::test {

ErrorParts ParseError(std::string_view text) {
    static const std::regex suffix(R"(^([\s\S]*?)(:?)TavControllerImpl\[(\d+)\]; $)");
    ErrorParts parts;
    std::match_results<std::string_view::const_iterator> match;
    if (!std::regex_match(text.begin(), text.end(), match, suffix)) {
        parts.message = std::string(text);
        return parts;
    }
    parts.wellFormed = true;
    parts.message = match[1].str();
    parts.colon = match[2].length() == 1;
    parts.line = std::stoi(match[3].str());
    return parts;
}

}  // namespace tav::test
