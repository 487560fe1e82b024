#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "json/Support.h"
#include "kelbaselib/ByteCountingBytesink.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/lazy/LazyDict.h"

using jsontest::String;
using jsontest::Text;
using sorn::ArrayValue;
using sorn::ByteBuffer;
using sorn::Dictionary;
using sorn::DictValue;
using sorn::JsonFormat;
using sorn::LazyDict;
using sorn::LazyDictValue;
using sorn::NullValue;
using sorn::StringValue;

namespace {

class JsonWriter : public testing::Test {
 protected:
    ref<StringValue> Bare(const char* text) {
        return new (&poolM) StringValue(&poolM, RoxString(&poolM, text), false);
    }
    ref<StringValue> Quoted(const char* text) { return StringValue::Make(text, &poolM); }
    ref<NullValue> Null() { return new (&poolM) NullValue(&poolM); }
    ref<Dictionary> NewDictionary() { return new (&poolM) Dictionary(&poolM); }
    ref<ArrayValue> NewArray() { return new (&poolM) ArrayValue(&poolM); }

    /// The text by all roads, which must agree.
    std::string Write(const DictValue& value, bool pretty = false) {
        ByteBuffer buffer(&poolM);
        buffer.AppendLiteral("kept");
        value.ToJson(buffer, JsonFormat(pretty));
        EXPECT_EQ(String(buffer).substr(0, 4), "kept");
        const std::string text = String(buffer).substr(4);
        jsontest::StringSink sink;
        value.ToJson(sink, JsonFormat(pretty));
        EXPECT_EQ(sink.GetText(), text);
        kelbaselib::ByteCountingBytesink counter;
        value.ToJson(counter, JsonFormat(pretty));
        EXPECT_EQ(counter.GetWrittenBytes(), text.size());
        EXPECT_EQ(String(value.ToJson(pretty)), text);
        return text;
    }

