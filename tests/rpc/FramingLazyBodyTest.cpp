// Framing neither parses nor converts a body that nobody asks for, and copies it no more than it must.
// Invariants for untrusted input: 4, 9, 11.

#include <gtest/gtest.h>

#include <memory>

#include "kelbaselib/Bytesink.h"
#include "rpc/FramingFixture.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "sornschema/Error.h"

namespace sorntest {

using namespace sorn;
using namespace std::string_literals;

namespace {

constexpr size_t bigG = 2 << 20;
constexpr size_t smallG = 16 << 10;

/// Counts the writes and remembers where the largest one lay.
class AddressSink final : public kelbaselib::Bytesink {
 public:
    unsigned Write(const void* bytes, unsigned count) override {
        if (count > nLargest) {
            nLargest = count;
            largest = bytes;
        }
        return count;
    }
    unsigned nLargest = 0;
    const void* largest = nullptr;
};

}  // namespace

class FramingLazyBodyTest : public FramingFixture {
 protected:
    /// Text that is no JSON from its first byte on, and opens as lazy text does.
    static std::string Broken(size_t n) {
        std::string text = "{]\r\n\r\nORPC/2 5 5\r\n";
        text.resize(n, '\xFF');
        return text;
    }
    /// What `work` takes of the pool at its height, beyond what is there. Nothing may have been higher
    /// before.
    template <class Work>
    static size_t Peak(RoxMempool& fresh, Work work) {
        const size_t before = fresh.GetUsedBytes();
        work();
        return fresh.GetUsedBytesHighWater() - before;
    }
    static ref<OrvoRpcWrapper> Response(RoxMempool* in, const std::string& body) {
        const ref<rox::ByteBuffer> bytes =
            rox::ByteBuffer::New(in, body.data(), static_cast<uint32_t>(body.size()));
        return ResponseWrapper::New(in, 7, true, LazyDict::FromBytestring(in, bytes, 0), nullptr);
    }
    static const rox::ByteBuffer& BytesOf(const ref<OrvoRpcWrapper>& wrapper) {
        if (auto* const response = dynamic_cast<ResponseWrapper*>(wrapper.get())) {
            return *response->GetBody()->GetStoredBytes();
        }
        return *dynamic_cast<RequestWrapper&>(*wrapper).GetBody()->GetStoredBytes();
    }
};

TEST_F(FramingLazyBodyTest, BrokenTextGoesThroughUnchanged) {
    for (const std::string& body :
         {Broken(40), "{"s, " "s, "{\"a\": \0"s, " \xC3"s, std::string(1000, '{')}) {
        for (const char* kind : {"request", "requestUpdate", "response"}) {
            ModelMessage message;
            message.kind = kind;
            message.requestType = "t";
            message.responseCount = kind[7] == '\0' ? "single" : "multiple";
            message.contentType = "application/json";
            message.body = body;
            const std::string bytes = Written(Wrap(message));
            EXPECT_EQ(bytes.substr(bytes.size() - body.size()), body);
            EXPECT_EQ(ByLibrary(bytes), "read: " + message.Describe());
            RoxString error;
            const ref<OrvoRpcWrapper> read = OrvoRpcV2::UnmarshalFromString(&pool, Text(bytes), false, error);
            ASSERT_NE(read, nullptr);
            EXPECT_EQ(Written(read), bytes);
            // Who asks for an object is told, and the body stays as it was.
            if (auto* const response = dynamic_cast<ResponseWrapper*>(read.get())) {
                EXPECT_EQ(response->UnmarshalToSornObject(), nullptr);
            }
            EXPECT_EQ(Written(read), bytes);
        }
    }
}

TEST_F(FramingLazyBodyTest, MarshallingTakesOneCopyInTheMessage) {
    const std::string body = Broken(bigG);
    RoxMempool bodies("bodies");
    const ref<OrvoRpcWrapper> wrapper = Response(&bodies, body);
    const size_t nBefore = bodies.GetUsedBytes();
    const size_t nHighBefore = bodies.GetUsedBytesHighWater();
    RoxString error;
    {
        RoxMempool fresh("string");
        RoxString text;
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToString(wrapper, text, error, &fresh, false); }),
                  bigG + smallG);
        EXPECT_EQ(text.NByte(), bigG + sizeof("ORPC/2 75 2097152\r\n") - 1 + 75);
    }
    {
        RoxMempool fresh("string without words");
        RoxString text;
        EXPECT_LT(Peak(fresh, [&] { text = OrvoRpcV2::MarshalToString(&fresh, wrapper, false); }),
                  bigG + smallG);
        EXPECT_EQ(text.NByte(), bigG + sizeof("ORPC/2 75 2097152\r\n") - 1 + 75);
    }
    {
        // A buffer with room enough: nothing but scratch.
        RoxMempool fresh("buffer");
        ByteBuffer out(&pool);
        out.Reserve(bigG + smallG);
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToString(wrapper, out, error, &fresh, false); }),
                  smallG);
        EXPECT_EQ(out.GetLength(), bigG + sizeof("ORPC/2 75 2097152\r\n") - 1 + 75);
    }
    {
        RoxMempool fresh("in place");
        ByteBuffer out(&pool);
        out.Reserve(bigG + smallG);
        unsigned begin = 0;
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalInPlace(wrapper, out, begin, error, &fresh); }),
                  smallG);
        EXPECT_EQ(out.GetLength() - begin, bigG + sizeof("ORPC/2 75 2097152\r\n") - 1 + 75);
    }
    {
        RoxMempool fresh("sink");
        AddressSink sink;
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToBytesink(wrapper, sink, error, &fresh, false); }),
                  smallG);
        EXPECT_EQ(sink.nLargest, bigG);
        EXPECT_EQ(sink.largest, BytesOf(wrapper).GetData());  // the body's own bytes
    }
    EXPECT_TRUE(error.FEmpty());
    EXPECT_EQ(bodies.GetUsedBytes(), nBefore);
    EXPECT_EQ(bodies.GetUsedBytesHighWater(), nHighBefore);
}

