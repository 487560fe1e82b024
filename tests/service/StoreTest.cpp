#include "service/Store.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

namespace {

using sorn::service::ErrorCode;
using sorn::service::Failure;
using sorn::service::Store;

constexpr int64_t largeG = int64_t{1} << 30;

class StoreTest : public testing::Test {
 protected:
    StoreTest() {
        char folder[] = "/tmp/sorn-store.XXXXXX";
        folderM = mkdtemp(folder);
        path = folderM + "/db";
    }
    ~StoreTest() override { std::filesystem::remove_all(folderM); }

    std::unique_ptr<Store> Open(int64_t maxBytes = largeG) { return Store::Open(path, maxBytes, words); }
    /// Stores a text; 0 when that fails.
    static int64_t Put(Store& store, const char* type, const std::string& key, const std::string& text) {
        Failure failure;
        int64_t number = 0;
        return store.Put(type, key, 42, text, number, failure) == Store::FAILED ? 0 : number;
    }
    static std::string Read(Store& store, int64_t number) {
        std::string text;
        Failure failure;
        const bool isRead = store.Read(
            number, [&](std::string_view found) { text = found; }, failure);
        return isRead ? text : "- " + failure.text;
    }
    /// The texts of a type in their order, joined.
    static std::string All(Store& store, const char* type) {
        std::vector<Store::Row> vRows;
        Failure failure;
        EXPECT_TRUE(store.List(type, vRows, failure)) << failure.text;
        std::string all;
        for (const Store::Row& row : vRows) all += Read(store, row.number) + ";";
        return all;
    }
    void Sql(const char* sql) {
        sqlite3* database = nullptr;
        ASSERT_EQ(sqlite3_open(path.c_str(), &database), SQLITE_OK);
        EXPECT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK);
        sqlite3_close(database);
    }

    std::string path;
    std::string words;

 private:
    std::string folderM;
};

TEST_F(StoreTest, KeepsTheOrderOfInsertion) {
    path.clear();  // in memory
    const auto store = Open();
    ASSERT_NE(store, nullptr) << words;
    const int64_t first = Put(*store, "a", "2", "two");
    const int64_t second = Put(*store, "a", "1", "one");
    EXPECT_LT(first, second);
    EXPECT_GT(Put(*store, "b", "2", "other"), second);
    EXPECT_EQ(All(*store, "a"), "two;one;");
    EXPECT_EQ(Put(*store, "a", "2", "TWO"), first) << "a replaced record keeps its place";
    EXPECT_EQ(All(*store, "a"), "TWO;one;");
    EXPECT_EQ(All(*store, "b"), "other;");
    EXPECT_EQ(All(*store, "c"), "");
    Failure failure;
    EXPECT_TRUE(store->Remove({first, second}, failure));
    EXPECT_EQ(All(*store, "a"), "");
    EXPECT_GT(Put(*store, "a", "2", "again"), second + 1) << "numbers are not used again";
    EXPECT_EQ(Read(*store, first), "- the store lacks a record");
}

TEST_F(StoreTest, TextsAreBytes) {
    const auto store = Open();
    for (const std::string& text :
         {std::string(), std::string("a\0b", 3), std::string("\xFF\xC3"), std::string(3'000'000, 'x')}) {
        EXPECT_EQ(Read(*store, Put(*store, "a", std::string("\0k", 2), text)), text);
    }
    EXPECT_EQ(All(*store, "a").size(), 3'000'001u) << "one key";
}

