#include "peer/PeerMessage.h"

#include <google/protobuf/io/coded_stream.h>
#include <google/protobuf/io/zero_copy_stream_impl_lite.h>
#include <gtest/gtest.h>

#include "peer/PeerSchema.h"
#include "rox/RoxStringArray.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Schema.h"
#include "sorn/model/Time.h"

namespace sorntest {

using namespace sorn;
using google::protobuf::FieldDescriptor;
using google::protobuf::Message;

namespace {

/// One field of a message: a single one is set, a repeated one gets a further element.
class MessageField {
 public:
    MessageField(Message& message, int number)
        : messageM(message), fieldM(message.GetDescriptor()->FindFieldByNumber(number)) {
        if (fieldM == nullptr) {
            ADD_FAILURE() << message.GetDescriptor()->name() << " has no field " << number;
            std::abort();
        }
    }

    void Put(bool value) {
        fieldM->is_repeated() ? R().AddBool(&messageM, fieldM, value) : R().SetBool(&messageM, fieldM, value);
    }
    void Put(int32_t value) {
        fieldM->is_repeated() ? R().AddInt32(&messageM, fieldM, value)
                              : R().SetInt32(&messageM, fieldM, value);
    }
    void Put(int64_t value) {
        fieldM->is_repeated() ? R().AddInt64(&messageM, fieldM, value)
                              : R().SetInt64(&messageM, fieldM, value);
    }
    void Put(uint32_t value) {
        fieldM->is_repeated() ? R().AddUInt32(&messageM, fieldM, value)
                              : R().SetUInt32(&messageM, fieldM, value);
    }
    void Put(uint64_t value) {
        fieldM->is_repeated() ? R().AddUInt64(&messageM, fieldM, value)
                              : R().SetUInt64(&messageM, fieldM, value);
    }
    void Put(double value) {
        fieldM->is_repeated() ? R().AddDouble(&messageM, fieldM, value)
                              : R().SetDouble(&messageM, fieldM, value);
    }
    void Put(const std::string& value) {
        fieldM->is_repeated() ? R().AddString(&messageM, fieldM, value)
                              : R().SetString(&messageM, fieldM, value);
    }
    void Put(const RoxString& value) { Put(std::string(value.Utf8(), value.NByte())); }
    Message& PutMessage() {
        return fieldM->is_repeated() ? *R().AddMessage(&messageM, fieldM)
                                     : *R().MutableMessage(&messageM, fieldM);
    }

 private:
    const google::protobuf::Reflection& R() const { return *messageM.GetReflection(); }

