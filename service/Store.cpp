#include "service/Store.h"

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <algorithm>
#include <climits>

namespace sorn::service {

namespace {

// What marks a file as ours: "sorn" as a number, and the format of the table.
constexpr int64_t applicationIdG = 0x736F726E;
constexpr int64_t formatG = 1;

constexpr char createG[] =
    "BEGIN;"
    "PRAGMA application_id = 1936683630;"
    "PRAGMA user_version = 1;"
    "CREATE TABLE record (number INTEGER PRIMARY KEY AUTOINCREMENT, type TEXT NOT NULL, key TEXT NOT NULL,"
    " version INTEGER NOT NULL, body TEXT NOT NULL, UNIQUE (type, key));"
    "COMMIT;";
static_assert(applicationIdG == 1936683630);

constexpr char findG[] = "SELECT number FROM record WHERE type = ? AND key = ?";
constexpr char insertG[] = "INSERT INTO record (type, key, version, body) VALUES (?, ?, ?, ?)";
constexpr char replaceG[] = "UPDATE record SET version = ?, body = ? WHERE number = ?";
constexpr char removeG[] = "DELETE FROM record WHERE number = ?";
constexpr char listG[] = "SELECT number, version FROM record WHERE type = ? ORDER BY number";
constexpr char readG[] = "SELECT body FROM record WHERE number = ?";

constexpr char inMemoryG[] = ":memory:";

/// SQLite finds more than files behind some names, but not behind those with a folder.
std::string NameOf(const std::string& path) {
    if (path.empty()) return inMemoryG;
    return path.front() == '/' ? path : "./" + path;
}

/// Makes the file for us alone, if it is not there.
void Touch(const std::string& path) {
    const int descriptor = ::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    if (descriptor >= 0) ::close(descriptor);
}

}  // namespace

/// One run of a prepared statement; parameters are bound in their order and must outlive it.
class Store::Statement {
 public:
    explicit Statement(const Prepared& prepared) : pStatementM(prepared.get()) {}
    ~Statement() {
        sqlite3_reset(pStatementM);
        sqlite3_clear_bindings(pStatementM);
    }
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;

    Statement& Bind(int64_t number) {
        fBoundM = sqlite3_bind_int64(pStatementM, ++nBoundM, number) == SQLITE_OK && fBoundM;
        return *this;
    }
    Statement& Bind(std::string_view text) {
        const int result =
            sqlite3_bind_text64(pStatementM, ++nBoundM, text.data(), text.size(), SQLITE_STATIC, SQLITE_UTF8);
        fBoundM = result == SQLITE_OK && fBoundM;
        return *this;
    }
    /// SQLITE_ROW, SQLITE_DONE or what went wrong.
    int Step() { return fBoundM ? sqlite3_step(pStatementM) : SQLITE_MISUSE; }
    int64_t Number(int column) { return sqlite3_column_int64(pStatementM, column); }
    std::string_view Text(int column) {
        const auto* const bytes = static_cast<const char*>(sqlite3_column_blob(pStatementM, column));
        const auto n = static_cast<size_t>(sqlite3_column_bytes(pStatementM, column));
        return bytes == nullptr ? std::string_view() : std::string_view(bytes, n);
    }

