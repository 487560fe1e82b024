// How messages are made: each form of New, the constructors, what is shared and what is new.

#include <cstring>
#include <string>
#include <type_traits>

#include "rpc/WrapperFixture.h"

namespace sorntest {

using namespace sorn;

class WrapperNewTest : public WrapperFixture {
 protected:
    /// The members of a request that its forms of New set.
    static std::string Shown(const RequestWrapper& request) {
        return std::to_string(request.GetRpcId()) + " " + Text(request.GetRequestType()) + " " +
               std::to_string(static_cast<int>(request.GetResponseCount())) + " v" +
               std::to_string(request.GetOrvoVersion().Number()) + " " + Text(request.GetContentType());
    }
    static std::string Shown(ResponseWrapper& response) {
        return std::to_string(response.GetRpcId()) + " " + Text(response.GetTypeName()) + " " +
               (response.IsFinalResponse() ? "final" : "not final") + " v" +
               std::to_string(response.GetOrvoVersion().Number()) + " " + Text(response.GetContentType());
    }
    /// That a body is the object at a version, made in this pool.
    void ExpectObjectBody(const ref<LazyDict>& body, const ref<SornObject>& object, int version) {
        ASSERT_NE(body, nullptr);
        EXPECT_EQ(body->GetRep(), LazyDict::REP_OBJECT);
        EXPECT_EQ(body->GetStoredObject(), object);
        EXPECT_EQ(body->GetVersion().Number(), version);
        EXPECT_EQ(body->GetMempool(), &pool);
    }
    /// The row of a virtual operation in its class's table, counted from 1.
    template <class Operation>
    static size_t RowOf(Operation operation) {
        uintptr_t word[2] = {0, 0};
        static_assert(sizeof operation == sizeof word);
        std::memcpy(word, &operation, sizeof word);
        // Where functions begin at odd addresses too, the mark of a virtual one is in the second word.
        const bool isMarkedFirst = (word[1] & 1) == 0;
        return (word[0] - (isMarkedFirst ? 1 : 0)) / sizeof(void*) + 1;
    }
};

TEST_F(WrapperNewTest, RequestOfABody) {
    const ref<LazyDict> body = Body(bodyTextG, 9);
    const ref<Dict> headers = Headers(R"({"A": "1"})");
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 3, "someType", RequestWrapper::RESPONSE_COUNT_NONE, 26, body, headers);
    EXPECT_EQ(Shown(*request), "3 someType 0 v26 application/json");
    EXPECT_EQ(request->GetBody(), body);
    EXPECT_EQ(body->GetVersion().Number(), 9);
    EXPECT_EQ(request->GetOptionalHeaders(), headers);
    EXPECT_EQ(request->GetOptionalHeadersDictionary(), headers->GetDictionary());
    EXPECT_EQ(request->GetRefCount(), 1u);
    EXPECT_EQ(request->GetMempool(), &pool);
    EXPECT_EQ(body->GetRefCount(), 2u);
    EXPECT_EQ(headers->GetRefCount(), 2u);
}

TEST_F(WrapperNewTest, RequestOfAnObject) {
    const ref<SornObject> object = Object(bodySortedG);
    const ref<Dict> headers = Headers("{}");
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 4, RequestWrapper::RESPONSE_COUNT_MULTIPLE, 12, object, headers);
    EXPECT_EQ(Shown(*request), "4 everyTypeCompanion 2 v12 application/json");
    ExpectObjectBody(request->GetBody(), object, 12);
    EXPECT_EQ(request->GetOptionalHeaders(), headers);
    EXPECT_EQ(request->GetRefCount(), 1u);
}