/// Optional headers change nothing of that, and too large a body costs nothing at all.
TEST_F(FramingLazyBodyTest, MarshallingWithOptionalHeaders) {
    const ref<OrvoRpcWrapper> wrapper = Response(&pool, Broken(bigG));
    dynamic_cast<ResponseWrapper&>(*wrapper).AddOptionalHeader(Text("Accept"), Text("x"));
    RoxString error;
    {
        RoxMempool fresh("string");
        RoxString text;
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToString(wrapper, text, error, &fresh, false); }),
                  bigG + smallG);
    }
    const ref<OrvoRpcWrapper> tooLarge = Response(&pool, Broken(5242881));
    RoxMempool fresh("refused");
    RoxString text;
    EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToString(tooLarge, text, error, &fresh, false); }), smallG);
    EXPECT_EQ(Str(error), "Orvo Rpc message body is too large.");
}

/// A text in the message's pool, or on the general heap: the body's bytes are the text's.
TEST_F(FramingLazyBodyTest, UnmarshallingSharesTheText) {
    const std::string body = Broken(bigG);
    for (const char* type : {"request", "requestUpdate", "response"}) {
        const std::string input =
            Framed({"RpcId: 7", std::string("Type: ") + type, "RequestType: t", "ResponseCount: none"}, body);
        for (const bool isHeap : {false, true}) {
            RoxMempool fresh("message");
            RoxString text = TextIn(isHeap ? nullptr : &fresh, input);
            const char* const place = text.Utf8() + (input.size() - body.size());
            ref<OrvoRpcWrapper> wrapper;
            RoxString error;
            EXPECT_LT(
                Peak(fresh, [&] { wrapper = OrvoRpcV2::UnmarshalFromString(&fresh, text, false, error); }),
                smallG);
            ASSERT_NE(wrapper, nullptr);
            EXPECT_EQ(static_cast<const void*>(BytesOf(wrapper).GetData()), place);
            // The body holds the text.
            text = RoxString();
            EXPECT_TRUE(Str(BytesOf(wrapper)) == body);
            wrapper = nullptr;
            EXPECT_EQ(fresh.GetUsedBytes(), 0u);
        }
    }
}

/// A body that is an object is written into the message, and nowhere else.
TEST_F(FramingLazyBodyTest, MarshallingInPlaceWritesAnObjectOnce) {
    const ref<SornObject> object = sornschema::Error::Factory(&pool);
    static_cast<sornschema::Error&>(*object).text = Text(std::string(bigG, 'x'));
    const ref<OrvoRpcWrapper> wrapper = ResponseWrapper::New(&pool, 7, true, object, OrvoVersion(), nullptr);
    RoxMempool fresh("scratch");
    ByteBuffer out(&pool);
    out.Reserve(bigG + smallG);
    const unsigned char* const place = out.GetData();
    const size_t before = pool.GetUsedBytes();
    unsigned begin = 0;
    RoxString error;
    EXPECT_LT(
        Peak(fresh, [&] { EXPECT_TRUE(OrvoRpcV2::MarshalInPlace(wrapper, out, begin, error, &fresh)); }),
        smallG);
    EXPECT_EQ(out.GetData(), place);
    EXPECT_EQ(pool.GetUsedBytes(), before);
    EXPECT_TRUE(Str(out.ToRoxString(&pool)).substr(begin) == Written(wrapper));
}

