// The registry calls on POSIX, over the SQLite store: handles and their access, key paths and
// case-insensitive names, value data in the layout callers give, and enumeration cursors that
// keep each step of an index walk as cheap as the first.
#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <locale.h>
#include <mutex>
#include <new>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>
#include <wctype.h>

#include <ut/platform/registry.h>
#include <ut/platform/text.h>

#include "registry_store.h"

namespace ut::platform::registry {
namespace {

constexpr std::size_t kLongestKeyName = 255;
constexpr std::size_t kLongestValueName = 16383;
constexpr REGSAM kAllAccess = KEY_ALL_ACCESS | KEY_WOW64_64KEY | KEY_WOW64_32KEY;
constexpr std::uintptr_t kFirstHandle = 0x1000;
constexpr std::uintptr_t kHandleStep = 4;

// Upper-cases one character by the C.UTF-8 rules, whatever locale the process has chosen, so that
// two names compare alike in every process. Like the system, characters beyond the basic plane
// are left as they are.
wchar_t FoldCharacter(wchar_t c) {
    static const locale_t rules = newlocale(LC_CTYPE_MASK, "C.UTF-8", static_cast<locale_t>(nullptr));
    if (c < 0x80)
        return c >= L'a' && c <= L'z' ? static_cast<wchar_t>(c - L'a' + L'A') : c;
    if (c > 0xFFFF || !rules)
        return c;
    return static_cast<wchar_t>(towupper_l(static_cast<wint_t>(c), rules));
}

// The form under which a name is compared and sorted.
std::string Fold(std::wstring_view name) {
    std::wstring upper(name);
    for (wchar_t& c : upper)
        c = FoldCharacter(c);
    return Utf8FromWide(upper);
}

std::wstring_view NameOf(const wchar_t* name) {
    return name ? std::wstring_view(name) : std::wstring_view();
}

// Splits a sub-key path into its key names, skipping empty ones.
LONG SplitPath(const wchar_t* path, std::vector<std::wstring_view>& names) {
    std::wstring_view rest = NameOf(path);
    if (!rest.empty() && rest.front() == L'\\')
        return ERROR_BAD_PATHNAME;
    while (!rest.empty()) {
        std::size_t cut = rest.find(L'\\');
        std::wstring_view name = rest.substr(0, cut);
        if (name.size() > kLongestKeyName)
            return ERROR_INVALID_PARAMETER;
        if (!name.empty())
            names.push_back(name);
        if (cut == std::wstring_view::npos)
            break;
        rest.remove_prefix(cut + 1);
    }
    return ERROR_SUCCESS;
}

// What a request for `access` grants: there are no security descriptors, so everything asked.
REGSAM Granted(REGSAM access) {
    if (access & (MAXIMUM_ALLOWED | GENERIC_ALL))
        return kAllAccess;
    if (access & GENERIC_READ)
        access |= KEY_READ;
    if (access & GENERIC_WRITE)
        access |= KEY_WRITE;
    if (access & GENERIC_EXECUTE)
        access |= KEY_EXECUTE;
    return access & kAllAccess;
}

std::int64_t Now() {
    // 100-nanosecond intervals since 1601-01-01, as FILETIME counts them.
    constexpr std::int64_t kUnixEpochInFileTime = 116444736000000000;
    auto since = std::chrono::system_clock::now().time_since_epoch();
    return kUnixEpochInFileTime + std::chrono::duration_cast<std::chrono::nanoseconds>(since).count() / 100;
}

void PutFileTime(std::int64_t ticks, PFILETIME out) {
    if (!out)
        return;
    out->dwLowDateTime = static_cast<DWORD>(static_cast<std::uint64_t>(ticks) & 0xFFFFFFFF);
    out->dwHighDateTime = static_cast<DWORD>(static_cast<std::uint64_t>(ticks) >> 32);
}

bool IsText(DWORD type) {
    return type == REG_SZ || type == REG_EXPAND_SZ || type == REG_MULTI_SZ;
}

wchar_t UnitAt(const BYTE* data, std::size_t index) {
    wchar_t unit;
    std::memcpy(&unit, data + index * sizeof(wchar_t), sizeof unit);
    return unit;
}

// The byte count the system keeps for `data`: text whose last unit is not zero but whose next one
// is gets that terminator (the system reads the unit past the count to decide, and so do we).
DWORD KeptSize(DWORD type, const BYTE* data, DWORD size) {
    std::size_t units = size / sizeof(wchar_t);
    if (!data || !IsText(type) || units == 0)
        return size;
    if (UnitAt(data, units - 1) != 0 && UnitAt(data, units) == 0)
        return static_cast<DWORD>((units + 1) * sizeof(wchar_t));
    return size;
}

// The store's form of value data: text as UTF-16LE, everything else byte for byte.
std::string StoredForm(DWORD type, const BYTE* data, DWORD size) {
    if (!data || size == 0)
        return std::string();
    if (!IsText(type))
        return std::string(reinterpret_cast<const char*>(data), size);
    std::wstring text(size / sizeof(wchar_t), L'\0');
    std::memcpy(text.data(), data, text.size() * sizeof(wchar_t));
    std::string stored;
    AppendUtf16Le(text, stored);
    return stored;
}

// Value data as callers on this home see it: text in wchar_t units.
std::string HomeForm(DWORD type, std::string_view stored) {
    if (!IsText(type))
        return std::string(stored);
    std::wstring text =
        WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(stored.data()), stored.size() / 2);
    return std::string(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(wchar_t));
}

// Copies value data to the caller's buffer of `room` bytes, which holds it. Text that lacks its
// terminator gets one after it when there is room (not counted), as the system does.
void CopyData(DWORD type, const std::string& bytes, BYTE* data, DWORD room) {
    std::memcpy(data, bytes.data(), bytes.size());
    if (!IsText(type) || bytes.size() < sizeof(wchar_t) || room - bytes.size() < sizeof(wchar_t))
        return;
    std::size_t units = bytes.size() / sizeof(wchar_t);
    if (UnitAt(reinterpret_cast<const BYTE*>(bytes.data()), units - 1) != 0) {
        constexpr wchar_t kTerminator = 0;
        std::memcpy(data + bytes.size(), &kTerminator, sizeof kTerminator);
    }
}

// Copies a name with its terminator when `*capacity` (in characters, terminator included) holds it.
bool CopyName(const std::wstring& name, wchar_t* out, DWORD* capacity) {
    if (name.size() >= *capacity)
        return false;
    std::memcpy(out, name.c_str(), (name.size() + 1) * sizeof(wchar_t));
    *capacity = static_cast<DWORD>(name.size());
    return true;
}

// Where an index walk over sub-keys or values stands: the entry last returned, and the version of
// the data it was found in. A step to the same or the next index continues from here.
struct Cursor {
    bool valid = false;
    DWORD index = 0;
    std::string fold;
    std::uint64_t version = 0;
};

struct OpenKey {
    std::int64_t id;
    REGSAM access;
    Cursor subKeys;
    Cursor values;
};

// One step of an index walk: its SQL from the start or from a cursor (`?1` the parent, `?2` the
// folded name or the offset).
struct Listing {
    const char* atOrAfter;
    const char* after;
    const char* atOffset;
};

constexpr Listing kSubKeyListing = {
    "SELECT name, fold, class, written FROM keys WHERE parent = ?1 AND fold >= ?2 ORDER BY fold LIMIT 1",
    "SELECT name, fold, class, written FROM keys WHERE parent = ?1 AND fold > ?2 ORDER BY fold LIMIT 1",
    "SELECT name, fold, class, written FROM keys WHERE parent = ?1 ORDER BY fold LIMIT 1 OFFSET ?2",
};
constexpr Listing kValueListing = {
    "SELECT name, fold, type, data FROM vals WHERE key = ?1 AND fold >= ?2 ORDER BY fold LIMIT 1",
    "SELECT name, fold, type, data FROM vals WHERE key = ?1 AND fold > ?2 ORDER BY fold LIMIT 1",
    "SELECT name, fold, type, data FROM vals WHERE key = ?1 ORDER BY fold LIMIT 1 OFFSET ?2",
};

// A sub-key or a value as an index walk finds it. Columns 2 and 3 are the class and write time of
// a key, or the type and data of a value.
struct Entry {
    std::wstring name;
    std::string fold;
    std::int64_t number = 0;
    std::string text;
    bool textIsNull = true;
};

class Registry {
public:
    Registry() {
        roots_[0] = {kClassesRootId, kAllAccess, {}, {}};
        roots_[1] = {kCurrentUserId, kAllAccess, {}, {}};
        roots_[2] = {kLocalMachineId, kAllAccess, {}, {}};
    }

