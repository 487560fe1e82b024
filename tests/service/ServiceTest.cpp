#include "service/Service.h"

#include "ServiceFixture.h"

namespace sorntest {
namespace {

class ServiceTest : public ServiceFixture {
 protected:
    std::string Search(const std::string& members = "", int version = 42) {
        const std::string body =
            R"({"type": "recordingSearch")" + (members.empty() ? "" : ", " + members) + "}";
        return Ask({7, "recordingSearch", body, "single", "", version}).body;
    }
};

TEST_F(ServiceTest, AnswersASearchWithTheTextsAsTheyCame) {
    const std::string odd =
        "{ \"bodyId\":\"b\" ,\t\"type\":\"recording\",\"title\":\"\xC3\x84\\u00e4\",\"movieYear\" : 1999}";
    Put("recording", " \r\n" + odd + "\n");
    PutRecording(2);
    const ResponseText answer = Ask({7, "recordingSearch", R"({"type": "recordingSearch"})"});
    EXPECT_EQ(answer.rpcId, 7u);
    EXPECT_TRUE(answer.isFinal);
    EXPECT_EQ(answer.body, RecordingList({odd, Recording(2)}));
    EXPECT_EQ(Search(R"("keyword": "nothing of the record")"), RecordingList({odd, Recording(2)}));
    EXPECT_EQ(Search("", 0), RecordingList({odd, Recording(2)}));
}

struct PageRow {
    const char* members;
    int first;  // of recordings 0 to 4
    int count;
    int anchorIndex;
    bool isBottom;
    bool isTop;
};

constexpr PageRow vPageRowsG[] = {
    {"", 0, 5, 0, true, true},
    {R"("offset": 0, "count": 5)", 0, 5, 0, true, true},
    {R"("count": 4)", 0, 4, 0, false, true},
    {R"("count": 1, "offset": 4)", 4, 1, 4, true, false},
    {R"("count": 2, "offset": 1)", 1, 2, 1, false, false},
    {R"("offset": 3)", 3, 2, 3, true, false},
    {R"("offset": 5)", 0, 0, 5, true, false},
    {R"("offset": 2147483647, "count": 2147483647)", 0, 0, 5, true, false},
    {R"("offset": -2147483648, "count": 2)", 0, 2, 0, false, true},
    {R"("count": 0)", 0, 0, 0, false, true},
    {R"("count": -1)", 0, 0, 0, false, true},
    {R"("count": -2147483648, "offset": 2)", 0, 0, 2, false, false},
};

TEST_F(ServiceTest, Pages) {
    for (int i = 0; i < 5; ++i) PutRecording(i);
    for (const PageRow& row : vPageRowsG) {
        std::vector<std::string> vRecords;
        for (int i = row.first; i < row.first + row.count; ++i) vRecords.push_back(Recording(i));
        EXPECT_EQ(Search(row.members), RecordingList(vRecords, row.anchorIndex, row.isBottom, row.isTop))
            << row.members;
    }
}

TEST_F(ServiceTest, NoRecords) {
    EXPECT_EQ(Search(), RecordingList({}));
    EXPECT_EQ(Search(R"("offset": 3)"), RecordingList({}));
}

TEST_F(ServiceTest, PagesOfWhatIsFound) {
    for (int i = 0; i < 6; ++i)
        PutRecording(i, i % 2 == 0 ? R"("state": "complete")" : R"("state": "scheduled")");
    const auto even = [](int i) { return Recording(i, R"("state": "complete")"); };
    EXPECT_EQ(Search(R"("state": ["complete"])"), RecordingList({even(0), even(2), even(4)}));
    EXPECT_EQ(Search(R"("state": ["complete"], "offset": 1, "count": 1)"),
              RecordingList({even(2)}, 1, false, false));
    EXPECT_EQ(Search(R"("state": ["complete"], "offset": 2)"), RecordingList({even(4)}, 2, true, false));
    EXPECT_EQ(Search(R"("state": ["inProgress"])"), RecordingList({}));
}

TEST_F(ServiceTest, ALimitOfRecordsInAList) {
    limits.maxListRecords = 3;
    Start();
    for (int i = 0; i < 4; ++i) PutRecording(i);
    const std::string three = RecordingList({Recording(0), Recording(1), Recording(2)}, 0, false, true);
    EXPECT_EQ(Search(), three);
    EXPECT_EQ(Search(R"("count": 3)"), three);
    EXPECT_EQ(Search(R"("count": 4)"), three);
}

TEST_F(ServiceTest, ALimitOfBytesInAnAnswer) {
    PutRecording(0);
    PutRecording(1);
    const std::string two = Search();
    limits.maxAnswerBytes = static_cast<uint32_t>(two.size());
    Start();
    PutRecording(0);
    PutRecording(1);
    EXPECT_EQ(Search(), two);
    limits.maxAnswerBytes = static_cast<uint32_t>(two.size() - 1);
    Start();
    PutRecording(0);
    PutRecording(1);
    const ResponseText answer = Ask({7, "recordingSearch", R"({"type": "recordingSearch"})"});
    EXPECT_TRUE(answer.FError("resourceUnavailable")) << answer.body;
    EXPECT_NE(answer.body.find("ask for fewer records with count"), std::string::npos);
    EXPECT_EQ(Search(R"("count": 1)"), RecordingList({Recording(0)}, 0, false, true));
}

TEST_F(ServiceTest, ARecordOfTheLargestSizeComesBack) {
    const size_t n = limits.maxRecordBytes - Recording(1, R"("title": "")").size();
    PutRecording(1, R"("title": ")" + std::string(n, 'x') + "\"");
    EXPECT_EQ(Search().size(), RecordingList({""}).size() + limits.maxRecordBytes);
    const std::string larger = Recording(2, R"("title": ")" + std::string(n + 1, 'x') + "\"");
    EXPECT_TRUE(Ask({8, "recording", larger, "single", "put"}).FError("resourceUnavailable"));
}