TEST_F(StoreTest, KeepsVersionsAndRecordsInTheFile) {
    {
        const auto store = Open();
        ASSERT_NE(store, nullptr) << words;
        Failure failure;
        int64_t number;
        EXPECT_EQ(store->Put("a", "1", 7, "one", number, failure), Store::INSERTED);
        EXPECT_EQ(store->Put("a", "1", 0, "uno", number, failure), Store::REPLACED);
    }
    const auto store = Open();
    ASSERT_NE(store, nullptr) << words;
    std::vector<Store::Row> vRows;
    Failure failure;
    ASSERT_TRUE(store->List("a", vRows, failure));
    ASSERT_EQ(vRows.size(), 1u);
    EXPECT_EQ(vRows[0].version, 0);
    EXPECT_EQ(All(*store, "a"), "uno;");
    struct stat status;
    ASSERT_EQ(::stat(path.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600u);
}

TEST_F(StoreTest, BatchesAreDoneTogether) {
    {
        const auto store = Open();
        Failure failure;
        ASSERT_TRUE(store->Begin(failure));
        Put(*store, "a", "1", "one");
        store->Rollback();
        EXPECT_EQ(All(*store, "a"), "");
        ASSERT_TRUE(store->Begin(failure));
        EXPECT_FALSE(store->Begin(failure)) << "no batch in a batch";
        EXPECT_EQ(failure.code, ErrorCode::internalErrorG);
        Put(*store, "a", "1", "one");
        Put(*store, "a", "2", "two");
        ASSERT_TRUE(store->Commit(failure));
        EXPECT_FALSE(store->Commit(failure));
    }
    EXPECT_EQ(All(*Open(), "a"), "one;two;");
}

TEST_F(StoreTest, RefusesFilesOfOthers) {
    struct Row {
        const char* sql;
        const char* words;
    };
    for (const Row& row : {Row{"CREATE TABLE t (a)", "the file belongs to another program"},
                           Row{"PRAGMA user_version = 1", "the file belongs to another program"},
                           Row{"PRAGMA application_id = 7", "the file belongs to another program"},
                           Row{"PRAGMA application_id = 0x736F726E; PRAGMA user_version = 2",
                               "the file has format 2, not 1"}}) {
        std::filesystem::remove(path);
        Sql(row.sql);
        EXPECT_EQ(Open(), nullptr) << row.sql;
        EXPECT_EQ(words, row.words) << row.sql;
    }
    std::ofstream(path) << std::string(5000, 'x');
    EXPECT_EQ(Open(), nullptr);
    EXPECT_EQ(words, "file is not a database");
    path += "/below";
    EXPECT_EQ(Open(), nullptr);
    EXPECT_EQ(words, "unable to open database file");
}

TEST_F(StoreTest, RefusesANameThatStandsForMemory) {
    path = ":memory:";
    EXPECT_EQ(Open(), nullptr);
    EXPECT_EQ(words, "not a name for a file; without one the store is in memory");
    EXPECT_FALSE(std::filesystem::exists(path));
}

TEST_F(StoreTest, OneProcessAtATime) {
    const auto store = Open();
    ASSERT_NE(store, nullptr) << words;
    EXPECT_EQ(Open(), nullptr);
    EXPECT_EQ(words, "the file is in use by another process");
    EXPECT_NE(Put(*store, "a", "1", "one"), 0) << "the first one goes on";
}

TEST_F(StoreTest, RefusesWhatDoesNotFit) {
    const auto store = Open(1 << 20);
    Failure failure;
    int64_t number = 0;
    ASSERT_EQ(store->Put("a", "1", 0, std::string(500'000, 'x'), number, failure), Store::INSERTED);
    EXPECT_EQ(store->Put("a", "2", 0, std::string(600'000, 'x'), number, failure), Store::FAILED);
    EXPECT_EQ(failure.code, ErrorCode::resourceUnavailableG);
    EXPECT_EQ(failure.text, "the store is full");
    EXPECT_EQ(All(*store, "a").size(), 500'001u);
    EXPECT_EQ(store->Put("a", "2", 0, "small", number, failure), Store::INSERTED);
}

TEST_F(StoreTest, ABatchThatDoesNotFitIsNotStoredInPart) {
    {
        const auto store = Open(1 << 20);
        Failure failure;
        ASSERT_TRUE(store->Begin(failure));
        EXPECT_NE(Put(*store, "a", "1", "one"), 0);
        EXPECT_FALSE(store->FBatchLost());
        EXPECT_EQ(Put(*store, "a", "2", std::string(2'000'000, 'x')), 0);
        EXPECT_TRUE(store->FBatchLost());
        EXPECT_EQ(Put(*store, "a", "3", "three"), 0) << "it would be stored on its own";
        EXPECT_FALSE(store->Commit(failure));
        EXPECT_EQ(failure.code, ErrorCode::resourceUnavailableG);
        EXPECT_EQ(failure.text, "the store is full");
        EXPECT_EQ(All(*store, "a"), "");
        EXPECT_FALSE(store->FBatchLost());
        ASSERT_TRUE(store->Begin(failure)) << "the next batch is another one";
        EXPECT_NE(Put(*store, "a", "4", "four"), 0);
        EXPECT_TRUE(store->Commit(failure));
    }
    EXPECT_EQ(All(*Open(), "a"), "four;");
}

/// Stores records until it is killed and tells each that is done by a byte.
[[noreturn]] void StoreForEver(const std::string& path, int told) {
    std::string words;
    const auto store = Store::Open(path, largeG, words);
    for (unsigned i = 0; store != nullptr; ++i) {
        Failure failure;
        int64_t number;
        const std::string text = "record " + std::to_string(i);
        if (store->Put("a", std::to_string(i), 0, text, number, failure) == Store::FAILED) break;
        if (::write(told, "+", 1) != 1) break;
    }
    ::_exit(1);
}

TEST_F(StoreTest, AKilledProcessLosesNothingThatIsDone) {
    unsigned nDone = 0;
    for (unsigned nMore : {1u, 20u, 57u}) {
        std::filesystem::remove(path);
        int told[2];
        ASSERT_EQ(::pipe2(told, O_CLOEXEC), 0);
        const pid_t child = ::fork();
        if (child == 0) StoreForEver(path, told[1]);
        ::close(told[1]);
        char byte;
        for (nDone = 0; nDone < nMore && ::read(told[0], &byte, 1) == 1;) ++nDone;
        ASSERT_EQ(nDone, nMore);
        ASSERT_EQ(::kill(child, SIGKILL), 0);
        while (::read(told[0], &byte, 1) == 1) ++nDone;  // what it did meanwhile
        ::close(told[0]);
        ASSERT_EQ(::waitpid(child, nullptr, 0), child);
        const auto store = Open();
        ASSERT_NE(store, nullptr) << words;
        const std::string all = All(*store, "a");
        std::string expected;
        for (unsigned i = 0; i < nDone; ++i) expected += "record " + std::to_string(i) + ";";
        EXPECT_EQ(all.substr(0, expected.size()), expected);
    }
}

}  // namespace