    std::mutex mutex;
    Store store;

    OpenKey* Find(HKEY key) {
        if (key == HKEY_CLASSES_ROOT)
            return &roots_[0];
        if (key == HKEY_CURRENT_USER)
            return &roots_[1];
        if (key == HKEY_LOCAL_MACHINE)
            return &roots_[2];
        auto found = handles_.find(reinterpret_cast<std::uintptr_t>(key));
        return found == handles_.end() ? nullptr : &found->second;
    }

    // The open key behind `key`, with the store ready to use.
    LONG Target(HKEY key, OpenKey*& open) {
        open = Find(key);
        if (!open)
            return ERROR_INVALID_HANDLE;
        return store.Ready();
    }

    HKEY Add(std::int64_t id, REGSAM access) {
        std::uintptr_t handle = next_;
        next_ += kHandleStep;
        handles_.emplace(handle, OpenKey{id, Granted(access), {}, {}});
        return reinterpret_cast<HKEY>(handle);
    }

    LONG Remove(HKEY key) {
        if (key == HKEY_CLASSES_ROOT || key == HKEY_CURRENT_USER || key == HKEY_LOCAL_MACHINE)
            return ERROR_SUCCESS;
        return handles_.erase(reinterpret_cast<std::uintptr_t>(key)) ? ERROR_SUCCESS : ERROR_INVALID_HANDLE;
    }

