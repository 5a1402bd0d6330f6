#include "module_test_support.h"

namespace tav::test {

std::string GuidText(REFGUID guid) {
    OLECHAR text[40] = {};
    const int length = StringFromGUID2(guid, text, 40);
    return length > 0 ? Narrow(text, static_cast<size_t>(length - 1)) : std::string();
}

std::basic_string<OLECHAR> Wide(const std::string& text) {
    return std::basic_string<OLECHAR>(text.begin(), text.end());
}

std::string Narrow(const OLECHAR* text, size_t length) {
    std::string narrow;
    for (size_t i = 0; i < length; ++i) {
        narrow.push_back(text[i] < 128 ? static_cast<char>(text[i]) : '?');
    }
    return narrow;
}

}  // namespace tav::test
