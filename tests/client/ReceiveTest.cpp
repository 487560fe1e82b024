#include "ClientFixture.h"

class ReceiveTest : public ClientTest {};

namespace {

std::string Message(const std::string& headers, const std::string& body) {
    return "ORPC/2 " + std::to_string(headers.size() + 2) + " " + std::to_string(body.size()) + "\r\n" +
           headers + "\r\n" + body;
}

}  // namespace

TEST_F(ReceiveTest, WhatIsDroppedInSilence) {
    const std::string whole = ScriptedBus::ResponseText(1, "true", ScriptedBus::bodyG);
    const std::string request = "RequestType: error\r\nResponseCount: none\r\n";
    const std::string body = ScriptedBus::bodyG;
    struct Case {
        const char* name;
        std::string text;
    };
    const Case cases[] = {
        {"an unknown number", ScriptedBus::ResponseText(2, "true", body)},
        {"number 0", ScriptedBus::ResponseText(0, "true", body)},
        {"a request", Message(request + "RpcId: 1\r\nSchemaVersion: 42\r\nType: request\r\n", body)},
        {"an update", Message("RequestType: error\r\nRpcId: 1\r\nType: requestUpdate\r\n", body)},
        {"a cancel", Message("RpcId: 1\r\nType: cancel\r\n", "")},
        {"no kind", Message("RpcId: 1\r\nIsFinal: true\r\n", body)},
        {"no body", Message("RpcId: 1\r\nType: response\r\nIsFinal: true\r\n", "")},
        {"no number", Message("IsFinal: true\r\nType: response\r\n", body)},
        {"nothing", ""},
        {"a zero", std::string(1, '\0')},
        {"a line", "ORPC/2"},
        {"another protocol", "ORPC/3" + whole.substr(6)},
        {"half of a message", whole.substr(0, whole.size() / 2)},
        {"all but the last byte", whole.substr(0, whole.size() - 1)},
        {"too large a body", "ORPC/2 10 5242881\r\n"},
        {"sizes of another world", "ORPC/2 4294967295 4294967295\r\n"},
    };
    const ref<VkLocalorvoClient> client = Connected();
    ASSERT_EQ(1u, SendAsync(client, true));
    for (const Case& each : cases) {
        bus.RespondWithText(each.text);
        bus.WaitHandled();
        EXPECT_EQ(0u, bus.EventResults().back()) << each.name;
        EXPECT_EQ("1 0 1 0", Tables(client)) << each.name;
        EXPECT_TRUE(AllReceived().empty()) << each.name;
    }
    EXPECT_EQ(0u, bus.Count("close"));
    bus.RespondWithText(whole);
    bus.WaitHandled();
    EXPECT_EQ(1u, AllReceived().size());
}

TEST_F(ReceiveTest, WhatEndsTheConnection) {
    struct Case {
        const char* name;
        std::function<void()> arrive;
    };
    const Case cases[] = {
        {"a piece of a response", [this] { bus.SendEvent(VkAesResponseChunk::idG); }},
        {"a hello", [this] { bus.SendEvent(VkAesHello::idG); }},
        {"a request", [this] { bus.SendEvent(VkAesRequest::idG); }},
        {"no id", [this] { bus.SendEvent(0); }},
        {"an unknown id", [this] { bus.SendEvent(171753); }},
        {"one that cannot be decoded",
         [this] {
             bus.nFailDecode = 1;
             bus.Respond(1);
         }},
    };
    for (const bool isMonitored : {false, true}) {
        for (const Case& each : cases) {
            const ref<VkLocalorvoClient> client = VkLocalorvoClient::Get();
            if (isMonitored) VkLocalorvoClientProbe{*client}.StartMonitoring();
            VkLocalorvoClientProbe{*client}.StorePending(object, this);
            const std::string cancel =
                "cancel " + std::to_string(VkLocalorvoClientProbe{*client}.LastRpcId());
            bus.ForgetCalls();
            each.arrive();
            if (!isMonitored) {
                // A sender handles it; it has a request pending of its own.
                bus.nFailSend = 1;
                EXPECT_FALSE(client->SendRequestAndForget(object.get()));
            }
            bus.WaitHandled();
            EXPECT_EQ(0xFFFFu, bus.EventResults().back()) << each.name;
            Lines calls = bus.CallsBeside();
            calls.erase(calls.begin(), calls.end() - 3);
            EXPECT_EQ((Lines{cancel, "close session", "close"}), calls) << each.name;
            EXPECT_EQ("0 0 0 0", Tables(client)) << each.name;
            EXPECT_FALSE(FMonitored(client)) << each.name;
            EXPECT_EQ(0u, VkLocalorvoClientProbe{*client}.Connection()) << each.name;
        }
    }
    EXPECT_TRUE(VkLocalorvoClient::Get()->SendRequestAndForget(object.get()));
}

TEST_F(ReceiveTest, AfterAPieceTheNextAsynchronousSendWorks) {
    const ref<VkLocalorvoClient> client = Connected();
    SendAsync(client, true);
    bus.SendEvent(VkAesResponseChunk::idG);
    bus.WaitHandled();
    const unsigned rpcId = SendAsync(client, true);
    EXPECT_TRUE(FMonitored(client));
    bus.Respond(rpcId);
    bus.WaitHandled();
    EXPECT_EQ((std::vector<Received>{{rpcId, true, ScriptedBus::bodyG, nullptr}}), AllReceived());
}

TEST_F(ReceiveTest, IsFinalIsTrueOnlyByThatWord) {
    const ref<VkLocalorvoClient> client = Connected();
    for (const char* word : {"true", "false", "True", "1", ""}) {
        const unsigned rpcId = SendAsync(client, false);
        bus.RespondWithText(ScriptedBus::ResponseText(rpcId, word, ScriptedBus::bodyG));
        bus.WaitHandled();
        EXPECT_EQ(std::string(word) == "true", AllReceived().back().isFinal) << word;
    }
    EXPECT_EQ(5u, AllReceived().size());
}

TEST_F(ReceiveTest, ABodyOfAnyTextReachesTheCallback) {
    const ref<VkLocalorvoClient> client = Connected();
    for (const std::string& body : {std::string("{nonsense"), std::string("{}"), std::string(1 << 20, ' ')}) {
        const unsigned rpcId = SendAsync(client, false);
        bus.Respond(rpcId, true, body);
        bus.WaitHandled();
        EXPECT_EQ(body, AllReceived().back().json);
    }
}
