#pragma once

/// Pointer to a counted object that takes no reference on it: one word, may be null. Whoever keeps one sees
/// to it that somebody else keeps the object alive.
template <class T>
class nonRef {
 public:
    nonRef() = default;
    nonRef(T* p) : pM(p) {}

    T* Get() const { return pM; }
    T* operator->() const { return pM; }
    T& operator*() const { return *pM; }
    explicit operator bool() const { return pM != nullptr; }

 private:
    T* pM = nullptr;
};
