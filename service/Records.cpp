#include "service/Records.h"

#include <algorithm>

#include "kelbaselib/InMemoryBytestream.h"
#include "service/RecordKey.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/model/Schema.h"

namespace sorn::service {

namespace {

/// A text as an object by the dictionary, which honours version and required fields; null and words.
ref<SornObject> ReadObject(RoxMempool* pool, std::string_view text, OrvoVersion version, RoxString& words) {
    const ref<Dictionary> dictionary = Dictionary::FromJson(
        reinterpret_cast<const unsigned char*>(text.data()), static_cast<unsigned>(text.size()), words, pool);
    ref<SornObject> object;
    if (dictionary != nullptr) {
        DictionarySornObject(pool, Schema::vStructDefG, Schema::nStructDefG)
            .DictionaryToSornObject(dictionary, version, object, words);
    }
    return object;
}

/// Whether readers of plain JSON take the text, too: ours takes bare words and other bytes than UTF-8.
bool FPlainJson(RoxMempool* pool, std::string_view text, RoxString& words) {
    kelbaselib::InMemoryBytestream stream(pool);
    stream.Write(text.data(), static_cast<unsigned>(text.size()));
    return Dictionary::FromJsonBytesource(stream.NewSource(), words, pool) != nullptr && words.FEmpty();
}

}  // namespace

ref<SornObject> Records::ReadRecord(std::string_view text, OrvoVersion version, Failure& failure) {
    RoxString words;
    ref<SornObject> object = ReadObject(&poolM, text, version, words);
    if (object != nullptr && FPlainJson(&poolM, text, words)) return object;
    failure.Set(ErrorCode::badArgumentG, words.FEmpty() ? "the record has no known type" : words.Utf8());
    return nullptr;
}

Records::Table* Records::GetTable(const StructInfo& type, Failure& failure) {
    const auto found = tablesM.find(&type);
    if (found != tablesM.end()) return &found->second;
    std::vector<Store::Row> vRows;
    if (!storeM.List(type.name, vRows, failure)) return nullptr;
    Table& table = tablesM[&type];
    table.reserve(vRows.size());
    for (const Store::Row& row : vRows) table.push_back({row.number, row.version, nullptr});
    return &table;
}

/// The object of a record; null for one that the schema of this service does not read any more.
bool Records::Decode(Entry& entry, ref<SornObject>& object, Failure& failure) {
    object = entry.object;
    if (object != nullptr) return true;
    const auto take = [&](std::string_view text) {
        RoxString words;
        object = ReadObject(&poolM, text, entry.version, words);
    };
    if (!storeM.Read(entry.number, take, failure)) return false;
    Keep(entry, object);
    return true;
}

void Records::Keep(Entry& entry, const ref<SornObject>& object) {
    if (poolM.GetUsedBytes() <= limitsM.maxDecodedBytes) entry.object = object;
}

void Records::Tell(Change change) {
    if (isBatchM) {
        vPendingM.push_back(std::move(change));
    } else if (listenerM) {
        listenerM(change);
    }
}

bool Records::Put(const ref<SornObject>& record, OrvoVersion version, std::string_view text,
                  Failure& failure) {
    const StructInfo& type = *Schema::vStructDefG[record->structId];
    Table* const table = GetTable(type, failure);
    if (table == nullptr) return false;
    if (table->size() >= limitsM.maxTypeRecords) {
        return failure.Set(ErrorCode::resourceUnavailableG, "there are too many records of that type");
    }
    Entry entry{0, version, nullptr};
    const Store::Stored stored = storeM.Put(type.name, RecordKey(*record, version, text), version.Number(),
                                            text, entry.number, failure);
    if (stored == Store::FAILED) return false;
    Keep(entry, record);
    Change change{&type, {}, {true, version, record}};
    if (stored == Store::INSERTED) {
        table->push_back(entry);
    } else {
        const auto place = std::partition_point(
            table->begin(), table->end(), [&](const Entry& each) { return each.number < entry.number; });
        change.before = {true, place->version, place->object};
        *place = entry;
    }
    Tell(std::move(change));
    return true;
}

bool Records::Remove(const StructInfo& type, const Conditions& conditions, Failure& failure) {
    std::vector<int64_t> vNumbers;
    const auto take = [&vNumbers](int64_t number) {
        vNumbers.push_back(number);
        return true;
    };
    if (!Find(type, conditions, take, failure)) return false;
    if (vNumbers.empty()) return true;
    if (!storeM.Remove(vNumbers, failure)) return false;
    Table& table = tablesM[&type];
    std::vector<Change> vChanges;
    std::erase_if(table, [&](const Entry& entry) {
        if (!std::binary_search(vNumbers.begin(), vNumbers.end(), entry.number)) return false;
        vChanges.push_back({&type, {true, entry.version, entry.object}, {}});
        return true;
    });
    for (Change& change : vChanges) Tell(std::move(change));
    return true;
}

bool Records::BeginBatch(Failure& failure) {
    isBatchM = storeM.Begin(failure);
    return isBatchM;
}

bool Records::EndBatch(Failure& failure) {
    if (!storeM.Commit(failure)) {
        DropBatch();
        return false;
    }
    isBatchM = false;
    for (Change& change : std::exchange(vPendingM, {})) Tell(std::move(change));
    return true;
}

void Records::DropBatch() {
    storeM.Rollback();
    isBatchM = false;
    vPendingM.clear();
    tablesM.clear();  // made again of what the store has
}

bool Records::Find(const StructInfo& type, const Conditions& conditions,
                   const std::function<bool(int64_t number)>& take, Failure& failure) {
    Table* const table = GetTable(type, failure);
    if (table == nullptr) return false;
    for (Entry& entry : *table) {
        if (!conditions.FEmpty()) {
            ref<SornObject> object;
            if (!Decode(entry, object, failure)) return false;
            if (object == nullptr || !conditions.FMatches(*object, entry.version)) continue;
        }
        if (!take(entry.number)) break;
    }
    return true;
}

}  // namespace sorn::service
