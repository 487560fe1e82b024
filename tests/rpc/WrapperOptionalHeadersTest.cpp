// Optional headers that are set and added: which names are reserved for whom, what is shared.

#include <string>

#include "rpc/WrapperFixture.h"

namespace sorntest {

using namespace sorn;

class WrapperOptionalHeadersTest : public WrapperFixture {
 protected:
    /// What each of the operations does about a name: whether setting removes it, and adding refuses it.
    template <class Wrapper>
    std::string Answers(const ref<Wrapper>& wrapper, const std::string& name) {
        const RoxString text =
            RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(name.size()), name.data());
        const ref<Dict> given = MakeDict(&pool);
        given->AddString(text, "1");
        given->AddString(text, "2");
        given->AddString("kept", "3");
        wrapper->SetOptionalHeaders(given);
        EXPECT_EQ(wrapper->GetOptionalHeaders(), given);
        EXPECT_EQ(Text(given->GetString("kept", 0)), "3");
        const unsigned nValues = given->CountValues(text);
        EXPECT_EQ(nValues != 2, nValues == 0) << "all values of a name or none";
        EXPECT_EQ(Wrapper::FReserved(text.View()), nValues == 0);

        const ref<Dict> fresh = MakeDict(&pool);
        wrapper->SetOptionalHeaders(fresh);
        const bool isAdded = wrapper->AddOptionalHeader(text, "4");
        EXPECT_EQ(JsonOf(fresh) != "{}", isAdded);
        EXPECT_EQ(fresh->CountValues(text), isAdded ? 1u : 0u);
        EXPECT_EQ(Text(fresh->GetString(text, 0)), isAdded ? "4" : "");
        return std::string(nValues == 0 ? "removed" : "kept") + (isAdded ? " added" : " refused");
    }
};

TEST_F(WrapperOptionalHeadersTest, ReservedNames) {
    const char* const reserved = "removed refused";
    const char* const half = "removed added";
    const char* const open = "kept added";
    struct Row {
        std::string name;
        const char* ofRequests;
        const char* ofResponses;
    };
    const Row vRows[] = {
        {"RequestType", reserved, open},
        {"SchemaVersion", reserved, open},
        {"ResponseCount", reserved, open},
        {"Type", reserved, reserved},
        {"type", half, open},
        {"RpcId", reserved, reserved},
        {"Content-Type", reserved, reserved},
        {"IsFinal", open, reserved},
        // Exactly, in case and length.
        {"requesttype", open, open},
        {"schemaVersion", open, open},
        {"RESPONSECOUNT", open, open},
        {"TYPE", open, open},
        {"rpcId", open, open},
        {"Content-type", open, open},
        {"ContentType", open, open},
        {"isFinal", open, open},
        {"Typ", open, open},
        {"Type ", open, open},
        {" Type", open, open},
        {std::string("Type\0", 5), open, open},
        {std::string("Type\0x", 6), open, open},
        {"", open, open},
        {"Body", open, open},
    };
    for (const Row& row : vRows) {
        EXPECT_EQ(Answers(Request(), row.name), row.ofRequests) << row.name;
        EXPECT_EQ(Answers(Update(), row.name), row.ofRequests) << row.name;
        EXPECT_EQ(Answers(Response(), row.name), row.ofResponses) << row.name;
    }
}

