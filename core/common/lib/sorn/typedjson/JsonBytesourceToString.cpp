#include "sorn/typedjson/JsonBytesourceToString.h"

#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/typedjson/CursorText.h"
#include "sorn/typedjson/TextValue.h"

namespace sorn {

bool JsonBytesourceToString(RoxMempool* pool, RoxHashStringToStringNew*, InputPointerBytesource& cursor,
                            RoxString& out) {
    return ReadString(pool, cursor, out);
}

bool ReadString(RoxMempool* pool, InputPointerBytesource& cursor, RoxString& out) {
    CursorText text(pool);
    if (!text.Read(cursor)) return false;
    out = text.Take(pool);
    return true;
}

bool ReadBool(RoxMempool* pool, InputPointerBytesource& cursor, bool& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToBool(text.View(), out);
}

bool ReadS32(RoxMempool* pool, InputPointerBytesource& cursor, int& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToS32(text.View(), out);
}

bool ReadS64(RoxMempool* pool, InputPointerBytesource& cursor, long long& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToS64(text.View(), out);
}

bool ReadU32(RoxMempool* pool, InputPointerBytesource& cursor, unsigned& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToU32(text.View(), out);
}

bool ReadU64(RoxMempool* pool, InputPointerBytesource& cursor, unsigned long long& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToU64(text.View(), out);
}

bool ReadEnum(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, unsigned& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToEnum(*field, NameKey(text.View()), out);
}

bool ReadIntId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, unsigned& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToIntId(*field, text.View(), out);
}

bool ReadLongId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field,
                unsigned long long& out) {
    CursorText text(pool);
    return text.Read(cursor) && textvalue::ToLongId(*field, text.View(), out);
}

bool ReadStringId(RoxMempool* pool, InputPointerBytesource& cursor, const FieldInfo* field, RoxString& out) {
    CursorText text(pool);
    std::string_view bare;
    if (!text.Read(cursor) || !textvalue::ToStringId(*field, text.View(), bare)) return false;
    out = RoxString::FromUtf8Bytes(pool, static_cast<unsigned>(bare.size()), bare.data());
    return true;
}

bool ReadBytestring(RoxMempool* pool, InputPointerBytesource& cursor, ref<rox::ByteBuffer>& out) {
    CursorText text(pool);
    if (!text.Read(cursor)) return false;
    out = textvalue::ToBytes(pool, text.View());
    if (out == nullptr) out = rox::ByteBuffer::NewOfLength(pool, 0);
    return true;
}

}  // namespace sorn
