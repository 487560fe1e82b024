#include "sorn/typedjson/KeyHints.h"

namespace sorn {

namespace {

constinit thread_local KeyHints hintsG;

}  // namespace

KeyHints& KeyHints::OfThread() {
    return hintsG;
}

}  // namespace sorn
