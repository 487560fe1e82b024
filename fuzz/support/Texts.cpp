#include "fuzz/support/Texts.h"

#include "sorn/binary/ProtoBuf.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace {

std::string Copy(const sorn::ByteBuffer& bytes) {
    return bytes.GetLength() == 0
               ? std::string()
               : std::string(reinterpret_cast<const char*>(bytes.GetData()), bytes.GetLength());
}

}  // namespace

std::string_view View(const ref<rox::ByteBuffer>& bytes) {
    if (bytes->GetLength() == 0) return {};
    return {reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength()};
}

std::string DictionaryText(const sorn::DictValue& value, RoxMempool* pool, bool isPretty) {
    sorn::ByteBuffer out(pool);
    value.ToJson(out, sorn::JsonFormat(isPretty));
    return Copy(out);
}

std::string TypedText(const sorn::SornObject& object, RoxMempool* pool, sorn::OrvoVersion version) {
    sorn::ByteBuffer out(pool);
    sorn::JsonSornObject(pool).SornObjectToJson(&object, version, out);
    return Copy(out);
}

std::string BinaryForm(const sorn::SornObject& object, RoxMempool* pool) {
    const sorn::ProtoBuf codec(pool, sorn::Schema::vStructDefG, sorn::Schema::nStructDefG);
    return std::string(View(codec.MarshalKnownDict(&object)));
}

void WriteEverywhere(const sorn::SornObject& object, RoxMempool* pool) {
    for (const int number : {0, 7, 42}) {
        const sorn::OrvoVersion version(number);
        TypedText(object, pool, version);
        DictionaryText(*object.ToDictionary(version), pool);
    }
    BinaryForm(object, pool);
}

bool FBrittle(std::string_view text) {
    return text.find("\\u") != text.npos || text.find('\x03') != text.npos || text.find('\x1a') != text.npos;
}
