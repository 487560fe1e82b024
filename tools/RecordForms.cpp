#include "tools/RecordForms.h"

#include <climits>

#include "rox/RoxMempool.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/convert/DictionarySornObject.h"
#include "sorn/dict/Base64.h"
#include "sorn/dict/ByteBuffer.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/model/Schema.h"
#include "sorn/typedjson/JsonSornObject.h"
#include "tools/Output.h"

namespace sorn::tools {

namespace {

constexpr Base64 base64G(Base64::DEFAULT_CODE_SET, Base64::DEFAULT_TERMINATOR);

const unsigned char* BytesOf(const std::string& record) {
    return reinterpret_cast<const unsigned char*>(record.data());
}

ref<SornObject> ReadTyped(RoxMempool* pool, const std::string& record, OrvoVersion version,
                          RoxString& error) {
    ref<SornObject> object;
    if (record.size() > INT_MAX) {
        error = "the record is longer than 2 GiB";
    } else if (!JsonSornObject(pool).JsonToSornObject(BytesOf(record), static_cast<int>(record.size()),
                                                      version, &object, error) &&
               error.FEmpty()) {
        // The one failure for which the reader has no words.
        error = "the type of the record is missing, or names no struct";
    }
    return object;
}

ref<SornObject> ReadByDictionary(RoxMempool* pool, const std::string& record, OrvoVersion version,
                                 RoxString& error) {
    const ref<Dictionary> dictionary =
        Dictionary::FromJson(BytesOf(record), static_cast<unsigned>(record.size()), error, pool);
    ref<SornObject> object;
    if (dictionary != nullptr) {
        DictionarySornObject(pool, Schema::vStructDefG, Schema::nStructDefG)
            .DictionaryToSornObject(dictionary, version, object, error);
    }
    return object;
}

ref<SornObject> ReadBinary(RoxMempool* pool, const std::string& record, bool isBase64, RoxString& error) {
    auto n = static_cast<unsigned>(record.size());
    if (isBase64 && n != 0 && record.back() == '\r') --n;  // of a line that ends with both
    const ref<rox::ByteBuffer> bytes =
        isBase64 ? base64G.Decode(pool, BytesOf(record), n) : rox::ByteBuffer::New(pool, record.data(), n);
    ref<SornObject> object;
    if (bytes == nullptr) {
        error = "the line is not Base64";
    } else if (!ProtoBuf(pool, Schema::vStructDefG, Schema::nStructDefG).UnmarshalKnownDict(bytes, &object)) {
        error = "Protobuf did not unmarshal to SornObject";
    }
    return object;
}

void WriteBinary(RoxMempool* pool, const ref<SornObject>& object, bool isBase64, std::FILE* out) {
    const ref<rox::ByteBuffer> bytes =
        ProtoBuf(pool, Schema::vStructDefG, Schema::nStructDefG).MarshalKnownDict(object.get());
    if (isBase64) {
        std::fputs(EncodeBase64(pool, bytes).Utf8(), out);
        std::fputc('\n', out);
    } else {
        std::fwrite(bytes->GetData(), 1, bytes->GetLength(), out);
    }
}

}  // namespace

ref<SornObject> ReadRecord(const ConvertOptions& options, RoxMempool* pool, const std::string& record,
                           std::string& words) {
    RoxString error;
    ref<SornObject> object;
    if (options.from == "binary") {
        object = ReadBinary(pool, record, options.lines, error);
    } else if (options.road == "typed") {
        object = ReadTyped(pool, record, options.schemaVersion, error);
    } else {
        object = ReadByDictionary(pool, record, options.schemaVersion, error);
    }
    if (object == nullptr) words = error.View();
    return object;
}

void WriteRecord(const ConvertOptions& options, RoxMempool* pool, const ref<SornObject>& object,
                 std::FILE* out) {
    if (options.to == "binary") {
        WriteBinary(pool, object, options.lines, out);
        return;
    }
    // A body of text goes out as it came in, line feeds included.
    FileSink sink(out, options.lines && !options.pretty);
    if (options.road == "typed" && !options.pretty) {
        ByteBuffer text(pool);
        JsonSornObject(pool).SornObjectToJson(object.get(), options.schemaVersion, text);
        sink.Write(text.GetData(), text.GetLength());
    } else {
        DictionarySornObject(pool, Schema::vStructDefG, Schema::nStructDefG)
            .SornObjectToDictionary(object.get(), options.schemaVersion)
            ->ToJson(sink, JsonFormat(options.pretty));
    }
    std::fputc('\n', out);
}

}  // namespace sorn::tools
