// Marshalling into sinks, which may refuse anything without the operation's failing.

#include <gtest/gtest.h>

#include <set>

#include "kelbaselib/Bytesink.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "rpc/FramingFixture.h"
#include "rpc/ModelWriter.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

using namespace sorn;

namespace {

/// Keeps what each call brought, and takes nothing, or one byte, of the calls that it is told to refuse.
class ScriptedSink final : public kelbaselib::Bytesink {
 public:
    explicit ScriptedSink(std::set<size_t> refused = {}, unsigned taken = 0)
        : refusedM(std::move(refused)), takenM(taken) {}

    unsigned Write(const void* bytes, unsigned count) override {
        const size_t call = vWrites.size();
        vWrites.emplace_back(static_cast<const char*>(bytes), count);
        nWritesAfterFinish += nFinishes;
        return refusedM.count(call) != 0 ? takenM : count;
    }
    void Finish() override { ++nFinishes; }
    std::string All() const {
        std::string all;
        for (const std::string& write : vWrites) all += write;
        return all;
    }

    std::vector<std::string> vWrites;
    unsigned nFinishes = 0;
    unsigned nWritesAfterFinish = 0;

 private:
    std::set<size_t> refusedM;
    unsigned takenM;
};

constexpr char lineG[] = "ORPC/2 75 9\r\n";
constexpr char headersG[] =
    "Content-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\nType: response\r\n\r\n";
constexpr char bodyG[] = "{\"a\": 42}";

}  // namespace

class MarshalSinkTest : public FramingFixture {
 protected:
    ref<OrvoRpcWrapper> Response(const ref<LazyDict>& body, const ModelHeaders& headers = {}) {
        return ResponseWrapper::New(&pool, 7, true, body, DictOf(headers));
    }
    bool Marshal(const ref<OrvoRpcWrapper>& wrapper, ScriptedSink& sink, std::string& words,
                 bool pretty = false) {
        RoxString error(words.c_str());
        const bool isWritten = OrvoRpcV2::MarshalToBytesink(wrapper, sink, error, &pool, pretty);
        words = Str(error);
        return isWritten;
    }
};

/// The first line, the headers, the body, the end, whatever the sink says.
TEST_F(MarshalSinkTest, Refusals) {
    struct Case {
        std::set<size_t> refused;
        unsigned taken;
        const char* before;
        const char* after;
    };
    const Case cases[] = {
        {{}, 0, "", ""},
        {{}, 0, "x", "x"},
        {{0}, 0, "x", "x"},
        {{1}, 0, "", "Failed to write headers"},
        {{1}, 0, "x", "xFailed to write headers"},
        {{1}, 1, "x", "x"},  // fewer than all, but not none
        {{2}, 0, "x", "x"},
        {{0, 2}, 0, "x", "x"},
        {{0, 1, 2}, 0, "x", "xFailed to write headers"},
        {{0, 1, 2}, 1, "x", "x"},
    };
    const ref<OrvoRpcWrapper> wrapper = Response(BodyOf(bodyG));
    for (const Case& each : cases) {
        ScriptedSink sink(each.refused, each.taken);
        std::string words = each.before;
        EXPECT_TRUE(Marshal(wrapper, sink, words));
        EXPECT_EQ(words, each.after);
        EXPECT_EQ(sink.vWrites, (std::vector<std::string>{lineG, headersG, bodyG}));
        EXPECT_EQ(sink.nFinishes, 1u);
        EXPECT_EQ(sink.nWritesAfterFinish, 0u);
    }
}

