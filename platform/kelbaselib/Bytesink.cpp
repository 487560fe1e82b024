#include "kelbaselib/Bytesink.h"

namespace kelbaselib {

Bytesink::~Bytesink() = default;

}  // namespace kelbaselib
