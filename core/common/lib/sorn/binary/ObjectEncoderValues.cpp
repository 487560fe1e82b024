#include "sorn/binary/AnyDictEncoder.h"
#include "sorn/binary/ObjectEncoder.h"
#include "sorn/binary/WireWriters.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"

namespace sorn {

using namespace wirewriters;

/// The values of a field that holds neither objects nor bodies, each with the tag.
void ObjectEncoder::WriteElements(const PlannedField& field, const FieldSource& source) {
    const DataType type = field.Type();
    unsigned char* p = outM.Begin();
    for (uint32_t i = source.Count(type); i-- > 0;) {
        p = outM.Room(p, maxPlainG);
        switch (type) {
            case SORN_DATA_TYPE_STRING:
            case SORN_DATA_TYPE_STRING_ID:
                p = WriteText(outM, source.TextAt(i), p, maxHeadG);
                break;
            case SORN_DATA_TYPE_BYTESTRING: {
                const auto* const bytes = source.ReferenceAt<rox::ByteBuffer>(i);
                if (bytes == nullptr) continue;
                p = WriteBytes(*bytes, p);
                break;
            }
            case SORN_DATA_TYPE_ANY_DICT: {
                const auto* const dict = source.ReferenceAt<Dict>(i);
                if (dict == nullptr) continue;
                p = WriteAnyDict(*dict, p);
                break;
            }
            default:
                p = WritePlain(type, &source.PlainAt<unsigned char>(i), p);
        }
        p = field.WriteTag(p);
    }
    outM.Commit(p);
}

// These leave room for a tag.

unsigned char* ObjectEncoder::WriteBytes(const rox::ByteBuffer& bytes, unsigned char* p) {
    if (!bytes.FEmpty()) p = outM.Bytes(p, bytes.GetData(), bytes.GetLength());
    return varint::WriteInRoom(bytes.GetLength(), outM.Room(p, maxHeadG));
}

unsigned char* ObjectEncoder::WriteAnyDict(const Dict& dict, unsigned char* p) {
    const size_t end = outM.Count(p);
    outM.Commit(p);
    AnyDictEncoder(pMempoolM, outM).Body(*dict.GetDictionary());
    p = outM.Room(outM.Begin(), maxHeadG);
    return varint::WriteInRoom(outM.Count(p) - end, p);
}

}  // namespace sorn
