#pragma once
// Replies of "-key value" fields that are found by their keys rather than
// scanned in one go: each search starts where the previous one stopped, a
// value runs to the next tab, and arrays are written as "-key count[" with
// their elements after the bracket.
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "core/text/ole_string.h"
#include "tav/platform.h"

namespace tav {

class KeyedText {
public:
    // text ends at its first NUL, as the controller's C text does.
    explicit KeyedText(OleStringView text);

    // Finds key at or after the position and moves just past it; false, the
    // position kept, when it does not occur.
    bool After(OleStringView key);
    // Finds key at or after the position and moves to its first character;
    // false, the position kept, when it does not occur.
    bool At(OleStringView key);
    // The text from the position up to the next tab (not included), the
    // position moved past that tab; nothing, the position kept, when no tab
    // follows.
    std::optional<OleStringView> UpToTab();
    // The value of key: After(key), then UpToTab().
    std::optional<OleStringView> ValueOf(OleStringView key);

    OleStringView Rest() const { return text_.substr(position_); }
    std::size_t Position() const { return position_; }
    void Skip(std::size_t count);

private:
    OleStringView text_;
    std::size_t position_ = 0;
};

// An array read from "-key count[" and its elements.
struct ArrayRead {
    LONG count = 0;          // as the reply writes it, even when above the capacity
    std::size_t stored = 0;  // elements written into the caller's array
};

// Reads the array that starts at `text` (at its "-key"): the head
// "-%s %d[", then up to min(count, into.size()) elements "%lf," each where
// the previous one ended; reading stops early at an element that does not
// scan. Nothing when the head does not scan.
std::optional<ArrayRead> ReadNumberArray(OleStringView text, std::span<double> into);

// The same for flags written as one character each, with no separator:
// '1' gives 1, any other character 0.
std::optional<ArrayRead> ReadFlagArray(OleStringView text, std::span<LONG> into);

}  // namespace tav
