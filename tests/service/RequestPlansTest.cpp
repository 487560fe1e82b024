#include "service/RequestPlans.h"

#include <gtest/gtest.h>

#include "service/Failure.h"
#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"
#include "sornschema/Error.h"

namespace {

using sorn::Schema;
using sorn::service::ErrorCode;
using sorn::service::RequestPlan;
using sorn::service::RequestPlans;

struct PlanRow {
    const char* request;
    RequestPlan::Kind kind;
    const char* record;
    const char* list;
    const char* field;
};

// All requests that the catalogue has by these names.
constexpr PlanRow vPlanRowsG[] = {
    {"bodyConfigSearch", RequestPlan::SEARCH, "bodyConfig", "bodyConfigList", "bodyConfig"},
    {"channelSearch", RequestPlan::SEARCH, "channel", "channelList", "channel"},
    {"localApplicationDataSearch", RequestPlan::SEARCH, "localApplicationData", "localApplicationDataList",
     "localApplicationData"},
    {"offerSearch", RequestPlan::SEARCH, "offer", "offerList", "offer"},
    {"recordingSearch", RequestPlan::SEARCH, "recording", "recordingList", "recording"},
    {"whatsOnSearch", RequestPlan::SEARCH, "whatsOn", "whatsOnList", "whatsOn"},
    {"bodyConfigUpdate", RequestPlan::STORE, "bodyConfig", nullptr, nullptr},
    {"channelUpdate", RequestPlan::STORE, "channel", nullptr, nullptr},
    {"localApplicationDataStore", RequestPlan::STORE, "localApplicationData", nullptr, nullptr},
    {"orvoRpcRequestUpdate", RequestPlan::STORE, "orvoRpcRequest", nullptr, nullptr},
    {"channelRemove", RequestPlan::REMOVE, "channel", nullptr, nullptr},
    {"localApplicationDataRemove", RequestPlan::REMOVE, "localApplicationData", nullptr, nullptr},
};

TEST(RequestPlansTest, AllThatTheSchemaHas) {
    const RequestPlans plans;
    for (const PlanRow& row : vPlanRowsG) {
        const RequestPlan* const plan = plans.Find(row.request);
        ASSERT_NE(plan, nullptr) << row.request;
        EXPECT_EQ(plan->kind, row.kind) << row.request;
        EXPECT_STREQ(plan->pRecord->name, row.record);
        EXPECT_STREQ(plan->pList == nullptr ? nullptr : plan->pList->name, row.list);
        if (row.field != nullptr) {
            EXPECT_STREQ(plan->pList->FieldName(*plan->pListRecords), row.field);
        }
    }
    size_t nPlans = 0;
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const sorn::StructInfo* const info = Schema::vStructDefG[id];
        nPlans += info != nullptr && plans.Find(info->name) != nullptr;
    }
    EXPECT_EQ(nPlans, std::size(vPlanRowsG));
}

TEST(RequestPlansTest, NoPlan) {
    const RequestPlans plans;
    for (const char* type :
         {"", "recording", "recordingList", "Search", "mediaComponentList", "recordingSearc"}) {
        EXPECT_EQ(plans.Find(type), nullptr) << type;
    }
}

TEST(RequestPlansTest, FieldsByNameAndVersion) {
    const sorn::StructInfo& info = *sorn::StructInfoMap::LookupStructByName("everyType");
    const auto find = [&info](int version) {
        return sorn::service::FindField(info, "variantOptional", version);
    };
    ASSERT_NE(find(0), nullptr);
    EXPECT_EQ(find(0)->Type(), sorn::SORN_DATA_TYPE_S64);
    EXPECT_EQ(find(42), find(0));
    EXPECT_EQ(find(19)->Type(), sorn::SORN_DATA_TYPE_S32);
    EXPECT_EQ(find(9)->Type(), sorn::SORN_DATA_TYPE_STRING);
    EXPECT_TRUE(sorn::service::FSameValues(*find(42), *find(20)));
    EXPECT_FALSE(sorn::service::FSameValues(*find(42), *find(19)));
    EXPECT_EQ(sorn::service::FindField(info, "variantOptiona", 0), nullptr);
    EXPECT_EQ(sorn::service::FindField(info, "limitedFirst", 8), nullptr);
    const auto same = [&info](const char* a, const char* b) {
        return sorn::service::FSameValues(*sorn::service::FindField(info, a, 0),
                                          *sorn::service::FindField(info, b, 0));
    };
    EXPECT_TRUE(same("optionalIntId", "multiIntId"));
    EXPECT_FALSE(same("optionalIntId", "idWithoutPrefixInt")) << "ids of another struct";
    EXPECT_FALSE(same("optionalEnum", "enumFromZero")) << "another enumeration";
    EXPECT_FALSE(same("optionalIntId", "optionalLongId"));
}

TEST(ErrorCodeTest, NumbersAreTheSchemas) {
    const sorn::FieldInfo* const code = sorn::service::FindField(sornschema::Error::structInfoG, "code", 0);
    ASSERT_NE(code, nullptr);
    const sorn::EnumDef& names = *Schema::FindEnum(code->typeRef);
    EXPECT_STREQ(names.NameOf(ErrorCode::badArgumentG), "badArgument");
    EXPECT_STREQ(names.NameOf(ErrorCode::internalErrorG), "internalError");
    EXPECT_STREQ(names.NameOf(ErrorCode::schemaExceptionG), "schemaException");
    EXPECT_STREQ(names.NameOf(ErrorCode::objectNotFoundG), "objectNotFound");
    EXPECT_STREQ(names.NameOf(ErrorCode::resourceUnavailableG), "resourceUnavailable");
    EXPECT_STREQ(names.NameOf(ErrorCode::serverBusyG), "serverBusy");
}

}  // namespace
