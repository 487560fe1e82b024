#include "kelbaselib/InMemoryBytestream.h"
#include "pairs/LibraryForms.h"
#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/ArrayValue.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/MempoolNew.h"
#include "sorn/dict/NullValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"

namespace sorntest {

using namespace sorn;

namespace {

RoxString Rox(RoxMempool* pool, const std::string& text) {
    return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(text.size()), text.data());
}

template <class T>
void StoreNumber(void* member, bool isMulti, const T& value) {
    if (isMulti) {
        static_cast<RoxGenericIntArray*>(member)->Add(&value);
    } else {
        *static_cast<T*>(member) = value;
    }
}

ref<RoxCore> MakeReference(RoxMempool* pool, const FieldInfo& field, const Value& value) {
    if (FNullReference(field, value)) return nullptr;
    switch (field.dataType) {
        case 1:
            return rox::ByteBuffer::New(pool, value.text.data(), static_cast<uint32_t>(value.text.size()));
        case 6:
            return MempoolNew<Dict>(pool, MakeDictionary(pool, *value.tree));
        case 13:
            return MakeLazy(pool, *value.body);
        default:
            return MakeObject(pool, *value.record);
    }
}

void Store(RoxMempool* pool, void* member, const FieldInfo& field, const Value& value) {
    bool isMulti = field.arity == 2;
    switch (field.dataType) {
        case 0:
            return StoreNumber(member, isMulti, static_cast<unsigned char>(value.number));
        case 2:
            return StoreNumber(member, isMulti,
                               ChannelNumber(static_cast<int>(value.number), static_cast<int>(value.sub)));
        case 3:
            return StoreNumber(member, isMulti, Currency(static_cast<int>(value.number), value.text.c_str()));
        case 8:
            return StoreNumber(member, isMulti, value.real);
        case 5:
        case 10:
        case 15:
        case 20:
            return StoreNumber(member, isMulti, value.number);
        case 11:
        case 17:
            if (isMulti) {
                static_cast<RoxStringArray*>(member)->Add(Rox(pool, value.text));
            } else {
                *static_cast<RoxString*>(member) = Rox(pool, value.text);
            }
            return;
        case 4:
        case 7:
        case 9:
        case 16:
        case 18:
        case 19:
            return StoreNumber(member, isMulti, static_cast<uint32_t>(value.number));
        default: {
            ref<RoxCore> made = MakeReference(pool, field, value);
            if (isMulti) {
                static_cast<RoxGenericArray*>(member)->Add(made.get());
            } else {
                *static_cast<RefBase*>(member) = made;
            }
        }
    }
}

ref<DictValue> MakeTreeValue(RoxMempool* pool, const Tree& tree) {
    switch (tree.kind) {
        case Tree::isText: {
            ref<StringValue> text = MempoolNew<StringValue>(pool, Rox(pool, tree.text));
            text->SetNeedQuotes(tree.quoted);
            return text;
        }
        case Tree::isNull:
            return ref<NullValue>(new (pool) NullValue());
        case Tree::isBody: {
            ref<ArrayValue> holder(new (pool) ArrayValue());
            holder->Add(MakeLazy(pool, *tree.body));
            return holder->GetValueAt(0);
        }
        case Tree::isArray: {
            ref<ArrayValue> array(new (pool) ArrayValue());
            for (const Tree& item : tree.items) array->Add(MakeTreeValue(pool, item));
            return array;
        }
        default:
            return MakeDictionary(pool, tree);
    }
}

}  // namespace

ref<SornObject> MakeObject(RoxMempool* pool, const Record& record) {
    ref<SornObject> object = record.info->Factory(pool);
    for (const auto& [key, values] : record.fields) {
        const FieldInfo& field = record.FieldOf(key);
        char* start = reinterpret_cast<char*>(object.get());
        if (field.arity == 0 && field.presenceOffset != 0) start[field.presenceOffset] = 1;
        for (const Value& value : values) Store(pool, start + field.storageOffset, field, value);
    }
    return object;
}

ref<Dictionary> MakeDictionary(RoxMempool* pool, const Tree& tree) {
    ref<Dictionary> dictionary(new (pool) Dictionary());
    for (const auto& [name, value] : tree.entries)
        dictionary->Add(Rox(pool, name), MakeTreeValue(pool, value));
    return dictionary;
}

ref<LazyDict> MakeLazy(RoxMempool* pool, const Body& body) {
    ref<rox::ByteBuffer> bytes;
    switch (body.rep) {
        case Body::ofDict:
            return LazyDict::FromDict(pool, MempoolNew<Dict>(pool, MakeDictionary(pool, *body.tree)),
                                      static_cast<unsigned short>(body.version));
        case Body::ofDictionary:
            return LazyDict::FromDictionary(pool, MakeDictionary(pool, *body.tree), body.version);
        case Body::ofObject:
            return LazyDict::FromSornObject(pool, MakeObject(pool, *body.record), body.version);
        case Body::ofStream: {
            auto* stream = new kelbaselib::InMemoryBytestream();
            stream->Write(body.bytes.data(), static_cast<unsigned>(body.bytes.size()));
            return LazyDict::FromBytesource(pool, stream, body.version);
        }
        default:
            bytes = rox::ByteBuffer::New(pool, body.bytes.data(), static_cast<uint32_t>(body.bytes.size()));
            return LazyDict::FromBytestring(pool, bytes, body.version);
    }
}

}  // namespace sorntest