 private:
    sqlite3_stmt* pStatementM;
    int nBoundM = 0;
    bool fBoundM = true;
};

void Store::CloseDatabase::operator()(sqlite3* database) const {
    sqlite3_close(database);
}
void Store::EndStatement::operator()(sqlite3_stmt* statement) const {
    sqlite3_finalize(statement);
}

std::unique_ptr<Store> Store::Open(const std::string& path, int64_t maxBytes, std::string& words) {
    if (path == inMemoryG) {
        words = "not a name for a file; without one the store is in memory";
        return nullptr;
    }
    std::unique_ptr<Store> store(new Store);
    if (!path.empty()) Touch(path);
    sqlite3* database = nullptr;
    const int flags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX;
    const int result = sqlite3_open_v2(NameOf(path).c_str(), &database, flags, nullptr);
    store->databaseM.reset(database);
    if (result == SQLITE_OK && !store->Check(words)) return nullptr;
    if (result == SQLITE_OK && store->SetUp(maxBytes)) return store;
    if (database == nullptr) {
        words = sqlite3_errstr(result);
    } else if (sqlite3_errcode(database) == SQLITE_BUSY) {
        words = "the file is in use by another process";
    } else {
        words = sqlite3_errmsg(database);
    }
    return nullptr;
}

Store::~Store() = default;

/// Whether the file is empty or one of ours; changes nothing in it. What SQLite cannot read is no answer:
/// the operations that follow tell.
bool Store::Check(std::string& words) {
    // Held from the first read on, so that two services never write one file.
    Run("PRAGMA locking_mode = EXCLUSIVE");
    const int64_t id = Number("PRAGMA application_id");
    const int64_t format = Number("PRAGMA user_version");
    const int64_t nTables = Number("SELECT count(*) FROM sqlite_master");
    if (id == 0 && format == 0 && nTables == 0) return true;
    if (id < 0 || format < 0 || nTables < 0) return true;
    if (id != applicationIdG) {
        words = "the file belongs to another program";
    } else if (format != formatG) {
        words = "the file has format " + std::to_string(format) + ", not " + std::to_string(formatG);
    }
    return words.empty();
}

bool Store::SetUp(int64_t maxBytes) {
    // A commit is on the disk before it is told, and an interrupted one leaves nothing behind.
    if (!Run("PRAGMA journal_mode = WAL") || !Run("PRAGMA synchronous = FULL")) return false;
    const int64_t nPages = std::max<int64_t>(1, maxBytes / std::max<int64_t>(1, Number("PRAGMA page_size")));
    const std::string limit = "PRAGMA max_page_count = " + std::to_string(nPages);
    if (Number("PRAGMA user_version") == 0 && !Run(createG)) return false;
    // Taken for writing at once: a second service learns here that there is one.
    return Run(limit.c_str()) && Run("BEGIN IMMEDIATE; COMMIT") && Prepare();
}

bool Store::Prepare() {
    return PrepareOne(findG, findM) && PrepareOne(insertG, insertM) && PrepareOne(replaceG, replaceM) &&
           PrepareOne(removeG, removeM) && PrepareOne(listG, listM) && PrepareOne(readG, readM);
}

bool Store::PrepareOne(const char* sql, Prepared& prepared) {
    sqlite3_stmt* statement = nullptr;
    const bool isPrepared = sqlite3_prepare_v3(databaseM.get(), sql, -1, SQLITE_PREPARE_PERSISTENT,
                                               &statement, nullptr) == SQLITE_OK;
    prepared.reset(statement);
    return isPrepared;
}

bool Store::Run(const char* sql) {
    return sqlite3_exec(databaseM.get(), sql, nullptr, nullptr, nullptr) == SQLITE_OK;
}

/// The number that a statement gives; -1 when it fails.
int64_t Store::Number(const char* sql) {
    Prepared prepared;
    if (!PrepareOne(sql, prepared)) return -1;
    Statement statement(prepared);
    return statement.Step() == SQLITE_ROW ? statement.Number(0) : -1;
}

bool Store::Fail(Failure& failure) {
    const int result = sqlite3_errcode(databaseM.get());
    if (result == SQLITE_FULL) {
        failure.Set(ErrorCode::resourceUnavailableG, "the store is full");
    } else {
        failure.Set(ErrorCode::internalErrorG, std::string("the store: ") + sqlite3_errmsg(databaseM.get()));
    }
    if (isBatchM) lossM = failure;
    return false;
}

/// SQLite ends a transaction when memory or disk fails it; what follows would be stored on its own.
bool Store::FBatchLost() const {
    return isBatchM && sqlite3_get_autocommit(databaseM.get()) != 0;
}

bool Store::FBatchLostBy(Failure& failure) const {
    if (!FBatchLost()) return false;
    failure = lossM;
    return true;
}

Store::Stored Store::Put(std::string_view type, std::string_view key, int version, std::string_view text,
                         int64_t& number, Failure& failure) {
    if (FBatchLostBy(failure)) return FAILED;
    Statement find(findM);
    const int result = find.Bind(type).Bind(key).Step();
    if (result != SQLITE_ROW && result != SQLITE_DONE) return Fail(failure), FAILED;
    if (result == SQLITE_ROW) {
        number = find.Number(0);
        Statement replace(replaceM);
        const bool isReplaced = replace.Bind(int64_t{version}).Bind(text).Bind(number).Step() == SQLITE_DONE;
        return isReplaced ? REPLACED : (Fail(failure), FAILED);
    }
    Statement insert(insertM);
    if (insert.Bind(type).Bind(key).Bind(int64_t{version}).Bind(text).Step() != SQLITE_DONE) {
        return Fail(failure), FAILED;
    }
    number = sqlite3_last_insert_rowid(databaseM.get());
    return INSERTED;
}

bool Store::Remove(const std::vector<int64_t>& vNumbers, Failure& failure) {
    if (!Begin(failure)) return false;
    for (int64_t number : vNumbers) {
        Statement remove(removeM);
        if (remove.Bind(number).Step() == SQLITE_DONE) continue;
        Fail(failure);
        Rollback();
        return false;
    }
    return Commit(failure);
}

bool Store::List(std::string_view type, std::vector<Row>& vRows, Failure& failure) {
    Statement list(listM);
    list.Bind(type);
    int result;
    while ((result = list.Step()) == SQLITE_ROW) {
        vRows.push_back({list.Number(0), static_cast<int>(list.Number(1))});
    }
    return result == SQLITE_DONE || Fail(failure);
}

bool Store::Read(int64_t number, const std::function<void(std::string_view)>& take, Failure& failure) {
    Statement read(readM);
    const int result = read.Bind(number).Step();
    if (result == SQLITE_DONE) return failure.Set(ErrorCode::internalErrorG, "the store lacks a record");
    if (result != SQLITE_ROW) return Fail(failure);
    take(read.Text(0));
    return true;
}

bool Store::Begin(Failure& failure) {
    if (FBatchLostBy(failure)) return false;
    if (!Run("BEGIN IMMEDIATE")) return Fail(failure);
    isBatchM = true;
    return true;
}

bool Store::Commit(Failure& failure) {
    if (!FBatchLostBy(failure)) {
        if (Run("COMMIT")) {
            isBatchM = false;
            return true;
        }
        Fail(failure);
    }
    Rollback();
    return false;
}

void Store::Rollback() {
    Run("ROLLBACK");
    isBatchM = false;
}

}  // namespace sorn::service
