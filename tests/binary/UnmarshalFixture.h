#pragma once

#include <string>

#include "binary/ValueRows.h"

namespace sorntest {

/// Bytes, read and written again.
class UnmarshalFixture : public BinaryFixture {
 protected:
    /// The fields that bytes are read as, written again; "refused".
    std::string Again(unsigned structId, const std::string& hex) {
        const ref<sorn::SornObject> object = Read(structId, hex);
        return object == nullptr ? "refused" : FieldsOf(object);
    }
    std::string Companion(const std::string& hex) {
        return Again(sornschema::EveryTypeCompanion::structIdG, hex);
    }
    /// What one field of everyType takes the bytes as; "refused".
    std::string OneField(const char* name, const std::string& hex) {
        const OneFieldStruct one(name);
        const ref<sorn::SornObject> object = sornschema::EveryType::Factory(&pool);
        const ExactBytes bytes(Bytes(hex));
        const unsigned char* cursor = bytes.Begin();
        if (!Codec().UnmarshalFields(&one.Info(), &cursor, bytes.End(), object.get())) return "refused";
        EXPECT_EQ(cursor, bytes.End());
        return Written(
            [&](sorn::ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); });
    }
};

}  // namespace sorntest
