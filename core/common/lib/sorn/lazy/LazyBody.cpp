#include "sorn/dict/LazyBody.h"

#include "kelbaselib/Bytesource.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/SornObject.h"

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

LazyBodyContent LazyBodyToWrite(const ref<LazyDict>& body, bool pretty, bool isForSink) {
    return body->ToWrite(pretty, isForSink);
}

ref<LazyDict> NewLazyBodyOfBytes(RoxMempool* pool, const ref<rox::ByteBuffer>& bytes) {
    return LazyDict::FromBytestring(pool, bytes, 0);
}

ref<LazyDict> NewLazyBodyOfSource(RoxMempool* pool, kelbaselib::Bytesource* source) {
    return LazyDict::FromBytesource(pool, source, 0);
}

ref<LazyDict> ShareLazyBody(const LazyDict* body) {
    return const_cast<LazyDict*>(body);
}

ref<SornObject> ObjectOfLazyBody(const ref<LazyDict>& body) {
    return body->ToSornObjectOrError();
}

uint32_t TextBytesOfLazyBody(const ref<LazyDict>& body) {
    if (body->GetRep() == LazyDict::REP_JSON && body->GetStoredBytes() != nullptr) {
        return body->GetStoredBytes()->GetLength();
    }
    if (body->GetRep() == LazyDict::REP_BYTESOURCE && body->GetStoredBytesource() != nullptr) {
        return body->GetStoredBytesource()->GetAvailable();
    }
    return 0;
}

}  // namespace sorn
