#include "kelbaselib/ByteCountingBytesink.h"

namespace kelbaselib {

ByteCountingBytesink::~ByteCountingBytesink() = default;

unsigned ByteCountingBytesink::Write(const void*, unsigned count) {
    writtenBytesM += count;
    return count;
}

}  // namespace kelbaselib
