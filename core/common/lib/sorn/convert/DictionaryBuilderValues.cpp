// The one table of data types on the way from objects to dictionaries.

#include "sorn/convert/DictionaryBuilder.h"
#include "sorn/convert/SchemaText.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/LazyDictValue.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/dict/StringValue.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Time.h"

namespace sorn {

ref<DictValue> DictionaryBuilder::MakeValue(const FieldInfo& field, const FieldSource& source,
                                            unsigned i) const {
    switch (field.Type()) {
        case SORN_DATA_TYPE_BOOL:
            return StringValue::Make(source.PlainAt<unsigned char>(i) != 0, pMempoolM);
        case SORN_DATA_TYPE_FLOAT:
            return StringValue::Make(source.PlainAt<double>(i), pMempoolM);
        case SORN_DATA_TYPE_S32:
            return StringValue::Make(int{source.PlainAt<int32_t>(i)}, pMempoolM);
        case SORN_DATA_TYPE_U32:
            return StringValue::Make(unsigned{source.PlainAt<uint32_t>(i)}, pMempoolM);
        // The 64-bit numbers are quoted in JSON, the others are not.
        case SORN_DATA_TYPE_S64:
            return StringValue::Make(static_cast<long long>(source.PlainAt<int64_t>(i)), pMempoolM);
        case SORN_DATA_TYPE_U64:
            return StringValue::Make(static_cast<unsigned long long>(source.PlainAt<uint64_t>(i)), pMempoolM);
        case SORN_DATA_TYPE_CHANNEL:
        case SORN_DATA_TYPE_CURRENCY:
        case SORN_DATA_TYPE_DATE:
        case SORN_DATA_TYPE_DATETIME:
        case SORN_DATA_TYPE_TIME:
        case SORN_DATA_TYPE_ENUM:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_STRING_ID:
        case SORN_DATA_TYPE_STRING:
            return ref<DictValue>(new (pMempoolM) StringValue(pMempoolM, MakeText(field, source, i), true));
        default:
            return MakeReferenceValue(field, source, i);
    }
}

RoxString DictionaryBuilder::MakeText(const FieldInfo& field, const FieldSource& source, unsigned i) const {
    switch (field.Type()) {
        case SORN_DATA_TYPE_CHANNEL:
            return source.PlainAt<ChannelNumber>(i).ToString(pMempoolM);
        case SORN_DATA_TYPE_CURRENCY:
            return source.PlainAt<Currency>(i).ToString(pMempoolM);
        case SORN_DATA_TYPE_DATE:
            return source.PlainAt<Date>(i).ToString(pMempoolM);
        case SORN_DATA_TYPE_DATETIME:
            return source.PlainAt<DateTime>(i).ToString(pMempoolM);
        case SORN_DATA_TYPE_TIME:
            return source.PlainAt<Time>(i).ToString(pMempoolM);
        case SORN_DATA_TYPE_ENUM:
            return schematext::EnumName(pMempoolM, field, source.PlainAt<uint32_t>(i));
        case SORN_DATA_TYPE_INT_ID:
            return schematext::LongIdText(pMempoolM, tableM, field, source.PlainAt<uint32_t>(i));
        case SORN_DATA_TYPE_LONG_ID:
            return schematext::LongIdText(pMempoolM, tableM, field, source.PlainAt<uint64_t>(i));
        case SORN_DATA_TYPE_STRING_ID:
            return schematext::StringIdText(pMempoolM, tableM, field, source.TextAt(i));
        default:
            return source.TextAt(i);
    }
}

ref<DictValue> DictionaryBuilder::MakeReferenceValue(const FieldInfo& field, const FieldSource& source,
                                                     unsigned i) const {
    switch (field.Type()) {
        case SORN_DATA_TYPE_BYTESTRING: {
            ref<rox::ByteBuffer> bytes(source.ReferenceAt<rox::ByteBuffer>(i));
            return bytes != nullptr ? StringValue::Make(bytes, pMempoolM) : nullptr;
        }
        case SORN_DATA_TYPE_ANY_DICT: {
            const Dict* dict = source.ReferenceAt<Dict>(i);
            return dict != nullptr ? ref<DictValue>(dict->GetDictionary()) : nullptr;
        }
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY: {
            const ref<LazyDict>& body = source.SharedAt<LazyDict>(i);
            return body != nullptr ? ref<DictValue>(new (pMempoolM) LazyDictValue(body)) : nullptr;
        }
        default:
            return nullptr;
    }
}

}  // namespace sorn
