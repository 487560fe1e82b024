#pragma once

#include "rox/RoxInitInfo.h"

/// The bus as a module of the process: whoever uses the bus while modules start and stop depends on it.
class LqxIpc {
 public:
    static RoxInitInfo initInfo;

 private:
    static unsigned Start(RoxMempool* pool);
    /// Closes what is still open.
    static void Stop();
};
