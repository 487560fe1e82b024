#include "sorn/dict/Base64.h"

#include <cstring>
#include <memory>

#include "DictFixture.h"

namespace {

using sorn::Base64;

class Base64Test : public DictFixture {
 protected:
    std::string Encoded(const Base64& codec, std::string_view bytes) {
        ref<rox::ByteBuffer> text;
        codec.Encode(&pool, Bytes(bytes), text);
        return Str(text);
    }
    /// The bytes of the text, or "refused", which no case has as its result.
    std::string Decoded(const Base64& codec, std::string_view text) {
        const ref<rox::ByteBuffer> before = Bytes("before");
        ref<rox::ByteBuffer> bytes = before;
        if (codec.Decode(&pool, Bytes(text), bytes)) {
            EXPECT_NE(bytes, before);
            return Str(bytes);
        }
        EXPECT_EQ(bytes, before) << "the output changed although the text was refused";
        return "refused";
    }

    const Base64 standard{Base64::DEFAULT_CODE_SET, Base64::DEFAULT_TERMINATOR};
    const Base64 alternative{Base64::YAHOO_CODE_SET, Base64::YAHOO_TERMINATOR};
};

TEST_F(Base64Test, KnownTexts) {
    struct {
        const char* bytes;
        const char* text;
    } const cases[] = {
        {"", ""},
        {"f", "Zg=="},
        {"fo", "Zm8="},
        {"foo", "Zm9v"},
        {"foob", "Zm9vYg=="},
        {"fooba", "Zm9vYmE="},
        {"foobar", "Zm9vYmFy"},
        {"A", "QQ=="},
        {"AB", "QUI="},
        {"ABC", "QUJD"},
        {"\xff", "/w=="},
        {"\xff\xff\xff", "////"},
        {"\xfb\xef\xbe", "++++"},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(Encoded(standard, c.bytes), c.text);
        EXPECT_EQ(Decoded(standard, c.text), c.bytes);
        EXPECT_EQ(Str(sorn::EncodeBase64(&pool, Bytes(c.bytes))), c.text);
        EXPECT_EQ(Str(sorn::DecodeBase64(&pool, Text(c.text))), c.bytes);
    }
}

TEST_F(Base64Test, AlternativeSet) {
    EXPECT_EQ(Encoded(alternative, "\xff"), "_w--");
    EXPECT_EQ(Decoded(alternative, "_w--"), "\xff");
    EXPECT_EQ(Encoded(alternative, "\xfb\xef\xbe\xff"), "...._w--");
    EXPECT_EQ(Decoded(alternative, "/w=="), "refused");
    EXPECT_FALSE(alternative.FCodeSetBad());
}

TEST_F(Base64Test, AcceptedOddities) {
    EXPECT_EQ(Decoded(standard, "QQ=x"), "A");  // the fourth character is not looked at
    EXPECT_EQ(Decoded(standard, "QQ=\n"), "A");
    EXPECT_EQ(Decoded(standard, "QR=="), "A");  // low bits are dropped
    EXPECT_EQ(Decoded(standard, "Q/=="), "C");  // 010000 111111: 01000011
    EXPECT_EQ(Decoded(standard, "QUJ="), "AB");
    EXPECT_EQ(Decoded(standard, "QUJDQQ=Q"), "ABCA");
}

TEST_F(Base64Test, Refused) {
    const std::string cases[] = {"Q",
                                 "QQ",
                                 "QQ=",
                                 "Q===",
                                 "====",
                                 "QUI=QUI=",
                                 "QQ==QUJD",
                                 "QQ=QQUJD",
                                 "QUJD\n",
                                 "QUJ\n",
                                 "QU\nD",
                                 "Q\nJD",
                                 "\nUJD",
                                 "QUJDQ===",
                                 "QUJD QUJ",
                                 "Q-==",
                                 "_w==",
                                 "QUJ\x80",
                                 "\xffUJD",
                                 "QU.=",
                                 std::string("QUJ\0", 4),
                                 std::string("QU\0=", 4),
                                 "QUJDQUI\xff"};
    for (const std::string& text : cases) {
        EXPECT_EQ(Decoded(standard, text), "refused") << text;
        const ref<rox::ByteBuffer> bytes = sorn::DecodeBase64(&pool, Text(text));
        ASSERT_NE(bytes, nullptr);
        EXPECT_EQ(bytes->GetLength(), 0u) << text;
    }
}

TEST_F(Base64Test, EmptyAndNullInput) {
    ref<rox::ByteBuffer> output = Bytes("x");
    EXPECT_TRUE(standard.Decode(&pool, Bytes(""), output));
    EXPECT_EQ(output->GetLength(), 0u);
    output = Bytes("x");
    standard.Encode(&pool, nullptr, output);
    EXPECT_EQ(output->GetLength(), 0u);
    EXPECT_TRUE(sorn::EncodeBase64(&pool, nullptr).FEmpty());
    EXPECT_EQ(sorn::DecodeBase64(&pool, RoxString())->GetLength(), 0u);
}

TEST_F(Base64Test, InputAndOutputMayBeTheSameReference) {
    ref<rox::ByteBuffer> bytes = Bytes("foobar");
    standard.Encode(&pool, bytes, bytes);
    EXPECT_EQ(Str(bytes), "Zm9vYmFy");
    EXPECT_TRUE(standard.Decode(&pool, bytes, bytes));
    EXPECT_EQ(Str(bytes), "foobar");
}

TEST_F(Base64Test, StorageIsOfExactSize) {
    EXPECT_EQ(sorn::DecodeBase64(&pool, Text("Zm9vYmFyZm9vYmE="))->GetCapacity(), 11u);
    ref<rox::ByteBuffer> text;
    standard.Encode(&pool, Bytes("foobarfoo"), text);
    EXPECT_EQ(text->GetCapacity(), 12u);
    EXPECT_EQ(Base64::EncodedLength(0), 0u);
    EXPECT_EQ(Base64::EncodedLength(1), 4u);
    EXPECT_EQ(Base64::EncodedLength(4294967295u), 5726623060ull);
}

TEST_F(Base64Test, BadSetsAreMarked) {
    const std::string good = Base64::DEFAULT_CODE_SET;
    EXPECT_FALSE(standard.FCodeSetBad());
    EXPECT_TRUE(Base64(good.c_str(), 'A').FCodeSetBad());
    EXPECT_TRUE(Base64(good.c_str(), '/').FCodeSetBad());
    std::string twice = good;
    twice[63] = 'A';
    EXPECT_TRUE(Base64(twice.c_str(), '=').FCodeSetBad());
    EXPECT_TRUE(Base64("", '=').FCodeSetBad());
    EXPECT_TRUE(Base64("ABC", '=').FCodeSetBad());
    const std::string shortSet(good.begin(), good.begin() + 40);
    EXPECT_TRUE(Base64(std::vector<char>(shortSet.c_str(), shortSet.c_str() + 41).data(), '=').FCodeSetBad());
}

TEST_F(Base64Test, BadSetsWorkWithinTheirTables) {
    const Base64 partly("ABCA", '=');  // values 0 to 2 stand; the fourth was a duplicate
    EXPECT_TRUE(partly.FCodeSetBad());
    EXPECT_EQ(Encoded(partly, std::string_view("\0\x10\x83", 3)), "ABCA");  // 000000 000001 000010 000011
    EXPECT_EQ(Decoded(partly, "ABCA"), std::string("\0\x10\x80", 3));
    EXPECT_EQ(Decoded(partly, "ABCD"), "refused");
    EXPECT_EQ(Encoded(partly, "\xff\xff\xff"), std::string(4, '\0'));
    const Base64 terminated("AB=", '=');
    EXPECT_TRUE(terminated.FCodeSetBad());
    EXPECT_EQ(Decoded(terminated, "AA=="), std::string(1, '\0'));
}

/// The text of the bytes by their bits, one by one.
std::string EncodedByBits(const std::string& bytes) {
    std::string bits;
    for (const char c : bytes) {
        for (int bit = 7; bit >= 0; --bit) bits.push_back((c >> bit & 1) != 0 ? '1' : '0');
    }
    while (bits.size() % 6 != 0) bits.push_back('0');
    std::string text;
    for (size_t i = 0; i < bits.size(); i += 6) {
        text.push_back(Base64::DEFAULT_CODE_SET[std::stoi(bits.substr(i, 6), nullptr, 2)]);
    }
    while (text.size() % 4 != 0) text.push_back('=');
    return text;
}

TEST_F(Base64Test, AllLengthsBothWays) {
    Random random(2);
    for (unsigned n = 0; n < 300; ++n) {
        std::string bytes;
        for (unsigned i = 0; i < n; ++i) bytes.push_back(static_cast<char>(random.Below(256)));
        const std::string text = EncodedByBits(bytes);
        ASSERT_EQ(Encoded(standard, bytes), text);
        ASSERT_EQ(Decoded(standard, text), bytes);
        // Any foreign byte at any place before the last two is refused.
        if (text.size() < 3) continue;
        std::string damaged = text;
        damaged[random.Below(text.size() - 2)] = '*';
        ASSERT_EQ(Decoded(standard, damaged), "refused") << damaged;
    }
}

TEST_F(Base64Test, PlainMemoryOfExactSize) {
    // In blocks of just their size a read or write outside is a report of AddressSanitizer.
    Random random(3);
    for (unsigned n = 0; n < 40; ++n) {
        const std::unique_ptr<unsigned char[]> bytes(new unsigned char[n]);
        for (unsigned i = 0; i < n; ++i) bytes[i] = static_cast<unsigned char>(random.Below(256));
        const std::string expected = EncodedByBits(std::string(bytes.get(), bytes.get() + n));
        const unsigned nText = static_cast<unsigned>(Base64::EncodedLength(n));
        ASSERT_EQ(nText, expected.size());
        const std::unique_ptr<unsigned char[]> text(new unsigned char[nText]);
        standard.Encode(bytes.get(), n, text.get());
        EXPECT_EQ(std::string(text.get(), text.get() + nText), expected);
        const ref<rox::ByteBuffer> back = standard.Decode(&pool, text.get(), nText);
        ASSERT_NE(back, nullptr);
        EXPECT_EQ(Str(back), std::string(bytes.get(), bytes.get() + n));
        if (nText == 0) continue;
        const std::unique_ptr<unsigned char[]> cut(new unsigned char[nText - 1]);
        std::memcpy(cut.get(), text.get(), nText - 1);
        EXPECT_EQ(standard.Decode(&pool, cut.get(), nText - 1), nullptr);
    }
}

}  // namespace
