// The registry calls on POSIX, over the SQLite store: handles and their access, and each call's
// checks and answers in the system's terms. Keys, values and walks are in registry_keys.cpp.
#include <algorithm>
#include <cstdlib>
#include <mutex>
#include <new>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include <ut/platform/registry.h>
#include <ut/platform/text.h>

#include "registry_keys.h"

namespace ut::platform::registry {
namespace {

constexpr REGSAM kAllAccess = KEY_ALL_ACCESS | KEY_WOW64_64KEY | KEY_WOW64_32KEY;
constexpr std::uintptr_t kFirstHandle = 0x1000;
constexpr std::uintptr_t kHandleStep = 4;

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

struct OpenKey {
    std::int64_t id;
    REGSAM access;
    Cursor subKeys;
    Cursor values;
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

    // The read cache when it may be used now, else null. Ask once per call, before reading.
    ReadCache* Cached() { return cache_.Usable(store); }

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

    // The open key behind `key`, with the store ready to use and the handle's access including
    // `needed`.
    LONG Target(HKEY key, REGSAM needed, OpenKey*& open) {
        open = Find(key);
        if (!open)
            return ERROR_INVALID_HANDLE;
        LONG ready = store.Ready();
        if (ready != ERROR_SUCCESS)
            return ready;
        return (open->access & needed) == needed ? ERROR_SUCCESS : ERROR_ACCESS_DENIED;
    }

    // The key behind `key` and the names of the path below it.
    LONG Resolve(HKEY key, const wchar_t* path, std::int64_t& id, std::vector<std::wstring_view>& names) {
        LONG split = SplitPath(path, names);
        if (split != ERROR_SUCCESS)
            return split;
        OpenKey* open = nullptr;
        LONG found = Target(key, 0, open);
        if (found == ERROR_SUCCESS)
            id = open->id;
        return found;
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
        cache_.Clear();
        handles_.clear();
        for (OpenKey& root : roots_)
            root.subKeys = root.values = Cursor{};
    }

private:
    ReadCache cache_;
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

// Runs `write(id)` in a write scope on the key `path` names below `key`.
template <class Write>
LONG WriteBelow(Registry& registry, HKEY key, const wchar_t* path, Write write) {
    std::vector<std::wstring_view> names;
    std::int64_t id = 0;
    if (LONG resolved = registry.Resolve(key, path, id, names); resolved != ERROR_SUCCESS)
        return resolved;
    WriteScope scope(registry.store);
    if (scope.Status() != ERROR_SUCCESS)
        return scope.Status();
    LONG found = Walk(registry.store, nullptr, id, names);
    return scope.Finish(found == ERROR_SUCCESS ? write(id) : found);
}

// Runs `write(id)` in a write scope on the key behind `key`, which must allow setting values.
template <class Write>
LONG WriteValues(Registry& registry, HKEY key, Write write) {
    OpenKey* open = nullptr;
    if (LONG ready = registry.Target(key, KEY_SET_VALUE, open); ready != ERROR_SUCCESS)
        return ready;
    WriteScope scope(registry.store);
    if (scope.Status() != ERROR_SUCCESS)
        return scope.Status();
    LONG touched = Touch(registry.store, open->id);
    return scope.Finish(touched == ERROR_SUCCESS ? write(open->id) : touched);
}

// Hands value data out as the system does: the type and size always, the data when it and the
// name fit, ERROR_MORE_DATA when either does not.
LONG GiveData(DWORD valueType, const std::string& bytes, bool nameFits, LPDWORD type, LPBYTE data,
              LPDWORD byteCount) {
    auto size = static_cast<DWORD>(bytes.size());
    LONG answer = ERROR_SUCCESS;
    if (!nameFits || (data && *byteCount < size))
        answer = ERROR_MORE_DATA;
    else if (data)
        CopyData(valueType, bytes, data, *byteCount);
    if (type)
        *type = valueType;
    if (byteCount)
        *byteCount = size;
    return answer;
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
        std::int64_t start = 0;
        if (LONG resolved = registry.Resolve(key, subKey, start, names); resolved != ERROR_SUCCESS)
            return resolved;
        std::int64_t id = start;
        bool created = false;
        // Most calls open a key that exists: they need no write.
        LONG found = reg::Walk(registry.store, registry.Cached(), id, names);
        if (found == ERROR_FILE_NOT_FOUND) {
            WriteScope scope(registry.store);
            if (scope.Status() != ERROR_SUCCESS)
                return scope.Status();
            id = start;
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
        std::int64_t id = 0;
        if (LONG resolved = registry.Resolve(key, subKey, id, names); resolved != ERROR_SUCCESS)
            return resolved;
        if (LONG found = reg::Walk(registry.store, registry.Cached(), id, names); found != ERROR_SUCCESS)
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
        reg::Store& store = registry.store;
        return reg::WriteBelow(registry, key, subKey, [&](std::int64_t id) -> LONG {
            if (id <= reg::kLocalMachineId)
                return ERROR_ACCESS_DENIED;
            reg::Statement child = store.Query("SELECT 1 FROM keys WHERE parent = ?1 LIMIT 1");
            int hasChild = child.Bind(1, id).Step();
            if (hasChild != SQLITE_DONE)
                return hasChild == SQLITE_ROW ? ERROR_ACCESS_DENIED : reg::ErrorCode(hasChild);
            LONG deleted = store.Query("DELETE FROM vals WHERE key = ?1").Bind(1, id).Run();
            return deleted == ERROR_SUCCESS ? store.Query("DELETE FROM keys WHERE id = ?1").Bind(1, id).Run()
                                            : deleted;
        });
    });
}

LONG RegDeleteTreeW(HKEY key, LPCWSTR subKey) {
    return Call([&](Registry& registry) {
        // With a sub-key the key goes too; without one only what it holds.
        bool withKey = subKey != nullptr;
        return reg::WriteBelow(registry, key, subKey, [&](std::int64_t id) {
            if (withKey && id <= reg::kLocalMachineId)
                return ERROR_ACCESS_DENIED;
            return reg::DeleteSubtree(registry.store, id, withKey);
        });
    });
}

LONG RegQueryValueExW(HKEY key, LPCWSTR name, LPDWORD reserved, LPDWORD type, LPBYTE data,
                      LPDWORD byteCount) {
    return Call([&](Registry& registry) -> LONG {
        if ((data && !byteCount) || reserved)
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, KEY_QUERY_VALUE, open); ready != ERROR_SUCCESS)
            return ready;
        DWORD valueType = REG_NONE;
        std::string bytes;
        LONG found = reg::ReadValue(registry.store, registry.Cached(), open->id, reg::Fold(reg::NameOf(name)),
                                    valueType, bytes);
        return found == ERROR_SUCCESS ? reg::GiveData(valueType, bytes, true, type, data, byteCount) : found;
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
        std::string stored = reg::StoredForm(type, data, reg::KeptSize(type, data, byteCount));
        return reg::WriteValues(registry, key, [&](std::int64_t id) {
            return registry.store
                .Query("INSERT INTO vals(key, name, fold, type, data) VALUES(?1, ?2, ?3, ?4, ?5) "
                       "ON CONFLICT(key, fold) DO UPDATE SET type = excluded.type, data = excluded.data")
                .Bind(1, id)
                .BindText(2, ut::platform::Utf8FromWide(valueName))
                .BindText(3, reg::Fold(valueName))
                .Bind(4, type)
                .BindBlob(5, stored)
                .Run();
        });
    });
}

