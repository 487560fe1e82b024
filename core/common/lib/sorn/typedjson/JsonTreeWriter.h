#pragma once

#include "rox/RoxWorkStack.h"
#include "sorn/convert/StructTable.h"
#include "sorn/dict/LazyBody.h"
#include "sorn/json/JsonFormat.h"
#include "sorn/json/JsonOutput.h"
#include "sorn/json/ValueWriter.h"
#include "sorn/model/OrvoVersion.h"
#include "sorn/typedjson/ObjectWriter.h"

namespace sorn {

/// The writer behind all text of values and objects. Dictionaries hold lazy bodies, which may be objects, and
/// objects hold dictionaries: the writers of both take turns, each where it left off, so that nesting of any
/// kind is bounded by memory alone. What is written must not change meanwhile. One thread at a time.
class JsonTreeWriter {
 public:
    /// `pool` takes the stacks when they become large. Objects are written compact whatever the format.
    JsonTreeWriter(RoxMempool* pool, JsonOutput& out, JsonFormat format, StructTable table = SchemaTable());

    void Write(const DictValue& value);
    void Write(const SornObject& object, OrvoVersion version);
    /// What a lazy body's text is made of.
    void Write(const LazyBodyContent& content);
    /// One field of an object with a name of the caller's, as ObjectWriter::BeginField.
    void WriteField(const char* name, const FieldInfo& field, bool isMulti, const SornObject& object,
                    OrvoVersion version, bool& isFirst);

    /// The structs of the schema.
    static StructTable SchemaTable();

 private:
    enum Writer : bool { VALUES, OBJECTS };

    void Run(Writer writer);

    JsonOutput& outM;
    ValueWriter valuesM;
    ObjectWriter objectsM;
    RoxWorkStack<size_t, 8> depthsM;  // those to which the writers that wait have to run
};

}  // namespace sorn
