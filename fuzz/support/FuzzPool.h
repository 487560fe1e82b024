#pragma once

#include "fuzz/support/Check.h"
#include "rox/RoxMempool.h"

/// The pool of one execution. It is declared before all that lies in it, and ends the process when something
/// is left.
class FuzzPool {
 public:
    FuzzPool() : poolM("fuzz") {}
    FuzzPool(const FuzzPool&) = delete;
    FuzzPool& operator=(const FuzzPool&) = delete;
    ~FuzzPool() { Check(poolM.GetUsedBytes() == 0, "the pool is not empty at the end"); }

    RoxMempool* Get() { return &poolM; }

 private:
    RoxMempool poolM;
};
