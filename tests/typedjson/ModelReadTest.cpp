// Memory, streams of all piece sizes and the model agree: on good texts, on texts cut at every byte, and on
// texts with bytes changed, in blocks of exactly their size. Invariants for untrusted input: 1, 9, 13.

#include <random>

#include "sorn/model/Schema.h"
#include "sornschema/EveryType.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

namespace {

/// Texts that look like records, with most mistakes that can be made in one.
class RandomText {
 public:
    explicit RandomText(uint32_t seed) : randomM(seed), isPlainM(seed % 3 == 0) {}

    std::string Record() { return Object(sornschema::EveryType::structInfoG, 3, true); }
    uint32_t Below(size_t n) { return static_cast<uint32_t>(randomM() % n); }

 private:
    std::string Blank() {
        if (isPlainM) return "";
        static const char* const blanks[] = {"", "", "", "", " ", " ", "\n    ", "\t", "\r\n"};
        return blanks[Below(std::size(blanks))];
    }
    std::string Quoted(const std::string& text) { return "\"" + text + "\""; }

    std::string Object(const StructInfo& info, int nLevels, bool isNamed) {
        std::string out = "{";
        const uint32_t nKeys = Below(6);
        const uint32_t typeAt = Below(nKeys + 1);
        std::string name = Below(30) == 0 ? "noSuchStruct" : info.name;
        for (uint32_t i = 0; i <= nKeys; ++i) {
            if (i == typeAt && (isNamed || Below(4) == 0)) {
                out += Blank() + (Below(8) == 0 ? "type" : Quoted("type")) + Blank() + ":" + Blank() +
                       (Below(4) == 0 ? name : Quoted(name)) + Blank() + ",";
            }
            out += Member(info, nLevels) + Blank() + ",";
        }
        if (Below(8) != 0) out.pop_back();
        return out + Blank() + "}";
    }
    std::string Member(const StructInfo& info, int nLevels) {
        const FieldInfo& field = info.vFieldInfo[Below(static_cast<size_t>(info.nFields))];
        if (field.FHole() || Below(12) == 0) return Quoted("unknown") + ":" + Blank() + AnyValue(nLevels);
        std::string out = Blank() + Quoted(info.FieldName(field)) + Blank() + ":" + Blank();
        if (field.arity != 2 ? Below(25) != 0 : Below(4) == 0) return out + Value(field, nLevels);
        return out + Array(field, nLevels);
    }
    std::string Array(const FieldInfo& field, int nLevels) {
        std::string out = "[";
        for (uint32_t n = Below(4); n != 0; --n) {
            out += Blank() + (Below(10) == 0 ? Array(field, nLevels) : Value(field, nLevels)) + Blank() +
                   (n != 1 || Below(15) == 0 ? "," : "");
        }
        return out + Blank() + "]";
    }
    std::string Value(const FieldInfo& field, int nLevels) {
        switch (field.dataType) {
            case 6:
                return Map(nLevels);
            case 12:
            case 13:
            case 14:
                if (nLevels == 0 || Below(15) == 0) return Below(2) != 0 ? "{}" : "null";
                return Object(AStruct(field), nLevels - 1, Below(6) != 0);
            default:
                return Scalar(field);
        }
    }
    const StructInfo& AStruct(const FieldInfo& field) {
        const StructInfo* const declared = Schema::FindStruct(field.typeRef);
        if (declared != nullptr && Below(5) != 0) return *declared;
        static const unsigned ids[] = {5919, 5919, 5921, 5922, 5924, 140};
        return *Schema::FindStruct(ids[Below(std::size(ids))]);
    }
    std::string Scalar(const FieldInfo& field) {
        static const char* const numbers[] = {"0",          "7",   "-1",  "12abc",
                                              "4294967296", "-5",  "+3",  "99999999999999999999",
                                              "\"  8\"",    "1.5", "1e3", ""};
        static const char* const words[] = {"\"\"",
                                            "true",
                                            "false",
                                            "null",
                                            "\"red\"",
                                            "blue",
                                            "\"a\\nb\"",
                                            "\"\\u00e9\"",
                                            "\"x \\\"y\\\" \\/\"",
                                            "\"USD.5\"",
                                            "\"7-2\"",
                                            "\"QUI=\"",
                                            "\"2012-02-29\"",
                                            "\"2012-02-29 01:02:03\"",
                                            "\"23:59:59\"",
                                            "\"\xC3\xA9\"",
                                            "bare-word.x+1"};
        static const char* const ids[] = {"\"vuka:etc.5\"",    "vuka", "\"vuka:etc.ts.6\"", "\"vuka:etc.\"",
                                          "\"vuka:etc.word\"", "\"5\""};
        if (field.dataType >= 9 && field.dataType <= 11 && Below(12) != 0) return ids[Below(5)];
        if (Below(40) == 0) return "\"bad \\q\"";
        switch (field.dataType) {
            case 0:
                return Below(20) != 0 ? words[1 + Below(2)] : words[Below(std::size(words))];
            case 2:
                return Below(20) != 0 ? words[10] : "7-";
            case 3:
                return Below(20) != 0 ? words[9] : "USD";
            case 7:
                return Below(20) != 0 ? words[4 + Below(2)] : "\"small\"";
            case 8:
            case 15:
            case 16:
            case 19:
            case 20:
                return numbers[Below(Below(10) != 0 ? std::size(numbers) - 1 : std::size(numbers))];
            default:
                return words[Below(std::size(words))];
        }
    }
    std::string Map(int nLevels) {
        if (Below(25) == 0) return Below(2) != 0 ? "{}" : "scalar";
        std::string out = "{";
        for (uint32_t n = 1 + Below(3); n != 0; --n) {
            out += Blank() + Quoted(Below(2) != 0 ? "a" : "b") + ":" + Blank() + MapValue(nLevels) + Blank() +
                   (n != 1 ? "," : "");
        }
        return out + "}";
    }
    std::string MapValue(int nLevels) {
        switch (Below(6)) {
            case 0:
                return nLevels > 0 ? Map(nLevels - 1) : "1";
            case 1:
                return Below(5) == 0 ? "[[]]" : "[p, \"q\", ]";
            case 2:
                return "[]";
            default:
                return "\"text\"";
        }
    }
    std::string AnyValue(int nLevels) {
        switch (Below(5)) {
            case 0:
                return nLevels > 0 ? Object(*Schema::FindStruct(5919), nLevels - 1, true) : "{}";
            case 1:
                return "[1, [\"a\", {}], ]";
            default:
                return "\"text\"";
        }
    }