TEST_F(ServiceTest, RecordsThatAreNotKeptDecodedAreFoundAllTheSame) {
    limits.maxDecodedBytes = 0;
    Start();
    for (int i = 0; i < 3; ++i) PutRecording(i, i == 1 ? R"("title": "b")" : R"("title": "a")");
    EXPECT_EQ(Search(R"("title": "b")"), RecordingList({Recording(1, R"("title": "b")")}));
    Remove("recording", R"({"type": "recording", "title": "a"})");
    EXPECT_EQ(Search(), RecordingList({Recording(1, R"("title": "b")")}));
}

TEST_F(ServiceTest, PutReplacesByKey) {
    PutRecording(1, R"("title": "a")");
    PutRecording(2);
    PutRecording(1, R"("title": "b")");
    EXPECT_EQ(Search(), RecordingList({Recording(1, R"("title": "b")"), Recording(2)}));
    EXPECT_EQ(Search(R"("title": "a")"), RecordingList({}));
    // Without an id a record is told by its text.
    const std::string bare = R"({"type": "recording", "bodyId": "c"})";
    Put("recording", bare);
    Put("recording", bare);
    EXPECT_EQ(Search(R"("bodyId": "c")"), RecordingList({bare}));
}

TEST_F(ServiceTest, Remove) {
    for (int i = 0; i < 4; ++i) PutRecording(i, i < 2 ? R"("title": "a")" : R"("title": "b")");
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.0", "title": "b"})");  // no such one
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.9"})");
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.0"})");
    Remove("recording", R"({"type": "recording", "title": "b"})");
    EXPECT_EQ(Search(), RecordingList({Recording(1, R"("title": "a")")}));
}

TEST_F(ServiceTest, NothingIsSentToWhoExpectsNothing) {
    Receive({1, "recording", Recording(1), "none", "put"});
    Receive({2, "recordingSearch", R"({"type": "recordingSearch"})", "none"});
    Receive({3, "noSuchType", R"({"type": "noSuchType"})", "none"});
    Receive(CancelText(4));
    Receive(Framed("RpcId: 5\r\nType: response\r\nIsFinal: true\r\n", "{}"));
    EXPECT_EQ(Take().size(), 0u);
    EXPECT_EQ(Search(), RecordingList({Recording(1)})) << "it is done all the same";
}