/// The body's bytes are those of the buffer, which it holds, and with it whatever that keeps.
TEST_F(FramingLazyBodyTest, UnmarshallingSharesTheBytes) {
    const std::string body = Broken(bigG);
    const std::string input = Framed({"RpcId: 7", "Type: response"}, body);
    const ref<rox::ByteBuffer> storage = Bytes(input);
    for (const bool isKept : {false, true}) {
        ref<rox::ByteBuffer> bytes =
            isKept ? rox::ByteBuffer::NewKept(&pool, storage, storage->GetData(), storage->GetLength())
                   : Bytes(input);
        const unsigned char* const place = bytes->GetData() + (input.size() - body.size());
        RoxMempool fresh("message");
        ref<OrvoRpcWrapper> wrapper;
        RoxString error;
        EXPECT_LT(Peak(fresh, [&] { wrapper = OrvoRpcV2::UnmarshalFromBytes(&fresh, bytes, false, error); }),
                  smallG);
        ASSERT_NE(wrapper, nullptr);
        EXPECT_EQ(BytesOf(wrapper).GetData(), place);
        bytes = nullptr;
        EXPECT_TRUE(Str(BytesOf(wrapper)) == body);
        wrapper = nullptr;
        EXPECT_EQ(fresh.GetUsedBytes(), 0u);
    }
}

/// A text in another pool, which may die first: a copy.
TEST_F(FramingLazyBodyTest, UnmarshallingCopiesFromAnotherPool) {
    const std::string body = Broken(bigG);
    const std::string input = Framed({"RpcId: 7", "Type: response", "Accept: x"}, body);
    for (const bool isHeapMessage : {false, true}) {
        RoxMempool* const target = isHeapMessage ? nullptr : &pool;
        ref<OrvoRpcWrapper> wrapper;
        {
            auto other = std::make_unique<RoxMempool>("text");
            const RoxString text = TextIn(other.get(), input);
            RoxString error;
            const size_t before = pool.GetUsedBytes();
            wrapper = OrvoRpcV2::UnmarshalFromString(target, text, false, error);
            ASSERT_NE(wrapper, nullptr);
            EXPECT_LT(pool.GetUsedBytes() - before, bigG + smallG);
            const auto* const data = reinterpret_cast<const char*>(BytesOf(wrapper).GetData());
            EXPECT_TRUE(data + bigG <= text.Utf8() || data >= text.Utf8() + text.NByte());
        }
        EXPECT_EQ(Look(*wrapper).optional, (ModelHeaders{{"Accept", {"x"}}}));
        EXPECT_TRUE(Str(BytesOf(wrapper)) == body);
    }
}

/// The same buffer from reading to writing again: a message passed on costs the new message.
TEST_F(FramingLazyBodyTest, PassedOn) {
    const std::string body = Broken(bigG);
    const std::string input =
        Framed({"Content-Type: ", "IsFinal: false", "RpcId: 7", "Type: response"}, body);
    RoxMempool fresh("passed on");
    RoxString error;
    RoxString text = TextIn(&fresh, input);
    const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(&fresh, text, false, error);
    AddressSink sink;
    EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToBytesink(wrapper, sink, error, &fresh, false); }),
              smallG);
    EXPECT_EQ(sink.largest, text.Utf8() + (input.size() - body.size()));
    RoxString again;
    EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::MarshalToString(wrapper, again, error, &fresh, false); }),
              bigG + smallG);
    EXPECT_TRUE(Str(again) == input);
}

/// A refusal at the last step has copied no body either.
TEST_F(FramingLazyBodyTest, RefusalsCostNoBody) {
    const std::string body = Broken(bigG);
    for (const char* type : {"cancel", "request", "requestUpdate", "x", ""}) {
        const RoxString text = Text(Framed({"RpcId: 7", std::string("Type: ") + type}, body));
        RoxMempool fresh("refused");
        RoxString error;
        EXPECT_LT(Peak(fresh, [&] { OrvoRpcV2::UnmarshalFromString(&fresh, text, false, error); }), smallG);
        EXPECT_EQ(fresh.GetUsedBytes(), 0u);
        EXPECT_FALSE(error.FEmpty());
    }
}

}  // namespace sorntest
