#pragma once

#include <string>

#include "typedjson/ReaderFixture.h"

namespace sorntest {

/// Single fields of records of everyType, read from text.
class FieldReadFixture : public ReaderFixture {
 protected:
    static std::string Record(const std::string& members) {
        return "{" + members + (members.empty() ? "" : ", ") + "\"type\": \"everyType\"}";
    }
    static std::string Member(const std::string& field, const std::string& value) {
        return "\"" + field + "\": " + value;
    }
    /// What a record shows under a field, memory and stream alike; the words when it is refused.
    std::string Shown(const std::string& members, const std::string& field) {
        const std::string text = Record(members);
        const ReadOutcome outcome = Read(text);
        EXPECT_EQ(ReadStream(text, 3), outcome) << text;
        EXPECT_EQ(ReadInMemory(text), outcome) << text;
        if (!outcome.isRead) return "refused" + outcome.words;
        size_t begin = outcome.shown.find(";" + field);
        if (begin == std::string::npos) begin = outcome.shown.find("{" + field);
        if (begin == std::string::npos) return "?";
        begin += 1 + field.size();
        return outcome.shown.substr(begin, outcome.shown.find(';', begin) - begin);
    }
};

}  // namespace sorntest
