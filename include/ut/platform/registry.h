// The registry on both homes: the system's calls (RegCreateKeyExW, RegOpenKeyExW, RegQueryValueExW,
// RegSetValueExW, RegEnumKeyExW, RegEnumValueW, RegQueryInfoKeyW, RegDeleteKeyW, RegDeleteTreeW,
// RegDeleteValueW, RegFlushKey, RegCloseKey and the short RegCreateKeyW and RegOpenKeyW), an owner
// for open keys, and store transactions.
//
// On Windows the calls are the system's. On POSIX they run on a store of our own, one SQLite file
// per user, with the same answers for what the library uses:
// - the roots HKEY_LOCAL_MACHINE, HKEY_CLASSES_ROOT and HKEY_CURRENT_USER (the classes root is a
//   root of its own, not a view of the other two); other roots answer ERROR_INVALID_HANDLE;
// - key and value names are case-insensitive and keep the case they were created with; names are
//   compared by upper-casing each character of the basic plane with the C.UTF-8 rules, whatever
//   the process's locale; a path may not start with a backslash (ERROR_BAD_PATHNAME), repeated and
//   trailing backslashes are ignored, and one key name holds at most 255 characters;
// - sub-keys enumerate in the order of their upper-cased names, values too; stepping through the
//   indexes one by one costs the same at every step, however many there are;
// - values keep the layout the caller gives: byte counts of text types (REG_SZ, REG_EXPAND_SZ,
//   REG_MULTI_SZ) count wchar_t units times sizeof(wchar_t), and the store keeps text as UTF-16LE
//   (a byte count that is not a whole number of units loses its partial unit); other types are kept
//   byte for byte. As the system does, a text value whose last unit is not zero but whose next one
//   is gets that terminator added, and a read adds a terminator after text that lacks one when the
//   buffer has room for it (not counted in the byte count);
// - access: a handle answers ERROR_ACCESS_DENIED to calls its access mask does not allow
//   (KEY_QUERY_VALUE to read values and key information, KEY_SET_VALUE to write and delete values,
//   KEY_ENUMERATE_SUB_KEYS to list sub-keys); opening, creating and deleting sub-keys need no right
//   on the parent handle, and there are no security descriptors;
// - RegDeleteKeyW refuses a key that has sub-keys and a root with ERROR_ACCESS_DENIED; calls on a
//   handle whose key was deleted answer ERROR_KEY_DELETED; a closed or unknown handle answers
//   ERROR_INVALID_HANDLE;
// - volatile keys (REG_OPTION_VOLATILE) are kept like the others.
//
// The store is the file that the environment variable UT_REGISTRY names, else
// $XDG_DATA_HOME/ut/registry.db, else $HOME/.local/share/ut/registry.db; it is created with its
// folders on first use. UT_REGISTRY=":memory:" gives a private store in memory that lives as long
// as the process. Every write is one atomic and durable transaction (write-ahead log, synced at
// each commit); processes share the store, waiting up to 30 s for one another's writes. A store
// that cannot be written answers ERROR_ACCESS_DENIED to writes and leaves the file as it was. A
// file that is not such a store (not a database, another program's database, a newer format, or
// damaged) is never written: the first call says why on standard error and every call answers
// ERROR_BADDB.
#pragma once

#include <memory>

#include <ut/platform/com.h>
#include <ut/platform/native/registry.h>

namespace ut {

struct HKeyCloser {
    void operator()(HKEY key) const noexcept {
        (void)RegCloseKey(key); // a key that fails to close is gone for us either way
    }
};
// Owns an open key and closes it on every path. Closing a predefined root is harmless.
using UniqueHKey = std::unique_ptr<HKEY__, HKeyCloser>;

} // namespace ut

namespace ut::platform {

// Groups every registry write of the process until the commit into one atomic and durable
// transaction of the store: other processes see all of it or none of it, and a rollback undoes it.
// Transactions do not nest: a second begin answers ERROR_INVALID_FUNCTION; commit and rollback
// without a begin answer ERROR_INVALID_FUNCTION too. Other processes wait for the store while a
// transaction is open. On Windows each registry call stands alone: the three calls answer
// ERROR_SUCCESS and do nothing, so a rollback undoes nothing there.
UT_PLATFORM_API LONG BeginRegistryTransaction();
UT_PLATFORM_API LONG CommitRegistryTransaction();
UT_PLATFORM_API LONG RollbackRegistryTransaction();

// A registry transaction for a scope: it begins on construction and rolls back when the scope
// ends without Commit().
class RegistryTransaction {
public:
    RegistryTransaction() : status_(BeginRegistryTransaction()) {}
    ~RegistryTransaction() {
        if (status_ == ERROR_SUCCESS && !committed_)
            (void)RollbackRegistryTransaction(); // nothing more can be undone when this fails
    }
    RegistryTransaction(const RegistryTransaction&) = delete;
    RegistryTransaction& operator=(const RegistryTransaction&) = delete;

    // ERROR_SUCCESS when the transaction began.
    LONG Status() const { return status_; }
    LONG Commit() {
        if (status_ != ERROR_SUCCESS)
            return status_;
        committed_ = true;
        return CommitRegistryTransaction();
    }

private:
    LONG status_;
    bool committed_ = false;
};

} // namespace ut::platform
