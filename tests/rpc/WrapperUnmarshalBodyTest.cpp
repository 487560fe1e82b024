// Bodies that become objects, and what is left when they do not.

#include <string>

#include "lazy/TextSource.h"
#include "rox/RoxFeatures.h"
#include "rpc/WrapperFixture.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sornschema/EveryTypeCompanion.h"

namespace sorntest {

using namespace sorn;

class WrapperUnmarshalBodyTest : public WrapperFixture {
 protected:
    void TearDown() override {
        RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, false);
        WrapperFixture::TearDown();
    }
    ref<LazyDict> OfBytes(const std::string& bytes) {
        return LazyDict::FromBytestring(
            &pool, rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size())), 0);
    }
    /// That the wrapper's body is the result, at a version, in a new LazyDict of the wrapper's pool.
    template <class Wrapper>
    void ExpectTaken(const ref<Wrapper>& wrapper, const ref<SornObject>& result, const ref<LazyDict>& before,
                     int version) {
        ASSERT_NE(result, nullptr);
        EXPECT_EQ(Text(result->ToString(false, 0)), bodySortedG);
        const ref<LazyDict>& body = wrapper->GetBody();
        EXPECT_NE(body, before);
        EXPECT_EQ(body->GetRep(), LazyDict::REP_OBJECT);
        EXPECT_EQ(body->GetStoredObject(), result);
        EXPECT_EQ(body->GetVersion().Number(), version);
        EXPECT_EQ(body->GetMempool(), wrapper->GetMempool());
    }
};

TEST_F(WrapperUnmarshalBodyTest, RequestKeepsItsType) {
    const ref<LazyDict> before = Body(bodyTextG, 9);
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 7, "other", RequestWrapper::RESPONSE_COUNT_SINGLE, 26, before, nullptr);
    ExpectTaken(request, request->UnmarshalToSornObject(), before, 26);
    EXPECT_EQ(Text(request->GetTypeName()), "other");
    EXPECT_EQ(before->GetRep(), LazyDict::REP_JSON);
    EXPECT_EQ(before->GetVersion().Number(), 9);
    // Once more: the same object, and no conversion.
    const ref<LazyDict> again = request->GetBody();
    EXPECT_EQ(request->UnmarshalToSornObject(), again->GetStoredObject());
}

TEST_F(WrapperUnmarshalBodyTest, ResponseTakesTheNameOfTheType) {
    const ref<LazyDict> before = Body(bodyTextG, 26);
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, before, nullptr);
    EXPECT_EQ(Text(response->GetTypeName()), "response");
    ExpectTaken(response, response->UnmarshalToSornObject(), before, 26);
    EXPECT_EQ(Text(response->GetTypeName()), "everyTypeCompanion");
}

TEST_F(WrapperUnmarshalBodyTest, OfAnUpdateWithoutVersion) {
    const ref<LazyDict> before = Body(bodyTextG, 26);
    const ref<RequestUpdateWrapper> update = RequestUpdateWrapper::New(&pool, 7, "t", before, nullptr);
    ExpectTaken(update, update->UnmarshalToSornObject(), before, 0);
}

TEST_F(WrapperUnmarshalBodyTest, TheNewBodyIsInTheMessagesPool) {
    RoxMempool others("bodies");
    {
        const ref<LazyDict> before = LazyDict::FromJsonString(&others, bodyTextG, 26);
        const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, before, nullptr);
        const ref<SornObject> object = response->UnmarshalToSornObject();
        ExpectTaken(response, object, before, 26);
        EXPECT_EQ(object->GetMempool(), &others);
    }
    EXPECT_EQ(others.GetUsedBytes(), 0u);
}

TEST_F(WrapperUnmarshalBodyTest, TheObjectOfAnObjectBodyIsShared) {
    const ref<SornObject> object = Object(bodySortedG);
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 7, RequestWrapper::RESPONSE_COUNT_SINGLE, 26, object, nullptr);
    EXPECT_EQ(request->UnmarshalToSornObject(), object);
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, object, 26, nullptr);
    RoxString error;
    EXPECT_EQ(response->UnmarshalToSornObject(), object);
    EXPECT_EQ(response->UnmarshalToSornObject(9, error), object);
    EXPECT_EQ(response->GetBody()->GetVersion().Number(), 26);
}

TEST_F(WrapperUnmarshalBodyTest, AStream) {
    TextSource::Counts counts;
    {
        const ref<LazyDict> before = LazyDict::FromBytesource(&pool, new TextSource(counts, bodyTextG), 26);
        const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, before, nullptr);
        ExpectTaken(response, response->UnmarshalToSornObject(), before, 26);
        EXPECT_EQ(counts.newSources, 1);
    }
    EXPECT_EQ(counts.releases, 2);
}

