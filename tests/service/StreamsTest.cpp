#include "service/Streams.h"

#include <algorithm>

#include "ServiceFixture.h"

namespace sorntest {
namespace {

const std::string searchG = R"({"type": "recordingSearch"})";

std::string SearchOf(const std::string& members) {
    return R"({"type": "recordingSearch", )" + members + "}";
}

class StreamsTest : public ServiceFixture {
 protected:
    void Open(uint32_t rpcId, const std::string& body = searchG, uint32_t session = 1) {
        Receive({rpcId, "recordingSearch", body, "multiple"}, session);
    }
    /// Opens a stream and compares its first list.
    void ExpectOpen(uint32_t rpcId, const std::string& body, const std::string& list, uint32_t session = 1) {
        Open(rpcId, body, session);
        ExpectList(Take(), rpcId, list, session);
    }
    static void ExpectList(const std::vector<Sent>& answers, uint32_t rpcId, const std::string& list,
                           uint32_t session = 1) {
        ASSERT_EQ(answers.size(), 1u);
        EXPECT_EQ(answers[0].session, session);
        EXPECT_EQ(answers[0].response.rpcId, rpcId);
        EXPECT_FALSE(answers[0].response.isFinal);
        EXPECT_EQ(answers[0].response.body, list);
    }
};

TEST_F(StreamsTest, ALifeOfAStream) {
    PutRecording(1);
    ExpectOpen(7, searchG, RecordingList({Recording(1)}));
    EXPECT_TRUE(Delivered().empty()) << "nothing has changed";
    PutRecording(2);
    ExpectList(Delivered(), 7, RecordingList({Recording(1), Recording(2)}));
    PutRecording(2);
    EXPECT_TRUE(Delivered().empty()) << "the same text again";
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.1"})");
    ExpectList(Delivered(), 7, RecordingList({Recording(2)}));
    Receive(CancelText(7));
    PutRecording(3);
    EXPECT_TRUE(Delivered().empty()) << "it was cancelled";
    EXPECT_EQ(Service().CountStreams(), 0u);
    Receive(CancelText(7));
    EXPECT_TRUE(Take().empty());
}

struct ChangeRow {
    const char* what;
    const char* before;  // members of recording 1; null for none
    const char* after;
    bool isTold;
};

constexpr ChangeRow vChangeRowsG[] = {
    {"it comes", nullptr, R"("title": "a")", true},
    {"another one comes", nullptr, R"("title": "b")", false},
    {"it goes", R"("title": "a")", nullptr, true},
    {"another one goes", R"("title": "b")", nullptr, false},
    {"it becomes one", R"("title": "b")", R"("title": "a")", true},
    {"it is none any more", R"("title": "a")", R"("title": "b")", true},
    {"it changes otherwise", R"("title": "a")", R"("title": "a", "duration": 1)", true},
    {"another one changes", R"("title": "b")", R"("title": "b", "duration": 1)", false},
};

TEST_F(StreamsTest, OnlyMatchingRecordsMatter) {
    for (size_t maxDecodedBytes : {limits.maxDecodedBytes, size_t{0}}) {
        limits.maxDecodedBytes = maxDecodedBytes;
        for (const ChangeRow& row : vChangeRowsG) {
            Start();
            if (row.before != nullptr) PutRecording(1, row.before);
            Open(7, SearchOf(R"("title": "a")"));
            EXPECT_EQ(Take().size(), 1u);
            if (row.after != nullptr) {
                PutRecording(1, row.after);
            } else {
                Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.1"})");
            }
            const std::vector<Sent> answers = Delivered();
            ASSERT_EQ(answers.size(), row.isTold ? 1u : 0u) << row.what;
            if (!row.isTold) continue;
            const bool isIn =
                row.after != nullptr && std::string(row.after).find("\"a\"") != std::string::npos;
            EXPECT_EQ(answers[0].response.body,
                      isIn ? RecordingList({Recording(1, row.after)}) : RecordingList({}))
                << row.what;
        }
    }
}

