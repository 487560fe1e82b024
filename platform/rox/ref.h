#pragma once

#include <cstddef>
#include <type_traits>
#include <utility>

#include "rox/RefBase.h"

/// Counted pointer to a T derived from RoxCore: one word, may be null. T may be incomplete where a ref is
/// only copied, moved, compared or destroyed. A ref belongs to one thread at a time; the object's count is
/// atomic.
template <class T>
class ref : public RefBase {
 public:
    ref() = default;
    ref(std::nullptr_t) {}
    ref(T* p) : RefBase(static_cast<RoxCore*>(p)) {}
    /// The first reference on an object that has just been made.
    static ref First(T* p) {
        static_cast<RoxCore*>(p)->UpRefFirst();
        ref first;
        first.pCoreM = p;
        return first;
    }
    ref(const ref&) = default;
    ref(ref&&) noexcept = default;
    template <class U>
    requires(!std::is_same_v<U, T> && std::is_convertible_v<U*, T*>) ref(const ref<U>& other)
        : RefBase(other) {}
    template <class U>
    requires(!std::is_same_v<U, T> && std::is_convertible_v<U*, T*>) ref(ref<U>&& other)
    noexcept : RefBase(std::move(other)) {}
    ~ref() = default;

    ref& operator=(const ref&) = default;
    ref& operator=(ref&&) noexcept = default;
    ref& operator=(std::nullptr_t) {
        Reset(nullptr);
        return *this;
    }
    ref& operator=(T* p) {
        Reset(static_cast<RoxCore*>(p));
        return *this;
    }

    T* get() const { return static_cast<T*>(pCoreM); }
    T* operator->() const { return get(); }
    T& operator*() const { return *get(); }

    /// Identity of the objects, not equality of their contents.
    friend bool operator==(const ref& a, const ref& b) { return a.pCoreM == b.pCoreM; }
    friend bool operator==(const ref& a, std::nullptr_t) { return a.pCoreM == nullptr; }
    friend bool operator==(const ref& a, const T* b) { return a.get() == b; }
};
