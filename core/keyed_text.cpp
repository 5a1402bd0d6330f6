#include "core/keyed_text.h"

#include <algorithm>

#include "core/text/char_class.h"
#include "core/text/scan.h"

namespace tav {
namespace {

// Room for the key word of an array head; a longer one does not scan.
constexpr std::size_t kKeyRoom = 64;

struct ArrayHead {
    LONG count = 0;
    OleStringView elements;
};

std::optional<ArrayHead> ReadArrayHead(OleStringView text) {
    OLECHAR key[kKeyRoom];
    ArrayHead head;
    std::int32_t consumed = 0;
    if (text::Scan<OLESTR("-%s %d[%n")>(text, key, &head.count, &consumed) != 2) {
        return std::nullopt;
    }
    head.elements = text.substr(static_cast<std::size_t>(consumed));
    return head;
}

std::size_t Wanted(LONG count, std::size_t capacity) {
    return count > 0 ? std::min(static_cast<std::size_t>(count), capacity) : 0;
}

}  // namespace

KeyedText::KeyedText(OleStringView text) : text_(text::UpToNul(text)) {}

bool KeyedText::After(OleStringView key) {
    const std::size_t at = text_.find(key, position_);
    if (at == OleStringView::npos) {
        return false;
    }
    position_ = at + key.size();
    return true;
}

bool KeyedText::At(OleStringView key) {
    const std::size_t at = text_.find(key, position_);
    if (at == OleStringView::npos) {
        return false;
    }
    position_ = at;
    return true;
}

std::optional<OleStringView> KeyedText::UpToTab() {
    const std::size_t tab = text_.find(OLECHAR(u'\t'), position_);
    if (tab == OleStringView::npos) {
        return std::nullopt;
    }
    const OleStringView value = text_.substr(position_, tab - position_);
    position_ = tab + 1;
    return value;
}

std::optional<OleStringView> KeyedText::ValueOf(OleStringView key) {
    const std::size_t before = position_;
    if (!After(key)) {
        return std::nullopt;
    }
    std::optional<OleStringView> value = UpToTab();
    if (!value) {
        position_ = before;
    }
    return value;
}

void KeyedText::Skip(std::size_t count) { position_ = std::min(text_.size(), position_ + count); }

std::optional<ArrayRead> ReadNumberArray(OleStringView text, std::span<double> into) {
    const std::optional<ArrayHead> head = ReadArrayHead(text);
    if (!head) {
        return std::nullopt;
    }
    ArrayRead read{head->count, 0};
    OleStringView rest = head->elements;
    for (const std::size_t wanted = Wanted(head->count, into.size()); read.stored < wanted; ++read.stored) {
        std::int32_t consumed = 0;
        if (text::Scan<OLESTR("%lf,%n")>(rest, &into[read.stored], &consumed) != 1) {
            break;
        }
        rest = rest.substr(static_cast<std::size_t>(consumed));
    }
    return read;
}

std::optional<ArrayRead> ReadFlagArray(OleStringView text, std::span<LONG> into) {
    const std::optional<ArrayHead> head = ReadArrayHead(text);
    if (!head) {
        return std::nullopt;
    }
    ArrayRead read{head->count, 0};
    OleStringView rest = head->elements;
    for (const std::size_t wanted = Wanted(head->count, into.size()); read.stored < wanted; ++read.stored) {
        OLECHAR flag = 0;
        std::int32_t consumed = 0;
        if (text::Scan<OLESTR("%c%n")>(rest, &flag, &consumed) != 1) {
            break;
        }
        into[read.stored] = flag == u'1' ? 1 : 0;
        rest = rest.substr(static_cast<std::size_t>(consumed));
    }
    return read;
}

}  // namespace tav