    void Close() {
        store.Close();
        handles_.clear();
        for (OpenKey& root : roots_)
            root.subKeys = root.values = Cursor{};
    }

private:
    OpenKey roots_[3];
    std::unordered_map<std::uintptr_t, OpenKey> handles_;
    std::uintptr_t next_ = kFirstHandle;
};

void CloseAtExit();

// Never destroyed: modules may still call the registry while the process exits. The connection
// is closed at exit, so that the store's log is folded back into the file.
Registry& TheRegistry() {
    static Registry* registry = [] {
        auto* made = new Registry;
        std::atexit(&CloseAtExit);
        return made;
    }();
    return *registry;
}

void CloseAtExit() {
    Registry& registry = TheRegistry();
    std::lock_guard lock(registry.mutex);
    registry.Close();
}

// Runs one registry call under the registry's lock; no exception leaves it.
template <class Body>
LONG Call(Body body) noexcept {
    try {
        Registry& registry = TheRegistry();
        std::lock_guard lock(registry.mutex);
        return body(registry);
    } catch (const std::bad_alloc&) {
        return ERROR_OUTOFMEMORY;
    }
}

// ERROR_SUCCESS when the key exists, ERROR_KEY_DELETED when it is gone.
LONG Exists(Store& store, std::int64_t id) {
    Statement query = store.Query("SELECT 1 FROM keys WHERE id = ?1");
    int result = query.Bind(1, id).Step();
    if (result == SQLITE_ROW)
        return ERROR_SUCCESS;
    return result == SQLITE_DONE ? ERROR_KEY_DELETED : ErrorCode(result);
}

// `answer` when the key still exists; ERROR_KEY_DELETED or the store's failure otherwise.
LONG UnlessDeleted(Store& store, std::int64_t id, LONG answer) {
    LONG exists = Exists(store, id);
    return exists == ERROR_SUCCESS ? answer : exists;
}

// Finds the sub-key `name` of `parent`: ERROR_SUCCESS, ERROR_FILE_NOT_FOUND or a failure.
LONG Child(Store& store, std::int64_t parent, std::wstring_view name, std::int64_t& id) {
    Statement query = store.Query("SELECT id FROM keys WHERE parent = ?1 AND fold = ?2");
    int result = query.Bind(1, parent).BindText(2, Fold(name)).Step();
    if (result == SQLITE_ROW)
        id = query.Int(0);
    return result == SQLITE_ROW    ? ERROR_SUCCESS
           : result == SQLITE_DONE ? ERROR_FILE_NOT_FOUND
                                   : ErrorCode(result);
}

// Follows `names` down from `id`; a missing key answers ERROR_FILE_NOT_FOUND, or ERROR_KEY_DELETED
// when the walk's start is gone.
LONG Walk(Store& store, std::int64_t& id, const std::vector<std::wstring_view>& names) {
    std::int64_t start = id;
    if (names.empty())
        return Exists(store, id);
    for (std::wstring_view name : names) {
        LONG found = Child(store, id, name, id);
        if (found == ERROR_FILE_NOT_FOUND)
            return UnlessDeleted(store, start, ERROR_FILE_NOT_FOUND);
        if (found != ERROR_SUCCESS)
            return found;
    }
    return ERROR_SUCCESS;
}

// Inside a write scope: follows `names` down from `id`, creating what is missing. The class goes
// to the last key when it is created.
LONG CreatePath(Store& store, std::int64_t& id, const std::vector<std::wstring_view>& names,
                const wchar_t* keyClass, bool& created) {
    LONG exists = Exists(store, id);
    if (exists != ERROR_SUCCESS)
        return exists;
    for (std::size_t i = 0; i < names.size(); ++i) {
        LONG found = Child(store, id, names[i], id);
        if (found == ERROR_SUCCESS)
            continue;
        if (found != ERROR_FILE_NOT_FOUND)
            return found;
        Statement insert =
            store.Query("INSERT INTO keys(parent, name, fold, class, written) VALUES(?1, ?2, ?3, ?4, ?5)");
        insert.Bind(1, id).BindText(2, Utf8FromWide(names[i])).BindText(3, Fold(names[i])).Bind(5, Now());
        if (keyClass && i + 1 == names.size())
            insert.BindText(4, Utf8FromWide(keyClass));
        else
            insert.BindNull(4);
        LONG inserted = insert.Run();
        if (inserted != ERROR_SUCCESS)
            return inserted;
        id = store.LastInsertId();
        created = true;
    }
    return ERROR_SUCCESS;
}

// Marks a key written, which is also how a write learns that its key is gone.
LONG Touch(Store& store, std::int64_t id) {
    LONG touched = store.Query("UPDATE keys SET written = ?2 WHERE id = ?1").Bind(1, id).Bind(2, Now()).Run();
    if (touched != ERROR_SUCCESS)
        return touched;
    return store.Changes() == 0 ? ERROR_KEY_DELETED : ERROR_SUCCESS;
}

void ReadEntry(const Statement& row, Entry& entry) {
    entry.name = WideFromUtf8(row.Text(0));
    entry.fold = std::string(row.Text(1));
    entry.number = row.Int(2);
    entry.textIsNull = row.IsNull(3);
    entry.text = std::string(row.IsNull(3) ? std::string_view() : row.Blob(3));
}

// The entry at `index` among the children of `id`, in the order of their folded names.
// ERROR_NO_MORE_ITEMS past the last one. A step to the cursor's index or the next one seeks by
// name from the cursor, unless the data changed since; any other index counts from the start.
LONG EntryAt(Store& store, const Listing& listing, std::int64_t id, Cursor& cursor, DWORD index,
             Entry& entry) {
    bool continues = cursor.valid && (index == cursor.index || index == cursor.index + 1);
    if (continues || index == 0) {
        Statement seek = store.Query(continues && index != cursor.index ? listing.after : listing.atOrAfter);
        int result = seek.Bind(1, id).BindText(2, continues ? cursor.fold : std::string()).Step();
        std::uint64_t version = store.DataVersion();
        if (!continues || version == cursor.version) {
            if (result != SQLITE_ROW && result != SQLITE_DONE)
                return ErrorCode(result);
            cursor.valid = result == SQLITE_ROW;
            if (result == SQLITE_DONE)
                return ERROR_NO_MORE_ITEMS;
            ReadEntry(seek, entry);
            cursor = {true, index, entry.fold, version};
            return ERROR_SUCCESS;
        }
    }
    Statement counted = store.Query(listing.atOffset);
    int result = counted.Bind(1, id).Bind(2, static_cast<std::int64_t>(index)).Step();
    std::uint64_t version = store.DataVersion();
    cursor.valid = result == SQLITE_ROW;
    if (result == SQLITE_DONE)
        return ERROR_NO_MORE_ITEMS;
    if (result != SQLITE_ROW)
        return ErrorCode(result);
    ReadEntry(counted, entry);
    cursor = {true, index, entry.fold, version};
    return ERROR_SUCCESS;
}

// Like EntryAt, telling a key that was deleted from one that has no more entries.
LONG ListedEntry(Store& store, const Listing& listing, OpenKey& open, Cursor& cursor, DWORD index,
                 Entry& entry) {
    LONG found = EntryAt(store, listing, open.id, cursor, index, entry);
    return found == ERROR_NO_MORE_ITEMS ? UnlessDeleted(store, open.id, ERROR_NO_MORE_ITEMS) : found;
}

// Deletes what `id` holds (its values and every key below it), and the key itself when asked.
LONG DeleteSubtree(Store& store, std::int64_t id, bool withKey) {
    LONG deleted = store
                       .Query("WITH RECURSIVE tree(id) AS (SELECT ?1 UNION ALL SELECT keys.id FROM keys "
                              "JOIN tree ON keys.parent = tree.id) "
                              "DELETE FROM vals WHERE key IN (SELECT id FROM tree)")
                       .Bind(1, id)
                       .Run();
    if (deleted == ERROR_SUCCESS)
        deleted = store
                      .Query("WITH RECURSIVE tree(id) AS (SELECT id FROM keys WHERE parent = ?1 UNION ALL "
                             "SELECT keys.id FROM keys JOIN tree ON keys.parent = tree.id) "
                             "DELETE FROM keys WHERE id IN (SELECT id FROM tree)")
                      .Bind(1, id)
                      .Run();
    if (deleted == ERROR_SUCCESS && withKey)
        deleted = store.Query("DELETE FROM keys WHERE id = ?1").Bind(1, id).Run();
    return deleted;
}

} // namespace
} // namespace ut::platform::registry

