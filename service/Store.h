#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "service/Failure.h"

struct sqlite3;
struct sqlite3_stmt;

namespace sorn::service {

/// Records as texts by type and key, in a file or in memory. What an operation has done outside of a batch is
/// on the disk when it returns, and so is a batch after Commit: a process or machine that dies loses nothing
/// of it. One process at a time has a file open. One thread.
///
/// All operations that can fail give false and words; nothing is changed then.
class Store {
 public:
    struct Row {
        int64_t number;  // ascending in the order of insertion, never used again
        int version;     // schema version of the text; 0 for none
    };
    enum Stored { FAILED, INSERTED, REPLACED };

    /// Opens or makes the file; an empty path is a store in memory. Null and words for a file of another
    /// program or of another format, one that is in use, and the path ":memory:". It takes up to maxBytes.
    static std::unique_ptr<Store> Open(const std::string& path, int64_t maxBytes, std::string& words);
    ~Store();
    Store(const Store&) = delete;
    Store& operator=(const Store&) = delete;

    /// Stores a text. One with the same type and key is replaced and keeps its number.
    Stored Put(std::string_view type, std::string_view key, int version, std::string_view text,
               int64_t& number, Failure& failure);
    /// Removes rows by their numbers: all or none.
    bool Remove(const std::vector<int64_t>& vNumbers, Failure& failure);
    /// Appends all rows of a type, ascending by number.
    bool List(std::string_view type, std::vector<Row>& vRows, Failure& failure);
    /// Hands the text of a row to `take`, for the time of the call; false, too, without such a row.
    bool Read(int64_t number, const std::function<void(std::string_view)>& take, Failure& failure);

    /// Operations up to Commit are done together or not at all. No batch in a batch. A failure such as a full
    /// disk may end the batch on its own: then every further operation of it fails likewise, Commit included.
    bool Begin(Failure& failure);
    bool Commit(Failure& failure);
    void Rollback();
    /// Whether such a failure has ended the batch that has begun.
    bool FBatchLost() const;

 private:
    class Statement;
    struct CloseDatabase {
        void operator()(sqlite3* database) const;
    };
    struct EndStatement {
        void operator()(sqlite3_stmt* statement) const;
    };
    using Prepared = std::unique_ptr<sqlite3_stmt, EndStatement>;

    Store() = default;
    bool Check(std::string& words);
    bool SetUp(int64_t maxBytes);
    bool Prepare();
    bool PrepareOne(const char* sql, Prepared& prepared);
    bool Run(const char* sql);
    int64_t Number(const char* sql);
    bool Fail(Failure& failure);
    bool FBatchLostBy(Failure& failure) const;

    std::unique_ptr<sqlite3, CloseDatabase> databaseM;
    Prepared findM;
    Prepared insertM;
    Prepared replaceM;
    Prepared removeM;
    Prepared listM;
    Prepared readM;
    bool isBatchM = false;
    Failure lossM;  // the last failure in the batch
};

}  // namespace sorn::service
