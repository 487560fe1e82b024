#include "peer/OddWriter.h"

#include <google/protobuf/descriptor.h>
#include <google/protobuf/wire_format_lite.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

namespace sorntest {

using google::protobuf::FieldDescriptor;
using google::protobuf::Message;
using google::protobuf::Reflection;
using google::protobuf::internal::WireFormatLite;

std::string OddWriter::Write(const Message& message) {
    std::vector<const FieldDescriptor*> fields;
    message.GetReflection()->ListFields(message, &fields);
    if (isShufflingM) std::shuffle(fields.begin(), fields.end(), randomM);
    std::string bytes;
    for (const FieldDescriptor* field : fields) bytes += WriteField(message, *field);
    return bytes;
}

std::string OddWriter::WriteField(const Message& message, const FieldDescriptor& field) {
    const bool isAnyDict = message.GetDescriptor()->name().starts_with("AnyDict");
    const auto wireType =
        WireFormatLite::WireTypeForFieldType(static_cast<WireFormatLite::FieldType>(field.type()));
    const uint32_t tag = static_cast<uint32_t>(field.number()) * 8 + static_cast<uint32_t>(wireType);
    const int n = field.is_repeated() ? message.GetReflection()->FieldSize(message, &field) : 1;
    std::string bytes;
    for (int i = 0; i < n; ++i) {
        bytes += isAnyDict ? std::string(1, static_cast<char>(tag)) : Varint(tag, 5);
        bytes += Value(message, field, i);
    }
    return bytes;
}

std::string OddWriter::Value(const Message& message, const FieldDescriptor& field, int i) {
    const Reflection& r = *message.GetReflection();
    const bool isMulti = field.is_repeated();
    switch (field.type()) {
        case FieldDescriptor::TYPE_BOOL:
            return Varint(isMulti ? r.GetRepeatedBool(message, &field, i) : r.GetBool(message, &field), 5);
        case FieldDescriptor::TYPE_SINT32: {
            const int32_t value =
                isMulti ? r.GetRepeatedInt32(message, &field, i) : r.GetInt32(message, &field);
            return Varint(WireFormatLite::ZigZagEncode32(value), 5);
        }
        case FieldDescriptor::TYPE_SINT64: {
            const int64_t value =
                isMulti ? r.GetRepeatedInt64(message, &field, i) : r.GetInt64(message, &field);
            return Varint(WireFormatLite::ZigZagEncode64(value), 10);
        }
        case FieldDescriptor::TYPE_UINT32:
            return Varint(isMulti ? r.GetRepeatedUInt32(message, &field, i) : r.GetUInt32(message, &field),
                          5);
        case FieldDescriptor::TYPE_UINT64:
            return Varint(isMulti ? r.GetRepeatedUInt64(message, &field, i) : r.GetUInt64(message, &field),
                          10);
        case FieldDescriptor::TYPE_DOUBLE: {
            const double value =
                isMulti ? r.GetRepeatedDouble(message, &field, i) : r.GetDouble(message, &field);
            char bytes[sizeof value];  // the tests' hosts are little-endian
            memcpy(bytes, &value, sizeof value);
            return std::string(bytes, sizeof value);
        }
        case FieldDescriptor::TYPE_STRING:
        case FieldDescriptor::TYPE_BYTES:
            return WithLength(isMulti ? r.GetRepeatedString(message, &field, i)
                                      : r.GetString(message, &field));
        case FieldDescriptor::TYPE_MESSAGE: {
            const Message& inner =
                isMulti ? r.GetRepeatedMessage(message, &field, i) : r.GetMessage(message, &field);
            return WithLength(Write(inner));
        }
        default:
            ADD_FAILURE() << field.full_name() << " is of no type of the schema";
            return "";
    }
}

std::string OddWriter::Varint(uint64_t value, unsigned maxBytes) {
    std::string bytes;
    for (; value >= 0x80; value >>= 7) bytes += static_cast<char>(value | 0x80);
    bytes += static_cast<char>(value);
    while (isPaddingM && bytes.size() < maxBytes && randomM() % 2 == 0) {
        bytes.back() = static_cast<char>(bytes.back() | 0x80);
        bytes += '\0';
    }
    return bytes;
}

std::string OddWriter::WithLength(const std::string& bytes) {
    return Varint(bytes.size(), 5) + bytes;
}

}  // namespace sorntest
