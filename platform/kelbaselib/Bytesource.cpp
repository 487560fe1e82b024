#include "kelbaselib/Bytesource.h"

namespace kelbaselib {

Bytesource::~Bytesource() = default;

}  // namespace kelbaselib
