#pragma once
#include <optional>

#include "core/text/char_class.h"
#include "core/text/ole_string.h"

namespace tav::text {

// Splits a text at any of a set of delimiters as repeated wcstok calls do:
// runs of delimiters are skipped, so no token is empty, and the delimiter
// that ends a token is consumed with it. Unlike wcstok it keeps its state in
// the object and writes nothing. The text ends at its first NUL. Both texts
// are views: they must outlive the tokenizer.
class Tokenizer {
public:
    Tokenizer(OleStringView text, OleStringView delimiters) noexcept
        : rest_(UpToNul(text)), delimiters_(UpToNul(delimiters)) {}

    // The next token, or nothing when only delimiters remain.
    std::optional<OleStringView> Next() noexcept {
        const std::size_t start = rest_.find_first_not_of(delimiters_);
        if (start == OleStringView::npos) {
            rest_ = {};
            return std::nullopt;
        }
        const std::size_t stop = rest_.find_first_of(delimiters_, start);
        const OleStringView token = rest_.substr(start, stop == OleStringView::npos ? stop : stop - start);
        rest_ = stop == OleStringView::npos ? OleStringView() : rest_.substr(stop + 1);
        return token;
    }

    // What the next call will read from.
    OleStringView Rest() const noexcept { return rest_; }

private:
    OleStringView rest_;
    OleStringView delimiters_;
};

}  // namespace tav::text
