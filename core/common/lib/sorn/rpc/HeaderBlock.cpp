#include "sorn/rpc/HeaderBlock.h"

#include "rox/RoxStringArray.h"
#include "sorn/rpc/TrimmedView.h"

namespace sorn {

bool HeaderBlock::Read(std::string_view block, RoxString& error) {
    unsigned nPieces = 1;
    for (size_t end; (end = block.find("\r\n")) != std::string_view::npos; ++nPieces) {
        if (nPieces == RoxStringArray::maxCount) {
            error = "Too many header lines";
            return false;
        }
        if (!AddLine(block.substr(0, end), error)) return false;
        block.remove_prefix(end + 2);
    }
    return nPieces == 1 || AddLine(block, error);
}

bool HeaderBlock::AddLine(std::string_view line, RoxString& error) {
    if (line.empty()) return true;
    const size_t colon = line.find(':');
    if (colon == std::string_view::npos) {
        error.FormatAndSet("%sInvalid header line: %s", error.Utf8(), ToText(nullptr, line).Utf8());
        return false;
    }
    vLinesM.Push({line.substr(0, colon), TrimmedView(line.substr(colon + 1))});
    return true;
}

const HeaderBlock::Line* HeaderBlock::Find(std::string_view name) const {
    for (unsigned i = 0; i < vLinesM.Size(); ++i) {
        if (vLinesM[i].name == name) return &vLinesM[i];
    }
    return nullptr;
}

std::string_view HeaderBlock::Get(std::string_view name) const {
    const Line* const line = Find(name);
    return line == nullptr ? std::string_view() : line->value;
}

}  // namespace sorn
