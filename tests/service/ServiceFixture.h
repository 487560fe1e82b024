#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "Messages.h"
#include "service/Service.h"

namespace sorntest {

/// A service over a store in memory, which is handed messages and whose answers are kept.
class ServiceFixture : public testing::Test {
 protected:
    struct Sent {
        uint32_t session;
        ResponseText response;
    };

    void SetUp() override { Start(); }
    /// Anew, with the limits as they are.
    void Start() {
        serviceM.reset();
        std::string words;
        storeM = sorn::service::Store::Open("", sorn::service::maxStoreBytesG, words);
        ASSERT_NE(storeM, nullptr) << words;
        serviceM = std::make_unique<sorn::service::Service>(
            *storeM, limits, [this](uint32_t session, std::string_view message) {
                sent.push_back({session, ResponseText(std::string(message))});
            });
    }

    sorn::service::Service& Service() { return *serviceM; }
    void Receive(const std::string& message, uint32_t session = 1) { serviceM->Receive(session, message); }
    void Receive(const RequestText& request, uint32_t session = 1) { Receive(request.Message(), session); }
    /// The answers since the last call.
    std::vector<Sent> Take() { return std::exchange(sent, {}); }
    /// The one answer to a message; an empty one, and a failure, when there is another number of them.
    ResponseText Ask(const std::string& message, uint32_t session = 1) {
        Receive(message, session);
        const std::vector<Sent> answers = Take();
        EXPECT_EQ(answers.size(), 1u) << message;
        return answers.size() == 1 ? answers[0].response : ResponseText("");
    }
    ResponseText Ask(const RequestText& request, uint32_t session = 1) {
        return Ask(request.Message(), session);
    }
    void Put(const std::string& type, const std::string& body) {
        EXPECT_EQ(Ask({4000000000, type, body, "single", "put"}).body, successG) << body;
    }
    void PutRecording(int number, const std::string& more = "") { Put("recording", Recording(number, more)); }
    void Remove(const std::string& type, const std::string& body) {
        EXPECT_EQ(Ask({4000000001, type, body, "single", "remove"}).body, successG) << body;
    }
    /// All that is due to open streams.
    std::vector<Sent> Delivered() {
        while (serviceM->Deliver()) {
        }
        return Take();
    }

    sorn::service::Limits limits;
    std::vector<Sent> sent;

 private:
    std::unique_ptr<sorn::service::Store> storeM;
    std::unique_ptr<sorn::service::Service> serviceM;
};

/// A list of recordings, as the service writes it.
inline std::string RecordingList(const std::vector<std::string>& vRecords, int anchorIndex = 0,
                                 bool isBottom = true, bool isTop = true) {
    std::string text = R"({"type": "recordingList", "recording": [)";
    for (size_t i = 0; i < vRecords.size(); ++i) text += (i == 0 ? "" : ", ") + vRecords[i];
    return text + "], \"anchorIndex\": " + std::to_string(anchorIndex) +
           ", \"isBottom\": " + (isBottom ? "true" : "false") + ", \"isTop\": " + (isTop ? "true" : "false") +
           "}";
}

}  // namespace sorntest