TEST_F(StreamsTest, ChangesOutsideOfThePage) {
    for (int i = 0; i < 3; ++i) PutRecording(i);
    const std::string second = SearchOf(R"("offset": 1, "count": 1)");
    ExpectOpen(7, second, RecordingList({Recording(1)}, 1, false, false));
    PutRecording(3);
    EXPECT_TRUE(Delivered().empty());
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.0"})");
    ExpectList(Delivered(), 7, RecordingList({Recording(2)}, 1, false, false));
    Put("offer", R"({"type": "offer"})");
    EXPECT_TRUE(Delivered().empty()) << "of another type";
}

TEST_F(StreamsTest, UpdatesReplaceTheQuery) {
    PutRecording(1, R"("title": "a")");
    PutRecording(2, R"("title": "b")");
    ExpectOpen(7, SearchOf(R"("title": "a")"), RecordingList({Recording(1, R"("title": "a")")}));
    Receive(UpdateText(7, "recordingSearch", SearchOf(R"("title": "b")")));
    ExpectList(Take(), 7, RecordingList({Recording(2, R"("title": "b")")}));
    PutRecording(1, R"("title": "a", "duration": 1)");
    EXPECT_TRUE(Delivered().empty()) << "the old query";
    PutRecording(3, R"("title": "b")");
    ExpectList(Delivered(), 7,
               RecordingList({Recording(2, R"("title": "b")"), Recording(3, R"("title": "b")")}));
    // To another list.
    Receive(UpdateText(7, "offerSearch", R"({"type": "offerSearch"})"));
    const std::vector<Sent> answers = Take();
    ASSERT_EQ(answers.size(), 1u);
    EXPECT_EQ(answers[0].response.body.find(R"({"type": "offerList", "offer": [])"), 0u);
    EXPECT_EQ(Service().CountStreams(), 1u);
}

TEST_F(StreamsTest, BadUpdatesEndTheRequest) {
    EXPECT_TRUE(Ask(UpdateText(7, "recordingSearch", searchG)).FError("objectNotFound")) << "none is open";
    struct Row {
        const char* type;
        const char* body;
    };
    for (const Row& row : {Row{"recordingSearch", "{"}, Row{"recordingSearch", R"({"type": "offerSearch"})"},
                           Row{"success", R"({"type": "success"})"}, Row{"noSuchType", "{}"},
                           Row{"recordingSearch", R"({"type": "recordingSearch", "count": "x"})"}}) {
        Open(7);
        EXPECT_EQ(Take().size(), 1u);
        EXPECT_TRUE(Ask(UpdateText(7, row.type, row.body)).FError("badArgument")) << row.body;
        EXPECT_EQ(Service().CountStreams(), 0u);
    }
}

TEST_F(StreamsTest, ANumberIsUsedOnce) {
    Open(7);
    EXPECT_EQ(Take().size(), 1u);
    EXPECT_TRUE(Ask({7, "recordingSearch", searchG, "multiple"}).FError("badArgument"));
    EXPECT_EQ(Service().CountStreams(), 0u) << "both are over";
    Open(7, searchG, 2);
    Open(7, searchG, 3);
    EXPECT_EQ(Take().size(), 2u) << "sessions have numbers of their own";
}

TEST_F(StreamsTest, SessionsEnd) {
    for (uint32_t session : {1u, 2u, 3u}) {
        for (uint32_t rpcId : {1u, 2u}) Open(rpcId, searchG, session);
    }
    EXPECT_EQ(Take().size(), 6u);
    Service().EndSession(2);
    Service().EndSession(9);
    EXPECT_EQ(Service().CountStreams(), 4u);
    PutRecording(1);
    std::vector<uint32_t> vSessions;
    for (const Sent& each : Delivered()) vSessions.push_back(each.session);
    EXPECT_EQ(vSessions, (std::vector<uint32_t>{1, 1, 3, 3}));
}

