// tav::ComPtr<T>: holds one reference on a COM interface.
#pragma once
#include <cstddef>
#include <type_traits>
#include <utility>

#include "tav/platform.h"

namespace tav {

template <typename T> class ComPtr {
public:
    ComPtr() noexcept = default;
    ComPtr(std::nullptr_t) noexcept {}
    // Adds a reference of its own; use Attach to take over one.
    explicit ComPtr(T* object) noexcept : object_(object) { AddRefHeld(); }
    ComPtr(const ComPtr& other) noexcept : object_(other.object_) { AddRefHeld(); }
    template <typename U>
        requires std::is_convertible_v<U*, T*>
    ComPtr(const ComPtr<U>& other) noexcept : object_(other.Get()) {
        AddRefHeld();
    }
    ComPtr(ComPtr&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
    template <typename U>
        requires std::is_convertible_v<U*, T*>
    ComPtr(ComPtr<U>&& other) noexcept : object_(other.Detach()) {}
    ~ComPtr() { Reset(); }

    ComPtr& operator=(ComPtr other) noexcept {
        std::swap(object_, other.object_);
        return *this;
    }
    ComPtr& operator=(std::nullptr_t) noexcept {
        Reset();
        return *this;
    }

    T* Get() const noexcept { return object_; }
    T* operator->() const noexcept { return object_; }
    T& operator*() const noexcept { return *object_; }
    explicit operator bool() const noexcept { return object_ != nullptr; }
    bool operator==(const ComPtr& other) const noexcept { return object_ == other.object_; }
    bool operator==(std::nullptr_t) const noexcept { return object_ == nullptr; }

    // For an [out] T** parameter: releases what is held first.
    T** operator&() noexcept {
        Reset();
        return &object_;
    }

    // Takes over the caller's reference.
    void Attach(T* object) noexcept {
        Reset();
        object_ = object;
    }
    [[nodiscard]] T* Detach() noexcept { return std::exchange(object_, nullptr); }
    void Reset() noexcept {
        if (T* held = std::exchange(object_, nullptr)) held->Release();
    }

    // QueryInterface for U, by U's interface identifier.
    template <typename U> HRESULT As(ComPtr<U>& target) const noexcept {
        if (object_ == nullptr) {
            target.Reset();
            return E_POINTER;
        }
        return object_->QueryInterface(__uuidof(U), reinterpret_cast<void**>(&target));
    }

    // A new reference for the caller's [out] T**.
    HRESULT CopyTo(T** target) const noexcept {
        if (target == nullptr) return E_POINTER;
        *target = object_;
        AddRefHeld();
        return S_OK;
    }

private:
    void AddRefHeld() const noexcept {
        if (object_ != nullptr) object_->AddRef();
    }

    T* object_ = nullptr;
};

// QueryInterface of object for I, by I's interface identifier: no cast at
// the call site, so the identifier and the pointer type cannot disagree.
template <typename I> HRESULT QueryTo(IUnknown* object, I** target) noexcept {
    if (target == nullptr) return E_POINTER;
    *target = nullptr;
    if (object == nullptr) return E_POINTER;
    return object->QueryInterface(__uuidof(I), reinterpret_cast<void**>(target));
}

template <typename I> HRESULT QueryTo(IUnknown* object, ComPtr<I>& target) noexcept {
    return QueryTo(object, &target);
}

}  // namespace tav
