// Texts as programs write them, with which the reader is quickest, at each place around the end of what it
// looks at in one go; and the names of the schema.

#include <thread>
#include <vector>

#include "sorn/model/Schema.h"
#include "sorn/model/StructInfoMap.h"
#include "sorn/typedjson/EnumNames.h"
#include "sorn/typedjson/StructNames.h"
#include "typedjson/ReaderFixture.h"

namespace sorntest {

using namespace sorn;

/// Bytes that are looked at in one go.
constexpr size_t nPieceG = 2048;

class PlainReadTest : public ReaderFixture {
 protected:
    void Check(const std::string& text, size_t n) {
        const ReadOutcome expected = ModelRead(text, "before");
        EXPECT_EQ(Read(text, "before"), expected) << n;
        EXPECT_EQ(ReadInMemory(text, "before"), expected) << n;
        EXPECT_EQ(ReadStream(text, 16384, "before"), expected) << n;
    }
};

const char* const vMembersG[] = {
    R"("type": "everyType", "requiredS32": 12, "requiredString": "text", "multiS32": [1, 2, [3], "4"])",
    R"("type":"everyType","requiredS32":-7,"unknown":{"type":"success","a":[{},{"b":[]}]},"multiString":["",a,"b"])",
    R"("requiredKnownDict": {"label": "x", "type": "everyTypeCompanion"}, "type": "everyType", "optionalBool": true)",
    R"("multiObject": [{"label": "a"}, {"label": "b\"", "number": 1}], "type": "everyType", "optionalString": "")",
    R"("type": "everyType", "requiredLazy": {"a": ["b", {"c": "d"}]}, "optionalAnyDict": {"k": {"l": "m"}})",
    R"("type": "everyType", "requiredS32": x)",
    R"("type": "everyType", "requiredString": "bad\q")",
    R"("type": "everyType", "multiS32": [1, 2 3])",
    R"("type": "everyType", "multiObject": [{"label" "a"}])",
    R"("\type": 5, "t\uype": "everyType", type: "everyType", "requiredString" : "a" ,"optionalS32":1)",
    R"("type": everyType, "u": {"type": [1]}, "v": 1)",
};

// Members of all kinds behind a long text, which moves each of their bytes over the end of a piece.
TEST_F(PlainReadTest, EveryByteAtTheEndOfAPiece) {
    for (const char* const members : vMembersG) {
        SCOPED_TRACE(members);
        const std::string rest = std::string(members) + ", \"last\": \"x\"}";
        for (size_t n = nPieceG - rest.size() - 20; n < nPieceG && !HasFailure(); ++n) {
            Check("{\"u\": \"" + std::string(n, 'x') + "\", " + rest, n);
        }
    }
}

TEST_F(PlainReadTest, EveryByteAtTheEndOfABlock) {
    for (const char* const members : vMembersG) {
        SCOPED_TRACE(members);
        const std::string rest = std::string(members) + ", \"last\": \"x\"}";
        std::string before = "{";
        while (before.size() < 16384 - rest.size() - 60) before += "\"u\": \"xxxxxxxxxxxx\", ";
        for (size_t n = 16384 - rest.size() - 20; n < 16400 && !HasFailure(); ++n) {
            Check(before + "\"v\":\"" + std::string(n - before.size(), 'x') + "\"," + rest, n);
        }
    }
}

// Keys and texts that are longer than a piece, and many that are short.
TEST_F(PlainReadTest, LongAndShortMembers) {
    for (const size_t n : {1u, 7u, 31u, 32u, 33u, 2030u, 2047u, 2048u, 2049u, 5000u}) {
        const std::string run(n, 'k');
        std::string text = "{";
        for (int i = 0; i < 5; ++i)
            text += "\"" + run + "\": " + run + ", \"" + run + "\": \"" + run + "\", ";
        text += "\"requiredString\": \"" + run + "\", \"type\": \"everyType\"}";
        Check(text, n);
    }
    std::string text = "{";
    for (int i = 0; i < 3000; ++i) text += i % 3 == 0 ? "\"a\":1," : "b:\"\",";
    Check(text + "\"requiredString\": \"x\", \"type\": \"everyType\"}", 0);
}

