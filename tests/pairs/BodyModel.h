#pragma once

#include <optional>
#include <string>

#include "pairs/Record.h"
#include "pairs/TextModel.h"

namespace sorntest {

// What each conversion of a body must give. `isTypedRoad` is the feature of the direct road from text to
// objects.

/// Nothing and words on failure.
std::optional<Tree> BodyTree(const Body& body, std::string& words);
std::optional<Record> BodyRecord(const Body& body, bool isTypedRoad, std::string& words);
/// The body's binary form, a known-dict value.
std::string BodyBinary(const Body& body, bool isTypedRoad);
/// Empty when it cannot be read.
std::string BodyText(const Body& body, bool pretty, Destination destination);

/// The record and the dictionary that stand in for a failure.
Record ErrorRecord(const std::string& words);
Tree ErrorTree(const std::string& words);

// The conversions of which those are made.

/// Object to dictionary at a version.
Tree TreeOfRecord(const Record& record, int version);
/// Dictionary to object at a version.
std::optional<Record> RecordOfTree(const Tree& tree, int version, std::string& words);
/// The typed reader; words are empty for a text without a good type.
std::optional<Record> RecordOfTypedText(const std::string& text, std::string& words);
/// The binary form of a record, as a known-dict value.
std::string Binary(const Record& record, bool isTypedRoad);
/// What that form reads as: older forms of fields are lost, lazy fields become bytes, any-dicts plain.
Record AfterBinary(const Record& record, bool isTypedRoad);

}  // namespace sorntest
