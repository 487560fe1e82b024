#pragma once

#include <utility>

#include "rox/RoxCore.h"
#include "rox/ref.h"

namespace sorn {

/// Allocates a T in the pool and constructs it with the argument.
template <class T, class A>
ref<T> MempoolNew(RoxMempool* pool, A&& arg) {
    return ref<T>(new (pool) T(std::forward<A>(arg)));
}

}  // namespace sorn
