#include "service/Streams.h"

#include <utility>
#include <vector>

#include "rox/RoxHashBytes.h"
#include "rox/RoxMonotonicTime.h"
#include "service/ListAnswer.h"

namespace sorn::service {

namespace {

/// Tells lists apart, which are never empty, without keeping them.
uint64_t Digest(const std::string& text) {
    return uint64_t{RoxHashBytes(text.data(), text.size())} << 32 |
           RoxHashBytes(text.data(), text.size() - 1);
}

bool FTouches(const Conditions& conditions, const Records::Side& side) {
    if (!side.isRecord) return false;
    // What cannot be compared may have been in the list.
    return conditions.FEmpty() || side.object == nullptr || conditions.FMatches(*side.object, side.version);
}

}  // namespace

bool Streams::FRoom(StreamId id, Failure& failure) const {
    const auto found = nOfSessionM.find(id.session);
    const size_t nOfSession = found == nOfSessionM.end() ? 0 : found->second;
    if (streamsM.size() < limitsM.maxStreams && nOfSession < limitsM.maxSessionStreams &&
        nQueryBytesM < limitsM.maxStreamQueryBytes) {
        return true;
    }
    return failure.Set(ErrorCode::serverBusyG, "too many requests are open");
}

bool Streams::Open(StreamId id, Query query, Failure& failure) {
    std::string text;
    if (!FRoom(id, failure) || !WriteList(recordsM, query, limitsM, text, failure)) return false;
    Join(id, std::move(query), Digest(text));
    answersM.SendText(id.session, id.rpcId, false, text);
    return true;
}

Streams::Group& Streams::Join(StreamId id, Query query, uint64_t digest) {
    std::string identity = query.Identity();
    const size_t nBytes = identity.size();
    const auto [place, isNew] = groupsM[query.pPlan->pRecord].try_emplace(std::move(identity));
    Group& group = place->second;
    if (isNew) {
        group.query = std::move(query);
        nQueryBytesM += nBytes;
    }
    group.streams[id] = digest;
    streamsM[id] = &group;
    ++nOfSessionM[id.session];
    return group;
}

void Streams::Close(StreamId id) {
    const auto found = streamsM.find(id);
    if (found == streamsM.end()) return;
    Group& group = *found->second;
    streamsM.erase(found);
    if (--nOfSessionM[id.session] == 0) nOfSessionM.erase(id.session);
    group.streams.erase(id);
    if (!group.streams.empty()) return;
    Unqueue(group);
    const std::string identity = group.query.Identity();
    nQueryBytesM -= identity.size();
    groupsM[group.query.pPlan->pRecord].erase(identity);
}

void Streams::CloseSession(uint32_t session) {
    for (auto each = streamsM.lower_bound({session, 0});
         each != streamsM.end() && each->first.session == session;) {
        const StreamId id = each->first;
        ++each;
        Close(id);
    }
}

void Streams::OnChange(const Records::Change& change) {
    const auto found = groupsM.find(change.pType);
    if (found == groupsM.end()) return;
    for (auto& [identity, group] : found->second) {
        if (group.isQueued && !group.isWritten) continue;  // to be looked up anyway
        const Conditions& conditions = group.query.conditions;
        if (FTouches(conditions, change.before) || FTouches(conditions, change.after)) Queue(group);
    }
}

void Streams::Queue(Group& group) {
    group.isWritten = false;
    if (group.isQueued) return;
    group.place = queuedM.insert(queuedM.end(), &group);
    group.isQueued = true;
}

void Streams::Unqueue(Group& group) {
    if (!group.isQueued) return;
    queuedM.erase(group.place);
    group.isQueued = false;
    group.isWritten = false;
    std::string().swap(group.text);
}

bool Streams::Deliver() {
    Turn turn{RoxMonotonicTime::Now()};
    while (!queuedM.empty()) {
        if (!DeliverGroup(*queuedM.front(), turn)) return true;
    }
    return false;
}

/// Each turn does something.
bool Streams::FOver(const Turn& turn) const {
    if (turn.nMessages == 0) return false;
    return turn.nMessages >= limitsM.maxTurnMessages || turn.nBytes >= limitsM.maxTurnBytes ||
           RoxMonotonicTime::ToNanoseconds(RoxMonotonicTime::Now() - turn.start) >=
               limitsM.maxTurnNanoseconds;
}

/// False when the turn is over before all streams of the group have their list.
bool Streams::DeliverGroup(Group& group, Turn& turn) {
    // A list that was made is sent at least once, and the next one goes on where this one ended: however fast
    // changes come, every stream gets its turn.
    bool isDue = !group.isWritten;
    if (!group.isWritten) {
        if (FOver(turn)) return false;
        ++turn.nMessages;
        Failure failure;
        if (!WriteList(recordsM, group.query, limitsM, group.text, failure)) {
            End(group, failure);
            return true;
        }
        turn.nBytes += group.text.size();
        group.digest = Digest(group.text);
        group.isWritten = true;
    }
    auto each = group.streams.lower_bound(group.next);
    for (size_t n = group.streams.size(); n > 0; --n, ++each) {
        if (each == group.streams.end()) each = group.streams.begin();
        if (each->second == group.digest) continue;
        if (!std::exchange(isDue, false) && FOver(turn)) {
            group.next = each->first;
            return false;
        }
        ++turn.nMessages;
        turn.nBytes += group.text.size();
        each->second = group.digest;
        answersM.SendText(each->first.session, each->first.rpcId, false, group.text);
    }
    Unqueue(group);
    return true;
}

/// There is no list any more that could be sent.
void Streams::End(Group& group, const Failure& failure) {
    std::vector<StreamId> vIds;
    for (const auto& [id, digest] : group.streams) vIds.push_back(id);
    for (StreamId id : vIds) {
        answersM.SendError(id.session, id.rpcId, failure);
        Close(id);
    }
}

}  // namespace sorn::service
