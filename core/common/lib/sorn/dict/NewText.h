#pragma once

#include <cstdint>

#include "rox/RoxString.h"

namespace sorn {

/// A string of n bytes in the pool, which `fill(char*)` writes where they stay.
template <class Fill>
RoxString NewText(RoxMempool* pool, uint32_t n, Fill fill) {
    if (n == 0) return RoxString();
    RoxStringRepN* const rep = RoxStringRepN::New(pool, n);
    fill(rep->MutableBytes());
    RoxString text(rep);
    rep->DownRef();  // the count that it was made with
    return text;
}

}  // namespace sorn
