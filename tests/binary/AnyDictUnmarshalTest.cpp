// Dictionaries without a schema: reading. Invariants for untrusted input: 1, 2, 6, 9.

#include "binary/BinaryFixture.h"

namespace sorntest {

using namespace sorn;

class AnyDictUnmarshalTest : public BinaryFixture {
 protected:
    /// The value that bytes are read as: a dictionary's JSON text, "text: " and a text, or "refused".
    std::string Value(const std::string& hex) {
        const ExactBytes bytes(Bytes(hex));
        dictvalue::Type type = dictvalue::NONE;
        RoxString text;
        ref<Dict> dict;
        if (!Codec().UnmarshalAnyDictValue(bytes.Begin(), bytes.End(), type, text, dict)) {
            EXPECT_EQ(dict, nullptr);
            EXPECT_EQ(type, dictvalue::NONE);
            return "refused";
        }
        if (dict == nullptr) {
            EXPECT_EQ(static_cast<int>(type), 0);
            return "text: " + Text(text);
        }
        EXPECT_EQ(static_cast<int>(type), 1);
        return JsonOf(dict);
    }
    /// What an entry adds to an empty dictionary.
    std::string Entry(const std::string& hex) {
        const ExactBytes bytes(Bytes(hex));
        const ref<Dict> dict = MakeDict(&pool);
        const bool isRead = Codec().UnmarshalAnyDictField(bytes.Begin(), bytes.End(), dict);
        return isRead ? JsonOf(dict) : "refused";
    }
};

TEST_F(AnyDictUnmarshalTest, Values) {
    struct Case {
        const char* hex;
        const char* value;
    };
    const Case cases[] = {
        {"", "{}"},
        {"12 01 61", "text: a"},
        {"12 00", "text: "},
        {"12 81 00 61", "text: a"},
        {"22 08 32 01 61 42 03 12 01 62", R"({"a": "b"})"},
        {"22 05 32 01 61 42 00 22 05 32 01 62 42 00", R"({"a": {}, "b": {}})"},
        {"22 0F 32 01 6F 42 0A 22 08 32 01 69 42 03 12 01 76", R"({"o": {"i": "v"}})"},
        // A text stands alone.
        {"12 01 61 12 01 61", "refused"},
        {"12 01 61 22 05 32 01 62 42 00", "refused"},
        {"22 05 32 01 62 42 00 12 01 61", "refused"},
        {"12 01 61 00", "refused"},
        // Other tags, and what does not fit.
        {"32 01 61", "refused"},
        {"A2 01 05 32 01 61 42 00", "refused"},  // the tag in two bytes
        {"00", "refused"},
        {"12", "refused"},
        {"12 02 61", "refused"},
        {"22", "refused"},
        {"22 06 32 01 61 42 00", "refused"},
        {"12 FF FF FF FF 0F 61", "refused"},
        {"12 FF FF FF FF FF 01 61", "refused"},
        {"22 FF FF FF FF 0F 32 01 61 42 00", "refused"},
        {"22 00", "refused"},
    };
    for (const Case& each : cases) EXPECT_EQ(Value(each.hex), each.value) << each.hex;
}

TEST_F(AnyDictUnmarshalTest, Entries) {
    struct Case {
        const char* hex;
        const char* value;
    };
    const Case cases[] = {
        {"32 01 61 42 03 12 01 62", R"({"a": "b"})"},
        {"42 03 12 01 62 32 01 61", R"({"a": "b"})"},
        {"42 03 12 01 62 32 01 61 42 03 12 01 63", R"({"a": ["b", "c"]})"},
        {"32 01 61 42 00", R"({"a": {}})"},
        {"32 01 61", "{}"},                           // a name without values adds nothing
        {"32 01 61 32 01 7A 42 00", R"({"a": {}})"},  // the first of two names
        {"32 00 42 00", R"({"": {}})"},
        {"32 01 61 42 03 12 01 62 42 00 42 0A 22 08 32 01 69 42 03 12 01 76",
         R"({"a": ["b", {}, {"i": "v"}]})"},
        {"", "refused"},
        {"42 00", "refused"},
        {"32", "refused"},
        {"32 02 61", "refused"},
        {"32 01 61 42", "refused"},
        {"32 01 61 42 01", "refused"},
        {"32 01 61 42 01 12", "refused"},
        {"32 01 61 42 06 12 01 61 12 01 62", "refused"},  // more behind a text
        {"32 01 61 12 00", "refused"},
        {"12 00 32 01 61", "refused"},  // passed by when the name is looked for, not afterwards
        {"32 01 61 42 FF FF FF FF 0F", "refused"},
    };
    for (const Case& each : cases) EXPECT_EQ(Entry(each.hex), each.value) << each.hex;
}

/// What lies behind the entry is not the entry's, even where it would make sense.
TEST_F(AnyDictUnmarshalTest, ItemsBeyondTheirEntry) {
    EXPECT_EQ(Value("22 05 32 01 61 42 03 12 01 62"), "refused");
    EXPECT_EQ(Value("22 06 32 01 61 42 03 12 01 62"), "refused");
    EXPECT_EQ(Value("22 05 32 01 61 42 05 32 01 62 42 00"), "refused");
}

TEST_F(AnyDictUnmarshalTest, WithAndWithoutLength) {
    const ExactBytes bytes(Bytes("0A 22 08 32 01 61 42 03 12 01 62 77"));
    ref<Dict> dict;
    const unsigned char* cursor = bytes.Begin();
    EXPECT_TRUE(Codec().UnmarshalAnyDictWithLength(&cursor, bytes.End(), &dict));
    EXPECT_EQ(cursor, bytes.End() - 1);
    EXPECT_EQ(JsonOf(dict), R"({"a": "b"})");
    // A dictionary that is there gets more.
    cursor = bytes.Begin() + 1;
    EXPECT_TRUE(Codec().UnmarshalAnyDict(&cursor, bytes.End() - 1, &dict));
    EXPECT_EQ(cursor, bytes.End() - 1);
    EXPECT_EQ(JsonOf(dict), R"({"a": ["b", "b"]})");
    struct Case {
        const char* hex;
        const char* value;
    };
    for (const Case& each :
         {Case{"00", "{}"}, Case{"0A 00", "refused"}, Case{"", "refused"}, Case{"80", "refused"},
          Case{"03 12 01 61", "refused"}, Case{"FF FF FF FF 0F", "refused"}, Case{"80 80 80 80 10", "{}"}}) {
        const ExactBytes exact(Bytes(each.hex));
        ref<Dict> read;
        cursor = exact.Begin();
        const bool isRead = Codec().UnmarshalAnyDictWithLength(&cursor, exact.End(), &read);
        EXPECT_EQ(isRead ? JsonOf(read) : "refused", each.value) << each.hex;
        EXPECT_EQ(read == nullptr, !isRead);
    }
    // The cursor goes to the end whatever comes of it.
    const ExactBytes text(Bytes("12 01 61"));
    ref<Dict> none;
    cursor = text.Begin();
    EXPECT_FALSE(Codec().UnmarshalAnyDict(&cursor, text.End(), &none));
    EXPECT_EQ(cursor, text.End());
    EXPECT_EQ(none, nullptr);
}

TEST_F(AnyDictUnmarshalTest, FullNames) {
    for (const char* value : {"42 00", "42 02 12 00"}) {
        std::string entry = Bytes("32 01 61");
        for (unsigned i = 0; i < 65535; ++i) entry += Bytes(value);
        const std::string cases[] = {entry, entry + Bytes(value)};
        for (const std::string& each : cases) {
            const ExactBytes bytes(each);
            const ref<Dict> dict = MakeDict(&pool);
            EXPECT_EQ(Codec().UnmarshalAnyDictField(bytes.Begin(), bytes.End(), dict), each == entry);
            EXPECT_EQ(dict->CountValues("a"), 65535u);
        }
    }
}

/// More names than containers of the runtime hold: a dictionary has no such limit, in either direction.
TEST_F(AnyDictUnmarshalTest, ManyNames) {
    constexpr unsigned nNames = 70000;
    std::string body;
    for (unsigned i = 0; i < nNames; ++i) {
        const std::string name = std::to_string(100000 + i);
        body += Bytes("22") + Section(Bytes("32") + Section(name) + Bytes("42 02 12 00"));
    }
    const ExactBytes bytes(body);
    const unsigned char* cursor = bytes.Begin();
    ref<Dict> dict;
    ASSERT_TRUE(Codec().UnmarshalAnyDict(&cursor, bytes.End(), &dict));
    EXPECT_EQ(dict->CountNames(), nNames);
    EXPECT_EQ(Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalAnyDict(dict.get(), s); }),
              Hex(body));
}

}  // namespace sorntest
