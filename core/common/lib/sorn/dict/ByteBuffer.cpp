#include "sorn/dict/ByteBuffer.h"

#include <algorithm>

namespace sorn {

ByteBuffer::~ByteBuffer() = default;

void ByteBuffer::AppendString(const char* text) {
    size_t left = std::strlen(text);
    while (left != 0) {
        // A run fills what AppendByte would fill without growing; the byte behind it makes the buffer grow.
        const unsigned length = GetLength();
        const unsigned room = GetCapacity() > length + 1 ? GetCapacity() - 1 - length : 0;
        const unsigned run = static_cast<unsigned>(std::min<size_t>(left, room));
        AppendBytes(text, run);
        text += run;
        left -= run;
        if (left == 0) break;
        AppendByte(static_cast<unsigned char>(*text++));
        --left;
    }
}

}  // namespace sorn