using ut::platform::registry::Call;
using ut::platform::registry::OpenKey;
using ut::platform::registry::Registry;
using ut::platform::registry::WriteScope;
namespace reg = ut::platform::registry;

extern "C" {

LONG RegCreateKeyExW(HKEY key, LPCWSTR subKey, DWORD reserved, LPWSTR keyClass, DWORD /*options*/,
                     REGSAM access, const SECURITY_ATTRIBUTES* /*security*/, PHKEY result,
                     LPDWORD disposition) {
    return Call([&](Registry& registry) -> LONG {
        if (!result)
            return ERROR_INVALID_PARAMETER;
        *result = nullptr;
        if (reserved)
            return ERROR_INVALID_PARAMETER;
        std::vector<std::wstring_view> names;
        OpenKey* parent = nullptr;
        if (LONG split = reg::SplitPath(subKey, names); split != ERROR_SUCCESS)
            return split;
        if (LONG ready = registry.Target(key, parent); ready != ERROR_SUCCESS)
            return ready;
        std::int64_t id = parent->id;
        bool created = false;
        // Most calls open a key that exists: they need no write.
        LONG found = reg::Walk(registry.store, id, names);
        if (found == ERROR_FILE_NOT_FOUND) {
            WriteScope scope(registry.store);
            if (scope.Status() != ERROR_SUCCESS)
                return scope.Status();
            id = parent->id;
            found = scope.Finish(reg::CreatePath(registry.store, id, names, keyClass, created));
        }
        if (found != ERROR_SUCCESS)
            return found;
        *result = registry.Add(id, access);
        if (disposition)
            *disposition = created ? REG_CREATED_NEW_KEY : REG_OPENED_EXISTING_KEY;
        return ERROR_SUCCESS;
    });
}

LONG RegCreateKeyW(HKEY key, LPCWSTR subKey, PHKEY result) {
    return RegCreateKeyExW(key, subKey, 0, nullptr, REG_OPTION_NON_VOLATILE, MAXIMUM_ALLOWED, nullptr, result,
                           nullptr);
}

LONG RegOpenKeyExW(HKEY key, LPCWSTR subKey, DWORD /*options*/, REGSAM access, PHKEY result) {
    return Call([&](Registry& registry) -> LONG {
        if (!result)
            return ERROR_INVALID_PARAMETER;
        *result = nullptr;
        std::vector<std::wstring_view> names;
        OpenKey* parent = nullptr;
        if (LONG split = reg::SplitPath(subKey, names); split != ERROR_SUCCESS)
            return split;
        if (LONG ready = registry.Target(key, parent); ready != ERROR_SUCCESS)
            return ready;
        std::int64_t id = parent->id;
        if (LONG found = reg::Walk(registry.store, id, names); found != ERROR_SUCCESS)
            return found;
        *result = registry.Add(id, access);
        return ERROR_SUCCESS;
    });
}

LONG RegOpenKeyW(HKEY key, LPCWSTR subKey, PHKEY result) {
    // The short form hands back the handle it was given when there is no sub-key.
    if (result && (!subKey || !*subKey)) {
        *result = key;
        return ERROR_SUCCESS;
    }
    return RegOpenKeyExW(key, subKey, 0, MAXIMUM_ALLOWED, result);
}

LONG RegCloseKey(HKEY key) {
    return Call([&](Registry& registry) { return registry.Remove(key); });
}

LONG RegDeleteKeyW(HKEY key, LPCWSTR subKey) {
    return Call([&](Registry& registry) -> LONG {
        if (!subKey)
            return ERROR_INVALID_PARAMETER;
        std::vector<std::wstring_view> names;
        OpenKey* parent = nullptr;
        if (LONG split = reg::SplitPath(subKey, names); split != ERROR_SUCCESS)
            return split;
        if (LONG ready = registry.Target(key, parent); ready != ERROR_SUCCESS)
            return ready;
        reg::Store& store = registry.store;
        WriteScope scope(store);
        if (scope.Status() != ERROR_SUCCESS)
            return scope.Status();
        std::int64_t id = parent->id;
        if (LONG found = reg::Walk(store, id, names); found != ERROR_SUCCESS)
            return scope.Finish(found);
        if (id <= reg::kLocalMachineId)
            return scope.Finish(ERROR_ACCESS_DENIED);
        reg::Statement child = store.Query("SELECT 1 FROM keys WHERE parent = ?1 LIMIT 1");
        int hasChild = child.Bind(1, id).Step();
        if (hasChild != SQLITE_DONE)
            return scope.Finish(hasChild == SQLITE_ROW ? ERROR_ACCESS_DENIED : reg::ErrorCode(hasChild));
        LONG deleted = store.Query("DELETE FROM vals WHERE key = ?1").Bind(1, id).Run();
        if (deleted == ERROR_SUCCESS)
            deleted = store.Query("DELETE FROM keys WHERE id = ?1").Bind(1, id).Run();
        return scope.Finish(deleted);
    });
}

LONG RegDeleteTreeW(HKEY key, LPCWSTR subKey) {
    return Call([&](Registry& registry) -> LONG {
        std::vector<std::wstring_view> names;
        OpenKey* parent = nullptr;
        if (LONG split = reg::SplitPath(subKey, names); split != ERROR_SUCCESS)
            return split;
        if (LONG ready = registry.Target(key, parent); ready != ERROR_SUCCESS)
            return ready;
        reg::Store& store = registry.store;
        WriteScope scope(store);
        if (scope.Status() != ERROR_SUCCESS)
            return scope.Status();
        std::int64_t id = parent->id;
        if (LONG found = reg::Walk(store, id, names); found != ERROR_SUCCESS)
            return scope.Finish(found);
        // With a sub-key the key goes too; without one only what it holds.
        bool withKey = subKey != nullptr;
        if (withKey && id <= reg::kLocalMachineId)
            return scope.Finish(ERROR_ACCESS_DENIED);
        return scope.Finish(reg::DeleteSubtree(store, id, withKey));
    });
}

LONG RegQueryValueExW(HKEY key, LPCWSTR name, LPDWORD reserved, LPDWORD type, LPBYTE data,
                      LPDWORD byteCount) {
    return Call([&](Registry& registry) -> LONG {
        if ((data && !byteCount) || reserved)
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_QUERY_VALUE))
            return ERROR_ACCESS_DENIED;
        reg::Store& store = registry.store;
        reg::Statement query = store.Query("SELECT type, data FROM vals WHERE key = ?1 AND fold = ?2");
        int result = query.Bind(1, open->id).BindText(2, reg::Fold(reg::NameOf(name))).Step();
        if (result == SQLITE_DONE)
            return reg::UnlessDeleted(store, open->id, ERROR_FILE_NOT_FOUND);
        if (result != SQLITE_ROW)
            return reg::ErrorCode(result);
        auto valueType = static_cast<DWORD>(query.Int(0));
        std::string bytes = reg::HomeForm(valueType, query.Blob(1));
        auto size = static_cast<DWORD>(bytes.size());
        LONG answer = ERROR_SUCCESS;
        if (data && *byteCount < size)
            answer = ERROR_MORE_DATA;
        else if (data)
            reg::CopyData(valueType, bytes, data, *byteCount);
        if (type)
            *type = valueType;
        if (byteCount)
            *byteCount = size;
        return answer;
    });
}

