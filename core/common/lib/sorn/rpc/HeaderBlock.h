#pragma once

#include <string_view>

#include "rox/RoxString.h"
#include "rox/RoxWorkStack.h"
#include "rox/ref.h"
#include "sorn/dict/Dict.h"

namespace sorn {

/// The header lines of a message that is being read: views of its text, which must stay.
class HeaderBlock {
 public:
    explicit HeaderBlock(RoxMempool* pool) : vLinesM(pool) {}

    /// Cuts the block at each CR, LF; a block without any has no lines. Empty lines count for nothing. False
    /// and words for a line without a colon (appended) and for more than 65,535 pieces (replaced).
    bool Read(std::string_view block, RoxString& error);

    /// The first value of a header, without white space around it; empty without one.
    std::string_view Get(std::string_view name) const;
    bool FHas(std::string_view name) const { return Find(name) != nullptr; }

    /// A new dictionary in the pool of the headers that `skip(name)` does not take out.
    template <class Skip>
    ref<Dict> ToDict(RoxMempool* pool, Skip skip) const {
        ref<Dict> dict = MakeDict(pool);
        for (unsigned i = 0; i < vLinesM.Size(); ++i) {
            const Line& line = vLinesM[i];
            if (!skip(line.name)) dict->AddString(ToText(pool, line.name), ToText(pool, line.value));
        }
        return dict;
    }

    static RoxString ToText(RoxMempool* pool, std::string_view text) {
        return RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(text.size()), text.data());
    }

 private:
    struct Line {
        std::string_view name;
        std::string_view value;
    };

    const Line* Find(std::string_view name) const;
    bool AddLine(std::string_view line, RoxString& error);

    RoxWorkStack<Line, 8> vLinesM;
};

}  // namespace sorn
