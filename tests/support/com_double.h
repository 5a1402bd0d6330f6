#pragma once
#include <atomic>
#include <memory>

#include "tav/platform.h"

namespace tav::test {

// A test's own reference on a COM test double; released when it goes.
template <class T>
struct Releaser {
    void operator()(T* object) const {
        if (object != nullptr) {
            object->Release();
        }
    }
};
template <class T>
using Ref = std::unique_ptr<T, Releaser<T>>;

// The reference count of a test double. It starts at one, the creator's.
class RefCount {
public:
    ULONG Add() { return ++count_; }
    ULONG Drop() { return --count_; }
    ULONG Current() const { return count_.load(); }

private:
    std::atomic<ULONG> count_{1};
};

// AddRef and Release of a test double whose count is the member refs_; the
// last Release deletes it.
#define TAV_TEST_DOUBLE_REFCOUNT                                      \
    ULONG STDMETHODCALLTYPE AddRef() override { return refs_.Add(); } \
    ULONG STDMETHODCALLTYPE Release() override {                      \
        const ULONG left = refs_.Drop();                              \
        if (left == 0) {                                              \
            delete this;                                              \
        }                                                             \
        return left;                                                  \
    }                                                                 \
    ULONG References() const { return refs_.Current(); }

}  // namespace tav::test