TEST_F(WrapperNewTest, ResponseOfABodyTakesTheVersionOfTheBody) {
    const ref<LazyDict> body = Body(bodyTextG, 31);
    const ref<Dict> headers = Headers(R"({"A": "1"})");
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 5, true, body, headers);
    EXPECT_EQ(Shown(*response), "5 response final v31 application/json");
    EXPECT_EQ(response->GetBody(), body);
    EXPECT_EQ(response->GetOptionalHeaders(), headers);
    EXPECT_EQ(response->GetOptionalHeadersDictionary(), headers->GetDictionary());
    EXPECT_EQ(response->GetRefCount(), 1u);
    EXPECT_EQ(response->GetMempool(), &pool);
    body->SetVersion(8);
    EXPECT_EQ(response->GetOrvoVersion().Number(), 31);
}

TEST_F(WrapperNewTest, ResponseOfAnObject) {
    const ref<SornObject> object = Object(bodySortedG);
    const ref<Dict> headers = Headers("{}");
    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 6, false, object, 17, headers);
    EXPECT_EQ(Shown(*response), "6 everyTypeCompanion not final v17 application/json");
    ExpectObjectBody(response->GetBody(), object, 17);
    EXPECT_EQ(response->GetOptionalHeaders(), headers);
}

TEST_F(WrapperNewTest, ResponseWithoutABodyAsserts) {
    EXPECT_DEATH(ResponseWrapper::New(&pool, 5, true, ref<LazyDict>(), nullptr), "no body");
}

TEST_F(WrapperNewTest, UpdateOfABody) {
    const ref<LazyDict> body = Body(bodyTextG, 31);
    const ref<Dict> headers = Headers(R"({"A": "1"})");
    const ref<RequestUpdateWrapper> update = RequestUpdateWrapper::New(&pool, 8, "someType", body, headers);
    EXPECT_EQ(Shown(*update), "8 someType 2 v0 application/json");
    EXPECT_EQ(update->GetBody(), body);
    EXPECT_EQ(body->GetVersion().Number(), 31);
    EXPECT_EQ(update->GetOptionalHeaders(), headers);
    EXPECT_EQ(update->GetRefCount(), 1u);
}

TEST_F(WrapperNewTest, UpdateOfAnObjectHasABodyWithoutVersion) {
    const ref<SornObject> object = Object(bodySortedG);
    const ref<RequestUpdateWrapper> update = RequestUpdateWrapper::New(&pool, 9, object, nullptr);
    EXPECT_EQ(Shown(*update), "9 everyTypeCompanion 2 v0 application/json");
    ExpectObjectBody(update->GetBody(), object, 0);
}

TEST_F(WrapperNewTest, CancelDropsItsHeaders) {
    const ref<Dict> headers = Headers(R"({"A": "1"})");
    const ref<CancelWrapper> cancel = CancelWrapper::New(&pool, 10, headers);
    EXPECT_EQ(cancel->GetRpcId(), 10u);
    EXPECT_TRUE(cancel->GetOrvoVersion().FAbsent());
    EXPECT_EQ(headers->GetRefCount(), 1u);
    EXPECT_EQ(cancel->GetRefCount(), 1u);
    EXPECT_EQ(HeadersOf(*cancel), R"({"RpcId": "10", "Type": "cancel"})");
}

TEST_F(WrapperNewTest, WithoutHeadersEachMessageGetsAnEmptyDictOfItsOwnPool) {
    RoxMempool others("bodies");
    {
        const ref<LazyDict> body = LazyDict::FromJsonString(&others, bodyTextG, 0);
        const ref<SornObject> object = Object(bodySortedG);
        const Count count = RequestWrapper::RESPONSE_COUNT_SINGLE;
        const ref<Dict> all[] = {
            RequestWrapper::New(&pool, 1, "t", count, 0, body, nullptr)->GetOptionalHeaders(),
            RequestWrapper::New(&pool, 1, count, 0, object, nullptr)->GetOptionalHeaders(),
            ResponseWrapper::New(&pool, 1, true, body, nullptr)->GetOptionalHeaders(),
            ResponseWrapper::New(&pool, 1, true, object, 0, nullptr)->GetOptionalHeaders(),
            RequestUpdateWrapper::New(&pool, 1, "t", body, nullptr)->GetOptionalHeaders(),
            RequestUpdateWrapper::New(&pool, 1, object, nullptr)->GetOptionalHeaders(),
        };
        for (const ref<Dict>& headers : all) {
            ASSERT_NE(headers, nullptr);
            EXPECT_EQ(headers->GetMempool(), &pool);
            EXPECT_EQ(JsonOf(headers), "{}");
            EXPECT_EQ(headers->GetRefCount(), 1u) << "shared with another message";
        }
    }
    EXPECT_EQ(others.GetUsedBytes(), 0u);
}

