#include "sorn/rpc/WrapperBody.h"

#include "sorn/dict/Dict.h"
#include "sorn/lazy/LazyDict.h"

namespace sorn {

WrapperBody::WrapperBody(const ref<LazyDict>& body) : bodyM(body) {}

WrapperBody::~WrapperBody() = default;

ref<Dict> WrapperBody::ToDict() const {
    return bodyM == nullptr ? nullptr : bodyM->ToDict();
}

RoxString WrapperBody::ToJson(bool pretty) const {
    return bodyM == nullptr ? RoxString() : bodyM->ToJson(pretty);
}

void WrapperBody::ToJsonByteBuffer(ByteBuffer& out, bool pretty) const {
    if (bodyM != nullptr) bodyM->ToJsonByteBuffer(out, pretty);
}

void WrapperBody::ToJsonBytesink(kelbaselib::Bytesink& out, bool pretty) const {
    if (bodyM != nullptr) bodyM->ToJsonBytesink(out, pretty);
}

ref<SornObject> WrapperBody::Unmarshal(RoxMempool* pool, OrvoVersion version) {
    ref<SornObject> object;
    if (bodyM == nullptr || !bodyM->ToSornObject(object)) return nullptr;
    return Keep(pool, version, object);
}

ref<SornObject> WrapperBody::Unmarshal(RoxMempool* pool, OrvoVersion version, OrvoVersion readVersion,
                                       RoxString& error) {
    if (bodyM == nullptr) return nullptr;
    bodyM->SetVersion(readVersion);
    const ref<SornObject> object = bodyM->ToSornObjectOrErrorString(error);
    return object == nullptr ? nullptr : Keep(pool, version, object);
}

ref<SornObject> WrapperBody::Keep(RoxMempool* pool, OrvoVersion version, const ref<SornObject>& object) {
    bodyM = LazyDict::FromSornObject(pool, object, version);
    return object;
}

bool WrapperBody::operator==(const WrapperBody& other) const {
    if (bodyM == nullptr || other.bodyM == nullptr) return bodyM == other.bodyM;
    return *bodyM == *other.bodyM;
}

}  // namespace sorn
