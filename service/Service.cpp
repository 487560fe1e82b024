#include "service/Service.h"

#include <charconv>

#include "service/ListAnswer.h"
#include "sorn/model/Schema.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/FirstLine.h"
#include "sorn/rpc/HeaderBlock.h"
#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ReservedHeaders.h"

namespace sorn::service {

namespace {

/// The number that a message gives which is none otherwise; 0 where there is none to be seen.
uint32_t FindRpcId(RoxMempool* pool, std::string_view message) {
    FirstLine line;
    RoxString words;
    if (!line.Parse(message, words) || line.length > message.size()) return 0;
    HeaderBlock headers(pool);
    headers.Read(message.substr(line.length, line.headerLength), words);
    const std::string_view text = headers.Get(header::rpcIdG);
    uint32_t rpcId = 0;
    std::from_chars(text.data(), text.data() + text.size(), rpcId);
    return rpcId;
}

}  // namespace

Service::Service(Store& store, const Limits& limits, Answers::Send send)
    : limitsM(limits),
      recordsM(store, limits),
      answersM(poolM, std::move(send)),
      changesM(recordsM, poolM, limits),
      streamsM(recordsM, answersM, limits) {
    recordsM.SetListener([this](const Records::Change& change) { streamsM.OnChange(change); });
}

void Service::Receive(uint32_t session, std::string_view message) {
    RoxString words;
    const ref<OrvoRpcWrapper> wrapper = OrvoRpcV2::UnmarshalFromString(
        &poolM, RoxString::FromUtf8Bytes(&poolM, static_cast<unsigned>(message.size()), message.data()),
        false, words);
    if (wrapper == nullptr) {
        const char* const told = words.FEmpty() ? "the message is not complete" : words.Utf8();
        answersM.SendError(session, FindRpcId(&poolM, message), {ErrorCode::badArgumentG, told});
    } else if (const auto* update = dynamic_cast<const RequestUpdateWrapper*>(wrapper.get())) {
        TakeUpdate(session, *update);
    } else if (const auto* request = dynamic_cast<const RequestWrapper*>(wrapper.get())) {
        TakeRequest(session, *request);
    } else if (dynamic_cast<const CancelWrapper*>(wrapper.get()) != nullptr) {
        streamsM.Close({session, wrapper->GetRpcId()});
    }
    // Responses are nothing that a client has to send; to answer them could go on for ever.
}

void Service::TakeRequest(uint32_t session, const RequestWrapper& request) {
    const StreamId id{session, request.GetRpcId()};
    const bool isAnswered = request.GetResponseCount() != RequestWrapper::RESPONSE_COUNT_NONE;
    Failure failure;
    bool isDone = false;
    if (streamsM.FOpen(id)) {
        // Two exchanges of one number could not be told apart: the error ends both.
        streamsM.Close(id);
        failure.Set(ErrorCode::badArgumentG, "a request of that number is open");
    } else {
        isDone = Do(id, request, failure);
    }
    if (!isDone && isAnswered) answersM.SendError(session, id.rpcId, failure);
}

bool Service::Do(StreamId id, const RequestWrapper& request, Failure& failure) {
    RequestBody body;
    if (!body.Read(&poolM, request, failure)) return false;
    const RoxString action = request.GetOptionalHeaders()->GetString(actionHeaderG, 0);
    const RequestPlan* const plan = plansM.Find(body.pType->name);
    const RequestWrapper::ResponseCount count = request.GetResponseCount();
    if (action.FEmpty() && plan != nullptr && plan->kind == RequestPlan::SEARCH) {
        return Search(id, *plan, body, count, failure);
    }
    bool isDone;
    if (!action.FEmpty()) {
        isDone = DoAction(action, body, failure);
    } else if (plan != nullptr) {
        isDone = plan->kind == RequestPlan::STORE ? changesM.Store(*plan, body, failure)
                                                  : changesM.RemoveBy(*plan, body, failure);
    } else {
        const std::string type = body.pType->name;
        isDone =
            failure.Set(ErrorCode::badArgumentG, "this service does not answer requests of type " + type);
    }
    if (isDone && count != RequestWrapper::RESPONSE_COUNT_NONE) answersM.SendSuccess(id.session, id.rpcId);
    return isDone;
}

bool Service::DoAction(const RoxString& action, const RequestBody& body, Failure& failure) {
    if (action == putG) return changesM.Put(body.text, body.version, failure);
    if (action == removeG) return changesM.Remove(body, failure);
    return failure.Set(ErrorCode::badArgumentG, "the action is neither put nor remove");
}

bool Service::Search(StreamId id, const RequestPlan& plan, const RequestBody& body,
                     RequestWrapper::ResponseCount count, Failure& failure) {
    const ref<SornObject> object = body.ToObject(&poolM, failure);
    Query query;
    if (object == nullptr || !query.Set(plan, *object, body.version, limitsM, failure)) return false;
    if (count == RequestWrapper::RESPONSE_COUNT_MULTIPLE) {
        return streamsM.Open(id, std::move(query), failure);
    }
    if (count == RequestWrapper::RESPONSE_COUNT_NONE) return true;
    std::string text;
    if (!WriteList(recordsM, query, limitsM, text, failure)) return false;
    answersM.SendText(id.session, id.rpcId, true, text);
    return true;
}

/// A new query for an open request. Whatever is wrong with it ends the request.
void Service::TakeUpdate(uint32_t session, const RequestWrapper& update) {
    const StreamId id{session, update.GetRpcId()};
    Failure failure;
    if (!streamsM.FOpen(id)) {
        failure.Set(ErrorCode::objectNotFoundG, "no request of that number is open");
        answersM.SendError(session, id.rpcId, failure);
        return;
    }
    streamsM.Close(id);
    RequestBody body;
    const bool isRead = body.Read(&poolM, update, failure);
    const RequestPlan* const plan = isRead ? plansM.Find(body.pType->name) : nullptr;
    if (isRead && (plan == nullptr || plan->kind != RequestPlan::SEARCH)) {
        failure.Set(ErrorCode::badArgumentG, "the update is no search");
    } else if (isRead && Search(id, *plan, body, RequestWrapper::RESPONSE_COUNT_MULTIPLE, failure)) {
        return;
    }
    answersM.SendError(session, id.rpcId, failure);
}

bool Service::Load(std::string_view text, Failure& failure) {
    return changesM.Put(text, OrvoVersion(static_cast<int>(Schema::defaultSchemaVersionG)), failure);
}

}  // namespace sorn::service