TEST_F(WrapperNewTest, ConstructorsTakeTheSameArguments) {
    const ref<LazyDict> body = Body(bodyTextG, 31);
    const ref<SornObject> object = Object(bodySortedG);
    const Count single = RequestWrapper::RESPONSE_COUNT_SINGLE;
    const ref<RequestWrapper> ofBody(new (&pool) RequestWrapper(1, "t", single, 7, body, nullptr));
    const ref<RequestWrapper> ofObject(new (&pool) RequestWrapper(2, single, 8, object, nullptr));
    const ref<ResponseWrapper> answer(new (&pool) ResponseWrapper(3, true, body, nullptr));
    const ref<ResponseWrapper> answerOfObject(new (&pool) ResponseWrapper(4, false, object, 9, nullptr));
    const ref<RequestUpdateWrapper> update(new (&pool) RequestUpdateWrapper(5, "t", body, nullptr));
    const ref<RequestUpdateWrapper> updateOfObject(new (&pool) RequestUpdateWrapper(6, object, nullptr));
    const ref<CancelWrapper> cancel(new (&pool) CancelWrapper(7, nullptr));
    EXPECT_EQ(Shown(*ofBody), "1 t 1 v7 application/json");
    EXPECT_EQ(Shown(*ofObject), "2 everyTypeCompanion 1 v8 application/json");
    EXPECT_EQ(Shown(*answer), "3 response final v31 application/json");
    EXPECT_EQ(Shown(*answerOfObject), "4 everyTypeCompanion not final v9 application/json");
    EXPECT_EQ(Shown(*update), "5 t 2 v0 application/json");
    EXPECT_EQ(Shown(*updateOfObject), "6 everyTypeCompanion 2 v0 application/json");
    EXPECT_EQ(cancel->GetRpcId(), 7u);
}

TEST_F(WrapperNewTest, NumbersAreKeptInFull) {
    EXPECT_EQ(CancelWrapper::New(&pool, 0, nullptr)->GetRpcId(), 0u);
    EXPECT_EQ(CancelWrapper::New(&pool, 4294967295u, nullptr)->GetRpcId(), 4294967295u);
    const ref<RequestWrapper> request =
        RequestWrapper::New(&pool, 4294967295u, "", static_cast<Count>(3), -1, Body(), nullptr);
    EXPECT_EQ(Shown(*request), "4294967295  3 v-1 application/json");
    EXPECT_EQ(HeadersOf(*request), R"({"Content-Type": "application/json", "RequestType": "", )"
                                   R"("ResponseCount": "", "RpcId": "4294967295", )"
                                   R"("SchemaVersion": "4294967295", "Type": "request"})");
}

TEST_F(WrapperNewTest, OnTheGeneralHeap) {
    const ref<SornObject> object = Object(bodySortedG);
    const ref<RequestWrapper> request =
        RequestWrapper::New(nullptr, 2, RequestWrapper::RESPONSE_COUNT_SINGLE, 8, object, nullptr);
    EXPECT_EQ(request->GetMempool(), nullptr);
    EXPECT_EQ(Text(request->BodyToDict()->ToString(false)), bodySortedG);
}

