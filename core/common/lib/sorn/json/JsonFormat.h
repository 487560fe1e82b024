#pragma once

#include <cstdint>

namespace kelbaselib {
class Bytesink;
}

namespace sorn {

class ByteBuffer;
class JsonOutput;

/// Settings of a JSON text under way; passed by value down the tree, so that each level changes its own copy.
class JsonFormat {
 public:
    static constexpr int32_t blanksPerLevelG = 4;

    bool isPretty;            ///< line breaks and indentation on
    int32_t indentLevel = 0;  ///< current nesting depth

    explicit JsonFormat(bool pretty) : isPretty(pretty) {}

    /// One line feed, when pretty.
    void NewLine(ByteBuffer& out) const;
    void NewLine(kelbaselib::Bytesink& out) const;
    void NewLine(JsonOutput& out) const;
    /// Four blanks for each level, when pretty.
    void Indent(ByteBuffer& out) const;
    void Indent(kelbaselib::Bytesink& out) const;
    void Indent(JsonOutput& out) const;
};

}  // namespace sorn
