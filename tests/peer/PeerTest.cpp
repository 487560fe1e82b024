// The binary form against libprotobuf: random objects of all structs, the same bytes both ways.

#include <google/protobuf/unknown_field_set.h>
#include <google/protobuf/util/message_differencer.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <limits>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "convert/RandomRecord.h"
#include "peer/OddWriter.h"
#include "peer/PeerMessage.h"
#include "peer/PeerSchema.h"
#include "rox/RoxMempool.h"
#include "sorn/binary/ProtoBuf.h"
#include "sorn/binary/ProtoBufByteOutputStream.h"
#include "sorn/convert/FieldAccess.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/RoxByteBuffer.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Currency.h"
#include "sorn/model/Date.h"
#include "sorn/model/DateTime.h"
#include "sorn/model/Schema.h"
#include "sorn/model/Time.h"

namespace sorntest {

using namespace sorn;
using google::protobuf::FieldDescriptor;
using google::protobuf::Message;
using google::protobuf::Reflection;

namespace {

constexpr uint32_t everyTypeId = 5921;
constexpr uint32_t companionId = 5919;

/// The seed: another one is given by the environment variable SORN_TEST_SEED.
uint32_t Seed() {
    const char* given = getenv("SORN_TEST_SEED");
    return given != nullptr ? static_cast<uint32_t>(strtoul(given, nullptr, 10)) : 20250307;
}

const FieldInfo& FieldOf(const StructInfo& info, const std::string& name) {
    for (int slot = 0; slot < info.nFields; ++slot) {
        const FieldInfo& field = info.vFieldInfo[slot];
        if (!field.FHole() && info.FieldName(field) == name) return field;
    }
    ADD_FAILURE() << info.name << " has no " << name;
    std::abort();
}

/// Equality of bytes; where they differ, only the surroundings are shown.
::testing::AssertionResult FSameBytes(const std::string& ours, const std::string& expected) {
    if (ours == expected) return ::testing::AssertionSuccess();
    const auto differ = std::mismatch(ours.begin(), ours.end(), expected.begin(), expected.end());
    const size_t at = static_cast<size_t>(differ.first - ours.begin());
    const size_t from = at < 16 ? 0 : at - 16;
    auto hex = [from](const std::string& bytes) {
        std::string text;
        for (size_t i = from; i < std::min(bytes.size(), from + 32); ++i) {
            constexpr const char* digits = "0123456789ABCDEF";
            text += {' ', digits[static_cast<unsigned char>(bytes[i]) / 16], digits[bytes[i] & 15]};
        }
        return text;
    };
    return ::testing::AssertionFailure() << "byte " << at << " of " << ours.size() << " ours and "
                                         << expected.size() << " expected; from byte " << from
                                         << "\n  ours:    " << hex(ours) << "\n  expected:" << hex(expected);
}

class PeerTest : public ::testing::Test {
 protected:
    void TearDown() override { EXPECT_EQ(pool.GetUsedBytes(), 0u) << "bytes left in the pool"; }

    ProtoBuf Codec() { return ProtoBuf(&pool, Schema::vStructDefG, Schema::nStructDefG); }

    std::string OurBytes(const SornObject& object) {
        const ref<rox::ByteBuffer> bytes = Codec().MarshalKnownDict(&object);
        return std::string(reinterpret_cast<const char*>(bytes->GetData()), bytes->GetLength());
    }
    std::string OurBytesByStream(const SornObject& object) {
        ProtoBufByteOutputStream stream;
        Codec().MarshalKnownDict(&object, stream);
        const unsigned char* data = nullptr;
        unsigned length = 0;
        stream.Finish(data, length);
        return std::string(reinterpret_cast<const char*>(data), length);
    }
    /// The object of the bytes, read from a heap block of exactly their size; null when they are refused.
    ref<SornObject> Read(const std::string& bytes) {
        std::vector<unsigned char> block(bytes.begin(), bytes.end());
        block.shrink_to_fit();
        ref<SornObject> object;
        const bool isGood = Codec().UnmarshalKnownDict(block.data(), static_cast<int>(block.size()), &object);
        EXPECT_EQ(isGood, object != nullptr);
        return object;
    }
    static std::string Text(const SornObject& object) {
        const RoxString text = object.ToString(true, 0);
        return std::string(text.Utf8(), text.NByte());
    }
    /// Asserts that the bytes read as an object that equals the given one in every way of comparing.
    void ReadsAs(const std::string& bytes, const SornObject& object) {
        ref<SornObject> back = Read(bytes);
        ASSERT_TRUE(back != nullptr);
        ASSERT_EQ(back->structId, object.structId);
        ASSERT_EQ(Text(*back), Text(object));
        ASSERT_TRUE(FSameBytes(OurBytes(*back), OurBytes(object)));
        // Objects with bytes differ even from themselves.
        if (object == object) {
            ASSERT_TRUE(*back == object);
        }
    }