TEST_F(StreamsTest, SomeLeaveBeforeTheirTurn) {
    for (uint32_t rpcId = 1; rpcId <= 3; ++rpcId)
        Open(rpcId, SearchOf("\"count\": " + std::to_string(rpcId)));
    Take();
    PutRecording(1);
    Receive(CancelText(2));
    Service().EndSession(1);
    EXPECT_TRUE(Delivered().empty());
}

TEST_F(StreamsTest, Limits) {
    limits.maxSessionStreams = 3;
    limits.maxStreams = 5;
    Start();
    const auto open = [this](uint32_t session, uint32_t rpcId) {
        return Ask({rpcId, "recordingSearch", searchG, "multiple"}, session);
    };
    for (uint32_t rpcId = 1; rpcId <= 3; ++rpcId) EXPECT_FALSE(open(1, rpcId).isFinal);
    EXPECT_TRUE(open(1, 4).FError("serverBusy")) << "of one session";
    for (uint32_t rpcId = 1; rpcId <= 2; ++rpcId) EXPECT_FALSE(open(2, rpcId).isFinal);
    EXPECT_TRUE(open(2, 3).FError("serverBusy")) << "of all";
    Receive(CancelText(1), 1);
    EXPECT_FALSE(open(2, 3).isFinal);
    EXPECT_TRUE(open(1, 4).FError("serverBusy"));
    EXPECT_FALSE(Ask({9, "recordingSearch", searchG}, 1).FError("serverBusy")) << "single requests go on";
}

TEST_F(StreamsTest, LimitOfQueryBytes) {
    limits.maxStreamQueryBytes = 3000;
    Start();
    const auto open = [this](uint32_t rpcId, char title) {
        return Ask({rpcId, "recordingSearch", SearchOf("\"title\": \"" + std::string(1000, title) + "\""),
                    "multiple"});
    };
    EXPECT_FALSE(open(1, 'a').isFinal);
    EXPECT_FALSE(open(2, 'b').isFinal);
    EXPECT_FALSE(open(3, 'b').isFinal) << "the same query is there once";
    EXPECT_FALSE(open(4, 'c').isFinal);
    EXPECT_TRUE(open(5, 'd').FError("serverBusy"));
    Receive(CancelText(2));
    EXPECT_TRUE(open(5, 'd').FError("serverBusy")) << "another one has that query";
    Receive(CancelText(3));
    EXPECT_FALSE(open(5, 'd').isFinal);
}

TEST_F(StreamsTest, AnAnswerThatBecomesTooLargeEndsTheStream) {
    limits.maxAnswerBytes = 300;
    Start();
    Open(7);
    Open(8, SearchOf(R"("count": 1)"));
    EXPECT_EQ(Take().size(), 2u);
    const std::string title = "\"title\": \"" + std::string(100, 'x') + "\"";
    PutRecording(1, title);
    EXPECT_EQ(Delivered().size(), 2u);
    PutRecording(2, title);
    bool isEnded = false;
    for (const Sent& each : Delivered()) {
        isEnded = isEnded || (each.response.rpcId == 7 && each.response.FError("resourceUnavailable"));
    }
    EXPECT_TRUE(isEnded);
    EXPECT_EQ(Service().CountStreams(), 1u);
}

TEST_F(StreamsTest, TurnsAreBounded) {
    limits.maxTurnMessages = 10;
    limits.maxTurnNanoseconds = INT64_MAX;
    Start();
    constexpr size_t nStreams = 95;
    for (uint32_t rpcId = 1; rpcId <= nStreams; ++rpcId) Open(rpcId);
    Take();
    PutRecording(1);
    std::vector<size_t> vTurns;
    bool isMore = true;
    while (isMore) {
        isMore = Service().Deliver();
        vTurns.push_back(Take().size());
        EXPECT_LE(vTurns.back(), limits.maxTurnMessages);
        ASSERT_LT(vTurns.size(), 100u);
        // A second change while the first goes out: who got the first list gets the second as well.
        if (vTurns.size() == 3) PutRecording(2);
        Take();
    }
    // A turn writes one list where it begins one: 9 + 10 + 10 with the first, then all with the second.
    size_t nAll = 0;
    for (size_t n : vTurns) nAll += n;
    EXPECT_EQ(nAll, 29 + nStreams);
}

