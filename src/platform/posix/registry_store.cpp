// The POSIX registry's SQLite store: finding and opening the file, checking that it is ours
// before anything is written to it, the schema, statements, write scopes and error codes.
#include "registry_store.h"

#include <atomic>
#include <cstdlib>
#include <fcntl.h>
#include <filesystem>
#include <sys/mman.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

#include <ut/platform/process.h>
#include <ut/platform/text.h>

#include "path.h"

namespace ut::platform {

std::string RegistryStorePath() {
    if (const char* named = std::getenv("UT_REGISTRY"); named && *named)
        return named;
    return posix::UserFolderFile("XDG_DATA_HOME", ".local/share", "ut/registry.db");
}

} // namespace ut::platform

namespace ut::platform::registry {
namespace {

constexpr const char* kInMemory = ":memory:";
// 'utrg': marks a database as a registry store, so that another program's is never taken for one.
constexpr std::int64_t kApplicationId = 0x75747267;
constexpr std::int64_t kSchemaVersion = 1;
constexpr int kBusyMilliseconds = 30'000;

constexpr const char* kSchema = R"sql(
CREATE TABLE keys(
    id INTEGER PRIMARY KEY AUTOINCREMENT,
    parent INTEGER,
    name TEXT NOT NULL,
    fold TEXT NOT NULL,
    class TEXT,
    written INTEGER NOT NULL);
CREATE UNIQUE INDEX keys_by_name ON keys(parent, fold);
CREATE TABLE vals(
    key INTEGER NOT NULL,
    name TEXT NOT NULL,
    fold TEXT NOT NULL,
    type INTEGER NOT NULL,
    data BLOB NOT NULL,
    PRIMARY KEY(key, fold)) WITHOUT ROWID;
INSERT INTO keys(id, parent, name, fold, written) VALUES
    (1, NULL, 'HKEY_CLASSES_ROOT', 'HKEY_CLASSES_ROOT', 0),
    (2, NULL, 'HKEY_CURRENT_USER', 'HKEY_CURRENT_USER', 0),
    (3, NULL, 'HKEY_LOCAL_MACHINE', 'HKEY_LOCAL_MACHINE', 0);
PRAGMA application_id = 1970565735;
PRAGMA user_version = 1;
)sql";
static_assert(kApplicationId == 1970565735 && kSchemaVersion == 1, "keep kSchema's pragmas in step");

bool IsDamage(int result) {
    int primary = result & 0xFF;
    return primary == SQLITE_CORRUPT || primary == SQLITE_NOTADB;
}

} // namespace

LONG ErrorCode(int result) {
    switch (result & 0xFF) {
    case SQLITE_OK:
    case SQLITE_ROW:
    case SQLITE_DONE:
        return ERROR_SUCCESS;
    case SQLITE_READONLY:
    case SQLITE_PERM:
    case SQLITE_AUTH:
    case SQLITE_CANTOPEN:
        return ERROR_ACCESS_DENIED;
    case SQLITE_BUSY:
    case SQLITE_LOCKED:
        return ERROR_BUSY;
    case SQLITE_NOMEM:
        return ERROR_OUTOFMEMORY;
    case SQLITE_FULL:
        return ERROR_DISK_FULL;
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
        return ERROR_BADDB;
    default:
        return ERROR_REGISTRY_IO_FAILED;
    }
}

void ChangeCounter::Map(const std::string& path) {
    Release();
    int file = open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    writable_ = file >= 0;
    if (file < 0)
        file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0)
        return;
    struct stat status {};
    bool sized = fstat(file, &status) == 0 && (status.st_size >= static_cast<off_t>(sizeof(std::uint64_t)) ||
                                               (writable_ && ftruncate(file, sizeof(std::uint64_t)) == 0));
    void* mapped = sized ? mmap(nullptr, sizeof(std::uint64_t), PROT_READ | (writable_ ? PROT_WRITE : 0),
                                MAP_SHARED, file, 0)
                         : MAP_FAILED;
    close(file);
    if (mapped != MAP_FAILED)
        shared_ = static_cast<std::uint64_t*>(mapped);
}

void ChangeCounter::UseLocal() {
    Release();
    local_ = true;
}

void ChangeCounter::Release() {
    if (shared_)
        munmap(shared_, sizeof(std::uint64_t));
    shared_ = nullptr;
    writable_ = local_ = false;
}