    /// Calls `test` with random objects of all structs, several of each, and a number that differs for each.
    template <class Test>
    void ForRandomRecords(uint32_t nRounds, Test test) {
        const uint32_t seed = Seed();
        unsigned nStructs = 0;
        for (uint32_t id = 1; id < Schema::nStructDefG; ++id) {
            const StructInfo* info = Schema::FindStruct(id);
            if (info == nullptr) continue;
            nStructs += id < companionId;
            for (uint32_t i = 0; i < nRounds; ++i) {
                SCOPED_TRACE(std::string(info->name) + " " + std::to_string(i) +
                             " SORN_TEST_SEED=" + std::to_string(seed));
                const uint32_t number = seed + id * 64 + i;
                test(*RandomRecord(&pool, number).Make(*info), number);
                if (HasFatalFailure()) return;
            }
        }
        EXPECT_EQ(nStructs, 286u);
    }

    RoxMempool pool{"peer"};
};

TEST_F(PeerTest, RandomRecordsGiveThePeersBytesAndReadBack) {
    ForRandomRecords(8, [this](const SornObject& object, uint32_t) {
        const std::string expected = PeerBytes(*PeerMessage(object));
        ASSERT_TRUE(FSameBytes(OurBytes(object), expected));
        ASSERT_TRUE(FSameBytes(OurBytesByStream(object), expected));
        ReadsAs(expected, object);
    });
}

TEST_F(PeerTest, ThePeerReadsOurBytesAsTheSameMessage) {
    ForRandomRecords(2, [this](const SornObject& object, uint32_t) {
        std::unique_ptr<Message> message = PeerSchema::Get().NewMessage("KnownDict");
        ASSERT_TRUE(message->ParseFromString(OurBytes(object)));
        ASSERT_TRUE(google::protobuf::util::MessageDifferencer::Equals(*message, *PeerMessage(object)));
    });
}

TEST_F(PeerTest, FieldsMayComeInAnyOrderAndVarintsInAnyLength) {
    ForRandomRecords(3, [this](const SornObject& object, uint32_t number) {
        const std::unique_ptr<Message> message = PeerMessage(object);
        for (const auto& [isPadding, isShuffling] : {std::pair(true, false), {false, true}, {true, true}}) {
            const std::string odd = OddWriter(number, isPadding, isShuffling).Write(*message);
            std::unique_ptr<Message> peers = PeerSchema::Get().NewMessage("KnownDict");
            ASSERT_TRUE(peers->ParseFromString(odd));
            ASSERT_TRUE(FSameBytes(PeerBytes(*peers), PeerBytes(*message)));
            ReadsAs(odd, object);
            if (HasFatalFailure()) return;
        }
    });
}

/// One entry for each name, in the order of names, with the values of all its entries: what a dictionary
/// makes of them.
void UniteEntries(Message& anyDict) {
    const Reflection& r = *anyDict.GetReflection();
    const FieldDescriptor* entries = anyDict.GetDescriptor()->FindFieldByNumber(4);
    std::map<std::string, std::unique_ptr<Message>> byName;
    for (int i = 0; i < r.FieldSize(anyDict, entries); ++i) {
        const Message& entry = r.GetRepeatedMessage(anyDict, entries, i);
        const FieldDescriptor* name = entry.GetDescriptor()->FindFieldByNumber(6);
        std::unique_ptr<Message>& united = byName[entry.GetReflection()->GetString(entry, name)];
        if (united == nullptr) united.reset(entry.New());
        united->MergeFrom(entry);
    }
    r.ClearField(&anyDict, entries);
    for (const auto& [name, entry] : byName) r.AddMessage(&anyDict, entries)->CopyFrom(*entry);
}

TEST_F(PeerTest, OfSingleFieldsTheLastOccurrenceStandsAndRepeatedOnesAppend) {
    ForRandomRecords(3, [this](const SornObject& first, uint32_t number) {
        const StructInfo& info = *Schema::FindStruct(first.structId);
        const ref<SornObject> second = RandomRecord(&pool, number + 1000003).Make(info);
        const std::unique_ptr<Message> expected = PeerMessage(first);
        const std::unique_ptr<Message> addition = PeerMessage(*second);
        Message& record = RecordOf(*expected);
        const std::string fields = PeerBytes(record) + PeerBytes(RecordOf(*addition));

        // The peer would merge sub-messages; here they are replaced, but for any dicts, which are added to.
        std::vector<const FieldDescriptor*> set;
        record.GetReflection()->ListFields(RecordOf(*addition), &set);
        for (const FieldDescriptor* field : set) {
            const bool isMessage = field->type() == FieldDescriptor::TYPE_MESSAGE;
            const bool isAnyDict = isMessage && field->message_type()->name() == "AnyDictBody";
            if (isMessage && !isAnyDict && !field->is_repeated()) {
                record.GetReflection()->ClearField(&record, field);
            }
        }
        record.MergeFrom(RecordOf(*addition));
        for (const FieldDescriptor* field : set) {
            if (field->type() != FieldDescriptor::TYPE_MESSAGE || field->is_repeated()) continue;
            if (field->message_type()->name() != "AnyDictBody") continue;
            UniteEntries(*record.GetReflection()->MutableMessage(&record, field));
        }

        ref<SornObject> back;
        ASSERT_TRUE(Codec().Unmarshal(reinterpret_cast<const unsigned char*>(fields.data()),
                                      static_cast<int>(fields.size()), first.structId, &back));
        ASSERT_TRUE(FSameBytes(OurBytes(*back), PeerBytes(*expected)));
    });
}

TEST_F(PeerTest, FieldsOfANewerPeerAreSteppedOverAndNamed) {
    ForRandomRecords(1, [this](const SornObject& object, uint32_t) {
        const StructInfo& info = *Schema::FindStruct(object.structId);
        const std::unique_ptr<Message> message = PeerMessage(object);
        Message& record = RecordOf(*message);
        google::protobuf::UnknownFieldSet& unknown = *record.GetReflection()->MutableUnknownFields(&record);
        unknown.AddVarint(info.nFields, 1ull << 63);
        unknown.AddFixed64(info.nFields + 1, 12);
        unknown.AddLengthDelimited(536870911, std::string(300, 'd'));
        const std::string where = "' out of range in '" + std::string(info.name) + "'\n";
        ::testing::internal::CaptureStdout();
        const ref<SornObject> back = Read(PeerBytes(*message));
        const std::string lines = ::testing::internal::GetCapturedStdout();
        ASSERT_EQ(lines, "field number '" + std::to_string(info.nFields) + where + "field number '" +
                             std::to_string(info.nFields + 1) + where + "field number '536870911" + where);
        ASSERT_TRUE(back != nullptr);
        ASSERT_TRUE(FSameBytes(OurBytes(*back), OurBytes(object)));

        unknown.AddFixed32(info.nFields, 1);  // of a kind that no field has
        ::testing::internal::CaptureStdout();
        const ref<SornObject> refused = Read(PeerBytes(*message));
        ::testing::internal::GetCapturedStdout();
        ASSERT_TRUE(refused == nullptr);
    });
}

TEST_F(PeerTest, RetiredNumbersAreSteppedOverAndNamed) {
    const StructInfo& info = *Schema::FindStruct(everyTypeId);
    ASSERT_TRUE(info.vFieldInfo[64].FHole());
    const ref<SornObject> object = RandomRecord(&pool, Seed()).Make(info);
    const std::unique_ptr<Message> message = PeerMessage(*object);
    Message& record = RecordOf(*message);
    record.GetReflection()->MutableUnknownFields(&record)->AddVarint(64, 300);
    ::testing::internal::CaptureStdout();
    const ref<SornObject> back = Read(PeerBytes(*message));
    EXPECT_EQ(::testing::internal::GetCapturedStdout(), "field number '64' undefined in 'everyType'\n");
    ASSERT_TRUE(back != nullptr);
    EXPECT_TRUE(FSameBytes(OurBytes(*back), OurBytes(*object)));
}

/// Values at which the wire's forms change, in repeated fields of all plain types.
class ExtremesTest : public PeerTest {
 protected:
    template <class T>
    void Add(const char* name, const std::vector<T>& values) {
        const FieldInfo& field = FieldOf(infoM, name);
        for (const T& value : values) {
            ASSERT_TRUE(FieldTarget(objectM->MemberAt(field), true).StorePlain(value));
        }
    }
    template <class T, class Number>
    void AddAs(const char* name, const std::vector<Number>& numbers) {
        for (const Number number : numbers) Add<T>(name, {T(number)});
    }
    void AddText(const char* name, const std::string& text) {
        const RoxString value =
            RoxString::FromUtf8Bytes(&pool, static_cast<unsigned>(text.size()), text.data());
        ASSERT_TRUE(FieldTarget(objectM->MemberAt(FieldOf(infoM, name)), true).StoreText(value));
    }
    void AddReference(const char* name, const RefBase& value) {
        ASSERT_TRUE(FieldTarget(objectM->MemberAt(FieldOf(infoM, name)), true).StoreReference(value));
    }