    Message& messageM;
    const FieldDescriptor* fieldM;
};

void FillRecord(Message& record, const SornObject& object);

void FillKnownDict(Message& knownDict, const SornObject& object) {
    FillRecord(MessageField(knownDict, static_cast<int>(object.structId)).PutMessage(), object);
}

void FillAnyDict(Message& message, const Dict& dict) {
    RoxStringArray names(nullptr);
    dict.GetSortedNames(names);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        Message& entry = MessageField(message, 4).PutMessage();
        MessageField(entry, 6).Put(names[i]);
        for (unsigned j = 0; j < dict.CountValues(names[i]); ++j) {
            Message& value = MessageField(entry, 8).PutMessage();
            const int type = dict.GetType(names[i], j);
            if (type == 0) MessageField(value, 2).Put(dict.GetString(names[i], j));
            if (type == 1) FillAnyDict(value, *dict.GetDict(names[i], j));
        }
    }
}

std::string ChannelText(const ChannelNumber& channel) {
    if (channel == ChannelNumber::INVALID) return "invalid";
    std::string text = std::to_string(channel.number);
    if (channel.subNumber != ChannelNumber::noneG) text += "-" + std::to_string(channel.subNumber);
    return text;
}

std::string CurrencyText(const Currency& currency) {
    if (currency.code[0] == 0) return "invalid";
    return std::string(currency.code, 3) + "." + std::to_string(currency.amount);
}

void FillValue(MessageField target, DataType type, const FieldSource& source, unsigned i) {
    switch (type) {
        case SORN_DATA_TYPE_BOOL:
            return target.Put(source.PlainAt<bool>(i));
        case SORN_DATA_TYPE_BYTESTRING: {
            const auto& bytes = *source.ReferenceAt<rox::ByteBuffer>(i);
            return target.Put(std::string(reinterpret_cast<const char*>(bytes.GetData()), bytes.GetLength()));
        }
        case SORN_DATA_TYPE_CHANNEL:
            return target.Put(ChannelText(source.PlainAt<ChannelNumber>(i)));
        case SORN_DATA_TYPE_CURRENCY:
            return target.Put(CurrencyText(source.PlainAt<Currency>(i)));
        case SORN_DATA_TYPE_DATE:
            return target.Put(source.PlainAt<Date>(i).days);
        case SORN_DATA_TYPE_DATETIME:
            return target.Put(source.PlainAt<DateTime>(i).milliseconds);
        case SORN_DATA_TYPE_ANY_DICT:
            return FillAnyDict(target.PutMessage(), *source.ReferenceAt<Dict>(i));
        case SORN_DATA_TYPE_FLOAT:
            return target.Put(source.PlainAt<double>(i));
        case SORN_DATA_TYPE_ENUM:
        case SORN_DATA_TYPE_INT_ID:
        case SORN_DATA_TYPE_U32:
            return target.Put(source.PlainAt<uint32_t>(i));
        case SORN_DATA_TYPE_TIME:
            return target.Put(static_cast<uint32_t>(source.PlainAt<Time>(i).milliseconds));
        case SORN_DATA_TYPE_LONG_ID:
        case SORN_DATA_TYPE_U64:
            return target.Put(source.PlainAt<uint64_t>(i));
        case SORN_DATA_TYPE_STRING_ID:
        case SORN_DATA_TYPE_STRING:
            return target.Put(source.TextAt(i));
        case SORN_DATA_TYPE_KNOWN_DICT:
            return FillKnownDict(target.PutMessage(), *source.ReferenceAt<SornObject>(i));
        case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            return FillKnownDict(target.PutMessage(), *ObjectOfLazyBody(source.SharedAt<LazyDict>(i)));
        case SORN_DATA_TYPE_OBJECT:
            return FillRecord(target.PutMessage(), *source.ReferenceAt<SornObject>(i));
        case SORN_DATA_TYPE_S64:
            return target.Put(source.PlainAt<int64_t>(i));
        case SORN_DATA_TYPE_S32:
            return target.Put(source.PlainAt<int32_t>(i));
        case SORN_DATA_TYPE_NONE:
            break;
    }
}

void FillRecord(Message& record, const SornObject& object) {
    const StructInfo& info = *Schema::FindStruct(object.structId);
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (field.FHole() || (field.arity == SORN_ARITY_OPTIONAL && !object.FPresent(field))) continue;
        const FieldSource source(object.MemberAt(field), field.arity == SORN_ARITY_MULTI);
        const unsigned n = source.Count(field.Type());
        for (unsigned i = 0; i < n; ++i) FillValue(MessageField(record, slot), field.Type(), source, i);
    }
}

}  // namespace

std::unique_ptr<Message> PeerMessage(const SornObject& object) {
    std::unique_ptr<Message> message = PeerSchema::Get().NewMessage("KnownDict");
    FillKnownDict(*message, object);
    return message;
}

Message& RecordOf(Message& knownDict) {
    std::vector<const FieldDescriptor*> fields;
    knownDict.GetReflection()->ListFields(knownDict, &fields);
    if (fields.size() != 1) {
        ADD_FAILURE() << "a known dict holds " << fields.size() << " records";
        std::abort();
    }
    return *knownDict.GetReflection()->MutableMessage(&knownDict, fields[0]);
}

std::string PeerBytes(const Message& message) {
    std::string bytes;
    {
        google::protobuf::io::StringOutputStream out(&bytes);
        google::protobuf::io::CodedOutputStream coded(&out);
        coded.SetSerializationDeterministic(true);
        EXPECT_TRUE(message.SerializeToCodedStream(&coded));
    }
    return bytes;
}

}  // namespace sorntest
