#pragma once

#include <google/protobuf/message.h>

#include <cstdint>
#include <random>
#include <string>

namespace sorntest {

/// Writes messages in forms of the same meaning that no ordinary writer gives: varints longer than needed,
/// and fields in any order. The order of a repeated field's elements, and the single bytes of tags in any
/// dicts, are part of the meaning and stay.
class OddWriter {
 public:
    OddWriter(uint32_t seed, bool isPadding, bool isShuffling)
        : randomM(seed), isPaddingM(isPadding), isShufflingM(isShuffling) {}

    /// The fields of a message.
    std::string Write(const google::protobuf::Message& message);

 private:
    std::string WriteField(const google::protobuf::Message& message,
                           const google::protobuf::FieldDescriptor& field);
    std::string Value(const google::protobuf::Message& message,
                      const google::protobuf::FieldDescriptor& field, int index);
    /// A varint of at most maxBytes.
    std::string Varint(uint64_t value, unsigned maxBytes);
    std::string WithLength(const std::string& bytes);

    std::mt19937 randomM;
    bool isPaddingM;
    bool isShufflingM;
};

}  // namespace sorntest