// The field that came behind another one is looked for first where that one comes again.
TEST_F(PlainReadTest, KeysThatAreAlmostTheOneBefore) {
    const std::string rest =
        ", \"type\": \"everyType\", \"unknown\": \"far enough from the end of the text\"}";
    const auto text = [&rest](const std::string& key) {
        return "{\"requiredString\": \"x\", " + key + " 5" + rest;
    };
    const std::string usual = "\"optionalS32\":";
    for (const char* key :
         {"\"optionalS32\" :", "\"optionalS32x\":", "\"optionalS3\":", "\"xoptionalS32\":", "\"optionalS32:",
          "optionalS32:", "\"optionalS64\":", "\"requiredString\":", "\"optionalS32\"",
          "\"optionalS32\"\":", "\"\":", "\"type\":", "\"optional\\u005332\":"}) {
        Check(text(usual), 1);
        Check(text(key), 2);
        Check(text(usual), 3);
    }
    // Another struct in between, and the same order again.
    Check(text("\"optionalObject\": {\"type\": \"error\", \"text\": \"x\", \"code\": \"badArgument\"}, " +
               usual),
          4);
    Check(text(usual), 5);
}

TEST_F(PlainReadTest, StructsByName) {
    for (uint32_t id = 0; id < Schema::nStructDefG; ++id) {
        const StructInfo* const info = Schema::FindStruct(id);
        if (info == nullptr) continue;
        const std::string name = info->name;
        for (const std::string& each :
             {name, name + "x", "x" + name, name.substr(1), name.substr(0, name.size() - 1)}) {
            const StructInfo* const expected = StructInfoMap::LookupStructByName(each.c_str());
            EXPECT_EQ(StructNames::Find(NameKey(each)), expected) << each;
            const std::string roomy = each + "\"       ";
            EXPECT_EQ(StructNames::Find(NameKey::OfRoomy({roomy.data(), each.size()})), expected) << each;
        }
    }
    EXPECT_EQ(StructNames::Find(NameKey("")), nullptr);
    StructNames::Destroy();
    EXPECT_EQ(StructNames::Find(NameKey("success")), StructInfoMap::LookupStructByName("success"));
}

class EnumNamesTest : public PlainReadTest {
 protected:
    /// The lowest value of a name by a walk; -1 for none.
    static int64_t Walk(const EnumDef& def, const std::string& name) {
        for (uint32_t i = 0; i < def.count; ++i) {
            if (def.names[i] != nullptr && def.names[i] == name) return i;
        }
        return -1;
    }
    static int64_t Find(const EnumDef& def, const NameKey& name) {
        uint32_t value = 0;
        return EnumNames::Find(def, name, value) ? int64_t{value} : -1;
    }
    static unsigned CheckAll() {
        unsigned n = 0;
        for (uint32_t id = 0; id < Schema::nEnumDefG; ++id) {
            const EnumDef* const def = Schema::FindEnum(id);
            if (def == nullptr) continue;
            EXPECT_EQ(Find(*def, NameKey("")), -1);
            for (uint32_t i = 0; i < def->count; ++i) {
                if (def->names[i] == nullptr) continue;
                const std::string name = def->names[i];
                for (const std::string& each :
                     {name, name + "x", name.substr(1), name.substr(0, name.size() - 1)}) {
                    EXPECT_EQ(Find(*def, NameKey(each)), Walk(*def, each)) << each;
                }
                const std::string roomy = name + "\"       ";
                EXPECT_EQ(Find(*def, NameKey::OfRoomy({roomy.data(), name.size()})), Walk(*def, name))
                    << name;
                ++n;
            }
        }
        return n;
    }
};

TEST_F(EnumNamesTest, EveryNameOfTheSchema) {
    const unsigned n = CheckAll();
    EXPECT_GT(n, 500u);
    EnumNames::DestroyAll();
    EXPECT_EQ(CheckAll(), n);
}

TEST_F(EnumNamesTest, TheLowestOfEqualNames) {
    static const char* const names[] = {nullptr, "one", "other", "one"};
    static const EnumDef def{4, names};
    EXPECT_EQ(Find(def, NameKey("one")), 1);
    EXPECT_EQ(Find(def, NameKey("other")), 2);
    EXPECT_EQ(Find(def, NameKey("none")), -1);
    EnumNames::DestroyAll();
}

TEST_F(EnumNamesTest, ThreadsShareTheNames) {
    EnumNames::DestroyAll();
    StructNames::Destroy();
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([] {
            EXPECT_NE(StructNames::Find(NameKey("success")), nullptr);
            CheckAll();
        });
    }
    for (std::thread& thread : threads) thread.join();
}

}  // namespace sorntest
