// Equality of messages: what counts for each kind, and what does not.

#include <string>

#include "lazy/TextSource.h"
#include "rpc/WrapperFixture.h"

namespace sorntest {

using namespace sorn;

class WrapperEqualityTest : public WrapperFixture {
 protected:
    ref<RequestWrapper> Made(unsigned rpcId, const char* type, int count, int version,
                             const ref<LazyDict>& body, const ref<Dict>& headers = nullptr) {
        return RequestWrapper::New(&pool, rpcId, type, static_cast<Count>(count), version, body, headers);
    }
    template <class Wrapper>
    static void Expect(bool isEqual, const ref<Wrapper>& a, const ref<Wrapper>& b, const char* what) {
        EXPECT_EQ(*a == *b, isEqual) << what;
        EXPECT_EQ(*b == *a, isEqual) << what;
        EXPECT_EQ(*a != *b, !isEqual) << what;
    }
};

TEST_F(WrapperEqualityTest, Requests) {
    const ref<RequestWrapper> base = Made(1, "t", 1, 26, Body(), Headers(R"({"A": "1"})"));
    const auto headers = [this](const char* json = R"({"A": "1"})") { return Headers(json); };
    const ref<RequestWrapper> otherType = Made(1, "t", 1, 26, Body(), headers());
    otherType->SetContentType("text/plain");
    struct Row {
        const char* what;
        bool isEqual;
        ref<RequestWrapper> other;
    };
    const Row vRows[] = {
        {"the same again", true, Made(1, "t", 1, 26, Body(), headers())},
        {"number", false, Made(2, "t", 1, 26, Body(), headers())},
        {"type", false, Made(1, "T", 1, 26, Body(), headers())},
        {"count", false, Made(1, "t", 2, 26, Body(), headers())},
        {"version", false, Made(1, "t", 1, 0, Body(), headers())},
        {"content type", false, otherType},
        {"body", false, Made(1, "t", 1, 26, Body(R"({"number":6,"type":"everyTypeCompanion"})"), headers())},
        {"body's order and blanks", true,
         Made(1, "t", 1, 26, Body(R"( {"type" : "everyTypeCompanion", "number":5})"), headers())},
        {"body's representation", true,
         Made(1, "t", 1, 26, LazyDict::FromSornObject(&pool, Object(bodySortedG), 0), headers())},
        {"body's version", true, Made(1, "t", 1, 26, Body(bodyTextG, 9), headers())},
        {"no body", false, Made(1, "t", 1, 26, nullptr, headers())},
        {"header's value", false, Made(1, "t", 1, 26, Body(), headers(R"({"A": "2"})"))},
        {"header's name", false, Made(1, "t", 1, 26, Body(), headers(R"({"a": "1"})"))},
        {"one header more", false, Made(1, "t", 1, 26, Body(), headers(R"({"A": "1", "B": "1"})"))},
        {"two values", false, Made(1, "t", 1, 26, Body(), headers(R"({"A": ["1", "1"]})"))},
        {"no headers", false, Made(1, "t", 1, 26, Body())},
        {"shared headers", true, Made(1, "t", 1, 26, Body(), base->GetOptionalHeaders())},
    };
    for (const Row& row : vRows) Expect(row.isEqual, base, row.other, row.what);
    Expect(true, base, base, "itself");
    Expect(true, Made(1, "t", 1, 26, nullptr), Made(1, "t", 1, 26, nullptr), "no bodies");
}

// Only the members count: an update equals a request that has the same.
TEST_F(WrapperEqualityTest, UpdateAndRequest) {
    const ref<RequestWrapper> update = RequestUpdateWrapper::New(&pool, 1, "t", Body(), nullptr);
    Expect(true, update, Made(1, "t", 2, 0, Body()), "as of an update");
    Expect(false, update, Made(1, "t", 2, 26, Body()), "version");
    Expect<RequestWrapper>(true, update, RequestUpdateWrapper::New(&pool, 1, "t", Body(), nullptr),
                           "updates");
}

TEST_F(WrapperEqualityTest, Responses) {
    const auto made = [this](unsigned rpcId, bool isFinal, const char* json, int version,
                             const char* headers) {
        return ResponseWrapper::New(&pool, rpcId, isFinal, Body(json, version), Headers(headers));
    };
    const ref<ResponseWrapper> base = made(1, true, bodyTextG, 26, R"({"A": "1"})");
    const ref<ResponseWrapper> otherType = made(1, true, bodyTextG, 26, R"({"A": "1"})");
    otherType->SetContentType("");
    const ref<ResponseWrapper> ofObject =
        ResponseWrapper::New(&pool, 1, true, Object(bodySortedG), 9, Headers(R"({"A": "1"})"));
    EXPECT_NE(Text(ofObject->GetTypeName()), Text(base->GetTypeName()));
    struct Row {
        const char* what;
        bool isEqual;
        ref<ResponseWrapper> other;
    };
    const Row vRows[] = {
        {"the same again", true, made(1, true, bodyTextG, 26, R"({"A": "1"})")},
        {"number", false, made(2, true, bodyTextG, 26, R"({"A": "1"})")},
        {"body", false, made(1, true, R"({"type":"everyTypeCompanion"})", 26, R"({"A": "1"})")},
        {"content type", false, otherType},
        {"final", false, made(1, false, bodyTextG, 26, R"({"A": "1"})")},
        {"headers", false, made(1, true, bodyTextG, 26, R"({"A": "2"})")},
        {"version does not count", true, made(1, true, bodyTextG, 0, R"({"A": "1"})")},
        {"type name and version do not count", true, ofObject},
    };
    for (const Row& row : vRows) Expect(row.isEqual, base, row.other, row.what);
    Expect(true, base, base, "itself");
}

TEST_F(WrapperEqualityTest, Cancels) {
    const ref<CancelWrapper> base = CancelWrapper::New(&pool, 1, Headers(R"({"A": "1"})"));
    Expect(true, base, CancelWrapper::New(&pool, 1, nullptr), "whatever else was given");
    Expect(false, base, CancelWrapper::New(&pool, 2, Headers(R"({"A": "1"})")), "number");
    Expect(true, base, base, "itself");
}

// The comparison stops at the first difference, and the body has its place in the order: a stream tells
// whether it was read.
TEST_F(WrapperEqualityTest, ABodyIsReadOnlyWhenAllBeforeItAgrees) {
    TextSource::Counts counts;
    const auto stream = [&] { return LazyDict::FromBytesource(&pool, new TextSource(counts, bodyTextG), 0); };
    const auto reads = [&](const auto& a, const auto& b) {
        counts.newSources = 0;
        EXPECT_FALSE(*a == *b);
        return counts.newSources;
    };
    const ref<RequestWrapper> request = Made(1, "t", 1, 26, stream());
    const ref<RequestWrapper> otherType = Made(1, "t", 1, 26, stream());
    otherType->SetContentType("x");
    EXPECT_EQ(reads(request, Made(2, "t", 1, 26, stream())), 0);
    EXPECT_EQ(reads(request, Made(1, "u", 1, 26, stream())), 0);
    EXPECT_EQ(reads(request, Made(1, "t", 0, 26, stream())), 0);
    EXPECT_EQ(reads(request, Made(1, "t", 1, 25, stream())), 0);
    EXPECT_EQ(reads(request, otherType), 0);
    EXPECT_EQ(reads(request, Made(1, "t", 1, 26, stream(), Headers(R"({"A": "1"})"))), 2);

    const ref<ResponseWrapper> response = ResponseWrapper::New(&pool, 1, true, stream(), nullptr);
    EXPECT_EQ(reads(response, ResponseWrapper::New(&pool, 2, true, stream(), nullptr)), 0);
    EXPECT_EQ(reads(response, ResponseWrapper::New(&pool, 1, false, stream(), nullptr)), 2);
}

}  // namespace sorntest
