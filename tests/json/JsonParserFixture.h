#pragma once

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include "json/Support.h"
#include "kelbaselib/Bytesource.h"
#include "rox/RoxStringArray.h"
#include "sorn/json/JsonParser.h"

namespace jsontest {

using Pieces = std::vector<std::string_view>;

/// A value as a text that tells all about it: a string in single quotes with their need, a bare one without,
/// all values of a name. Recursive: for small trees.
inline std::string Show(const sorn::DictValue* value) {
    if (value == nullptr) return "nothing";
    switch (value->GetTag()) {
        case sorn::dictvalue::STRING: {
            const auto* text = static_cast<const sorn::StringValue*>(value);
            const char* const quote = text->FNeedQuotes() ? "'" : "";
            return quote + String(text->GetValue()) + quote;
        }
        case sorn::dictvalue::ARRAY: {
            const auto* array = static_cast<const sorn::ArrayValue*>(value);
            std::string shown = "[";
            for (unsigned i = 0; i < array->CountValues(); ++i) {
                shown += (i > 0 ? "," : "") + Show(array->At(i));
            }
            return shown + "]";
        }
        case sorn::dictvalue::DICTIONARY: {
            const auto* dictionary = static_cast<const sorn::Dictionary*>(value);
            RoxStringArray names;
            dictionary->GetSortedNames(names);
            std::string shown = "{";
            for (unsigned i = 0; i < names.GetCount(); ++i) {
                RoxArray<sorn::DictValue> values;
                dictionary->GetRange(names.At(i), values);
                for (unsigned k = 0; k < values.GetCount(); ++k) {
                    if (shown.size() > 1) shown += ",";
                    shown += String(names.At(i)) + ":" + Show(values.At(k));
                }
            }
            return shown + "}";
        }
        case sorn::dictvalue::LAZY_DICT:
        case sorn::dictvalue::NONE:
            break;
    }
    return "null";
}

/// What the parser says to a text in these pieces, each in a block of exactly its size: the tree, or "error:
/// " and the words. Fed until a chunk is refused; whatever comes, nothing stays in the pool.
inline std::string ParsePieces(const Pieces& pieces) {
    RoxMempool pool("pieces");
    std::string shown;
    {
        ref<sorn::Dictionary> result;
        sorn::JsonParser parser(&pool);
        parser.BeginParse(result);
        bool isGood = true;
        for (size_t i = 0; i < pieces.size() && isGood; ++i) {
            const ExactBytes bytes(pieces[i]);
            isGood = parser.ParseChunk(reinterpret_cast<const char*>(bytes.Begin()), bytes.Size());
            if (isGood != (parser.GetErrorMessage() == nullptr)) return "words do not fit the answer";
        }
        if (isGood && parser.EndParse()) {
            shown = parser.GetErrorMessage() == nullptr ? Show(result.get()) : "words without failure";
        } else {
            shown = parser.GetErrorMessage() != nullptr ? std::string("error: ") + parser.GetErrorMessage()
                                                        : "failure without words";
        }
        parser.EndParse();  // now, so that its words can be dropped, too
        parser.DropErrorMessage();
    }
    return pool.GetUsedBytes() == 0 ? shown : "bytes left behind";
}

inline std::string ParseWhole(std::string_view text) {
    return ParsePieces({text});
}

/// Cuts a text into pieces of n bytes, the last one perhaps shorter.
inline Pieces Cut(std::string_view text, size_t n) {
    Pieces pieces;
    for (size_t i = 0; i < text.size(); i += n) pieces.push_back(text.substr(i, n));
    return pieces;
}

/// A source of a text that gives at most so many bytes at a time and notes what is done with it. It lives on
/// the stack of the test.
class NotingSource final : public kelbaselib::Bytesource {
 public:
    NotingSource(std::string_view text, unsigned largestRead) : textM(text), largestReadM(largestRead) {}

    unsigned Read(void* buffer, unsigned capacity) override {
        capacitiesM.push_back(capacity);
        const size_t n = std::min<size_t>({capacity, largestReadM, textM.size() - positionM});
        std::memcpy(buffer, textM.data() + positionM, n);
        positionM += n;
        return static_cast<unsigned>(n);
    }
    kelbaselib::Bytesource* NewSource() override { return nullptr; }
    unsigned GetAvailable() const override { return 0; }
    void Release() override { ++nReleasesM; }

    const std::vector<unsigned>& GetCapacities() const { return capacitiesM; }
    unsigned CountReleases() const { return nReleasesM; }

 private:
    std::string_view textM;
    unsigned largestReadM;
    size_t positionM = 0;
    std::vector<unsigned> capacitiesM;
    unsigned nReleasesM = 0;
};

}  // namespace jsontest
