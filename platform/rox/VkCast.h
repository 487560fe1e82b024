#pragma once

#include "rox/ref.h"

/// Run-time class test: the object as a T, or null when it is null or no T. T has a static `classTagG` of its
/// own and answers to it in VkCastHelper.
template <class T>
T* VkCast(RoxCore* p) {
    return p == nullptr ? nullptr : static_cast<T*>(p->VkCastHelper(&T::classTagG));
}

template <class T, class U>
T* VkCast(const ref<U>& r) {
    return VkCast<T>(r.GetCore());
}
