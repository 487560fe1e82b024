// What the codec works out for a struct once: which fields are set, their order, and numbers of every length.
// Invariants for untrusted input: 1, 2.

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
    /// A number between two others in a struct of three fields, read from a block of exactly the bytes.
    template <class T>
    void CheckNumber(const char* name, T value, const std::string& wire);
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

template <class T>
void StructPlanTest::CheckNumber(const char* name, T value, const std::string& wire) {
    const OneFieldStruct one(name);
    const ref<SornObject> object = EveryType::Factory(&pool);
    FieldTarget(object->MemberAt(one.Field()), false).StorePlain(value);
    object->SetPresent(one.Field());
    const std::string bytes = one.Tag(0) + wire;
    EXPECT_EQ(
        Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); }),
        Hex(bytes));
    // Behind it nothing, or up to ten more bytes: the same field once more, with a value of one byte.
    for (unsigned nMore = 0; nMore <= 10; nMore += static_cast<unsigned>(one.Tag(0).size()) + 1) {
        std::string more;
        while (more.size() < nMore) more += one.Tag(0) + '\1';
        const ref<SornObject> again = EveryType::Factory(&pool);
        for (size_t n = 0; n <= bytes.size(); ++n) {  // and cut off at every place
            const ExactBytes exact(n < bytes.size() ? bytes.substr(0, n) : bytes + more);
            const unsigned char* cursor = exact.Begin();
            EXPECT_EQ(Codec().UnmarshalFields(&one.Info(), &cursor, exact.End(), again.get()),
                      n == 0 || n == bytes.size());
        }
        if (more.empty()) {
            EXPECT_EQ(FieldSource(again->MemberAt(one.Field()), false).PlainAt<T>(0), value);
        }
    }
}

TEST_F(StructPlanTest, NumbersOfEveryLength) {
    for (unsigned nBits = 0; nBits <= 64; ++nBits) {
        const uint64_t edge = nBits == 64 ? 0 : uint64_t{1} << nBits;
        for (const uint64_t value : {edge - 1, edge, edge + 1}) {
            SCOPED_TRACE(value);
            CheckNumber("optionalU64", value, Varint(value));
            CheckNumber("requiredLongId", value, Varint(value));
            const auto narrow = static_cast<uint32_t>(value);
            CheckNumber("optionalU32", narrow, Varint(narrow));
            // In zigzag form even numbers stand for 0, 1, 2, ..., odd ones for -1, -2, ...
            const auto half = static_cast<int64_t>(value / 2);
            CheckNumber("optionalS64", value % 2 == 0 ? half : -half - 1, Varint(value));
            const auto narrowHalf = static_cast<int32_t>(narrow / 2);
            CheckNumber("requiredS32", narrow % 2 == 0 ? narrowHalf : -narrowHalf - 1, Varint(narrow));
        }
    }
}

/// Texts around every length at which copying changes its way, alone and behind others.
TEST_F(StructPlanTest, TextsOfEveryLength) {
    const OneFieldStruct one("multiString");
    std::string all;
    const ref<SornObject> object = EveryType::Factory(&pool);
    for (unsigned n = 0; n <= 300; ++n) {
        std::string text;
        for (unsigned i = 0; i < n; ++i) text += static_cast<char>('!' + (n + i) % 90);
        FieldTarget(object->MemberAt(one.Field()), true).StoreText(RoxString(&pool, text.c_str()));
        all += one.Tag(2) + Section(text);
        const ref<SornObject> alone = EveryType::Factory(&pool);
        const ExactBytes exact(one.Tag(2) + Section(text));
        const unsigned char* cursor = exact.Begin();
        ASSERT_TRUE(Codec().UnmarshalFields(&one.Info(), &cursor, exact.End(), alone.get()));
        EXPECT_EQ(Text(FieldSource(alone->MemberAt(one.Field()), true).TextAt(0)), text);
    }
    EXPECT_EQ(
        Written([&](ProtoBufByteOutputStream& s) { Codec().MarshalFields(&one.Info(), object.get(), s); }),
        Hex(all));
}

}  // namespace sorntest