TEST_F(WrapperNewTest, MessagesDieWithTheirLastHolder) {
    const size_t nBefore = pool.GetUsedBytes();
    const ref<LazyDict> body = Body();
    const ref<Dict> headers = Headers("{}");
    const size_t nWithParts = pool.GetUsedBytes();
    {
        ref<OrvoRpcWrapper> first =
            RequestWrapper::New(&pool, 1, "t", RequestWrapper::RESPONSE_COUNT_SINGLE, 0, body, headers);
        const ref<OrvoRpcWrapper> second = first;
        first = nullptr;
        EXPECT_GT(pool.GetUsedBytes(), nWithParts);
    }
    EXPECT_EQ(pool.GetUsedBytes(), nWithParts);
    EXPECT_EQ(body->GetRefCount(), 1u);
    EXPECT_EQ(headers->GetRefCount(), 1u);
    EXPECT_GT(nWithParts, nBefore);
}

TEST_F(WrapperNewTest, Kinds) {
    static_assert(std::is_abstract_v<OrvoRpcWrapper>);
    static_assert(std::is_base_of_v<RoxCore, OrvoRpcWrapper>);
    static_assert(std::is_base_of_v<OrvoRpcWrapper, CancelWrapper>);
    struct Row {
        ref<OrvoRpcWrapper> wrapper;
        const char* kinds;  // request, update, response, cancel
    };
    for (const Row& row :
         {Row{Request(), "R---"}, Row{Update(), "RU--"}, Row{Response(), "--A-"}, Row{Cancel(), "---C"}}) {
        OrvoRpcWrapper* const p = row.wrapper.get();
        std::string kinds = "----";
        if (dynamic_cast<RequestWrapper*>(p) != nullptr) kinds[0] = 'R';
        if (dynamic_cast<RequestUpdateWrapper*>(p) != nullptr) kinds[1] = 'U';
        if (dynamic_cast<ResponseWrapper*>(p) != nullptr) kinds[2] = 'A';
        if (dynamic_cast<CancelWrapper*>(p) != nullptr) kinds[3] = 'C';
        EXPECT_EQ(kinds, row.kinds);
    }
}

TEST_F(WrapperNewTest, Layout) {
    EXPECT_EQ(sizeof(RequestUpdateWrapper), sizeof(RequestWrapper));
    EXPECT_EQ(sizeof(CancelWrapper), sizeof(OrvoRpcWrapper));
    if (sizeof(void*) != 4) return;
    // The header's 12 bytes, two words; six words more, of which the response's mark takes one.
    EXPECT_EQ(sizeof(OrvoRpcWrapper), 20u);
    EXPECT_EQ(sizeof(RequestWrapper), 40u);
    EXPECT_EQ(sizeof(ResponseWrapper), 40u);
}

TEST_F(WrapperNewTest, VirtualOperationsStandInTheirOrder) {
    EXPECT_EQ(RowOf(&RoxCore::VkCastHelper), 3u);  // behind the two destructors
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::GetTypeName), 4u);
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::HeadersToDict), 5u);
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::BodyToDict), 6u);
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::BodyToJson), 7u);
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::BodyToJsonByteBuffer), 8u);
    EXPECT_EQ(RowOf(&OrvoRpcWrapper::BodyToJsonByteSink), 9u);
    EXPECT_EQ(RowOf(&ResponseWrapper::IsFinalResponse), 10u);
}

TEST_F(WrapperNewTest, ResponseCountWords) {
    struct Row {
        int number;
        const char* word;
    };
    for (const Row& row : {Row{0, "none"}, Row{1, "single"}, Row{2, "multiple"}}) {
        EXPECT_STREQ(RequestWrapper::ResponseCountWord(static_cast<Count>(row.number)), row.word);
        Count count = static_cast<Count>(3);
        EXPECT_TRUE(RequestWrapper::ParseResponseCount(row.word, count));
        EXPECT_EQ(static_cast<int>(count), row.number);
    }
    EXPECT_STREQ(RequestWrapper::ResponseCountWord(static_cast<Count>(3)), "");
    for (const char* word : {"", "None", "single ", "multipl", "2"}) {
        Count count = RequestWrapper::RESPONSE_COUNT_MULTIPLE;
        EXPECT_FALSE(RequestWrapper::ParseResponseCount(word, count)) << word;
        EXPECT_EQ(count, RequestWrapper::RESPONSE_COUNT_MULTIPLE);
    }
}

}  // namespace sorntest