    RoxMempool poolM{"writer"};
};

TEST_F(JsonWriter, Format) {
    ByteBuffer buffer(&poolM);
    jsontest::StringSink sink;
    JsonFormat compact(false);
    compact.indentLevel = 3;
    JsonFormat pretty(true);
    EXPECT_EQ(pretty.indentLevel, 0);
    const auto both = [&](const JsonFormat& format) {
        format.NewLine(buffer);
        format.NewLine(sink);
        format.Indent(buffer);
        format.Indent(sink);
    };
    both(compact);
    EXPECT_EQ(buffer.GetLength(), 0u);
    both(pretty);
    pretty.indentLevel = 1;
    both(pretty);
    pretty.indentLevel = -1;
    both(pretty);
    pretty.indentLevel = 300;
    both(pretty);
    EXPECT_EQ(String(buffer), "\n\n    \n\n" + std::string(1200, ' '));
    EXPECT_EQ(sink.GetText(), String(buffer));
}

TEST_F(JsonWriter, Scalars) {
    EXPECT_EQ(Write(*Null()), "null");
    EXPECT_EQ(Write(*Null(), true), "null");
    EXPECT_EQ(Write(*Bare("12")), "12");
    EXPECT_EQ(Write(*Bare("-3")), "-3");
    EXPECT_EQ(Write(*Bare("true")), "true");
    EXPECT_EQ(Write(*Bare("word")), "word");
    EXPECT_EQ(Write(*Bare("12.5")), "\"12.5\"");
    EXPECT_EQ(Write(*Bare("1e+3")), "\"1e+3\"");
    EXPECT_EQ(Write(*Bare("")), "");
    EXPECT_EQ(Write(*Bare("\xC3\xA9")), "\"\xC3\xA9\"");
    EXPECT_EQ(Write(*Quoted("12")), "\"12\"");
    EXPECT_EQ(Write(*Quoted("")), "\"\"");
}

TEST_F(JsonWriter, ScalarsByTheirMakers) {
    EXPECT_EQ(Write(*StringValue::Make(5000000000LL, &poolM)), "\"5000000000\"");
    EXPECT_EQ(Write(*StringValue::Make(5000000000ULL, &poolM)), "\"5000000000\"");
    EXPECT_EQ(Write(*StringValue::Make(5, &poolM)), "5");
    EXPECT_EQ(Write(*StringValue::Make(-5, &poolM)), "-5");
    EXPECT_EQ(Write(*StringValue::Make(5u, &poolM)), "5");
    EXPECT_EQ(Write(*StringValue::Make(true, &poolM)), "true");
    EXPECT_EQ(Write(*StringValue::Make(false, &poolM)), "false");
    EXPECT_EQ(Write(*StringValue::Make(2.5, &poolM)), "\"2.5\"");
    EXPECT_EQ(Write(*StringValue::Make(3.0, &poolM)), "\"3.0\"");
    EXPECT_EQ(Write(*StringValue::Make(rox::ByteBuffer::New(&poolM, "Man", 3), &poolM)), "\"TWFu\"");
}

TEST_F(JsonWriter, EmptyContainers) {
    EXPECT_EQ(Write(*NewDictionary()), "{}");
    EXPECT_EQ(Write(*NewDictionary(), true), "{\n}");
    EXPECT_EQ(Write(*NewArray()), "[]");
    EXPECT_EQ(Write(*NewArray(), true), "[\n\n]");
}

TEST_F(JsonWriter, TwoEntries) {
    const ref<Dictionary> dictionary = NewDictionary();
    dictionary->Add(Text(poolM, "b"), Bare("2"));
    dictionary->Add(Text(poolM, "a"), Bare("1"));
    EXPECT_EQ(Write(*dictionary), R"({"a": 1, "b": 2})");
    EXPECT_EQ(Write(*dictionary, true), "{\n    \"a\": 1, \n    \"b\": 2\n}");
    const ref<ArrayValue> array = NewArray();
    array->Add(Bare("1"));
    array->Add(Bare("2"));
    EXPECT_EQ(Write(*array), "[1, 2]");
    EXPECT_EQ(Write(*array, true), "[\n    1, \n    2\n]");
}

TEST_F(JsonWriter, Nested) {
    const ref<Dictionary> inner = NewDictionary();
    inner->Add(Text(poolM, "n"), Null());
    const ref<ArrayValue> array = NewArray();
    array->Add(inner);
    array->Add(NewArray());
    array->Add(Quoted("x"));
    const ref<Dictionary> outer = NewDictionary();
    outer->Add(Text(poolM, "list"), array);
    outer->Add(Text(poolM, "z"), inner);
    EXPECT_EQ(Write(*outer), R"({"list": [{"n": null}, [], "x"], "z": {"n": null}})");
    EXPECT_EQ(Write(*outer, true),
              "{\n"
              "    \"list\": [\n"
              "        {\n"
              "            \"n\": null\n"
              "        }, \n"
              "        [\n"
              "\n"
              "        ], \n"
              "        \"x\"\n"
              "    ], \n"
              "    \"z\": {\n"
              "        \"n\": null\n"
              "    }\n"
              "}");
}

TEST_F(JsonWriter, BeginsAtTheLevelOfTheFormat) {
    const ref<ArrayValue> array = NewArray();
    array->Add(Bare("1"));
    ByteBuffer buffer(&poolM);
    JsonFormat format(true);
    format.indentLevel = 2;
    array->ToJson(buffer, format);
    EXPECT_EQ(String(buffer), "[\n            1\n        ]");
}

TEST_F(JsonWriter, SeveralValuesUnderAName) {
    const ref<Dictionary> dictionary = NewDictionary();
    dictionary->Add(Text(poolM, "x"), Bare("1"));
    dictionary->Add(Text(poolM, "x"), Bare("2"));
    EXPECT_EQ(Write(*dictionary), R"({"x": 1, "x": 2})");
    dictionary->Add(Text(poolM, "a"), NewDictionary());
    dictionary->Add(Text(poolM, "x"), NewArray());
    dictionary->Add(Text(poolM, "y"), Bare("4"));
    EXPECT_EQ(Write(*dictionary), R"({"a": {}, "x": 1, "x": 2, "x": [], "y": 4})");
    EXPECT_EQ(
        Write(*dictionary, true),
        "{\n    \"a\": {\n    }, \n    \"x\": 1, \n    \"x\": 2, \n    \"x\": [\n\n    ], \n    \"y\": 4\n}");
}

TEST_F(JsonWriter, NamesAreSortedByTheirBytesAndAlwaysQuoted) {
    const ref<Dictionary> dictionary = NewDictionary();
    const char* names[] = {"b",  "\xC3\xA9", "a", "", "ab", "B", "a\"", "commonPrefix2", "commonPrefix10",
                           "-1", "1"};
    for (const char* name : names) dictionary->Add(Text(poolM, name), Bare("0"));
    EXPECT_EQ(Write(*dictionary),
              "{\"\": 0, \"-1\": 0, \"1\": 0, \"B\": 0, \"a\": 0, \"a\\\"\": 0, \"ab\": 0, \"b\": 0, "
              "\"commonPrefix10\": 0, \"commonPrefix2\": 0, \"\xC3\xA9\": 0}");
}

TEST_F(JsonWriter, ManyNames) {
    const ref<Dictionary> dictionary = NewDictionary();
    std::string expected = "{";
    for (unsigned i = 0; i < 1000; ++i) {
        // 7 has no factor in common with 1000, so that every number comes once.
        char name[16];
        std::snprintf(name, sizeof name, "name%03u", i * 7 % 1000);
        dictionary->Add(Text(poolM, name), Bare("0"));
        std::snprintf(name, sizeof name, "name%03u", i);
        expected += std::string(i == 0 ? "" : ", ") + "\"" + name + "\": 0";
    }
    EXPECT_EQ(Write(*dictionary), expected + "}");
}

TEST_F(JsonWriter, NullReferencesAreLeftOut) {
    const ref<ArrayValue> array = NewArray();
    array->Add(ref<DictValue>());
    EXPECT_EQ(Write(*array), "[]");
    EXPECT_EQ(Write(*array, true), "[\n\n]");
    array->Add(Bare("1"));
    array->Add(ref<DictValue>());
    array->Add(Bare("2"));
    array->Add(ref<DictValue>());
    EXPECT_EQ(Write(*array), "[1, 2]");
    EXPECT_EQ(Write(*array, true), "[\n    1, \n    2\n]");
    const ref<Dictionary> dictionary = NewDictionary();
    dictionary->Add(Text(poolM, "b"), ref<DictValue>());
    EXPECT_EQ(Write(*dictionary), "{}");
    EXPECT_EQ(Write(*dictionary, true), "{\n}");
    dictionary->Add(Text(poolM, "a"), Bare("1"));
    dictionary->Add(Text(poolM, "c"), ref<DictValue>());
    dictionary->Add(Text(poolM, "c"), Bare("3"));
    dictionary->Add(Text(poolM, "c"), ref<DictValue>());
    dictionary->Add(Text(poolM, "d"), Bare("4"));
    EXPECT_EQ(Write(*dictionary), R"({"a": 1, "c": 3, "d": 4})");
    EXPECT_EQ(Write(*dictionary, true), "{\n    \"a\": 1, \n    \"c\": 3, \n    \"d\": 4\n}");
}

TEST_F(JsonWriter, LazyValues) {
    const ref<Dictionary> body = NewDictionary();
    body->Add(Text(poolM, "k"), Bare("1"));
    const ref<Dictionary> outer = NewDictionary();
    outer->Add(Text(poolM, "lazy"), LazyDict::FromDictionary(&poolM, body, 0));
    EXPECT_EQ(Write(*outer), R"({"lazy": {"k": 1}})");
    // The body begins again at indentation 0.
    EXPECT_EQ(Write(*outer, true), "{\n    \"lazy\": {\n    \"k\": 1\n}\n}");
    EXPECT_EQ(Write(*ref<LazyDictValue>(new (&poolM) LazyDictValue(ref<LazyDict>()))), "null");
    outer->Add(Text(poolM, "none"), ref<LazyDict>());
    EXPECT_EQ(Write(*outer), R"({"lazy": {"k": 1}, "none": null})");
}

TEST_F(JsonWriter, TextsLongerThanTheWindows) {
    const ref<Dictionary> dictionary = NewDictionary();
    std::string expected = "{";
    for (char c = 'a'; c <= 'z'; ++c) {
        const std::string name(600, c);
        const std::string value(3000u + static_cast<unsigned char>(c), c);
        dictionary->Add(Text(poolM, name), Text(poolM, value));
        expected += (c == 'a' ? "\"" : ", \"") + name + "\": \"" + value + "\"";
    }
    EXPECT_EQ(Write(*dictionary), expected + "}");
}

TEST_F(JsonWriter, ManySmallWritesToOneBufferGrowItInProportion) {
    ByteBuffer buffer(&poolM);
    const ref<StringValue> value = Quoted("0123456789");
    for (unsigned i = 0; i < 100000; ++i) value->ToJson(buffer, JsonFormat(false));
    EXPECT_EQ(buffer.GetLength(), 1200000u);
    EXPECT_LE(buffer.GetCapacity(), 4u * 1200000u);
}

TEST_F(JsonWriter, OnTheGeneralHeap) {
    const ref<Dictionary> dictionary = Dictionary::New(nullptr, RoxString());
    dictionary->Add(RoxString("a"), RoxString("b"));
    EXPECT_EQ(Write(*dictionary), R"({"a": "b"})");
}

TEST_F(JsonWriter, Bytestring) {
    const ref<Dictionary> dictionary = NewDictionary();
    dictionary->Add(Text(poolM, "a"), Text(poolM, std::string_view("x\0y", 3)));
    const ref<rox::ByteBuffer> compact = dictionary->ToBytestring(false);
    const std::string expected = R"({"a": "x\u0000y"})";
    ASSERT_EQ(compact->GetLength(), expected.size());
    EXPECT_EQ(std::memcmp(compact->GetData(), expected.data(), expected.size()), 0);
    EXPECT_EQ(compact->GetMempool(), &poolM);
    const ref<rox::ByteBuffer> pretty = dictionary->ToBytestring(true);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(pretty->GetData()), pretty->GetLength()),
              "{\n    \"a\": \"x\\u0000y\"\n}");
}

