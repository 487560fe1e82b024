// What the codec works out for a struct once: which fields are set, and their order. Invariants for untrusted
// input: 1, 8.

#include "sorn/binary/StructPlan.h"

#include <thread>

#include "binary/ValueRows.h"
#include "sornschema/Recording.h"

namespace sorntest {

using namespace sorn;
using sornschema::EveryType;
using sornschema::EveryTypeCompanion;

class StructPlanTest : public BinaryFixture {
 protected:
    static unsigned WireType(DataType type) {
        switch (type) {
            case SORN_DATA_TYPE_BYTESTRING:
            case SORN_DATA_TYPE_CHANNEL:
            case SORN_DATA_TYPE_CURRENCY:
            case SORN_DATA_TYPE_ANY_DICT:
            case SORN_DATA_TYPE_STRING_ID:
            case SORN_DATA_TYPE_KNOWN_DICT:
            case SORN_DATA_TYPE_KNOWN_DICT_AS_LAZY:
            case SORN_DATA_TYPE_OBJECT:
            case SORN_DATA_TYPE_STRING:
                return 2;
            case SORN_DATA_TYPE_FLOAT:
                return 1;
            default:
                return 0;
        }
    }
    /// Tag and value of a field of a new object.
    static std::string Empty(const FieldInfo& field, unsigned slot) {
        const std::string tag = Varint(slot * 8 + WireType(field.Type()));
        switch (field.Type()) {
            case SORN_DATA_TYPE_CHANNEL:
            case SORN_DATA_TYPE_CURRENCY:
                return tag + Section("invalid");
            case SORN_DATA_TYPE_FLOAT:
                return tag + std::string(8, '\0');
            default:
                return tag + std::string(1, '\0');
        }
    }
    /// The fields of a new object without references, with the presence bytes that are said.
    template <class FPresent>
    static std::string Expected(const StructInfo& info, FPresent fPresent) {
        std::string bytes;
        for (int slot = 1; slot < info.nFields; ++slot) {
            const FieldInfo& field = info.vFieldInfo[slot];
            const bool isReference = StorageOf(field.Type()) == FieldStorage::REFERENCE;
            const bool isSet = field.arity == SORN_ARITY_REQUIRED
                                   ? !isReference
                                   : field.presenceOffset != 0 && fPresent(slot);
            if (!field.FHole() && isSet) bytes += Empty(field, static_cast<unsigned>(slot));
        }
        return Hex(bytes);
    }
    static void SetPresence(SornObject& object, const FieldInfo& field, unsigned char byte) {
        reinterpret_cast<unsigned char*>(&object)[field.presenceOffset] = byte;
    }
};

/// A field is set by any byte but 0, whatever stands in the bytes beside it.
TEST_F(StructPlanTest, PresenceBytes) {
    for (const StructInfo* info : {&EveryType::structInfoG, &sornschema::Recording::structInfoG}) {
        const ref<SornObject> object = info->Factory(&pool);
        for (int slot = 1; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            if (field.FHole() || field.presenceOffset == 0) continue;
            for (const int byte : {1, 2, 0x7F, 0x80, 0x81, 0xFF}) {
                SetPresence(*object, field, static_cast<unsigned char>(byte));
                EXPECT_EQ(FieldsOf(object), Expected(*info, [slot](int other) { return other == slot; }))
                    << info->FieldName(field) << " by " << byte;
            }
            SetPresence(*object, field, 0);
        }
    }
}

/// Every third field, and all: the order of presence bytes and members is not that of the slots.
TEST_F(StructPlanTest, OrderOfSlots) {
    for (const StructInfo* info : {&EveryType::structInfoG, &sornschema::Recording::structInfoG}) {
        ASSERT_GT(info->nFields, 64) << "more than one group";
        for (const int step : {1, 2, 3, 7}) {
            const ref<SornObject> object = info->Factory(&pool);
            const auto fPresent = [step](int slot) { return slot % step == 0; };
            for (int slot = 1; slot < info->nFields; ++slot) {
                const FieldInfo& field = info->vFieldInfo[slot];
                if (field.presenceOffset != 0) SetPresence(*object, field, fPresent(slot) ? 1 : 0);
            }
            EXPECT_EQ(FieldsOf(object), Expected(*info, fPresent)) << info->name << " by " << step;
        }
    }
}

/// Optional values without presence bytes, as metadata made by hand may have them: set by the first 32 bits
/// of the member, whatever stands behind them.
TEST_F(StructPlanTest, OptionalValuesWithoutPresenceBytes) {
    struct Case {
        const char* name;
        std::function<void(const FieldTarget&)> store;
        const char* value;  ///< as hex; null when the field is not set
    };
    const Case cases[] = {
        {"requiredBool", Plain(false), nullptr},
        {"requiredBool", Plain(true), "01"},
        {"requiredS32", Plain(int32_t{0}), nullptr},
        {"requiredS32", Plain(int32_t{-1}), "01"},
        {"requiredU32", Plain(uint32_t{0x80000000}), "80 80 80 80 08"},
        {"requiredU32", Plain(uint32_t{1}), "01"},
        {"requiredEnum", Plain(uint32_t{0}), nullptr},
        {"requiredEnum", Plain(uint32_t{0x01000000}), "80 80 80 08"},
        {"requiredU64", Plain(uint64_t{0}), nullptr},
        {"requiredU64", Plain(uint64_t{1} << 32), nullptr},  // its low 32 bits come first
        {"requiredU64", Plain((uint64_t{1} << 32) + 1), "81 80 80 80 10"},
        {"requiredFloat", Plain(1.0), nullptr},
        {"requiredChannel", Plain(ChannelNumber(0, 2)), nullptr},
        {"requiredChannel", Plain(ChannelNumber(7, 2)), "03 37 2D 32"},
        {"requiredString", StoreText(""), nullptr},
        {"requiredString", StoreText("d"), "01 64"},
        {"requiredObject", Reference(Companion(&pool, nullptr)), "00"},
    };
    for (const Case& each : cases) {
        SCOPED_TRACE(each.name);
        const OneFieldStruct one(each.name);
        std::vector<FieldInfo> fields(one.Info().vFieldInfo, one.Info().vFieldInfo + one.Info().nFields);
        const auto slot = static_cast<size_t>(&one.Field() - one.Info().vFieldInfo);
        fields[slot].arity = SORN_ARITY_OPTIONAL;
        StructInfo info = one.Info();
        info.vFieldInfo = fields.data();
        // All members of the object have values, so that those beside this one are not 0.
        const ref<SornObject> object = EveryType::Factory(&pool);
        for (const ValueRow& row : ValueRows(&pool)) {
            const FieldInfo* const other =
                FindField(EveryType::structInfoG, std::string("required") + row.name);
            row.storeFirst(FieldTarget(object->MemberAt(*other), false));
        }
        each.store(FieldTarget(object->MemberAt(fields[slot]), false));
        const std::string tag = Hex(Varint(slot * 8 + WireType(fields[slot].Type())));
        EXPECT_EQ(
            Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&info, object.get(), s); }),
            each.value == nullptr ? "" : tag + " " + each.value);
    }
}