TEST_F(MarshalSinkTest, CancelHasNothingBehindTheHeaders) {
    ModelMessage cancel;
    cancel.kind = "cancel";
    cancel.rpcId = 7;
    ScriptedSink sink;
    std::string words;
    EXPECT_TRUE(Marshal(Wrap(cancel), sink, words));
    EXPECT_EQ(sink.All(), "ORPC/2 26 0\r\nRpcId: 7\r\nType: cancel\r\n\r\n");
    EXPECT_EQ(sink.vWrites[0], "ORPC/2 26 0\r\n");
    EXPECT_EQ(sink.vWrites[1], "RpcId: 7\r\nType: cancel\r\n\r\n");
    EXPECT_EQ(sink.nFinishes, 1u);
    EXPECT_EQ(words, "");
}

TEST_F(MarshalSinkTest, NothingReachesTheSinkOfAMessageThatIsTooLarge) {
    struct Case {
        size_t nBody;
        size_t nValue;  ///< of a header "a"
        const char* words;
    };
    // The block of 75 bytes grows by "a: ", the value and its end, which are 5 bytes.
    const size_t atLimit = 1048576 - 75 - 5;
    const Case cases[] = {
        {5242880, 1, ""},
        {5242881, 1, "xOrvo Rpc message body is too large."},
        {2, atLimit, ""},
        {2, atLimit + 1, "xOrvo Rpc headers are too large"},
        {5242880, atLimit, ""},
        {5242880, atLimit + 1, "xOrvo Rpc headers are too large"},
        {5242881, atLimit + 1, "xOrvo Rpc message body is too large."},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(std::to_string(each.nBody) + " " + std::to_string(each.nValue));
        const std::string body(each.nBody, ' ');
        const std::string value(each.nValue, 'v');
        ScriptedSink sink;
        std::string words = "x";
        const bool isTooLarge = *each.words != '\0';
        EXPECT_EQ(Marshal(Response(BodyOf(body), {{"a", {value}}}), sink, words), !isTooLarge);
        EXPECT_EQ(words, isTooLarge ? each.words : "x");
        EXPECT_EQ(sink.nFinishes, isTooLarge ? 0u : 1u);
        if (isTooLarge) {
            EXPECT_TRUE(sink.vWrites.empty());
        } else {
            const std::string block =
                std::string(headersG, sizeof(headersG) - 3) + "a: " + value + "\r\n\r\n";
            EXPECT_TRUE(sink.All() == ModelWriter::Frame(block, body));
        }
    }
}

/// The text is made twice, and the first time's length is right for the second one's bytes: in both styles,
/// of all forms, a stream among them, which is still there behind it.
TEST_F(MarshalSinkTest, BodiesOfAllForms) {
    const std::string json = R"({"type": "recordingSearch", "offset": 3})";
    const ref<LazyDict> text = BodyOf(json);
    ref<SornObject> object;
    ASSERT_TRUE(text->ToSornObject(object));
    RoxString error;
    auto* const stream = new kelbaselib::InMemoryBytestream(&pool);
    stream->Write(json.data(), static_cast<unsigned>(json.size()));
    const ref<LazyDict> bodies[] = {
        text,
        LazyDict::FromDict(&pool, text->ToDict(), 0),
        LazyDict::FromDictionary(&pool, text->ToDictionary(error), 0),
        LazyDict::FromSornObject(&pool, object, 0),
        LazyDict::FromBytestring(&pool, text->ToProtobuf(), 0),
        LazyDict::FromBytesource(&pool, stream, 0),
    };
    for (const ref<LazyDict>& body : bodies) {
        for (const bool pretty : {false, true}) {
            SCOPED_TRACE(std::to_string(body->GetRep()) + (pretty ? " pretty" : ""));
            ScriptedSink alone;
            body->ToJsonBytesink(alone, pretty);
            EXPECT_NE(alone.All().find("recordingSearch"), std::string::npos);
            ScriptedSink sink;
            std::string words;
            EXPECT_TRUE(Marshal(Response(body), sink, words, pretty));
            EXPECT_EQ(sink.All(), ModelWriter::Frame(headersG, alone.All()));
            EXPECT_EQ(sink.nFinishes, 1u);
            EXPECT_EQ(words, "");
        }
    }
}

}  // namespace sorntest
