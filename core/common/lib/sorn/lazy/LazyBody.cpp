#include "sorn/dict/LazyBody.h"

#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"

namespace sorn {

ref<LazyDict> NewLazyBody(RoxMempool* pool, const ref<Dictionary>& dictionary, OrvoVersion version) {
    return LazyDict::FromDictionary(pool, dictionary, version);
}

ref<LazyDict> NewEmptyLazyBody(RoxMempool* pool) {
    return LazyDict::FromJsonString(pool, "{}", 0);
}

ref<Dict> DictOfLazyBody(RoxMempool* pool, const ref<LazyDict>& body) {
    return body != nullptr ? body->ToDict() : MakeDict(pool);
}

bool FEqualLazyBodies(const ref<LazyDict>& a, const ref<LazyDict>& b) {
    if (a == nullptr || b == nullptr) return a == b;
    return *a == *b;
}

ref<Dictionary> LazyBodyToWrite(const ref<LazyDict>& body, bool pretty, ref<rox::ByteBuffer>& text) {
    return body->ToWrite(pretty, text);
}

}  // namespace sorn