/// Only of optional fields a presence byte is looked at, and only theirs is set.
TEST_F(StructPlanTest, PresenceBytesOfFieldsThatAreNotOptional) {
    const OneFieldStruct one("optionalS32");
    const uint32_t presence = one.Field().presenceOffset;
    const OneFieldStruct multi("multiS32");
    std::vector<FieldInfo> fields(one.Info().vFieldInfo, one.Info().vFieldInfo + one.Info().nFields);
    const auto slot = static_cast<size_t>(&one.Field() - one.Info().vFieldInfo);
    const auto slotOfMulti = static_cast<size_t>(&multi.Field() - multi.Info().vFieldInfo);
    fields[slot].arity = SORN_ARITY_REQUIRED;
    fields[slotOfMulti] = multi.Field();
    fields[slotOfMulti].presenceOffset = presence & 0x1FF;
    StructInfo info = one.Info();
    info.vFieldInfo = fields.data();
    const ref<SornObject> object = EveryType::Factory(&pool);
    const auto written = [&] {
        return Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&info, object.get(), s); });
    };
    std::string bytes = one.Tag(0) + '\0';
    EXPECT_EQ(written(), Hex(bytes)) << "required, and its byte is 0";
    bytes = one.Tag(0) + '\2';
    const std::string element = multi.Tag(0) + '\4';
    bytes = slot < slotOfMulti ? bytes + element : element + bytes;
    const ExactBytes exact(bytes);
    const unsigned char* cursor = exact.Begin();
    ASSERT_TRUE(Codec().UnmarshalFields(&info, &cursor, exact.End(), object.get()));
    EXPECT_EQ(reinterpret_cast<const unsigned char*>(object.get())[presence], 0);
    EXPECT_EQ(written(), Hex(bytes));
}