    std::mt19937 randomM;
    bool isPlainM;  ///< without white space, as programs write
};

}  // namespace

class ModelReadTest : public ReaderFixture {
 protected:
    /// True when the text is read.
    bool Check(const std::string& text, unsigned nPiece) {
        const ReadOutcome expected = ModelRead(text, "before");
        EXPECT_EQ(Read(text, "before"), expected) << text;
        EXPECT_EQ(ReadStream(text, nPiece, "before"), expected) << nPiece << ": " << text;
        EXPECT_EQ(ReadInMemory(text, "before"), expected) << text;
        return expected.isRead;
    }
};

TEST_F(ModelReadTest, RandomTexts) {
    unsigned nRead = 0;
    for (uint32_t seed = 0; seed < 4000 && !HasFailure(); ++seed) {
        if (Check(RandomText(seed).Record(), 1 + seed % 40)) ++nRead;
    }
    EXPECT_GT(nRead, 800u);
    EXPECT_LT(nRead, 3200u);
}

TEST_F(ModelReadTest, EveryLengthOfATextAndEveryPieceSize) {
    for (uint32_t seed = 0; seed < 12 && !HasFailure(); ++seed) {
        const std::string text = RandomText(seed).Record();
        for (size_t n = 0; n <= text.size() && !HasFailure(); ++n) Check(text.substr(0, n), 5);
        for (unsigned nPiece = 1; nPiece <= text.size() && !HasFailure(); ++nPiece) Check(text, nPiece);
    }
}

TEST_F(ModelReadTest, ChangedBytes) {
    for (uint32_t seed = 0; seed < 4000 && !HasFailure(); ++seed) {
        RandomText random(seed);
        std::string text = random.Record();
        static const std::string bytes("{}[]\",:\\ \0u1\n\xFF", 14);
        for (uint32_t n = 1 + random.Below(3); n != 0; --n) {
            const size_t at = random.Below(text.size());
            switch (random.Below(3)) {
                case 0:
                    text[at] = bytes[random.Below(bytes.size())];
                    break;
                case 1:
                    text.erase(at, 1 + random.Below(3));
                    break;
                default:
                    text.insert(at, 1, bytes[random.Below(bytes.size())]);
            }
            if (text.empty()) break;
        }
        Check(text, 1 + seed % 50);
    }
}

}  // namespace sorntest