std::optional<std::uint64_t> ChangeCounter::Stable() const {
    static_assert(std::atomic_ref<std::uint64_t>::is_always_lock_free,
                  "the counter is shared between processes");
    std::uint64_t value = localValue_;
    if (shared_)
        value = std::atomic_ref<std::uint64_t>(*shared_).load(std::memory_order_acquire);
    else if (!local_)
        return std::nullopt;
    if (value % 2 != 0)
        return std::nullopt;
    return value;
}

void ChangeCounter::BeforeCommit() {
    if (local_) {
        mine_ = ++localValue_ | 1;
        localValue_ = mine_;
        return;
    }
    if (!shared_ || !writable_)
        return;
    std::atomic_ref<std::uint64_t> counter(*shared_);
    std::uint64_t value = counter.load(std::memory_order_acquire);
    do
        mine_ = value % 2 == 0 ? value + 1 : value + 2;
    while (!counter.compare_exchange_weak(value, mine_, std::memory_order_acq_rel));
}

void ChangeCounter::AfterCommit() {
    if (local_) {
        localValue_ = mine_ + 1;
        return;
    }
    if (!shared_ || !writable_)
        return;
    // Another writer that has moved it on since keeps it odd until its own commit is done.
    std::uint64_t expected = mine_;
    (void)std::atomic_ref<std::uint64_t>(*shared_).compare_exchange_strong(expected, mine_ + 1,
                                                                           std::memory_order_acq_rel);
}

Statement::~Statement() {
    if (!statement_)
        return;
    if (stepped_)
        store_.Counters().machineSteps +=
            static_cast<std::uint64_t>(sqlite3_stmt_status(statement_, SQLITE_STMTSTATUS_VM_STEP, 1));
    sqlite3_reset(statement_);
    sqlite3_clear_bindings(statement_);
}

Statement& Statement::Bind(int index, std::int64_t value) {
    if (statement_)
        sqlite3_bind_int64(statement_, index, value);
    return *this;
}

