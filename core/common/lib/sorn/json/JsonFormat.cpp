#include "sorn/json/JsonFormat.h"

#include "sorn/json/JsonOutput.h"

namespace sorn {

void JsonFormat::NewLine(JsonOutput& out) const {
    if (isPretty) out.Byte('\n');
}

void JsonFormat::Indent(JsonOutput& out) const {
    if (isPretty && indentLevel > 0) {
        out.Blanks(static_cast<size_t>(indentLevel) * static_cast<size_t>(blanksPerLevelG));
    }
}

void JsonFormat::NewLine(ByteBuffer& out) const {
    JsonBufferOutput output(out);
    NewLine(output);
}

void JsonFormat::NewLine(kelbaselib::Bytesink& out) const {
    JsonSinkOutput output(out);
    NewLine(output);
}

void JsonFormat::Indent(ByteBuffer& out) const {
    JsonBufferOutput output(out);
    Indent(output);
}

void JsonFormat::Indent(kelbaselib::Bytesink& out) const {
    JsonSinkOutput output(out);
    Indent(output);
}

}  // namespace sorn