LONG RegSetValueExW(HKEY key, LPCWSTR name, DWORD /*reserved*/, DWORD type, const BYTE* data,
                    DWORD byteCount) {
    return Call([&](Registry& registry) -> LONG {
        if (!data && byteCount)
            return ERROR_NOACCESS;
        std::wstring_view valueName = reg::NameOf(name);
        if (valueName.size() > reg::kLongestValueName)
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_SET_VALUE))
            return ERROR_ACCESS_DENIED;
        std::string stored = reg::StoredForm(type, data, reg::KeptSize(type, data, byteCount));
        reg::Store& store = registry.store;
        WriteScope scope(store);
        if (scope.Status() != ERROR_SUCCESS)
            return scope.Status();
        LONG written = reg::Touch(store, open->id);
        if (written == ERROR_SUCCESS)
            written =
                store
                    .Query("INSERT INTO vals(key, name, fold, type, data) VALUES(?1, ?2, ?3, ?4, ?5) "
                           "ON CONFLICT(key, fold) DO UPDATE SET type = excluded.type, data = excluded.data")
                    .Bind(1, open->id)
                    .BindText(2, ut::platform::Utf8FromWide(valueName))
                    .BindText(3, reg::Fold(valueName))
                    .Bind(4, type)
                    .BindBlob(5, stored)
                    .Run();
        return scope.Finish(written);
    });
}

