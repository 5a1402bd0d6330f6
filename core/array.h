#pragma once
#include <cstddef>
#include <cstring>
#include <limits>
#include <type_traits>

#include "tav/platform.h"

namespace tav {

// A zero-filled array of count plain records from TavMemAlloc, to be freed
// with TavMemFree. nullptr when memory is out or when count * sizeof(T) does
// not fit in size_t: a wrapped size would hand out a block far too small for
// the records written into it. A count of 0 still gives a block of its own,
// so that an empty list is told apart from no list at all.
template <class T>
T* AllocateArray(size_t count) noexcept {
    static_assert(std::is_trivially_copyable_v<T> && std::is_trivially_destructible_v<T>,
                  "arrays from TavMemAlloc hold plain records only");
    if (count > std::numeric_limits<size_t>::max() / sizeof(T)) {
        return nullptr;
    }
    const size_t bytes = count * sizeof(T);
    void* block = TavMemAlloc(bytes);
    if (block == nullptr) {
        return nullptr;
    }
    std::memset(block, 0, bytes);
    return static_cast<T*>(block);
}

}  // namespace tav