/// Metadata that the caller changes between two codecs at the same addresses: nothing stale is used.
TEST_F(StructPlanTest, TablesOfTheCallers) {
    StructInfo info = EveryTypeCompanion::structInfoG;
    std::vector<FieldInfo> fields(info.vFieldInfo, info.vFieldInfo + info.nFields);
    info.vFieldInfo = fields.data();
    std::vector<const StructInfo*> table(EveryTypeCompanion::structIdG + 1);
    table.back() = &info;
    const auto codec = [&] { return ProtoBuf(&pool, table.data(), static_cast<uint32_t>(table.size())); };
    const int three = 3;
    const ref<SornObject> object = Companion(&pool, &three);
    const auto written = [&] {
        return Written([&](ProtoBufByteOutputStream& stream) { codec().Marshal(object.get(), stream); });
    };
    const auto isRead = [&](const std::string& hex) {
        const ExactBytes bytes(Bytes(hex));
        ref<SornObject> again;
        return codec().Unmarshal(bytes.Begin(), bytes.Size(), EveryTypeCompanion::structIdG, &again);
    };
    EXPECT_EQ(written(), "38 06");  // slot 7, the number 3 in zigzag form
    EXPECT_TRUE(isRead("38 06"));
    fields[7] = FieldInfo{0, 0, SORN_DATA_TYPE_NONE, SORN_ARITY_NONE, 0, 0, 0, 0};
    EXPECT_EQ(written(), "");
    testing::internal::CaptureStdout();
    EXPECT_TRUE(isRead("38 06"));
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "field number '7' undefined in 'everyTypeCompanion'\n");
    ref<SornObject> none;
    const ExactBytes nothing("");
    EXPECT_FALSE(codec().Unmarshal(nothing.Begin(), 0, EveryTypeCompanion::structIdG - 1, &none));
    EXPECT_FALSE(codec().Unmarshal(nothing.Begin(), 0, EveryTypeCompanion::structIdG + 1, &none));
}

/// Data types that are none: refused, and not taken for a hole.
TEST_F(StructPlanTest, UnknownDataType) {
    StructInfo info = EveryTypeCompanion::structInfoG;
    std::vector<FieldInfo> fields(info.vFieldInfo, info.vFieldInfo + info.nFields);
    info.vFieldInfo = fields.data();
    for (const unsigned type : {21u, 22u, 31u}) {
        fields[7].dataType = static_cast<uint16_t>(type & 31);
        const ExactBytes bytes(Bytes("38 06"));
        const unsigned char* cursor = bytes.Begin();
        const ref<SornObject> object = Companion(&pool, nullptr);
        testing::internal::CaptureStdout();
        EXPECT_FALSE(Codec().UnmarshalFields(&info, &cursor, bytes.End(), object.get()));
        EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    }
}

TEST_F(StructPlanTest, FirstUseByManyThreads) {
    StructPlans::DestroyAll();
    std::vector<std::string> results(4);
    std::vector<std::thread> threads;
    for (std::string& result : results) {
        threads.emplace_back([&result] {
            RoxMempool own("thread");
            const ProtoBuf codec(&own, Schema::vStructDefG, Schema::nStructDefG);
            for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
                if (Schema::vStructDefG[id] == nullptr) continue;
                const ref<SornObject> object = Schema::vStructDefG[id]->Factory(&own);
                result += Hex(*codec.MarshalKnownDict(object.get())) + '\n';
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    std::string expected;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::vStructDefG[id];
        if (info == nullptr) continue;
        const std::string fields = Bytes(Expected(*info, [](int) { return false; }));
        expected += Hex(Varint(id * 8 + 2) + Section(fields)) + '\n';
    }
    for (const std::string& result : results) EXPECT_EQ(result, expected);
}

/// While an object is written its count changes, beside which some of its numbers stand.
TEST_F(StructPlanTest, OthersCountWhileItIsWritten) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::FindStruct(id);
        if (info == nullptr) continue;
        const ref<SornObject> object = info->Factory(&pool);
        for (int slot = 1; slot < info->nFields; ++slot) {
            const FieldInfo& field = info->vFieldInfo[slot];
            const bool isReference = StorageOf(field.Type()) == FieldStorage::REFERENCE;
            if (!field.FHole() && field.presenceOffset != 0 && !isReference) SetPresence(*object, field, 1);
        }
        const std::string expected = FieldsOf(object);
        std::thread counting([object] {
            for (int i = 0; i < 20; ++i) const ref<SornObject> another = object;
        });
        for (int i = 0; i < 5; ++i) EXPECT_EQ(FieldsOf(object), expected) << info->name;
        counting.join();
    }
}

}  // namespace sorntest
