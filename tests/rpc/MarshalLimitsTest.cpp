// The largest body and the largest header block, and one byte more of each, by all ways to strings.

#include <gtest/gtest.h>

#include "rpc/FramingFixture.h"
#include "rpc/ModelWriter.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

using namespace sorn;

namespace {

constexpr char bodyWordsG[] = "Orvo Rpc message body is too large.";
constexpr char headerWordsG[] = "Orvo Rpc headers are too large";
constexpr char headersG[] =
    "Content-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\nType: response\r\n";

}  // namespace

class MarshalLimitsTest : public FramingFixture {
 protected:
    /// By all forms: the message, or the words behind an "x" with all outputs as they were.
    void Check(const ref<OrvoRpcWrapper>& wrapper, const std::string& expected, const char* words) {
        ByteBuffer out(&pool);
        out.AppendString("there");
        RoxString text("there");
        RoxString error("x");
        RoxString textError("x");
        const bool isGood = *words == '\0';
        EXPECT_EQ(OrvoRpcV2::MarshalToString(wrapper, out, error, &pool, false), isGood);
        EXPECT_EQ(OrvoRpcV2::MarshalToString(wrapper, text, textError, &pool, false), isGood);
        EXPECT_TRUE(Written(wrapper, "x") == (isGood ? expected : Str(error)));
        const std::string wordsAfter = std::string("x") + words;
        EXPECT_EQ(Str(error), wordsAfter);
        EXPECT_EQ(Str(textError), wordsAfter);
        // Comparisons that print no megabytes.
        EXPECT_TRUE(Str(out.ToRoxString(&pool)) == "there" + expected);
        EXPECT_TRUE(Str(text) == (isGood ? expected : "there"));
        EXPECT_TRUE(Str(OrvoRpcV2::MarshalToString(&pool, wrapper, false)) == expected);
    }
    ref<OrvoRpcWrapper> Response(const ref<LazyDict>& body, const ModelHeaders& headers = {}) {
        return ResponseWrapper::New(&pool, 7, true, body, DictOf(headers));
    }
    ref<LazyDict> DictionaryBody(size_t n) {
        const ref<Dict> dict = MakeDict(&pool);
        dict->AddString("a", std::string(n, 'v').c_str());
        return LazyDict::FromDict(&pool, dict, 0);
    }
};

TEST_F(MarshalLimitsTest, Body) {
    const std::string atLimit(5242880, ' ');
    const std::string message = ModelWriter::Frame(std::string(headersG) + "\r\n", atLimit);
    EXPECT_EQ(message.substr(0, 19), "ORPC/2 75 5242880\r\n");
    Check(Response(BodyOf(atLimit)), message, "");
    Check(Response(BodyOf(atLimit + " ")), "", bodyWordsG);
    Check(Response(BodyOf(atLimit + atLimit)), "", bodyWordsG);
}

/// The text counts, not what it is made of: here of a dictionary.
TEST_F(MarshalLimitsTest, BodyThatIsWritten) {
    const size_t nAround = Str(DictionaryBody(0)->ToJson(false)).size();
    const size_t nAtLimit = 5242880 - nAround;
    EXPECT_EQ(Str(DictionaryBody(5)->ToJson(false)).size(), nAround + 5);
    const ref<LazyDict> body = DictionaryBody(nAtLimit);
    Check(Response(body), ModelWriter::Frame(std::string(headersG) + "\r\n", Str(body->ToJson(false))), "");
    Check(Response(DictionaryBody(nAtLimit + 1)), "", bodyWordsG);
}

/// The limit holds in the style asked for.
TEST_F(MarshalLimitsTest, PrettyBody) {
    const size_t nPretty = Str(DictionaryBody(0)->ToJson(true)).size();
    const size_t nCompact = Str(DictionaryBody(0)->ToJson(false)).size();
    ASSERT_GT(nPretty, nCompact);
    const ref<OrvoRpcWrapper> wrapper = Response(DictionaryBody(5242880 - nCompact));
    RoxString error;
    RoxString out;
    EXPECT_FALSE(OrvoRpcV2::MarshalToString(wrapper, out, error, &pool, true));
    EXPECT_EQ(Str(error), bodyWordsG);
    EXPECT_TRUE(OrvoRpcV2::MarshalToString(wrapper, out, error, &pool, false));
}

