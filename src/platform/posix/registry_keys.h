// Keys and values in the POSIX registry store as the registry calls see them: names under the
// fixed case rule, sub-key paths, value data in the layouts of memory and of the store, the read
// cache, and index walks over sub-keys and values.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include <ut/platform/native/registry.h>

#include "registry_store.h"

namespace ut::platform::registry {

inline constexpr std::size_t kLongestKeyName = 255;
inline constexpr std::size_t kLongestValueName = 16383;

// The form under which names are compared and sorted: each character upper-cased by the C.UTF-8
// rules, whatever the process's locale.
std::string Fold(std::wstring_view name);
std::wstring_view NameOf(const wchar_t* name);
// Splits a sub-key path into its names, skipping empty ones.
LONG SplitPath(const wchar_t* path, std::vector<std::wstring_view>& names);

// Now and key write times, as FILETIME counts them.
std::int64_t Now();
void PutFileTime(std::int64_t ticks, PFILETIME out);

bool IsText(DWORD type);
// The byte count the system keeps for `data` (it reads one unit past the count to decide).
DWORD KeptSize(DWORD type, const BYTE* data, DWORD size);
// Value data in the store's layout (text as UTF-16LE) and in memory's (text in wchar_t units).
std::string StoredForm(DWORD type, const BYTE* data, DWORD size);
std::string HomeForm(DWORD type, std::string_view stored);
// Copies data the caller's buffer holds, adding a terminator after text that lacks one when there
// is room, as the system does.
void CopyData(DWORD type, const std::string& bytes, BYTE* data, DWORD room);
// Copies a name with its terminator when `*capacity` (in characters, terminator included) holds it.
bool CopyName(const std::wstring& name, wchar_t* out, DWORD* capacity);

// What this process read from the store since the shared change counter last moved: key ids by
// parent and name, keys known to exist, values (in memory's layout), and the keys whose values
// are all here.
class ReadCache {
public:
    // The cache when what is read may be kept and used now, else null. Drops what is stale.
    ReadCache* Usable(Store& store);
    void Clear();
    std::uint64_t Generation() const { return generation_; }

    struct Value {
        bool present;
        DWORD type;
        std::string data;
    };
    // Found child ids, or 0 for a child known to be missing.
    std::unordered_map<std::string, std::int64_t> children;
    std::unordered_map<std::string, Value> values;
    std::unordered_set<std::int64_t> existing;
    std::unordered_set<std::int64_t> complete;

private:
    bool valid_ = false;
    std::uint64_t generation_ = 0;
};

// The cache's key for a name below the key `id`.
std::string CacheKey(std::int64_t id, std::string_view fold);

// A sub-key or a value as an index walk finds it. `number` is a key's write time or a value's
// type; `text` a key's class or a value's data in the store's layout.
struct Entry {
    std::int64_t id = 0;
    std::wstring name;
    std::string fold;
    std::int64_t number = 0;
    std::string text;
};

// Where an index walk stands: a run of entries read together from `start`, and what the data was
// when they were read. A step inside the run, or just after it, continues from here.
struct Cursor {
    bool valid = false;
    DWORD start = 0;
    std::vector<Entry> batch;
    bool atEnd = false;
    std::uint64_t version = 0;
    bool cached = false;
    std::uint64_t generation = 0;
};

// ERROR_SUCCESS when the key exists, ERROR_KEY_DELETED when it is gone.
LONG Exists(Store& store, ReadCache* cache, std::int64_t id);
// `answer` when the key still exists; ERROR_KEY_DELETED or the store's failure otherwise.
LONG UnlessDeleted(Store& store, ReadCache* cache, std::int64_t id, LONG answer);
// Follows `names` down from `id`: ERROR_FILE_NOT_FOUND for a missing key, ERROR_KEY_DELETED when
// the start is gone.
LONG Walk(Store& store, ReadCache* cache, std::int64_t& id, const std::vector<std::wstring_view>& names);
// Inside a write scope: follows `names` down from `id`, creating what is missing. The class goes to
// the last key when it is created.
LONG CreatePath(Store& store, std::int64_t& id, const std::vector<std::wstring_view>& names,
                const wchar_t* keyClass, bool& created);
// Marks a key written, which is also how a write learns that its key is gone.
LONG Touch(Store& store, std::int64_t id);
// Deletes what the key holds (values and every key below it), and the key itself when asked.
LONG DeleteSubtree(Store& store, std::int64_t id, bool withKey);

// The value of key `id` whose folded name is `fold`, in memory's layout.
LONG ReadValue(Store& store, ReadCache* cache, std::int64_t id, const std::string& fold, DWORD& type,
               std::string& data);

// The sub-key or value at `index` below key `id`, in the order of folded names;
// ERROR_NO_MORE_ITEMS past the last, ERROR_KEY_DELETED when the key is gone.
LONG SubKeyAt(Store& store, ReadCache* cache, std::int64_t id, Cursor& cursor, DWORD index, Entry& entry);
LONG ValueAt(Store& store, ReadCache* cache, std::int64_t id, Cursor& cursor, DWORD index, Entry& entry);

} // namespace ut::platform::registry
