#include "pairs/HostileFixture.h"

#include <fstream>

#include "pairs/RandomModel.h"
#include "sorn/model/Schema.h"

namespace sorntest {

std::vector<Record> HostileFixture::Victims() {
    // The shortest of many, for each of its bits costs many readings, that comes back on all roads.
    std::vector<Record> victims;
    size_t shortest = SIZE_MAX;
    for (uint32_t seed = 0; seed < 400; ++seed) {
        const Record record = RandomModel(seed).Make(*sorn::Schema::FindStruct(5921));
        const size_t length = Binary(record, false).size();
        std::string words;
        if (length >= shortest || !RecordOfTypedText(TypedText(record, 0), words)) continue;
        if (!RecordOfTree(TreeOfRecord(record, 0), 0, words)) continue;
        shortest = length;
        victims.assign(1, record);
    }
    for (const char* name : {"events", "requests", "settings"}) {
        std::ifstream file(std::string(SORN_SOURCE_DIR "/examples/data/") + name + ".jsonl");
        std::string line;
        std::string best;
        while (std::getline(file, line)) {
            if (best.empty() || line.size() < best.size()) best = line;
        }
        std::string words;
        std::optional<Record> record = RecordOfTypedText(best, words);
        EXPECT_TRUE(record.has_value()) << name;
        if (record) victims.push_back(*record);
    }
    return victims;
}

void HostileFixture::Read(ForEachChange forEach, const std::string& bytes, const Attack& attack) {
    std::string bad;
    auto unlessFailed = [&](const std::string& input) {
        if (HasFatalFailure()) return;
        attack(input);
        if (HasFatalFailure()) bad = input;
    };
    {
        QuietOutput quiet;
        forEach(bytes, unlessFailed);
    }
    if (HasFatalFailure()) attack(bad);
}

}  // namespace sorntest
