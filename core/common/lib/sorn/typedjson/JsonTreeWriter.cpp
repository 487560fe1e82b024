#include "sorn/typedjson/JsonTreeWriter.h"

#include "sorn/dict/Dictionary.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/Schema.h"
#include "sorn/model/SornObject.h"

namespace sorn {

StructTable JsonTreeWriter::SchemaTable() {
    return {Schema::vStructDefG, Schema::nStructDefG};
}

JsonTreeWriter::JsonTreeWriter(RoxMempool* pool, JsonOutput& out, JsonFormat format, StructTable table)
    : outM(out), valuesM(pool, out, format), objectsM(pool, table, out), depthsM(pool) {}

void JsonTreeWriter::Write(const DictValue& value) {
    valuesM.Begin(value);
    Run(VALUES);
}

void JsonTreeWriter::Write(const SornObject& object, OrvoVersion version) {
    objectsM.BeginObject(object, version);
    Run(OBJECTS);
}

void JsonTreeWriter::Write(const LazyBodyContent& content) {
    if (content.dictionary != nullptr) {
        Write(*content.dictionary);
    } else if (content.object != nullptr) {
        Write(*content.object, content.version);
    } else if (content.text != nullptr) {
        outM.Bytes(content.text->GetData(), content.text->GetLength());
    }
}

void JsonTreeWriter::WriteField(const char* name, const FieldInfo& field, bool isMulti,
                                const SornObject& object, OrvoVersion version, bool& isFirst) {
    objectsM.BeginField(name, field, isMulti, object, version, isFirst);
    Run(OBJECTS);
}

void JsonTreeWriter::Run(Writer writer) {
    size_t depth = 0;
    for (;;) {
        if (writer == VALUES ? valuesM.Run(depth) : objectsM.Run(depth)) {
            if (depthsM.FEmpty()) return;
            depth = depthsM.Top();
            depthsM.Pop();
        } else {
            depthsM.Push(depth);
            if (writer == VALUES) {
                depth = objectsM.GetDepth();
                objectsM.BeginBody(valuesM.TakeObject(), valuesM.GetObjectVersion());
            } else {
                depth = valuesM.GetDepth();
                valuesM.BeginBody(objectsM.TakeDictionary());
            }
        }
        writer = writer == VALUES ? OBJECTS : VALUES;
    }
}

}  // namespace sorn
