#pragma once

#include <string>

#include "pairs/Record.h"
#include "rox/ref.h"
#include "sorn/model/SornObject.h"

namespace rox {
class ByteBuffer;
}
namespace sorn {
class Dictionary;
class LazyDict;
}  // namespace sorn

namespace sorntest {

// From the tests' data to the library's values and back, by members and containers alone: no codec of the
// library has a part in it.

ref<sorn::SornObject> MakeObject(RoxMempool* pool, const Record& record);
ref<sorn::Dictionary> MakeDictionary(RoxMempool* pool, const Tree& tree);
ref<sorn::LazyDict> MakeLazy(RoxMempool* pool, const Body& body);

Record RecordOfObject(const sorn::SornObject& object);
Tree TreeOfDictionary(const sorn::Dictionary& dictionary);
Body BodyOfLazy(const sorn::LazyDict& lazy);

std::string BytesOf(const ref<rox::ByteBuffer>& bytes);

}  // namespace sorntest
