#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "rox/RoxGenericArray.h"
#include "rox/RoxGenericIntArray.h"
#include "rox/RoxMempool.h"
#include "rox/RoxMempoolPoison.h"
#include "rox/RoxStringArray.h"
#include "sorn/model/ChannelNumber.h"
#include "sorn/model/Schema.h"
#include "sornschema/all.h"

using sorn::FieldInfo;
using sorn::Schema;
using sorn::SornObject;
using sorn::StructInfo;

namespace {

std::vector<uint32_t> StructIds() {
    std::vector<uint32_t> ids;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        if (Schema::vStructDefG[id] != nullptr) ids.push_back(id);
    }
    return ids;
}

// All forms of all fields, older variants too.
std::vector<const FieldInfo*> AllForms(const StructInfo& info) {
    std::vector<const FieldInfo*> forms;
    for (int slot = 0; slot < info.nFields; ++slot) {
        if (info.vFieldInfo[slot].FHole()) continue;
        forms.push_back(&info.vFieldInfo[slot]);
        const sorn::FieldInfoHistory& history = info.vFieldInfoHistory[slot];
        for (unsigned i = 0; i < history.nVariants; ++i) forms.push_back(&history.vVariants[i]);
    }
    return forms;
}

bool FZero(const void* p, size_t n) {
    for (size_t i = 0; i < n; ++i) {
        if (static_cast<const unsigned char*>(p)[i] != 0) return false;
    }
    return true;
}

// Element size of a RoxGenericIntArray of the type; 0 for the types of the other containers.
int ElementSize(unsigned dataType) {
    switch (dataType) {
        case sorn::SORN_DATA_TYPE_BOOL:
            return 1;
        case sorn::SORN_DATA_TYPE_DATE:
        case sorn::SORN_DATA_TYPE_ENUM:
        case sorn::SORN_DATA_TYPE_INT_ID:
        case sorn::SORN_DATA_TYPE_S32:
        case sorn::SORN_DATA_TYPE_TIME:
        case sorn::SORN_DATA_TYPE_U32:
            return 4;
        case sorn::SORN_DATA_TYPE_CHANNEL:
        case sorn::SORN_DATA_TYPE_CURRENCY:
        case sorn::SORN_DATA_TYPE_DATETIME:
        case sorn::SORN_DATA_TYPE_FLOAT:
        case sorn::SORN_DATA_TYPE_LONG_ID:
        case sorn::SORN_DATA_TYPE_S64:
        case sorn::SORN_DATA_TYPE_U64:
            return 8;
        default:
            return 0;
    }
}

bool FStrings(unsigned dataType) {
    return dataType == sorn::SORN_DATA_TYPE_STRING || dataType == sorn::SORN_DATA_TYPE_STRING_ID;
}

void ExpectEmptyMulti(const FieldInfo& field, const void* member, RoxMempool* pool,
                      const std::string& where) {
    if (const int size = ElementSize(field.dataType)) {
        const auto* array = static_cast<const RoxGenericIntArray*>(member);
        EXPECT_EQ(array->GetCount(), 0u) << where;
        EXPECT_EQ(array->GetElementSize(), size) << where;
        EXPECT_EQ(array->GetMempool(), pool) << where;
        EXPECT_EQ(array->GetUser(), 3) << where;
    } else if (FStrings(field.dataType)) {
        const auto* array = static_cast<const RoxStringArray*>(member);
        EXPECT_EQ(array->GetCount(), 0u) << where;
        EXPECT_EQ(array->GetMempool(), pool) << where;
        EXPECT_EQ(array->GetDebugLockOwner(), 0u) << where;
    } else {
        const auto* array = static_cast<const RoxGenericArray*>(member);
        EXPECT_EQ(array->GetCount(), 0u) << where;
        EXPECT_EQ(array->GetMempool(), pool) << where;
        EXPECT_EQ(array->GetUser(), 3) << where;
    }
}

void ExpectEmptySingle(const FieldInfo& field, const void* member, const std::string& where) {
    if (field.dataType == sorn::SORN_DATA_TYPE_CHANNEL) {
        EXPECT_EQ(*static_cast<const sorn::ChannelNumber*>(member), sorn::ChannelNumber(-2, -2)) << where;
    } else if (field.dataType == sorn::SORN_DATA_TYPE_CURRENCY) {
        EXPECT_TRUE(FZero(member, 8)) << where;
    } else if (field.dataType == sorn::SORN_DATA_TYPE_BOOL) {
        EXPECT_TRUE(FZero(member, 1)) << where;
    } else if (const int size = ElementSize(field.dataType)) {
        EXPECT_TRUE(FZero(member, static_cast<size_t>(size))) << where;
    } else {
        EXPECT_TRUE(FZero(member, sizeof(void*)))
            << where;  // an empty string and a null reference are a null word
    }
}

