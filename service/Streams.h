#pragma once

#include <compare>
#include <cstdint>
#include <list>
#include <map>
#include <string>
#include <unordered_map>

#include "service/Answers.h"
#include "service/Limits.h"
#include "service/Query.h"
#include "service/Records.h"

namespace sorn::service {

/// An open request: the number that its session gave it.
struct StreamId {
    uint32_t session;
    uint32_t rpcId;

    // A false alarm at defaulted comparisons. NOLINTNEXTLINE(modernize-use-nullptr)
    friend auto operator<=>(const StreamId&, const StreamId&) = default;
};

/// Searches that stay open: each gets its list again whenever that has become another one.
///
/// Streams with the same query share one answer. A change of a record is compared with each different query
/// of its type; only those that the record meets, or met, are looked up again. The new lists go out in turns,
/// between which others are served; a stream that waits for its turn while more changes come gets the last
/// list only.
class Streams {
 public:
    Streams(Records& records, Answers& answers, const Limits& limits)
        : recordsM(records), answersM(answers), limitsM(limits) {}
    Streams(const Streams&) = delete;
    Streams& operator=(const Streams&) = delete;

    bool FOpen(StreamId id) const { return streamsM.contains(id); }
    /// Opens a stream, which is not open, and sends the first list. False, and no stream, beyond the limits
    /// or when there is no list.
    bool Open(StreamId id, Query query, Failure& failure);
    /// Ends a stream; unknown ones are ignored. Sends nothing.
    void Close(StreamId id);
    void CloseSession(uint32_t session);
    size_t Count() const { return streamsM.size(); }

    void OnChange(const Records::Change& change);
    /// Sends what one turn may; whether more is left.
    bool Deliver();

 private:
    struct Group {
        Query query;
        std::map<StreamId, uint64_t> streams;  // and the digest of what each got last
        bool isQueued = false;
        std::list<Group*>::iterator place;  // among those queued
        // While the list goes out:
        bool isWritten = false;
        std::string text;
        uint64_t digest = 0;
        StreamId next = {0, 0};  // where the next turn goes on, all around
    };
    using Groups = std::map<std::string, Group>;  // by identity
    struct Turn {
        int64_t start;         // in tocks
        size_t nMessages = 0;  // and lists that were written for them
        size_t nBytes = 0;
    };

    bool FRoom(StreamId id, Failure& failure) const;
    Group& Join(StreamId id, Query query, uint64_t digest);
    bool FOver(const Turn& turn) const;
    bool DeliverGroup(Group& group, Turn& turn);
    void End(Group& group, const Failure& failure);
    void Queue(Group& group);
    void Unqueue(Group& group);

    Records& recordsM;
    Answers& answersM;
    const Limits limitsM;
    std::map<const StructInfo*, Groups> groupsM;
    std::map<StreamId, Group*> streamsM;
    std::unordered_map<uint32_t, size_t> nOfSessionM;
    size_t nQueryBytesM = 0;
    std::list<Group*> queuedM;
};

}  // namespace sorn::service
