#pragma once

#include <cstdint>
#include <string_view>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/typedjson/NameIndex.h"

namespace rox {
class ByteBuffer;
}

/// The values that texts without a NUL stand for in the typed reader. False, with the target untouched, for a
/// text that is none.
namespace sorn::textvalue {

bool ToBool(std::string_view text, bool& out);  ///< "true" and "false" alone
/// As sscanf does with "%d", "%lld", "%u", "%llu" and "%lg": blanks before the number and anything behind it
/// pass, a minus sign wraps for unsigned numbers, and there is no test of range. What is out of it: 64-bit
/// numbers become the nearest one in it; 32-bit ones are first clipped to the range of the host's `long`
/// type, of which the low 32 bits are kept.
bool ToS32(std::string_view text, int& out);
bool ToS64(std::string_view text, long long& out);
bool ToU32(std::string_view text, unsigned& out);
bool ToU64(std::string_view text, unsigned long long& out);
bool ToFloat(std::string_view text, double& out);
/// The value of a name of the field's enumeration.
bool ToEnum(const FieldInfo& field, const NameKey& text, uint32_t& out);
/// The id behind the prefix of the field's struct. Bad digits give 0, and succeed.
bool ToIntId(const FieldInfo& field, std::string_view text, unsigned& out);
bool ToLongId(const FieldInfo& field, std::string_view text, unsigned long long& out);
bool ToStringId(const FieldInfo& field, std::string_view text, std::string_view& out);
/// The bytes of a Base64 text, in the pool; null when there are none, for a bad text too.
ref<rox::ByteBuffer> ToBytes(RoxMempool* pool, std::string_view text);

/// A text with a NUL behind it, in place while it is short.
class Terminated {
 public:
    explicit Terminated(std::string_view text);
    Terminated(const Terminated&) = delete;
    Terminated& operator=(const Terminated&) = delete;

    const char* Text() const { return longM.FEmpty() ? shortM : longM.Utf8(); }

 private:
    char shortM[128];
    RoxString longM;
};

}  // namespace sorn::textvalue