void ExpectEmpty(const StructInfo& info, SornObject& object, RoxMempool* pool) {
    for (const FieldInfo* field : AllForms(info)) {
        const std::string where = std::string(info.name) + '.' + info.FieldName(*field);
        if (field->presenceOffset != 0) {
            EXPECT_EQ(reinterpret_cast<const char*>(&object)[field->presenceOffset], 0) << where;
        }
        if (field->arity == sorn::SORN_ARITY_MULTI) {
            ExpectEmptyMulti(*field, object.MemberAt(*field), pool, where);
        } else {
            ExpectEmptySingle(*field, object.MemberAt(*field), where);
        }
    }
}

// Leaves a free block full of 0xA5 where the pool puts the next object of the struct; gives its address.
// Fresh memory of a pool is zero, and would hide a member that the constructor leaves out.
const void* SoilNextObject(const StructInfo& info, RoxMempool* pool) {
    const size_t before = pool->GetUsedBytes();
    ref<SornObject> object = info.Factory(pool);
    const size_t bytes = pool->GetUsedBytes() - before - roxmempool::redzoneBytes;
    object = nullptr;
    void* block = pool->Malloc(bytes);
    memset(block, 0xA5, bytes);
    pool->Free(block);
    return block;
}

TEST(FactoryTest, EveryStructMakesAnEmptyObject) {
    ASSERT_EQ(StructIds().size(), 286u);
    for (uint32_t id : StructIds()) {
        const StructInfo& info = *Schema::vStructDefG[id];
        RoxMempool pool("FactoryTest");
        const void* soiled = SoilNextObject(info, &pool);
        {
            const ref<SornObject> object = info.Factory(&pool);
            ASSERT_EQ(static_cast<const void*>(object.get()), soiled) << info.name;
            EXPECT_EQ(object->structId, id);
            EXPECT_STREQ(object->GetTypeName().Utf8(), info.name);
            EXPECT_EQ(object->GetMempool(), &pool) << info.name;
            EXPECT_EQ(object->GetRefCount(), 1u) << info.name;
            ExpectEmpty(info, *object, &pool);
        }
        EXPECT_EQ(pool.GetUsedBytes(), 0u) << info.name;
    }
}

struct Filled {
    unsigned nReferences = 0;  // to the child
    unsigned nBlocks = 0;      // members that own memory of the pool
};

// Puts something that must be given back into every member that owns memory or holds references: into all
// reference members, whatever their class, the same child.
Filled Fill(const StructInfo& info, SornObject& object, SornObject* child, RoxMempool* pool) {
    Filled filled;
    const RoxString text(pool, "a text that is too long for any word");
    const char vElement[8] = {1, 2, 3, 4, 5, 6, 7, 8};
    for (const FieldInfo* field : AllForms(info)) {
        void* member = object.MemberAt(*field);
        const bool fMulti = field->arity == sorn::SORN_ARITY_MULTI;
        if (ElementSize(field->dataType) != 0) {
            if (!fMulti) continue;
            for (int i = 0; i < 20; ++i) EXPECT_TRUE(static_cast<RoxGenericIntArray*>(member)->Add(vElement));
            ++filled.nBlocks;
        } else if (FStrings(field->dataType)) {
            if (fMulti) {
                for (int i = 0; i < 3; ++i) EXPECT_TRUE(static_cast<RoxStringArray*>(member)->Add(text));
            } else {
                *static_cast<RoxString*>(member) = text;
            }
            ++filled.nBlocks;
        } else if (fMulti) {
            for (int i = 0; i < 3; ++i) EXPECT_TRUE(static_cast<RoxGenericArray*>(member)->Add(child));
            filled.nReferences += 3;
            ++filled.nBlocks;
        } else {
            *static_cast<RefBase*>(member) = RefBase(child);
            ++filled.nReferences;
        }
    }
    return filled;
}

TEST(FactoryTest, AFilledObjectGivesEverythingBack) {
    unsigned nReferences = 0;
    for (uint32_t id : StructIds()) {
        const StructInfo& info = *Schema::vStructDefG[id];
        RoxMempool pool("FactoryTest");
        const ref<SornObject> child = sornschema::Success::Factory(&pool);
        const size_t before = pool.GetUsedBytes();
        {
            const ref<SornObject> object = info.Factory(&pool);
            const size_t empty = pool.GetUsedBytes();
            const Filled filled = Fill(info, *object, child.get(), &pool);
            EXPECT_EQ(child->GetRefCount(), 1 + filled.nReferences) << info.name;
            if (filled.nBlocks == 0) {
                EXPECT_EQ(pool.GetUsedBytes(), empty) << info.name;
            } else {
                EXPECT_GT(pool.GetUsedBytes(), empty) << info.name;
            }
            nReferences += filled.nReferences;
        }
        EXPECT_EQ(child->GetRefCount(), 1u) << info.name;
        EXPECT_EQ(pool.GetUsedBytes(), before) << info.name;
    }
    EXPECT_GT(nReferences, 0u);
}

