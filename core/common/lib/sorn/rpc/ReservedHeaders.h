#pragma once

#include <cstdint>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/Dict.h"

namespace sorn {

// Names and words of the headers that the library itself writes and reads.
namespace header {
inline constexpr char contentTypeG[] = "Content-Type";
inline constexpr char isFinalG[] = "IsFinal";
inline constexpr char requestTypeG[] = "RequestType";
inline constexpr char responseCountG[] = "ResponseCount";
inline constexpr char rpcIdG[] = "RpcId";
inline constexpr char schemaVersionG[] = "SchemaVersion";
inline constexpr char typeG[] = "Type";
inline constexpr char lowerTypeG[] = "type";

inline constexpr char applicationJsonG[] = "application/json";
}  // namespace header

/// The headers of one message that its kind prescribes, in the order in which they enter a dictionary. Names
/// are literals; values are views, which what they were taken from must outlive.
class ReservedHeaders {
 public:
    static constexpr unsigned capacityG = 6;

    struct Line {
        const char* name;
        std::string_view value;
    };

    ReservedHeaders() = default;
    ReservedHeaders(const ReservedHeaders&) = delete;  // lines point into the object
    ReservedHeaders& operator=(const ReservedHeaders&) = delete;

    void Add(const char* name, std::string_view value) { vLinesM[nLinesM++] = {name, value}; }
    /// In decimal.
    void AddNumber(const char* name, uint32_t value);
    /// Ascending by name, in byte order: the order on the wire.
    void Sort();

    unsigned GetLength() const { return nLinesM; }
    const Line& operator[](unsigned i) const { return vLinesM[i]; }

    /// A new dictionary in the pool of these headers and the optional ones, which may be null: all values of
    /// all their names, by name, values that are no texts as empty ones.
    ref<Dict> ToDict(RoxMempool* pool, const Dict* optionalHeaders) const;

 private:
    static constexpr unsigned nDigitsG = 10;  // of 2^32 - 1

    Line vLinesM[capacityG];
    unsigned nLinesM = 0;
    char vDigitsM[capacityG][nDigitsG];
};

}  // namespace sorn
