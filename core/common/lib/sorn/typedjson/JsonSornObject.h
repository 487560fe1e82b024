#pragma once

#include <cstdint>

#include "rox/RoxString.h"
#include "rox/ref.h"
#include "sorn/dict/DictValue.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/model/FieldInfo.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/model/SornObject.h"

namespace kelbaselib {
class Bytesource;
}

namespace sorn {

class ByteBuffer;
class Dict;
class InputPointerBytesource;

/// The codec between objects and JSON text without a Dictionary between.
class JsonSornObject {
 public:
    explicit JsonSornObject(RoxMempool* pool);

    // Writing (JsonSornObjectWrite.cpp).

    RoxString SornObjectToJson(const SornObject* object, OrvoVersion version);
    void SornObjectToJson(const SornObject* object, OrvoVersion version, ByteBuffer& out);
    void WriteFieldName(const char* name, ByteBuffer& out, bool& first);
    void SingleFieldToJson(const char* name, const FieldInfo* field, const SornObject* object, ByteBuffer& out,
                           bool& first, OrvoVersion version);
    void MultiFieldToJson(const char* name, const FieldInfo* field, const SornObject* object, ByteBuffer& out,
                          bool& first, OrvoVersion version);
    void LazyToJson(const LazyDict* body, ByteBuffer& out);

    // Reading (JsonSornObjectRead.cpp).

    bool JsonToSornObject(const unsigned char* data, int length, OrvoVersion version, ref<SornObject>* out,
                          RoxString& err);
    bool JsonToSornObject(kelbaselib::Bytesource* source, unsigned& bytesRead, OrvoVersion version,
                          ref<SornObject>* out, RoxString& err);
    bool JsonToSornObject(InputPointerBytesource& first, InputPointerBytesource& second, OrvoVersion version,
                          ref<SornObject>* out, RoxString& err);
    bool Unmarshal(int depth, InputPointerBytesource& cursor, const StructInfo* info, ref<SornObject>* out,
                   RoxString& err);
    bool ReadFieldValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field, ref<SornObject> object,
                        RoxString& err);
    bool ArrayValueFromJson(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                            ref<SornObject> object, RoxString& err);
    bool ArrayValueReadFieldValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                  ref<SornObject> object, RoxString& err);
    bool UnmarshalOneSingleValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                 ref<SornObject> object, RoxString& err);
    bool UnmarshalOneMultiValue(int depth, InputPointerBytesource& cursor, const FieldInfo* field,
                                ref<SornObject> object, RoxString& err);
    bool UnmarshalAnyDict(InputPointerBytesource& cursor, ref<Dict>* out);
    bool UnmarshalAnyDict(int depth, InputPointerBytesource& cursor, ref<Dict>* out, RoxString& err);
    bool UnmarshalAnyDictValue(int depth, InputPointerBytesource& cursor, dictvalue::Type& type, RoxString& text,
                               ref<Dict>& dict, RoxString& err);
    bool UnmarshalAnyDictField(int depth, InputPointerBytesource& cursor, const ref<Dict>& dict, RoxString& err);
};

}  // namespace sorn
