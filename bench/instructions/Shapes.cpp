#include "instructions/Shapes.h"

#include "common/Bodies.h"

namespace bench {

namespace {

/// `head`, then items made of their numbers with ", " between until the text has nBytes, then `tail`.
template <class Item>
std::string Repeated(const std::string& head, const std::string& tail, size_t nBytes, Item item) {
    std::string text = head;
    for (unsigned i = 0; text.size() + tail.size() < nBytes; ++i) {
        if (i != 0) text += ", ";
        text += item(i);
    }
    return text + tail;
}

std::string Deep(size_t nBytes) {
    const std::string head = "{\"cause\": ", core = "{\"code\": \"badArgument\", \"type\": \"error\"}",
                      tail = ", \"code\": \"badArgument\", \"type\": \"error\"}";
    const size_t nLevels = nBytes / (head.size() + tail.size());
    std::string text;
    for (size_t i = 0; i < nLevels; ++i) text += head;
    text += core;
    for (size_t i = 0; i < nLevels; ++i) text += tail;
    return text;
}

/// A list of lists, since a list has an end at 65,535 elements.
std::string ListOfLists(const std::string& field, const std::string& element, unsigned nElements,
                        size_t nBytes) {
    std::string list = "{\"isBottom\": true, \"isTop\": true, \"" + field + "\": [";
    for (unsigned i = 0; i < nElements; ++i) list += (i == 0 ? "" : ", ") + element;
    list += "], \"type\": \"idSequence\"}";
    return Repeated("{\"isBottom\": true, \"isTop\": true, \"resolvedObject\": [",
                    "], \"type\": \"idSequence\"}", nBytes, [&list](unsigned) { return list; });
}

/// Names of 40 bytes that a polynomial hash with the factor 31 cannot tell apart ("Aa" and "BB" weigh the
/// same).
std::string CollidingName(unsigned number) {
    std::string name(4, 'k');
    for (unsigned bit = 0; bit < 18; ++bit) name += (number >> bit) % 2 != 0 ? "Aa" : "BB";
    return name;
}

std::string FreeForm(size_t nBytes, std::string (*name)(unsigned)) {
    return Repeated("{\"code\": \"badArgument\", \"traceInfo\": {", "}, \"type\": \"error\"}", nBytes,
                    [name](unsigned i) { return "\"" + name(i) + "\": \"v\""; });
}

std::string NumberedName(unsigned number) {
    return "name" + std::to_string(number);
}

std::string Blanks(size_t nBytes) {
    const std::string run(nBytes / 8, ' ');
    return "{" + run + "\"code\"" + run + ":" + run + "\"badArgument\"" + run + "," + run + "\"type\"" + run +
           ":" + run + "\"error\"" + run + "}";
}

}  // namespace

std::string ShapedText(const std::string& shape, size_t nBytes) {
    if (shape == "realistic") return ListOfRecords(nBytes, 5000).front();
    if (shape == "string") {
        return "{\"code\": \"badArgument\", \"text\": \"" + std::string(nBytes, 'd') +
               "\", \"type\": \"error\"}";
    }
    if (shape == "deep") return Deep(nBytes);
    if (shape == "keys") return FreeForm(nBytes, NumberedName);
    if (shape == "colliding") return FreeForm(nBytes, CollidingName);
    if (shape == "objects") return ListOfLists("resolvedObject", "{\"type\": \"success\"}", 100, nBytes);
    if (shape == "arrays") return ListOfLists("objectIdAndType", "\"1\"", 3, nBytes);
    if (shape == "blanks") return Blanks(nBytes);
    return "";
}

}  // namespace bench