Statement& Statement::BindText(int index, std::string_view text) {
    if (statement_)
        sqlite3_bind_text64(statement_, index, text.data(), text.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
    return *this;
}

Statement& Statement::BindBlob(int index, std::string_view bytes) {
    // A null pointer would bind NULL; an empty value is an empty blob.
    static const char kEmpty = 0;
    if (statement_)
        sqlite3_bind_blob64(statement_, index, bytes.empty() ? &kEmpty : bytes.data(), bytes.size(),
                            SQLITE_TRANSIENT);
    return *this;
}

Statement& Statement::BindNull(int index) {
    if (statement_)
        sqlite3_bind_null(statement_, index);
    return *this;
}

int Statement::Step() {
    if (!statement_) {
        store_.Fail(result_);
        return result_;
    }
    if (!stepped_)
        ++store_.Counters().statements;
    stepped_ = true;
    int result = sqlite3_step(statement_);
    if (result != SQLITE_ROW && result != SQLITE_DONE)
        store_.Fail(result);
    return result;
}

LONG Statement::Run() {
    int result = Step();
    return result == SQLITE_ROW || result == SQLITE_DONE ? ERROR_SUCCESS : ErrorCode(result);
}

std::string_view Statement::Text(int column) const {
    const auto* text = reinterpret_cast<const char*>(sqlite3_column_text(statement_, column));
    return text ? std::string_view(text, static_cast<std::size_t>(sqlite3_column_bytes(statement_, column)))
                : std::string_view();
}

std::string_view Statement::Blob(int column) const {
    const auto* bytes = static_cast<const char*>(sqlite3_column_blob(statement_, column));
    return bytes ? std::string_view(bytes, static_cast<std::size_t>(sqlite3_column_bytes(statement_, column)))
                 : std::string_view();
}

LONG Store::Ready() {
    if (refused_ != ERROR_SUCCESS)
        return refused_;
    if (db_)
        return ERROR_SUCCESS;
    return Open();
}

void Store::Close() {
    for (auto& [sql, statement] : statements_)
        sqlite3_finalize(statement);
    statements_.clear();
    if (db_)
        sqlite3_close(db_); // rolls back a transaction left open
    db_ = nullptr;
    refused_ = ERROR_SUCCESS;
    transactionOpen_ = false;
    counters_ = {};
    counter_.Release();
}

Statement Store::Query(const char* sql) {
    auto found = statements_.find(sql);
    if (found != statements_.end())
        return Statement(*this, found->second, SQLITE_OK);
    sqlite3_stmt* statement = nullptr;
    int result = sqlite3_prepare_v3(db_, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    if (result != SQLITE_OK) {
        sqlite3_finalize(statement);
        return Statement(*this, nullptr, result);
    }
    statements_.emplace(sql, statement);
    return Statement(*this, statement, SQLITE_OK);
}

LONG Store::Fail(int sqliteResult) {
    if (IsDamage(sqliteResult) && refused_ == ERROR_SUCCESS)
        Refuse(ERROR_BADDB, (sqliteResult & 0xFF) == SQLITE_NOTADB
                                ? "is not a registry store (not a database)"
                                : "is damaged (" + std::string(sqlite3_errstr(sqliteResult)) + ")");
    return ErrorCode(sqliteResult);
}

std::uint64_t Store::DataVersion() {
    unsigned int version = 0;
    if (sqlite3_file_control(db_, "main", SQLITE_FCNTL_DATA_VERSION, &version) != SQLITE_OK)
        return 0;
    return version;
}

LONG Store::Refuse(LONG code, const std::string& reason) {
    refused_ = code;
    ReportError(L"ut registry: the store " + WideFromUtf8(path_) + L" " + WideFromUtf8(reason) +
                L"; it is left as it is and registry calls fail");
    return code;
}

LONG Store::Execute(const char* sql) {
    int result = sqlite3_exec(db_, sql, nullptr, nullptr, nullptr);
    return result == SQLITE_OK ? ERROR_SUCCESS : Fail(result);
}

bool Store::ReadOnly() const {
    return sqlite3_db_readonly(db_, "main") == 1;
}

LONG Store::Commit() {
    counter_.BeforeCommit();
    LONG committed = Query("COMMIT").Run();
    counter_.AfterCommit();
    return committed;
}

LONG Store::Open() {
    path_ = RegistryStorePath();
    if (path_.empty())
        return Refuse(ERROR_ACCESS_DENIED, "has no place: set UT_REGISTRY or HOME");
    if (path_ != kInMemory) {
        std::error_code ignored; // a folder that cannot be made shows when the file cannot be opened
        std::filesystem::create_directories(std::filesystem::path(path_).parent_path(), ignored);
    }
    int result = sqlite3_open_v2(path_.c_str(), &db_,
                                 SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX, nullptr);
    if (result != SQLITE_OK) {
        sqlite3_close(db_);
        db_ = nullptr;
        result = sqlite3_open_v2(path_.c_str(), &db_, SQLITE_OPEN_READONLY | SQLITE_OPEN_NOMUTEX, nullptr);
    }
    if (result != SQLITE_OK) {
        std::string why = db_ ? sqlite3_errmsg(db_) : sqlite3_errstr(result);
        sqlite3_close(db_);
        db_ = nullptr;
        return Refuse(ERROR_ACCESS_DENIED, "cannot be opened (" + why + ")");
    }
    sqlite3_extended_result_codes(db_, 1);
    sqlite3_busy_timeout(db_, kBusyMilliseconds);
    LONG checked = CheckSchema();
    if (checked != ERROR_SUCCESS)
        return checked;
    if (path_ == kInMemory)
        counter_.UseLocal();
    else
        counter_.Map(path_ + "-changes");
    // Each commit reaches the disk before the call that made it returns.
    return Execute("PRAGMA synchronous = FULL");
}

// Reads only, until the file is known to be a store of ours or empty: a file that is neither
// is never written.
LONG Store::CheckSchema() {
    for (int attempt = 0; attempt < 2; ++attempt) {
        std::int64_t tables = 0, application = 0, version = 0;
        {
            Statement count = Query("SELECT count(*) FROM sqlite_master");
            int result = count.Step();
            if (result != SQLITE_ROW) {
                if (refused_ != ERROR_SUCCESS)
                    return refused_;
                return Refuse(ErrorCode(result),
                              std::string("cannot be read (") + sqlite3_errstr(result) + ")");
            }
            tables = count.Int(0);
        }
        {
            Statement id = Query("PRAGMA application_id");
            if (id.Step() == SQLITE_ROW)
                application = id.Int(0);
        }
        {
            Statement user = Query("PRAGMA user_version");
            if (user.Step() == SQLITE_ROW)
                version = user.Int(0);
        }
        if (refused_ != ERROR_SUCCESS)
            return refused_;
        if (application == kApplicationId && version == kSchemaVersion)
            return ERROR_SUCCESS;
        if (application == kApplicationId && version > kSchemaVersion)
            return Refuse(ERROR_BADDB, "was written by a newer version of the registry store");
        if (tables != 0 || application != 0)
            return Refuse(ERROR_BADDB, "is not a registry store (it is another program's database)");
        if (attempt > 0)
            break;
        if (ReadOnly())
            return Refuse(ERROR_ACCESS_DENIED, "is empty and cannot be written");
        LONG created = CreateSchema();
        if (created != ERROR_SUCCESS)
            return refused_ != ERROR_SUCCESS ? refused_ : Refuse(created, "cannot be created");
    }
    return Refuse(ERROR_BADDB, "has an unknown layout");
}

LONG Store::CreateSchema() {
    if (path_ != kInMemory) {
        LONG logged = Execute("PRAGMA journal_mode = WAL");
        if (logged != ERROR_SUCCESS)
            return logged;
    }
    LONG begun = Execute("BEGIN IMMEDIATE");
    if (begun != ERROR_SUCCESS)
        return begun;
    // Another process may have created it while this one waited for the lock.
    std::int64_t tables = 0;
    {
        Statement count = Query("SELECT count(*) FROM sqlite_master");
        if (count.Step() == SQLITE_ROW)
            tables = count.Int(0);
    }
    LONG created = tables == 0 ? Execute(kSchema) : ERROR_SUCCESS;
    if (created != ERROR_SUCCESS) {
        (void)Execute("ROLLBACK"); // the failure to report is the one above
        return created;
    }
    return Execute("COMMIT");
}

LONG Store::BeginTransaction() {
    if (transactionOpen_)
        return ERROR_INVALID_FUNCTION;
    if (ReadOnly())
        return ERROR_ACCESS_DENIED;
    LONG begun = Execute("BEGIN IMMEDIATE");
    transactionOpen_ = begun == ERROR_SUCCESS;
    return begun;
}

LONG Store::CommitTransaction() {
    if (!transactionOpen_)
        return ERROR_INVALID_FUNCTION;
    transactionOpen_ = false;
    LONG committed = Commit();
    if (committed != ERROR_SUCCESS && !sqlite3_get_autocommit(db_))
        (void)Execute("ROLLBACK"); // a commit that failed ends the transaction all the same
    return committed;
}

LONG Store::RollbackTransaction() {
    if (!transactionOpen_)
        return ERROR_INVALID_FUNCTION;
    transactionOpen_ = false;
    return Execute("ROLLBACK");
}

WriteScope::WriteScope(Store& store) : store_(store) {
    if (store_.ReadOnly()) {
        status_ = ERROR_ACCESS_DENIED;
        return;
    }
    status_ =
        store_.InTransaction() ? store_.Query("SAVEPOINT call").Run() : store_.Query("BEGIN IMMEDIATE").Run();
    open_ = status_ == ERROR_SUCCESS;
}

WriteScope::~WriteScope() {
    if (open_)
        Undo();
}

// The caller reports the failure that led here, not one of undoing it.
void WriteScope::Undo() {
    open_ = false;
    if (store_.InTransaction()) {
        (void)store_.Query("ROLLBACK TO call").Run(); // see above
        (void)store_.Query("RELEASE call").Run();     // see above
    } else if (!sqlite3_get_autocommit(store_.db_)) {
        (void)store_.Query("ROLLBACK").Run(); // see above
    }
}

LONG WriteScope::Finish(LONG result) {
    if (!open_)
        return result;
    if (result != ERROR_SUCCESS) {
        Undo();
        return result;
    }
    open_ = false;
    LONG committed = store_.InTransaction() ? store_.Query("RELEASE call").Run() : store_.Commit();
    if (committed != ERROR_SUCCESS) {
        open_ = true;
        Undo();
    }
    return committed;
}

} // namespace ut::platform::registry