TEST_F(StreamsTest, ATurnThatTakesLongEndsButDoesSomething) {
    limits.maxTurnNanoseconds = 0;
    Start();
    // Each its own query, so that each needs a list of its own.
    constexpr uint32_t nStreams = 5;
    for (uint32_t rpcId = 1; rpcId <= nStreams; ++rpcId) {
        Open(rpcId, SearchOf("\"count\": " + std::to_string(rpcId)));
    }
    Take();
    PutRecording(1);
    for (uint32_t n = 1; n <= nStreams; ++n) {
        EXPECT_EQ(Service().Deliver(), n < nStreams);
        EXPECT_EQ(Take().size(), 1u);
    }
}

TEST_F(StreamsTest, EveryStreamHasItsTurnHoweverFastChangesCome) {
    struct Row {
        const char* what;
        size_t maxTurnMessages;
        size_t maxTurnBytes;
        int64_t maxTurnNanoseconds;
    };
    for (const Row& row : {Row{"messages", 1, SIZE_MAX, INT64_MAX}, Row{"bytes", SIZE_MAX, 1, INT64_MAX},
                           Row{"time", SIZE_MAX, SIZE_MAX, 0}}) {
        limits.maxTurnMessages = row.maxTurnMessages;
        limits.maxTurnBytes = row.maxTurnBytes;
        limits.maxTurnNanoseconds = row.maxTurnNanoseconds;
        Start();
        for (uint32_t rpcId = 1; rpcId <= 3; ++rpcId) Open(rpcId);
        Take();
        std::string rpcIds;
        for (int i = 0; i < 6; ++i) {
            PutRecording(i);
            EXPECT_TRUE(Service().Deliver());
            for (const Sent& each : Take()) rpcIds += std::to_string(each.response.rpcId) + " ";
        }
        EXPECT_EQ(rpcIds, "1 2 3 1 2 3 ") << row.what;
    }
}

TEST_F(StreamsTest, ThereAndBackAgainIsNoChange) {
    PutRecording(1);
    Open(7);
    Take();
    PutRecording(2);
    Remove("recording", R"({"type": "recording", "recordingId": "vuka:rc.2"})");
    EXPECT_TRUE(Delivered().empty());
}

TEST_F(StreamsTest, TenThousandStreamsOfOneSession) {
    constexpr uint32_t nStreams = 10'000;
    for (int i = 0; i < 5; ++i) PutRecording(i);
    // Each its own query, and one in a hundred for the record that changes.
    for (uint32_t rpcId = 1; rpcId <= nStreams; ++rpcId) {
        Open(rpcId, SearchOf("\"recordingId\": \"vuka:rc." + std::to_string(rpcId % 100) +
                             "\", \"count\": " + std::to_string(rpcId)));
        ASSERT_EQ(Take().size(), 1u);
    }
    EXPECT_TRUE(Ask({nStreams + 1, "recordingSearch", searchG, "multiple"}).FError("serverBusy"));
    for (int change = 0; change < 3; ++change) {
        PutRecording(42, "\"duration\": " + std::to_string(change));
        const std::vector<Sent> answers = Delivered();
        EXPECT_EQ(answers.size(), nStreams / 100);
        EXPECT_TRUE(std::all_of(answers.begin(), answers.end(),
                                [](const Sent& each) { return each.response.rpcId % 100 == 42; }));
    }
    Service().EndSession(1);
    EXPECT_EQ(Service().CountStreams(), 0u);
}

}  // namespace
}  // namespace sorntest
