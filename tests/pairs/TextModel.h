#pragma once

#include <optional>
#include <string>

#include "pairs/Record.h"

namespace sorntest {

/// A text in quotes with its escapes.
std::string Quoted(const std::string& text);

/// Where JSON text goes. Bodies of objects inside a dictionary go out as their typed text into a buffer, but
/// into a sink only with the feature of the typed road.
enum class Destination { buffer, sink, sinkOfTypedRoad };

/// The text of a dictionary: names sorted, an entry for each value.
std::string TreeText(const Tree& tree, bool pretty, Destination destination = Destination::buffer);

/// The typed text of a record: fields in slot order, "type" before the last field that sorts below it.
std::string TypedText(const Record& record, int version);

/// Stands in words for what is only known to be there.
inline const std::string someWords = "<some words>";
inline bool FKnown(const std::string& words) {
    return words.find(someWords) == std::string::npos;
}

enum class Dialect {
    hand,    ///< of the parser for text in memory: escapes by number kept, names once
    stream,  ///< of the parser for streams: escapes by number decoded, names repeated
    typed,   ///< of the typed reader: backslash and u dropped, null a word
};

/// The dictionary of a text that one of the writers made; nothing and words when the dialect refuses it.
/// The words of the stream's dialect are only someWords.
std::optional<Tree> ParseText(const std::string& text, Dialect dialect, std::string& words);

}  // namespace sorntest