/// Takes so many bytes in all, and counts how often it is written to.
class FullSink final : public kelbaselib::Bytesink {
 public:
    explicit FullSink(size_t room) : roomM(room) {}
    unsigned Write(const void* bytes, unsigned count) override {
        ++nWritesM;
        const unsigned n = static_cast<unsigned>(std::min<size_t>(count, roomM));
        textM.append(static_cast<const char*>(bytes), n);
        roomM -= n;
        return n;
    }
    const std::string& GetText() const { return textM; }
    unsigned CountWrites() const { return nWritesM; }

 private:
    std::string textM;
    size_t roomM;
    unsigned nWritesM = 0;
};

TEST_F(JsonWriter, AFullSinkGetsNothingMore) {
    const ref<ArrayValue> array = NewArray();
    for (unsigned i = 0; i < 100; ++i) array->Add(Text(poolM, std::string(500, 'x')));
    const std::string text = Write(*array);
    ASSERT_EQ(text.size(), 2u + 100 * 502 + 99 * 2);
    for (const size_t room : {size_t{0}, size_t{1}, size_t{5000}, text.size() - 1, text.size()}) {
        FullSink sink(room);
        array->ToJson(sink, JsonFormat(false));
        EXPECT_EQ(sink.GetText(), text.substr(0, room));
        // Pieces come until one is not taken whole; a room that ends with a piece costs one write more.
        EXPECT_LE(sink.CountWrites(), room / 3000 + 1) << room;
        EXPECT_GE(sink.CountWrites(), room / 4096 + (room % 4096 != 0 ? 1 : 0)) << room;
    }
    FullSink none(0);
    array->ToJson(none, JsonFormat(false));
    EXPECT_EQ(none.CountWrites(), 1u);
}

}  // namespace