TEST_F(MarshalLimitsTest, HeaderBlock) {
    // The 73 bytes of the lines, "a: " and the value with its end, and the empty line.
    const std::string value(1048576 - 73 - 5 - 2, 'v');
    const std::string block = std::string(headersG) + "a: " + value + "\r\n\r\n";
    ASSERT_EQ(block.size(), 1048576u);
    Check(Response(BodyOf("{}"), {{"a", {value}}}), "ORPC/2 1048576 2\r\n" + block + "{}", "");
    Check(Response(BodyOf("{}"), {{"a", {value + "v"}}}), "", headerWordsG);
    Check(Response(BodyOf("{}"), {{"ab", {value}}}), "", headerWordsG);
    Check(Response(BodyOf("{}"), {{"a", {value, ""}}}), "", headerWordsG);
}

/// Without optional headers, too, where a type's name is what grows: 131 - 15 bytes stand around it.
TEST_F(MarshalLimitsTest, HeaderBlockOfReservedHeaders) {
    for (const size_t nMore : {0u, 1u}) {
        const std::string type(1048576 - 116 + nMore, 't');
        const ref<OrvoRpcWrapper> wrapper = RequestWrapper::New(
            &pool, 7, Text(type), RequestWrapper::RESPONSE_COUNT_SINGLE, 42, BodyOf("{}"), nullptr);
        Check(wrapper,
              nMore != 0 ? ""
                         : "ORPC/2 1048576 2\r\nContent-Type: application/json\r\nRequestType: " + type +
                               "\r\nResponseCount: single\r\nRpcId: 7\r\nSchemaVersion: 42\r\n"
                               "Type: request\r\n\r\n{}",
              nMore != 0 ? headerWordsG : "");
    }
}

TEST_F(MarshalLimitsTest, Both) {
    const std::string atLimit(5242880, ' ');
    const std::string value(1048576 - 80, 'v');
    const ref<OrvoRpcWrapper> largest = Response(BodyOf(atLimit), {{"a", {value}}});
    const std::string message =
        "ORPC/2 1048576 5242880\r\n" + std::string(headersG) + "a: " + value + "\r\n\r\n" + atLimit;
    Check(largest, message, "");
    EXPECT_TRUE(ByLibrary(message) == "read: " + Look(*largest).Describe());
    Check(Response(BodyOf(atLimit + " "), {{"a", {value + "v"}}}), "", bodyWordsG);
    Check(Response(BodyOf(atLimit), {{"a", {value + "v"}}}), "", headerWordsG);
}

/// Names are counted in 16 bits: a message that had to go without some of its headers does not go. Among
/// these are the reserved ones, which stand behind digits.
TEST_F(MarshalLimitsTest, Names) {
    struct Case {
        unsigned nNames;
        bool isTaken;
    };
    for (const Case& each :
         {Case{65531, true}, {65532, false}, {65535, false}, {65536, false}, {70000, false}}) {
        ModelMessage message;
        message.kind = "response";
        message.rpcId = 7;
        message.isFinal = true;
        message.contentType = "application/json";
        message.body = "{}";
        for (unsigned i = 0; i < each.nNames; ++i) message.optional[std::to_string(100000 + i)] = {""};
        std::string expected;
        std::string words;
        ASSERT_TRUE(ModelWriter::Write(message, expected, words));
        EXPECT_TRUE(Written(Wrap(message)) == (each.isTaken ? expected : headerWordsG)) << each.nNames;
    }
    // Where the optional names have the reserved ones among them, they alone count.
    for (const unsigned nNames : {65531u, 65532u, 70000u}) {
        ModelHeaders headers = {{"Content-Type", {""}}, {"IsFinal", {""}}, {"RpcId", {""}}, {"Type", {""}}};
        for (unsigned i = 0; i < nNames; ++i) headers["z" + std::to_string(100000 + i)] = {""};
        const std::string written = Written(Response(BodyOf("{}"), headers));
        EXPECT_EQ(written == headerWordsG, nNames != 65531) << nNames;
    }
}

/// A failure is one of the message, not of the wrapper.
TEST_F(MarshalLimitsTest, TheWrapperStays) {
    const ref<OrvoRpcWrapper> wrapper = Response(BodyOf(std::string(5242881, ' ')), {{"a", {"b"}}});
    const std::string before = Look(*wrapper).Describe();
    Check(wrapper, "", bodyWordsG);
    EXPECT_TRUE(Look(*wrapper).Describe() == before);
}

}  // namespace sorntest
