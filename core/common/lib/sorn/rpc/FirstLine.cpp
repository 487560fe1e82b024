#include "sorn/rpc/FirstLine.h"

#include <algorithm>

#include "sorn/rpc/OrvoRpcV2.h"
#include "sorn/rpc/TrimmedView.h"

namespace sorn {

namespace {

/// A decimal number as sscanf reads it: white space, a sign, digits up to the first other character. A number
/// below zero is a huge one; above 2^32 they all are.
bool ReadLength(std::string_view field, uint64_t& length) {
    field.remove_prefix(std::min(field.find_first_not_of(whiteSpaceG), field.size()));
    const bool isNegative = !field.empty() && field[0] == '-';
    if (isNegative || (!field.empty() && field[0] == '+')) field.remove_prefix(1);
    if (field.empty() || field[0] < '0' || field[0] > '9') return false;
    uint64_t value = 0;
    for (char c : field) {
        if (c < '0' || c > '9') break;
        if (value <= UINT32_MAX) value = value * 10 + static_cast<uint64_t>(c - '0');
    }
    length = isNegative ? 0 - value : value;
    return true;
}

bool ReadLength(std::string_view field, uint32_t limit, uint32_t& length, const char* badNumber,
                const char* tooLong, RoxString& error) {
    uint64_t value = 0;
    if (!ReadLength(field, value)) {
        error = badNumber;
        return false;
    }
    if (value > limit) {
        error = tooLong;
        return false;
    }
    length = static_cast<uint32_t>(value);
    return true;
}

}  // namespace

bool FirstLine::Parse(std::string_view input, RoxString& error) {
    const size_t end = input.find("\r\n");
    if (end == std::string_view::npos) {
        if (input.size() <= maxUnfinishedG) {
            length = 0;
            return false;
        }
        // True on purpose: no good line is so long, so these bytes are one packet that nobody can read.
        error = "First line too long";
        length = static_cast<uint32_t>(input.size());
        return true;
    }
    length = static_cast<uint32_t>(end) + 2;

    const std::string_view line = TrimmedView(input.substr(0, end));
    const size_t first = line.find(' ');
    const size_t second = first == std::string_view::npos ? first : line.find(' ', first + 1);
    if (second == std::string_view::npos || line.find(' ', second + 1) != std::string_view::npos) {
        error = "First line does not have expected number of fields (3)";
        return false;
    }
    if (line.substr(0, first) != magicG) {
        error = "First line of message does not start with 'ORPC/2'";
        return false;
    }
    return ReadLength(line.substr(first + 1, second - first - 1), OrvoRpcV2::maxHeaderLengthG, headerLength,
                      "Invalid header length - not a number", "Declared header length too long", error) &&
           ReadLength(line.substr(second + 1), OrvoRpcV2::maxBodyLengthG, bodyLength,
                      "Invalid body length - not a number", "Declared body length too long", error);
}

}  // namespace sorn
