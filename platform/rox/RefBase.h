#pragma once

#include <cstddef>
#include <utility>

#include "rox/RoxCore.h"

/// The counting half of `ref<T>`, which needs no T: one word, null or a reference held on an object.
class RefBase {
 public:
    RefBase() = default;
    explicit RefBase(RoxCore* p) : pCoreM(p) {
        if (p != nullptr) {
            p->UpRef();
        }
    }
    RefBase(const RefBase& other) : RefBase(other.pCoreM) {}
    RefBase(RefBase&& other) noexcept : pCoreM(std::exchange(other.pCoreM, nullptr)) {}
    ~RefBase() { RoxCore::DownRef(pCoreM); }

    RefBase& operator=(const RefBase& other) {
        Reset(other.pCoreM);
        return *this;
    }
    RefBase& operator=(RefBase&& other) noexcept {
        RoxCore* old = std::exchange(pCoreM, std::exchange(other.pCoreM, nullptr));
        RoxCore::DownRef(old);
        return *this;
    }

    RoxCore* GetCore() const { return pCoreM; }
    /// Gives up the reference without taking from the count: the caller holds it then.
    RoxCore* TakeCore() { return std::exchange(pCoreM, nullptr); }
    explicit operator bool() const { return pCoreM != nullptr; }

 protected:
    /// Takes the new reference before it drops the old one, so that assigning a part of the old value is
    /// safe.
    void Reset(RoxCore* p) {
        if (p != nullptr) {
            p->UpRef();
        }
        RoxCore::DownRef(std::exchange(pCoreM, p));
    }

    RoxCore* pCoreM = nullptr;
};
