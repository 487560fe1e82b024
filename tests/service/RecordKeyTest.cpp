#include "service/RecordKey.h"

#include <gtest/gtest.h>

#include "rox/RoxMempool.h"
#include "sorn/typedjson/JsonSornObject.h"

namespace {

/// The key of a record, which may lack required fields.
std::string KeyOf(const std::string& text, int version = 0) {
    RoxMempool pool("key");
    ref<sorn::SornObject> object;
    RoxString words;
    EXPECT_TRUE(
        sorn::JsonSornObject(&pool).JsonToSornObject(reinterpret_cast<const unsigned char*>(text.data()),
                                                     static_cast<int>(text.size()), version, &object, words))
        << text << words.Utf8();
    return object == nullptr ? "" : sorn::service::RecordKey(*object, version, text);
}

struct KeyRow {
    const char* record;
    const char* key;
};

constexpr KeyRow vKeyRowsG[] = {
    // The id called after the struct, not the other ids of its kind.
    {R"({"type":"recording","conflictRecordingId":["vuka:rc.9"],"recordingId":"vuka:rc.81267",)"
     R"("endTimeClippingRecordingId":"vuka:rc.7"})",
     R"("recordingId": "vuka:rc.81267")"},
    {R"({"type":"category","parentCategoryId":"vuka:ca.1","categoryId":"vuka:ca.2"})",
     R"("categoryId": "vuka:ca.2")"},
    {R"({"type":"offer","offerId":"vuka:of.ctd.2"})", R"("offerId": "vuka:of.ctd.2")"},
    // One of another name.
    {R"({"type":"orvoEndpoint","id":"vuka:me.x"})", R"("id": "vuka:me.x")"},
    {R"({"type":"partnerPackage","internalPartnerPackageId":"vuka:ptpk.3"})",
     R"("internalPartnerPackageId": "vuka:ptpk.3")"},
    // No id: what the remove request names.
    {R"({"type":"localApplicationData","appName":"guide","key":"a\"b"})",
     R"("appName": "guide", "key": "a\"b")"},
};

TEST(RecordKeyTest, OfTheRecord) {
    for (const KeyRow& row : vKeyRowsG) EXPECT_EQ(KeyOf(row.record), row.key) << row.record;
}

TEST(RecordKeyTest, OfTheText) {
    // An id that is not set, and a struct that has none.
    for (const char* type : {"recording", "bodyConfig", "success"}) {
        const std::string text = std::string("{\"type\":\"") + type + "\"}";
        const std::string key = KeyOf(text);
        EXPECT_EQ(key.size(), 33u) << key;
        EXPECT_EQ(key[0], '#');
        EXPECT_EQ(KeyOf(text), key);
        EXPECT_NE(KeyOf(text + " "), key) << "another text";
    }
}

}  // namespace
