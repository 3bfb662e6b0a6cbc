// The SQLite side of the POSIX registry: the process's one connection to the store file, its
// cached statements, write scopes and transactions, and SQLite's answers turned into the system's
// error codes.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>

#include <sqlite3.h>

#include <ut/platform/native/registry_store.h>

namespace ut::platform::registry {

// Row ids of the three roots, fixed when the store is created.
inline constexpr std::int64_t kClassesRootId = 1;
inline constexpr std::int64_t kCurrentUserId = 2;
inline constexpr std::int64_t kLocalMachineId = 3;

class Store;

// The system's code for an SQLite result (ERROR_SUCCESS for SQLITE_OK, SQLITE_ROW and SQLITE_DONE).
LONG ErrorCode(int sqliteResult);

// One run of a cached statement. It is reset, and its bindings cleared, when it goes.
class Statement {
public:
    Statement(Store& store, sqlite3_stmt* statement, int prepareResult)
        : store_(store), statement_(statement), result_(prepareResult) {}
    ~Statement();
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;

    Statement& Bind(int index, std::int64_t value);
    Statement& BindText(int index, std::string_view text);
    Statement& BindBlob(int index, std::string_view bytes);
    Statement& BindNull(int index);

    // SQLITE_ROW, SQLITE_DONE, or the failing SQLite code (which the store has already seen).
    int Step();
    // Runs a statement that returns no rows: ERROR_SUCCESS or the system's code for the failure.
    LONG Run();

    std::int64_t Int(int column) const { return sqlite3_column_int64(statement_, column); }
    std::string_view Text(int column) const;
    std::string_view Blob(int column) const;
    bool IsNull(int column) const { return sqlite3_column_type(statement_, column) == SQLITE_NULL; }

private:
    Store& store_;
    sqlite3_stmt* statement_;
    int result_;
    bool stepped_ = false;
};

// A counter shared by every process that uses the store, in a small file mapped beside it, so that
// a process can tell without a query whether anything was committed since it last read. Writers
// make it odd just before a commit and even again after it; a process caches what it reads only
// while the counter is even, and drops its cache when the counter moves. A writer that dies
// between the two steps leaves it odd, and caching stays off until the next commit.
class ChangeCounter {
public:
    ChangeCounter() = default;
    ~ChangeCounter() { Release(); }
    ChangeCounter(const ChangeCounter&) = delete;
    ChangeCounter& operator=(const ChangeCounter&) = delete;

    // Maps the file `path`, creating it when it can; without it nothing is cached.
    void Map(const std::string& path);
    // A counter of the process's own, for a store no other process sees.
    void UseLocal();
    void Release();

    // The counter while no commit is on its way; nothing when reads must not be cached.
    std::optional<std::uint64_t> Stable() const;
    void BeforeCommit();
    void AfterCommit();

private:
    std::uint64_t* shared_ = nullptr;
    bool writable_ = false;
    bool local_ = false;
    std::uint64_t localValue_ = 0;
    std::uint64_t mine_ = 0;
};

class Store {
public:
    Store() = default;
    ~Store() { Close(); }
    Store(const Store&) = delete;
    Store& operator=(const Store&) = delete;

    // ERROR_SUCCESS when the store can be used, opening it on first use; else why it cannot.
    LONG Ready();
    // Finalizes every statement and closes the connection; an open transaction is rolled back.
    void Close();

    // A run of the statement `sql`, prepared once. `sql` must be a string literal: its address
    // is the cache key.
    Statement Query(const char* sql);

    // The system's code for an SQLite failure. A damaged store is refused from here on, and said
    // so once on standard error.
    LONG Fail(int sqliteResult);

    // A number that changes whenever the data may have changed, by this process or another, since
    // the last statement read it. Read it right after the statement whose view it should describe.
    std::uint64_t DataVersion();

    bool InTransaction() const { return transactionOpen_; }
    // The change counter while what is read may be cached: no transaction of this process is
    // open and no commit of any process is on its way.
    std::optional<std::uint64_t> CacheableGeneration() const {
        return transactionOpen_ ? std::nullopt : counter_.Stable();
    }
    LONG BeginTransaction();
    LONG CommitTransaction();
    LONG RollbackTransaction();

    RegistryStoreCounters& Counters() { return counters_; }
    // Rows changed by the last statement, and the id of the last row inserted.
    std::int64_t Changes() const { return sqlite3_changes64(db_); }
    std::int64_t LastInsertId() const { return sqlite3_last_insert_rowid(db_); }

private:
    friend class WriteScope;

    LONG Open();
    LONG CheckSchema();
    LONG CreateSchema();
    LONG Refuse(LONG code, const std::string& reason);
    LONG Execute(const char* sql);
    bool ReadOnly() const;
    // Runs COMMIT with the change counter stepped around it.
    LONG Commit();

    sqlite3* db_ = nullptr;
    std::string path_;
    LONG refused_ = ERROR_SUCCESS;
    bool transactionOpen_ = false;
    std::unordered_map<const char*, sqlite3_stmt*> statements_;
    RegistryStoreCounters counters_;
    ChangeCounter counter_;
};

// The writes of one registry call: its own transaction, or a savepoint inside the store
// transaction that is open. Rolled back unless committed.
class WriteScope {
public:
    explicit WriteScope(Store& store);
    ~WriteScope();
    WriteScope(const WriteScope&) = delete;
    WriteScope& operator=(const WriteScope&) = delete;

    // ERROR_SUCCESS when the scope began; nothing may be written otherwise.
    LONG Status() const { return status_; }
    // Ends the scope with `result`: commits on ERROR_SUCCESS (answering the commit's own failure,
    // if any), rolls back otherwise and answers `result`.
    LONG Finish(LONG result);

private:
    void Undo();

    Store& store_;
    LONG status_;
    bool open_ = false;
};

} // namespace ut::platform::registry