TEST_F(WrapperUnmarshalBodyTest, AFailureLeavesTheMessageAsItWas) {
    // Two bytes of a known dict of struct 5919 (47354 = FA F1 02) that ends too soon.
    for (const char* text : {"{", "{}", R"({"type":"nosuch"})",
                             R"({"type":"everyTypeCompanion","number":"x"})", "\xFA\xF1\x02\x01"}) {
        const ref<LazyDict> body = OfBytes(text);
        const ref<RequestWrapper> request =
            RequestWrapper::New(&pool, 7, "asked", RequestWrapper::RESPONSE_COUNT_SINGLE, 26, body, nullptr);
        const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, body, nullptr);
        EXPECT_EQ(request->UnmarshalToSornObject(), nullptr) << text;
        EXPECT_EQ(response->UnmarshalToSornObject(), nullptr) << text;
        EXPECT_EQ(request->GetBody(), body);
        EXPECT_EQ(response->GetBody(), body);
        EXPECT_EQ(std::string(reinterpret_cast<const char*>(body->GetStoredBytes()->GetData()),
                              body->GetStoredBytes()->GetLength()),
                  text);
        EXPECT_EQ(body->GetVersion().Number(), 0);
        EXPECT_EQ(Text(request->GetTypeName()), "asked");
        EXPECT_EQ(Text(response->GetTypeName()), "response");
    }
}

TEST_F(WrapperUnmarshalBodyTest, TheVersionIsGivenToTheOldBodyAndNotToTheNew) {
    const ref<LazyDict> before = Body(bodyTextG, 26);
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, before, nullptr);
    RoxString error;
    ExpectTaken(response, response->UnmarshalToSornObject(9, error), before, 26);
    EXPECT_TRUE(error.FEmpty());
    EXPECT_EQ(before->GetVersion().Number(), 9);
    EXPECT_EQ(response->GetOrvoVersion().Number(), 26);
    EXPECT_EQ(Text(response->GetTypeName()), "everyTypeCompanion");
}

TEST_F(WrapperUnmarshalBodyTest, VersionAndWords) {
    // A plain record requires its id whenever a version is stated. '+' is the character of the number 43.
    struct Row {
        const char* json;
        int version;
        const char* words;
    };
    const Row vRows[] = {
        {R"({"type":"everyTypePlain"})", 0, nullptr},
        {R"({"type":"everyTypePlain"})", 26, "Required field not set: plainId"},
        {R"({"type":"everyTypePlain","plainId":"1"})", 26, nullptr},
        {R"({"type":"everyTypePlain","plainId":"1"})", 43,
         "Unmarshaling to SornObject: given orvo version is out of range used in code generation: +"},
        {R"({"type":"nosuch"})", 26, "no such structure type: nosuch"},
        {R"({"plainId":"1"})", 26, "Dictionary has no 'type' field."},
        {R"({"type":"everyTypeCompanion","number":"x"})", 7,
         "Cannot convert field. Bad single field: number"},
    };
    for (const Row& row : vRows) {
        const ref<LazyDict> body = Body(row.json, 12);
        const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, body, nullptr);
        RoxString error;
        const ref<SornObject> object = response->UnmarshalToSornObject(row.version, error);
        EXPECT_EQ(object == nullptr, row.words != nullptr) << row.json;
        EXPECT_EQ(Text(error), row.words == nullptr ? "" : row.words);
        EXPECT_EQ(body->GetVersion().Number(), row.version) << "whatever comes of it";
        EXPECT_EQ(response->GetBody() == body, row.words != nullptr);
        EXPECT_EQ(response->GetBody()->GetVersion().Number(), row.words != nullptr ? row.version : 12);
        EXPECT_EQ(Text(response->GetTypeName()), row.words != nullptr ? "response" : "everyTypePlain");
    }
    const ref<ResponseWrapper> response =
        ResponseWrapper::New(&pool, 7, true, OfBytes("\xFA\xF1\x02\x01"), nullptr);
    RoxString error;
    EXPECT_EQ(response->UnmarshalToSornObject(26, error), nullptr);
    EXPECT_EQ(Text(error), "Protobuf did not unmarshal to SornObject");
}

// The typed reader looks at no version.
TEST_F(WrapperUnmarshalBodyTest, TheStraightRoad) {
    RoxFeatures::SetEnabled(VK_FEATURE_TYPED_JSON, true);
    const ref<LazyDict> before = Body(bodyTextG, 26);
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 7, true, before, nullptr);
    RoxString error;
    ExpectTaken(response, response->UnmarshalToSornObject(43, error), before, 26);
    EXPECT_TRUE(error.FEmpty());
}

}  // namespace sorntest
