#pragma once

#include <cstdint>
#include <string_view>

#include "rox/RoxMempool.h"
#include "service/Answers.h"
#include "service/Changes.h"
#include "service/Limits.h"
#include "service/Records.h"
#include "service/RequestPlans.h"
#include "service/Store.h"
#include "service/Streams.h"
#include "sorn/rpc/RequestUpdateWrapper.h"

namespace sorn::service {

/// What the development service says to messages, wherever they come from. It knows the schema and no record:
/// docs/service.md tells which requests it has. One thread.
class Service {
 public:
    /// The header of a request for storing or removing a record, and its values. The request's type and body
    /// are the record's.
    static constexpr char actionHeaderG[] = "Action";
    static constexpr char putG[] = "put";
    static constexpr char removeG[] = "remove";

    /// Answers go to `send`, out of the operations below. The store outlives the service.
    Service(Store& store, const Limits& limits, Answers::Send send);

    /// One message of a session.
    void Receive(uint32_t session, std::string_view message);
    /// A session is over: its open requests are dropped.
    void EndSession(uint32_t session) { streamsM.CloseSession(session); }
    /// Sends new lists to open requests as far as one turn goes; whether more is left.
    bool Deliver() { return streamsM.Deliver(); }

    /// Stores a record at the default schema version; false and words.
    bool Load(std::string_view text, Failure& failure);
    /// Loads between them are stored together. EndLoad gives false and words when none of them was.
    bool BeginLoad(Failure& failure) { return recordsM.BeginBatch(failure); }
    bool EndLoad(Failure& failure) { return recordsM.EndBatch(failure); }
    /// Whether a failure of the store between them has undone all of them already: further ones fail, too.
    bool FLoadLost() const { return recordsM.FBatchLost(); }

    size_t CountStreams() const { return streamsM.Count(); }

 private:
    void TakeRequest(uint32_t session, const RequestWrapper& request);
    void TakeUpdate(uint32_t session, const RequestWrapper& update);
    bool Do(StreamId id, const RequestWrapper& request, Failure& failure);
    bool DoAction(const RoxString& action, const RequestBody& body, Failure& failure);
    bool Search(StreamId id, const RequestPlan& plan, const RequestBody& body,
                RequestWrapper::ResponseCount count, Failure& failure);

    RoxMempool poolM{"sorn service"};  // of one message at a time
    const Limits limitsM;
    const RequestPlans plansM;
    Records recordsM;
    Answers answersM;
    Changes changesM;
    Streams streamsM;
};

}  // namespace sorn::service