LONG RegDeleteValueW(HKEY key, LPCWSTR name) {
    return Call([&](Registry& registry) {
        return reg::WriteValues(registry, key, [&](std::int64_t id) {
            LONG deleted = registry.store.Query("DELETE FROM vals WHERE key = ?1 AND fold = ?2")
                               .Bind(1, id)
                               .BindText(2, reg::Fold(reg::NameOf(name)))
                               .Run();
            return deleted == ERROR_SUCCESS && registry.store.Changes() == 0 ? ERROR_FILE_NOT_FOUND : deleted;
        });
    });
}

LONG RegEnumKeyExW(HKEY key, DWORD index, LPWSTR name, LPDWORD nameLength, LPDWORD reserved, LPWSTR keyClass,
                   LPDWORD classLength, PFILETIME lastWrite) {
    return Call([&](Registry& registry) -> LONG {
        if (reserved || !name || !nameLength)
            return ERROR_INVALID_PARAMETER;
        OpenKey* open = nullptr;
        if (LONG ready = registry.Target(key, KEY_ENUMERATE_SUB_KEYS, open); ready != ERROR_SUCCESS)
            return ready;
        reg::Entry entry;
        LONG found = reg::SubKeyAt(registry.store, registry.Cached(), open->id, open->subKeys, index, entry);
        if (found != ERROR_SUCCESS)
            return found;
        std::wstring className = classLength ? ut::platform::WideFromUtf8(entry.text) : std::wstring();
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
        if (LONG ready = registry.Target(key, KEY_QUERY_VALUE, open); ready != ERROR_SUCCESS)
            return ready;
        reg::Entry entry;
        LONG found = reg::ValueAt(registry.store, registry.Cached(), open->id, open->values, index, entry);
        if (found != ERROR_SUCCESS)
            return found;
        auto valueType = static_cast<DWORD>(entry.number);
        bool nameFits = reg::CopyName(entry.name, name, nameLength);
        return reg::GiveData(valueType, reg::HomeForm(valueType, entry.text), nameFits, type, data,
                             byteCount);
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
        if (LONG ready = registry.Target(key, KEY_QUERY_VALUE, open); ready != ERROR_SUCCESS)
            return ready;
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
        return registry.Target(key, 0, open);
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