TEST_F(WrapperOptionalHeadersTest, SettingReplacesAndEmptiesWhatTheCallerHolds) {
    const char* const json =
        R"({"A": "1", "Content-Type": "x", "IsFinal": "x", "RequestType": ["x", "y"], "ResponseCount": "x", )"
        R"("RpcId": "x", "SchemaVersion": "x", "Type": "x", "type": "x"})";
    const ref<Dict> old = Headers(R"({"Old": "1"})");
    const ref<Dict> given = Headers(json);
    const ref<RequestWrapper> request = Request(old);
    request->SetOptionalHeaders(given);
    EXPECT_EQ(request->GetOptionalHeaders(), given);
    EXPECT_EQ(JsonOf(given), R"({"A": "1", "IsFinal": "x"})");
    EXPECT_EQ(JsonOf(old), R"({"Old": "1"})");
    EXPECT_EQ(old->GetRefCount(), 1u);

    const ref<Dict> others = Headers(json);
    const ref<ResponseWrapper> response = Response(old);
    response->SetOptionalHeaders(others);
    EXPECT_EQ(response->GetOptionalHeaders(), others);
    EXPECT_EQ(JsonOf(others), R"({"A": "1", "RequestType": ["x", "y"], "ResponseCount": "x", )"
                              R"("SchemaVersion": "x", "type": "x"})");
    EXPECT_EQ(JsonOf(old), R"({"Old": "1"})");
}

TEST_F(WrapperOptionalHeadersTest, SettingADictionaryWrapsIt) {
    const ref<Dictionary> given = Parse(R"({"A": "1", "RpcId": "x", "type": "x"})");
    const ref<RequestWrapper> request = Request();
    request->SetOptionalHeaders(given);
    EXPECT_EQ(request->GetOptionalHeadersDictionary(), given);
    EXPECT_EQ(request->GetOptionalHeaders()->GetMempool(), &pool);
    EXPECT_EQ(Text(given->ToJson(false)), R"({"A": "1"})");

    const ref<Dictionary> others = Parse(R"({"A": "1", "RpcId": "x", "type": "x"})");
    const ref<ResponseWrapper> response = Response();
    response->SetOptionalHeaders(others);
    EXPECT_EQ(response->GetOptionalHeadersDictionary(), others);
    EXPECT_EQ(Text(others->ToJson(false)), R"({"A": "1", "type": "x"})");
}

TEST_F(WrapperOptionalHeadersTest, AddingGoesIntoTheSharedDictionary) {
    const ref<Dict> headers = Headers(R"({"A": "1"})");
    const ref<RequestWrapper> request = Request(headers);
    const ref<ResponseWrapper> response = Response(headers);
    EXPECT_TRUE(request->AddOptionalHeader("A", "2"));
    EXPECT_TRUE(response->AddOptionalHeader("B", ""));
    EXPECT_FALSE(request->AddOptionalHeader("Type", "3"));
    EXPECT_FALSE(response->AddOptionalHeader("IsFinal", "3"));
    EXPECT_EQ(JsonOf(headers), R"({"A": ["1", "2"], "B": ""})");
    EXPECT_EQ(request->GetOptionalHeaders(), headers);
    EXPECT_EQ(response->GetOptionalHeaders(), headers);
}

TEST_F(WrapperOptionalHeadersTest, AddedTypeOfARequestIsAHeader) {
    const ref<RequestWrapper> request = Request();
    EXPECT_TRUE(request->AddOptionalHeader("type", "small"));
    const ref<Dict> headers = request->HeadersToDict(&pool);
    EXPECT_EQ(Text(headers->GetString("type", 0)), "small");
    EXPECT_EQ(headers->CountValues("Type"), 1u);
    request->SetOptionalHeaders(request->GetOptionalHeaders());
    EXPECT_EQ(JsonOf(request->GetOptionalHeaders()), "{}");
}

TEST_F(WrapperOptionalHeadersTest, OneNameTakesAsManyValuesAsAContainerHolds) {
    const ref<ResponseWrapper> response = Response();
    const RoxString name(&pool, "A");
    const RoxString value(&pool, "v");
    for (unsigned i = 0; i < 65535; ++i) ASSERT_TRUE(response->AddOptionalHeader(name, value)) << i;
    EXPECT_FALSE(response->AddOptionalHeader(name, value));
    EXPECT_EQ(response->GetOptionalHeaders()->CountValues("A"), 65535u);
    EXPECT_TRUE(response->AddOptionalHeader("B", value));
}

}  // namespace sorntest