TEST_F(ServiceTest, RequestsOfTheSchemaThatStoreAndRemove) {
    const auto store = [this](const char* app, const char* key, const char* value) {
        const std::string body = std::string(R"({"type": "localApplicationDataStore", "appName": ")") + app +
                                 R"(", "key": ")" + key + R"(", "data": {"v": ")" + value +
                                 R"("}, "storeInNonVolatileMemory": true})";
        EXPECT_EQ(Ask({3, "localApplicationDataStore", body}).body, successG);
    };
    const auto data = [](const char* app, const char* key, const char* value) {
        return std::string(R"({"appName": ")") + app + R"(", "data": {"v": ")" + value + R"("}, "key": ")" +
               key + R"(", "type": "localApplicationData"})";
    };
    const auto search = [this](const std::string& members) {
        const std::string body = R"({"type": "localApplicationDataSearch", )" + members + "}";
        return Ask({4, "localApplicationDataSearch", body}).body;
    };
    const auto list = [](const std::string& records) {
        return R"({"type": "localApplicationDataList", "localApplicationData": [)" + records +
               R"(], "anchorIndex": 0, "isBottom": true, "isTop": true})";
    };
    store("guide", "a", "1");
    store("guide", "b", "2");
    store("other", "a", "3");
    store("guide", "a", "4");
    EXPECT_EQ(search(R"("appName": "guide")"),
              list(data("guide", "a", "4") + ", " + data("guide", "b", "2")));
    EXPECT_EQ(search(R"("appName": "guide", "key": ["x", "b"])"), list(data("guide", "b", "2")));
    EXPECT_EQ(Ask({5, "localApplicationDataRemove",
                   R"({"type": "localApplicationDataRemove", "appName": "guide", "key": ["a", "c"]})"})
                  .body,
              successG);
    EXPECT_EQ(search(R"("appName": "guide")"), list(data("guide", "b", "2")));
    EXPECT_EQ(search(R"("appName": "other")"), list(data("other", "a", "3")));
}

TEST_F(ServiceTest, UpdatesThatHoldRecordsStoreThem) {
    const std::string first = R"({"type": "channel", "channelId": "vuka:ch.1", "callSign": "A"})";
    const std::string second = R"({"type": "channel", "channelId": "vuka:ch.2", "callSign": "B"})";
    EXPECT_EQ(
        Ask({3, "channelUpdate", R"({"type": "channelUpdate", "channel": [)" + first + ", " + second + "]}"})
            .body,
        successG);
    const std::string list = Ask({4, "channelSearch", R"({"type": "channelSearch"})"}).body;
    EXPECT_EQ(
        list.find(R"({"type": "channelList", "channel": [{"callSign": "A", "channelId": "vuka:ch.1", )"
                  R"("type": "channel"}, {"callSign": "B", "channelId": "vuka:ch.2", "type": "channel"}])"),
        0u)
        << list;
    EXPECT_EQ(
        Ask({5, "channelRemove", R"({"type": "channelRemove", "bodyId": "b", "channelId": "vuka:ch.1"})"})
            .body,
        successG);
}

TEST_F(ServiceTest, DeepRecords) {
    constexpr int depth = 50'000;
    std::string deep;
    for (int i = 0; i < depth; ++i) deep += R"({"type":"recording","bodyId":"b","recordingForOfferId":[)";
    deep += R"({"type":"recording","bodyId":"b"})";
    for (int i = 0; i < depth; ++i) deep += "]}";
    Put("recording", deep);
    EXPECT_TRUE(Search() == RecordingList({deep}));
    Remove("recording", R"({"type": "recording", "bodyId": "b"})");
    EXPECT_EQ(Search(), RecordingList({}));
}

TEST_F(ServiceTest, ALimitOfRecordsOfAType) {
    limits.maxTypeRecords = 2;
    Start();
    PutRecording(1);
    PutRecording(2);
    EXPECT_TRUE(Ask({1, "recording", Recording(3), "single", "put"}).FError("resourceUnavailable"));
    Put("offer", R"({"type": "offer"})");
    EXPECT_EQ(Search(), RecordingList({Recording(1), Recording(2)}));
}

TEST_F(ServiceTest, Load) {
    sorn::service::Failure failure;
    ASSERT_TRUE(Service().BeginLoad(failure));
    EXPECT_TRUE(Service().Load(Recording(1), failure));
    EXPECT_FALSE(Service().Load("{", failure));
    EXPECT_FALSE(failure.text.empty());
    EXPECT_TRUE(Service().Load(Recording(2), failure));
    ASSERT_TRUE(Service().EndLoad(failure));
    EXPECT_EQ(Search(), RecordingList({Recording(1), Recording(2)}));
}

}  // namespace
}  // namespace sorntest