LONG RegDeleteValueW(HKEY key, LPCWSTR name) {
    return Call([&](Registry& registry) -> LONG {
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_SET_VALUE))
            return ERROR_ACCESS_DENIED;
        reg::Store& store = registry.store;
        WriteScope scope(store);
        if (scope.Status() != ERROR_SUCCESS)
            return scope.Status();
        LONG deleted = reg::Touch(store, open->id);
        if (deleted == ERROR_SUCCESS)
            deleted = store.Query("DELETE FROM vals WHERE key = ?1 AND fold = ?2")
                          .Bind(1, open->id)
                          .BindText(2, reg::Fold(reg::NameOf(name)))
                          .Run();
        if (deleted == ERROR_SUCCESS && store.Changes() == 0)
            deleted = ERROR_FILE_NOT_FOUND;
        return scope.Finish(deleted);
    });
}

LONG RegEnumKeyExW(HKEY key, DWORD index, LPWSTR name, LPDWORD nameLength, LPDWORD reserved, LPWSTR keyClass,
                   LPDWORD classLength, PFILETIME lastWrite) {
    return Call([&](Registry& registry) -> LONG {
        if (reserved || !name || !nameLength)
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_ENUMERATE_SUB_KEYS))
            return ERROR_ACCESS_DENIED;
        reg::Entry entry;
        LONG found =
            reg::ListedEntry(registry.store, reg::kSubKeyListing, *open, open->subKeys, index, entry);
        if (found != ERROR_SUCCESS)
            return found;
        std::wstring className = ut::platform::WideFromUtf8(entry.text);
        if (entry.name.size() >= *nameLength || (keyClass && classLength && className.size() >= *classLength))
            return ERROR_MORE_DATA;
        reg::CopyName(entry.name, name, nameLength);
        if (keyClass && classLength)
            reg::CopyName(className, keyClass, classLength);
        else if (classLength)
            *classLength = static_cast<DWORD>(className.size());
        reg::PutFileTime(entry.number, lastWrite);
        return ERROR_SUCCESS;
    });
}

