#include "sorn/dict/ArrayCore.h"
#include "sorn/json/JsonFormat.h"

namespace sorn {

// Writers walk the values of a name; their holder has no text of its own.
void ArrayCore::ToJson(ByteBuffer&, JsonFormat) const {}

void ArrayCore::ToJson(kelbaselib::Bytesink&, JsonFormat) const {}

}  // namespace sorn