    const StructInfo& infoM = *Schema::FindStruct(everyTypeId);
    ref<SornObject> objectM = RandomRecord(&pool, 1).Make(infoM);

    void TearDown() override {
        const std::string expected = PeerBytes(*PeerMessage(*objectM));
        EXPECT_TRUE(FSameBytes(OurBytes(*objectM), expected));
        EXPECT_TRUE(FSameBytes(OurBytesByStream(*objectM), expected));
        ref<SornObject> back = Read(expected);
        ASSERT_TRUE(back != nullptr);
        EXPECT_TRUE(FSameBytes(OurBytes(*back), expected));
        back = nullptr;
        objectM = nullptr;
        PeerTest::TearDown();
    }
};

TEST_F(ExtremesTest, Numbers) {
    const std::vector<int32_t> s32 = {0,    1,     -1,   63,      -64,       64,       -65,
                                      8191, -8192, 8192, 1 << 27, INT32_MAX, INT32_MIN};
    const std::vector<int64_t> s64 = {0, -1, INT64_MAX, INT64_MIN, INT64_MAX / 2, INT64_MIN / 2, 1ll << 34};
    std::vector<uint32_t> u32 = {0, UINT32_MAX};
    std::vector<uint64_t> u64 = {0, UINT64_MAX};
    for (unsigned bit = 0; bit < 64; ++bit) {
        u64.insert(u64.end(), {1ull << bit, (1ull << bit) - 1});
        if (bit < 32) u32.insert(u32.end(), {1u << bit, (1u << bit) - 1});
    }
    Add("multiBool", std::vector<uint8_t>{0, 1, 1, 0});
    Add("multiS32", s32);
    AddAs<Date>("multiDate", s32);
    AddAs<Time>("multiTime", s32);
    Add("multiS64", s64);
    AddAs<DateTime>("multiDateTime", s64);
    Add("multiU32", u32);
    Add("multiEnum", u32);
    Add("multiIntId", u32);
    Add("multiU64", u64);
    Add("multiLongId", u64);
}

TEST_F(ExtremesTest, Floats) {
    using Limits = std::numeric_limits<double>;
    Add("multiFloat",
        std::vector<double>{0.0, -0.0, 1.0, -1.5, Limits::min(), Limits::denorm_min(), Limits::max(),
                            Limits::infinity(), -Limits::infinity(), Limits::quiet_NaN()});
}

TEST_F(ExtremesTest, Texts) {
    for (const size_t n : {0u, 1u, 99u, 100u, 101u, 127u, 128u, 16383u, 16384u, 100000u}) {
        AddText("multiString", std::string(n, 'd'));
        AddText("multiStringId", std::string(n, 'x'));
        const std::string bytes = std::string(n, '\x64') + "\x01\x64\x02";
        AddReference("multiBytes",
                     rox::ByteBuffer::New(&pool, bytes.data(), static_cast<uint32_t>(bytes.size())));
    }
    AddText("multiString", std::string("a\0b", 3));
    AddReference("multiBytes", rox::ByteBuffer::New(&pool, "", 0));
    Add("multiChannel", std::vector<ChannelNumber>{{0}, {INT32_MAX}, {0, 0}, {7, 2}, {INT32_MAX, INT32_MAX}});
    Add("multiCurrency", std::vector<Currency>{{0, "USD"}, {INT32_MAX, "JPY"}});
}

TEST_F(ExtremesTest, Dictionaries) {
    AddReference("multiAnyDict", MakeDict(&pool));
    ref<Dict> outer = MakeDict(&pool);
    for (const char* name : {"d", "", "b", "a", "\xC3\xA9", "Z"}) outer->AddString(name, name);
    outer->AddString("b", std::string(16384, 'd').c_str());
    ref<Dict> inner = MakeDict(&pool);
    for (unsigned level = 0; level < 40; ++level) {
        ref<Dict> around = MakeDict(&pool);
        around->AddDict("in", inner);
        around->AddDict("in", MakeDict(&pool));
        around->AddString("in", "text");
        around->AddString("level", std::to_string(level).c_str());
        inner = around;
    }
    outer->AddDict("b", inner);
    AddReference("multiAnyDict", outer);
}

TEST_F(ExtremesTest, NestedRecords) {
    // Each level adds four or six bytes, so that lengths pass 127 and 16383 somewhere.
    const StructInfo& info = *Schema::FindStruct(companionId);
    ref<SornObject> inner = info.Factory(&pool);
    const FieldInfo& label = FieldOf(info, "label");
    inner->SetPresent(label);
    FieldTarget(inner->MemberAt(label), false).StoreText(RoxString(&pool, std::string(16000, 'd').c_str()));
    for (unsigned level = 0; level < 40; ++level) {
        ref<SornObject> outer = info.Factory(&pool);
        const FieldInfo& field = FieldOf(info, level % 2 == 0 ? "known" : "child");
        FieldTarget(outer->MemberAt(field), false).StoreReference(inner);
        if (level == 20) FieldTarget(outer->MemberAt(FieldOf(info, "children")), true).StoreReference(inner);
        inner = outer;
    }
    AddReference("multiKnownDict", inner);
    AddReference("multiObject", inner);
}

}  // namespace

}  // namespace sorntest
