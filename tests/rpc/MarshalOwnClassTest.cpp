// Messages of a program's own classes: framing goes by their virtual operations.

#include <gtest/gtest.h>

#include "kelbaselib/Bytesink.h"
#include "kelbaselib/InMemoryBytestream.h"
#include "rpc/FramingFixture.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/rpc/ResponseWrapper.h"

namespace sorntest {

using namespace sorn;

namespace {

class OwnWrapper final : public OrvoRpcWrapper {
 public:
    OwnWrapper() : OrvoRpcWrapper(7, 42) {}
    RoxString GetTypeName() override { return "own"; }
    ref<Dict> HeadersToDict(RoxMempool* pool) const override {
        ref<Dict> headers = MakeDict(pool);
        headers->AddString("b", "2");
        headers->AddString("B", "1");
        headers->AddString("b", "3");
        return headers;
    }
    RoxString BodyToJson(bool pretty) override { return pretty ? "[ ]" : "[]"; }
    void BodyToJsonByteBuffer(ByteBuffer& out, bool pretty) override { out.AppendText(BodyToJson(pretty)); }
    void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool pretty) override {
        const RoxString text = BodyToJson(pretty);
        out.Write(text.Utf8(), text.NByte());
    }
};

/// A response that says more in its headers, and another body than it holds.
class OwnResponse final : public ResponseWrapper {
 public:
    explicit OwnResponse(const ref<LazyDict>& body) : ResponseWrapper(7, true, body, nullptr) {}
    ref<Dict> HeadersToDict(RoxMempool* pool) const override {
        ref<Dict> headers = ResponseWrapper::HeadersToDict(pool);
        headers->AddString("Accept", "x");
        return headers;
    }
    void BodyToJsonByteBuffer(ByteBuffer& out, bool) override { out.AppendLiteral("{other}"); }
    void BodyToJsonByteSink(kelbaselib::Bytesink& out, bool) override { out.Write("{other}", 7); }
};

}  // namespace

class MarshalOwnClassTest : public FramingFixture {
 protected:
    void Check(const ref<OrvoRpcWrapper>& wrapper, bool pretty, const std::string& expected) {
        RoxString error;
        ByteBuffer out(&pool);
        EXPECT_TRUE(OrvoRpcV2::MarshalToString(wrapper, out, error, &pool, pretty));
        EXPECT_EQ(Str(out.ToRoxString(&pool)), expected);
        EXPECT_EQ(Str(OrvoRpcV2::MarshalToString(&pool, wrapper, pretty)), expected);
        kelbaselib::InMemoryBytestream sink(&pool);
        EXPECT_TRUE(OrvoRpcV2::MarshalToBytesink(wrapper, sink, error, &pool, pretty));
        EXPECT_EQ(std::string(reinterpret_cast<const char*>(sink.GetData()), sink.GetLength()), expected);
        EXPECT_TRUE(error.FEmpty());
    }
};

TEST_F(MarshalOwnClassTest, OfNoKindOfTheLibrary) {
    const ref<OrvoRpcWrapper> wrapper(new (&pool) OwnWrapper);
    Check(wrapper, false, "ORPC/2 20 2\r\nB: 1\r\nb: 2\r\nb: 3\r\n\r\n[]");
    Check(wrapper, true, "ORPC/2 20 3\r\nB: 1\r\nb: 2\r\nb: 3\r\n\r\n[ ]");
}

TEST_F(MarshalOwnClassTest, DerivedFromOne) {
    const ref<OrvoRpcWrapper> wrapper(new (&pool) OwnResponse(BodyOf("{}")));
    Check(wrapper, false,
          "ORPC/2 86 7\r\nAccept: x\r\nContent-Type: application/json\r\nIsFinal: true\r\nRpcId: 7\r\n"
          "Type: response\r\n\r\n{other}");
}

}  // namespace sorntest