LONG RegEnumValueW(HKEY key, DWORD index, LPWSTR name, LPDWORD nameLength, LPDWORD reserved, LPDWORD type,
                   LPBYTE data, LPDWORD byteCount) {
    return Call([&](Registry& registry) -> LONG {
        if (reserved || !name || !nameLength || (data && !byteCount))
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_QUERY_VALUE))
            return ERROR_ACCESS_DENIED;
        reg::Entry entry;
        LONG found = reg::ListedEntry(registry.store, reg::kValueListing, *open, open->values, index, entry);
        if (found != ERROR_SUCCESS)
            return found;
        auto valueType = static_cast<DWORD>(entry.number);
        std::string bytes = reg::HomeForm(valueType, entry.text);
        auto size = static_cast<DWORD>(bytes.size());
        // As the system does, the type and size are given even when the name or data do not fit.
        LONG answer = ERROR_SUCCESS;
        if (!reg::CopyName(entry.name, name, nameLength) || (data && *byteCount < size))
            answer = ERROR_MORE_DATA;
        else if (data)
            reg::CopyData(valueType, bytes, data, *byteCount);
        if (type)
            *type = valueType;
        if (byteCount)
            *byteCount = size;
        return answer;
    });
}

LONG RegQueryInfoKeyW(HKEY key, LPWSTR keyClass, LPDWORD classLength, LPDWORD reserved, LPDWORD subKeys,
                      LPDWORD maxSubKeyLength, LPDWORD maxClassLength, LPDWORD values,
                      LPDWORD maxValueNameLength, LPDWORD maxValueLength, LPDWORD securityDescriptorLength,
                      PFILETIME lastWrite) {
    return Call([&](Registry& registry) -> LONG {
        if (reserved || (keyClass && !classLength))
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, open); ready != ERROR_SUCCESS)
            return ready;
        if (!(open->access & KEY_QUERY_VALUE))
            return ERROR_ACCESS_DENIED;
        reg::Store& store = registry.store;
        reg::Statement self = store.Query("SELECT class, written FROM keys WHERE id = ?1");
        int result = self.Bind(1, open->id).Step();
        if (result != SQLITE_ROW)
            return result == SQLITE_DONE ? ERROR_KEY_DELETED : reg::ErrorCode(result);
        std::wstring className = ut::platform::WideFromUtf8(self.Text(0));
        reg::PutFileTime(self.Int(1), lastWrite);
        reg::Statement children = store.Query(
            "SELECT count(*), coalesce(max(length(name)), 0), coalesce(max(length(class)), 0) FROM keys "
            "WHERE parent = ?1");
        if ((result = children.Bind(1, open->id).Step()) != SQLITE_ROW)
            return reg::ErrorCode(result);
        DWORD valueCount = 0, longestName = 0, largest = 0;
        reg::Statement listed = store.Query("SELECT name, type, data FROM vals WHERE key = ?1");
        listed.Bind(1, open->id);
        while ((result = listed.Step()) == SQLITE_ROW) {
            ++valueCount;
            longestName =
                std::max(longestName, static_cast<DWORD>(ut::platform::WideFromUtf8(listed.Text(0)).size()));
            largest = std::max(
                largest,
                static_cast<DWORD>(reg::HomeForm(static_cast<DWORD>(listed.Int(1)), listed.Blob(2)).size()));
        }
        if (result != SQLITE_DONE)
            return reg::ErrorCode(result);
        if (subKeys)
            *subKeys = static_cast<DWORD>(children.Int(0));
        if (maxSubKeyLength)
            *maxSubKeyLength = static_cast<DWORD>(children.Int(1));
        if (maxClassLength)
            *maxClassLength = static_cast<DWORD>(children.Int(2));
        if (values)
            *values = valueCount;
        if (maxValueNameLength)
            *maxValueNameLength = longestName;
        if (maxValueLength)
            *maxValueLength = largest;
        if (securityDescriptorLength)
            *securityDescriptorLength = 0;
        if (keyClass && !reg::CopyName(className, keyClass, classLength)) {
            *classLength = static_cast<DWORD>(className.size());
            return ERROR_MORE_DATA;
        }
        if (!keyClass && classLength)
            *classLength = static_cast<DWORD>(className.size());
        return ERROR_SUCCESS;
    });
}

