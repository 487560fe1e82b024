#pragma once

#include "rox/RoxAssert.h"

namespace sorn {

/// Ends the process through RoxAssertFail when one of the codec's arguments is null that must not be.
template <class... T>
inline void CheckGiven(const T*... argument) {
    RoxAssert(((argument != nullptr) && ...), "ProtoBuf: a null argument");
}

}  // namespace sorn