TEST(FactoryTest, GeneralHeap) {
    const ref<SornObject> object = sornschema::Ad::Factory(nullptr);
    EXPECT_EQ(object->GetMempool(), nullptr);
    EXPECT_EQ(object->structId, 140u);
    EXPECT_STREQ(object->GetTypeName().Utf8(), "ad");
}

TEST(FactoryTest, ChildrenMayOutliveTheirParent) {
    RoxMempool pool("FactoryTest");
    ref<SornObject> image = sornschema::Image::Factory(&pool);
    {
        const ref<SornObject> object = sornschema::Ad::Factory(&pool);
        EXPECT_TRUE(static_cast<sornschema::Ad*>(object.get())->image.Add(image.get()));
        EXPECT_EQ(image->GetRefCount(), 2u);
    }
    EXPECT_EQ(image->GetRefCount(), 1u);
    EXPECT_STREQ(image->GetTypeName().Utf8(), "image");
}

TEST(FactoryTest, DefaultChannelIdentifierHoldsTheInvalidChannel) {
    const ref<SornObject> object = sornschema::ChannelIdentifier::Factory(nullptr);
    const auto* identifier = static_cast<const sornschema::ChannelIdentifier*>(object.get());
    EXPECT_EQ(identifier->channelNumber, sorn::ChannelNumber::INVALID);
    EXPECT_EQ(identifier->channelNumber_isSet, 0);
}

TEST(FactoryTest, MembersAreWhereTheTablesSay) {
    const ref<SornObject> object = sornschema::ViewStartEvent::Factory(nullptr);
    auto* event = static_cast<sornschema::ViewStartEvent*>(object.get());
    const StructInfo& info = sornschema::ViewStartEvent::structInfoG;
    event->timestampMilliseconds = 5;
    event->timestampMilliseconds_7_11 = 6;
    event->timestampMilliseconds_7_11_isSet = 1;
    event->bodyId = "body-1";
    EXPECT_EQ(*static_cast<int64_t*>(object->MemberAt(info.vFieldInfo[14])), 5);
    const FieldInfo& older = info.vFieldInfoHistory[14].vVariants[0];
    EXPECT_EQ(*static_cast<int64_t*>(object->MemberAt(older)), 6);
    EXPECT_EQ(reinterpret_cast<char*>(object.get())[older.presenceOffset], 1);
    EXPECT_STREQ(static_cast<RoxString*>(object->MemberAt(info.vFieldInfo[2]))->Utf8(), "body-1");
}

TEST(FactoryTest, EnumeratorsHaveTheirNumbers) {
    EXPECT_EQ(sornschema::ErrorCode_badArgument, 3u);
    EXPECT_EQ(sornschema::BodyFeature_middleorvo_xmppActions, 6u);
    EXPECT_EQ(sornschema::ModulationMode_128qam, 1u);
    EXPECT_EQ(sornschema::VideoResolution_uhd, 200u);
    EXPECT_EQ(sornschema::OrvoObjectType_recording, 463u);
    static_assert(sizeof(sornschema::ErrorCode) == 4 && sizeof(sornschema::ServiceState) == 4);
}

TEST(SetDebugLockOwnerTest, ReachesEveryStringArray) {
    unsigned nArrays = 0;
    for (uint32_t id : StructIds()) {
        const StructInfo& info = *Schema::vStructDefG[id];
        const ref<SornObject> object = info.Factory(nullptr);
        object->SetDebugLockOwner(77);
        for (const FieldInfo* field : AllForms(info)) {
            if (field->arity != sorn::SORN_ARITY_MULTI || !FStrings(field->dataType)) continue;
            ++nArrays;
            EXPECT_EQ(static_cast<RoxStringArray*>(object->MemberAt(*field))->GetDebugLockOwner(), 77u)
                << info.name << '.' << info.FieldName(*field);
        }
    }
    EXPECT_EQ(nArrays, 58u);  // 57 fields and one older variant
}

TEST(SetDebugLockOwnerTest, LeavesSubObjectsAlone) {
    const ref<SornObject> child = sornschema::SupportedOrderBy::Factory(nullptr);
    const ref<SornObject> parent = sornschema::SearchRequestSummary::Factory(nullptr);
    EXPECT_TRUE(
        static_cast<sornschema::SearchRequestSummary*>(parent.get())->supportedOrderBy.Add(child.get()));
    child->SetDebugLockOwner(5);
    parent->SetDebugLockOwner(6);
    EXPECT_EQ(static_cast<sornschema::SupportedOrderBy*>(child.get())->orderField.GetDebugLockOwner(), 5u);
}

}  // namespace