LONG RegFlushKey(HKEY key) {
    // Every write already reached the disk when its call returned.
    return Call([&](Registry& registry) {
        OpenKey* open = nullptr;
        return registry.Target(key, open);
    });
}

} // extern "C"

namespace ut::platform {

LONG BeginRegistryTransaction() {
    return Call([](Registry& registry) {
        LONG ready = registry.store.Ready();
        return ready == ERROR_SUCCESS ? registry.store.BeginTransaction() : ready;
    });
}

LONG CommitRegistryTransaction() {
    return Call([](Registry& registry) {
        LONG ready = registry.store.Ready();
        return ready == ERROR_SUCCESS ? registry.store.CommitTransaction() : ready;
    });
}

LONG RollbackRegistryTransaction() {
    return Call([](Registry& registry) {
        LONG ready = registry.store.Ready();
        return ready == ERROR_SUCCESS ? registry.store.RollbackTransaction() : ready;
    });
}

void CloseRegistryStore() {
    (void)Call([](Registry& registry) { // nothing in closing can fail
        registry.Close();
        return ERROR_SUCCESS;
    });
}

RegistryStoreCounters GetRegistryStoreCounters() {
    RegistryStoreCounters counters;
    (void)Call([&](Registry& registry) { // copying the counters cannot fail
        counters = registry.store.Counters();
        return ERROR_SUCCESS;
    });
    return counters;
}

} // namespace ut::platform
