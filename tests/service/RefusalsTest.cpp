#include "ServiceFixture.h"
#include "service/Service.h"

namespace sorntest {
namespace {

using RefusalsTest = ServiceFixture;

struct RefusalRow {
    const char* what;
    RequestText request;
    const char* code;
};

const RefusalRow vRefusalRowsG[] = {
    {"unknown type", {1, "noSuchType", R"({"type": "noSuchType"})"}, "badArgument"},
    {"a type that is no request", {1, "recording", Recording(1)}, "badArgument"},
    {"another type", {1, "recordingSearch", R"({"type": "offerSearch"})"}, "badArgument"},
    {"no type", {1, "recordingSearch", "{}"}, "badArgument"},
    {"bad JSON", {1, "recordingSearch", R"({"type": "recordingSearch")"}, "badArgument"},
    {"an array", {1, "recordingSearch", "[]"}, "badArgument"},
    {"blanks", {1, "recordingSearch", "  "}, "badArgument"},
    {"binary", {1, "recordingSearch", "\x12\x01"}, "badArgument"},
    {"a bad value", {1, "recordingSearch", R"({"type": "recordingSearch", "count": "x"})"}, "badArgument"},
    {"a bad enumeration",
     {1, "recordingSearch", R"({"type": "recordingSearch", "state": ["x"]})"},
     "badArgument"},
    {"a required field lacks",
     {1, "localApplicationDataSearch", R"({"type": "localApplicationDataSearch"})"},
     "badArgument"},
    {"a version before the first",
     {1, "recordingSearch", R"({"type": "recordingSearch"})", "single", "", 6},
     "schemaException"},
    {"a version behind the last",
     {1, "recordingSearch", R"({"type": "recordingSearch"})", "single", "", 43},
     "schemaException"},
    {"an unknown action", {1, "recording", Recording(1), "single", "Put"}, "badArgument"},
    {"put: a required field lacks",
     {1, "recording", R"({"type": "recording"})", "single", "put"},
     "badArgument"},
    {"put: no JSON for others",
     {1, "recording", R"({"type": "recording", "bodyId": b})", "single", "put"},
     "badArgument"},
    {"put: not UTF-8",
     {1, "recording", "{\"type\": \"recording\", \"bodyId\": \"\xFF\"}", "single", "put"},
     "badArgument"},
    {"put: more than a record", {1, "recording", Recording(1) + "]", "single", "put"}, "badArgument"},
    {"remove: all", {1, "recording", R"({"type": "recording"})", "single", "remove"}, "badArgument"},
    {"remove: no field",
     {1, "recording", R"({"type": "recording", "titel": "a"})", "single", "remove"},
     "badArgument"},
    {"remove: nothing to compare",
     {1, "recording", R"({"type": "recording", "debugDict": {}})", "single", "remove"},
     "badArgument"},
    {"update: a bad record among good ones",
     {1, "channelUpdate",
      "{\"type\": \"channelUpdate\", \"channel\": [{\"type\": \"channel\", \"callSign\": \"A\"}, "
      "{\"type\": \"channel\", \"name\": \"\xFF\"}]}"},
     "badArgument"},
    {"update: a record of another type",
     {1, "channelUpdate", R"({"type": "channelUpdate", "channel": [{"type": "success"}]})"},
     "badArgument"},
};

TEST_F(RefusalsTest, Refusals) {
    PutRecording(0);
    for (const RefusalRow& row : vRefusalRowsG) {
        const ResponseText answer = Ask(row.request);
        EXPECT_TRUE(answer.FError(row.code)) << row.what << ": " << answer.body;
        EXPECT_EQ(answer.rpcId, 1u) << row.what;
        EXPECT_NE(answer.body.find("\"text\": \""), std::string::npos) << row.what;
        RequestText open = row.request;
        open.count = "multiple";
        EXPECT_TRUE(Ask(open).FError(row.code)) << row.what;
    }
    EXPECT_EQ(Service().CountStreams(), 0u);
    EXPECT_EQ(Ask({1, "recordingSearch", R"({"type": "recordingSearch"})"}).body,
              RecordingList({Recording(0)}));
    EXPECT_NE(Ask({1, "channelSearch", R"({"type": "channelSearch"})"}).body.find("\"channel\": []"),
              std::string::npos)
        << "all or none";
}

struct GarbageRow {
    std::string message;
    uint32_t rpcId;  // that the answer has
};

const GarbageRow vGarbageRowsG[] = {
    {"", 0},
    {"x", 0},
    {"ORPC/2 1000 0\r\nRpcId: 5\r\n", 5},
    {"GET / HTTP/1.1\r\nHost: x\r\n\r\n", 0},
    {std::string(1000, '\0'), 0},
    {Framed("Type: request\r\n", "{}"), 0},
    {Framed("RpcId: 9\r\n", "{}"), 9},
    {Framed("RpcId: 9\r\nType: request\r\n", "{}"), 9},
    {Framed("RpcId: 9\r\nType: request\r\nRequestType: success\r\nResponseCount: many\r\n", "{}"), 9},
    {Framed("RpcId: 9\r\nType: request\r\nRequestType: success\r\nResponseCount: single\r\n", ""), 9},
    {Framed("RpcId: 4294967295\r\nType: nothing\r\n", "{}"), 4294967295},
    {Framed("RpcId: 99999999999\r\nType: nothing\r\n", "{}"), 0},
    {Framed("RpcId: 9\r\nno colon\r\n", "{}"), 9},
};

/// The words of the refusal to remove by a name that is no field's.
std::string WordsAbout(const ResponseText& answer) {
    const std::string begin = "\"text\": \"recording has no field '";
    const size_t found = answer.body.find(begin);
    if (found == std::string::npos) return "no such words: " + answer.body;
    const size_t start = found + begin.size();
    return answer.body.substr(start, answer.body.find('"', start) - start);
}

TEST_F(RefusalsTest, WordsAreCutBetweenCharacters) {
    std::string name = "x";
    std::string all = "x";
    for (int i = 0; i < 3000; ++i) name += "\u00E4";
    // 4,096 bytes less the 24 before the name and its first one: half of a character would fit, too.
    for (int i = 0; i < 2035; ++i) all += "\u00E4";
    EXPECT_EQ(WordsAbout(Ask(
                  {1, "recording", "{\"type\": \"recording\", \"" + name + "\": 1}", "single", "remove"})),
              all);
}

TEST_F(RefusalsTest, WordsAreUtf8WhateverTheyQuote) {
    EXPECT_EQ(WordsAbout(Ask({1, "recording",
                              "{\"type\": \"recording\", \"a\xFF"
                              "b\xE4\xB8\u00E4\xC0\x80\": 1}",
                              "single", "remove"})),
              "a?b?"
              "?\u00E4?"
              "?'");
}

TEST_F(RefusalsTest, GarbageIsAnswered) {
    for (const GarbageRow& row : vGarbageRowsG) {
        const ResponseText answer = Ask(row.message);
        EXPECT_TRUE(answer.FError("badArgument")) << row.message << answer.body;
        EXPECT_EQ(answer.rpcId, row.rpcId) << row.message;
    }
}

}  // namespace
}  // namespace sorntest
