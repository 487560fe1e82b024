// Every data type in every arity, both ways, with bytes worked out by hand.

#include "binary/ValueRows.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;

class ValuesTest : public BinaryFixture {
 protected:
    static FieldTarget Target(const ref<SornObject>& object, const FieldInfo& field) {
        return FieldTarget(object->MemberAt(field), field.arity == SORN_ARITY_MULTI);
    }
    std::string Fields(const OneFieldStruct& one, const ref<SornObject>& object) {
        return Written(
            [&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); });
    }
    /// The bytes of a new object with what was read from the bytes; lazy bodies hold theirs.
    std::string ThereAndBack(const OneFieldStruct& one, const std::string& bytes) {
        const ref<SornObject> object = EveryType::Factory(&pool);
        const ExactBytes exact(bytes);
        const unsigned char* cursor = exact.Begin();
        if (!Codec().UnmarshalFields(&one.Info(), &cursor, exact.End(), object.get())) return "refused";
        EXPECT_EQ(cursor, exact.End());
        if (one.Field().Type() != SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) return Fields(one, object);
        std::string back;
        const FieldSource source(object->MemberAt(one.Field()), one.Field().arity == SORN_ARITY_MULTI);
        for (unsigned i = 0; i < source.Count(SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY); ++i) {
            const auto* const body = source.ReferenceAt<LazyDict>(i);
            if (body == nullptr) continue;
            EXPECT_EQ(body->GetRep(), LazyDict::REP_PROTOBUF);
            const rox::ByteBuffer& held = *body->GetStoredBytes();
            back += one.Tag(2) + Section(std::string(held.GetData(), held.GetData() + held.GetLength()));
        }
        return Hex(back);
    }
};

TEST_F(ValuesTest, SingleFields) {
    for (const ValueRow& row : ValueRows(&pool)) {
        for (const char* arity : {"optional", "required"}) {
            SCOPED_TRACE(std::string(arity) + row.name);
            const OneFieldStruct one(std::string(arity) + row.name);
            for (const bool isFirst : {true, false}) {
                const std::string value = isFirst ? row.first : row.second;
                const std::string bytes = one.Tag(row.wireType) + Bytes(value);
                const ref<SornObject> object = EveryType::Factory(&pool);
                (isFirst ? row.storeFirst : row.storeSecond)(Target(object, one.Field()));
                if (one.Field().presenceOffset != 0) {
                    EXPECT_EQ(Fields(one, object), "") << "a value that is not present";
                }
                object->SetPresent(one.Field());
                EXPECT_EQ(Fields(one, object), Hex(bytes));
                EXPECT_EQ(Written([&](ProtoBufByteOutputStream& stream) {
                              Codec().MarshalSingleField(&one.Field(), object.get(), stream);
                          }),
                          value);
                EXPECT_EQ(ThereAndBack(one, bytes), Hex(bytes));
            }
        }
    }
}

TEST_F(ValuesTest, RepeatedFields) {
    for (const ValueRow& row : ValueRows(&pool)) {
        SCOPED_TRACE(row.name);
        const OneFieldStruct one(std::string("multi") + row.name);
        const ref<SornObject> object = EveryType::Factory(&pool);
        EXPECT_EQ(Fields(one, object), "");
        row.storeFirst(Target(object, one.Field()));
        row.storeSecond(Target(object, one.Field()));
        row.storeFirst(Target(object, one.Field()));
        const std::string tag = one.Tag(row.wireType);
        const std::string bytes = tag + Bytes(row.first) + tag + Bytes(row.second) + tag + Bytes(row.first);
        EXPECT_EQ(Fields(one, object), Hex(bytes));
        EXPECT_EQ(ThereAndBack(one, bytes), Hex(bytes));
        const std::string otherTag("\xE5\x07");  // 997
        EXPECT_EQ(
            Written([&](ProtoBufByteOutputStream& stream) {
                Codec().MarshalMultiField(997, &one.Field(), object.get(), stream);
            }),
            Hex(otherTag + Bytes(row.first) + otherTag + Bytes(row.second) + otherTag + Bytes(row.first)));
    }
}

