#pragma once
// How the targets read text from a fuzz input: one character per byte,
// except that 0xFF and the two bytes after it make one 16-bit character.
#include <cstddef>
#include <cstdint>
#include <string>

#include "tav/platform.h"

namespace tav::fuzz {

inline std::basic_string<OLECHAR> OleTextOf(const std::uint8_t* data, std::size_t size) {
    std::basic_string<OLECHAR> text;
    text.reserve(size);
    for (std::size_t i = 0; i < size; ++i) {
        if (data[i] == 0xFF && i + 2 < size) {
            text.push_back(static_cast<OLECHAR>(data[i + 1] << 8 | data[i + 2]));
            i += 2;
        } else {
            text.push_back(static_cast<OLECHAR>(data[i]));
        }
    }
    return text;
}

}  // namespace tav::fuzz
