// Every allocation of the platform layer that a test may make fail.
#pragma once
#include <cstddef>

namespace tav::posix {

// malloc through the failure-injection counter; NULL on an injected failure.
void* Allocate(std::size_t size);
void* Reallocate(void* block, std::size_t size);
void Deallocate(void* block);

}  // namespace tav::posix