TEST_F(ValuesTest, OneValueInto) {
    for (const ValueRow& row : ValueRows(&pool)) {
        for (const char* arity : {"optional", "multi"}) {
            SCOPED_TRACE(std::string(arity) + row.name);
            const OneFieldStruct one(std::string(arity) + row.name);
            const bool isMulti = one.Field().arity == SORN_ARITY_MULTI;
            const ref<SornObject> object = EveryType::Factory(&pool);
            for (const char* value : {row.first, row.second}) {
                const ExactBytes bytes(Bytes(value));
                const unsigned char* cursor = bytes.Begin();
                const bool isRead =
                    isMulti
                        ? Codec().UnmarshalOneMultiValue(&one.Field(), &cursor, bytes.End(), object.get())
                        : Codec().UnmarshalOneSingleValue(&one.Field(), &cursor, bytes.End(), object.get());
                EXPECT_TRUE(isRead);
                EXPECT_EQ(cursor, bytes.End());
            }
            if (one.Field().Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) continue;
            const std::string tag = one.Tag(row.wireType);
            EXPECT_EQ(Fields(one, object).empty(), one.Field().presenceOffset != 0);  // it stays as it was
            object->SetPresent(one.Field());
            // Of an any dict the second value, which is empty, adds nothing to the first.
            const bool isAdded = one.Field().Type() == SORN_DATA_TYPE_ANY_DICT && !isMulti;
            const std::string last = isAdded ? row.first : row.second;
            EXPECT_EQ(Fields(one, object), Hex((isMulti ? tag + Bytes(row.first) : "") + tag + Bytes(last)));
        }
    }
}

/// All slots of one object, in the order of their numbers.
TEST_F(ValuesTest, WholeRecord) {
    const ref<SornObject> object = EveryType::Factory(&pool);
    const StructInfo& info = EveryType::structInfoG;
    std::string bytes[3];
    for (const ValueRow& row : ValueRows(&pool)) {
        const char* const arities[] = {"multi", "optional", "required"};
        for (unsigned i = 0; i < 3; ++i) {
            const FieldInfo& field = *FindField(info, std::string(arities[i]) + row.name);
            object->SetPresent(field);
            row.storeSecond(Target(object, field));
            bytes[i] += Varint(static_cast<unsigned>(&field - info.vFieldInfo) * 8 + row.wireType) +
                        Bytes(row.second);
        }
    }
    // Behind them: 75 a required bool, 79 a required text.
    const std::string whole = bytes[0] + bytes[1] + bytes[2] + Bytes("D8 04 00 FA 04 00");
    EXPECT_EQ(FieldsOf(object), Hex(whole));
    // 5921 * 8 + 2 = 47370 is 8A F2 02.
    const ref<rox::ByteBuffer> top = Codec().MarshalKnownDict(object.get());
    EXPECT_EQ(Hex(*top), Hex(Bytes("8A F2 02") + Section(whole)));
    EXPECT_EQ(Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalKnownDict(object.get(), s); }),
              Hex(*top));
    ref<SornObject> back;
    ASSERT_TRUE(Codec().UnmarshalKnownDict(top, &back));
    EXPECT_EQ(back->structId, EveryType::structIdG);
    // As bytes are never equal, the objects are compared by what they are written as; all but the lazy bodies
    // and the object that is read as another struct than it was written.
    for (const FieldInfo* field = info.vFieldInfo; field != info.vFieldInfo + info.nFields; ++field) {
        if (field->FHole() || field->Type() == SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY) continue;
        const OneFieldStruct one(info.FieldName(*field));
        if (field->typeRef == EveryType::structIdG) continue;
        EXPECT_EQ(Fields(one, back), Fields(one, object)) << info.FieldName(*field);
    }
}

}  // namespace sorntest
