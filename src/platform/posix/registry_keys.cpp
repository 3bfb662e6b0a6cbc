// Keys and values in the POSIX registry store: names and paths, value layouts, the read cache
// that spares a query while nothing changed, and index walks that read entries in runs, so that
// each step of a walk costs the same at every index.
#include "registry_keys.h"

#include <chrono>
#include <cstring>
#include <locale.h>
#include <wctype.h>

#include <ut/platform/text.h>

namespace ut::platform::registry {
namespace {

// Entries an index walk reads at once.
constexpr std::int64_t kRun = 64;
// Cached entries above which the cache starts over, and values too large to keep.
constexpr std::size_t kMostCached = 200'000;
constexpr std::size_t kLargestCachedValue = 64 * 1024;

wchar_t FoldCharacter(wchar_t c) {
    static const locale_t rules = newlocale(LC_CTYPE_MASK, "C.UTF-8", static_cast<locale_t>(nullptr));
    if (c < 0x80)
        return c >= L'a' && c <= L'z' ? static_cast<wchar_t>(c - L'a' + L'A') : c;
    // Like the system, characters beyond the basic plane are left as they are.
    if (c > 0xFFFF || !rules)
        return c;
    return static_cast<wchar_t>(towupper_l(static_cast<wint_t>(c), rules));
}

wchar_t UnitAt(const BYTE* data, std::size_t index) {
    wchar_t unit;
    std::memcpy(&unit, data + index * sizeof(wchar_t), sizeof unit);
    return unit;
}

LONG StepResult(int result, LONG done) {
    return result == SQLITE_ROW ? ERROR_SUCCESS : result == SQLITE_DONE ? done : ErrorCode(result);
}

LONG Child(Store& store, ReadCache* cache, std::int64_t parent, std::wstring_view name, std::int64_t& id) {
    std::string fold = Fold(name);
    std::string key = cache ? CacheKey(parent, fold) : std::string();
    if (cache) {
        auto found = cache->children.find(key);
        if (found != cache->children.end()) {
            id = found->second;
            return id ? ERROR_SUCCESS : ERROR_FILE_NOT_FOUND;
        }
    }
    Statement query = store.Query("SELECT id FROM keys WHERE parent = ?1 AND fold = ?2");
    LONG result = StepResult(query.Bind(1, parent).BindText(2, fold).Step(), ERROR_FILE_NOT_FOUND);
    if (result == ERROR_SUCCESS)
        id = query.Int(0);
    if (cache && (result == ERROR_SUCCESS || result == ERROR_FILE_NOT_FOUND)) {
        cache->children[key] = result == ERROR_SUCCESS ? id : 0;
        if (result == ERROR_SUCCESS)
            cache->existing.insert(id);
    }
    return result;
}

// One run of a walk: the statements that seek from a name (at or after it) or count from the
// start, and for sub-keys the ones that read the values of the keys in the run.
struct Listing {
    const char* from;
    const char* after;
    const char* offset;
    const char* valuesFrom;
    const char* valuesAfter;
    const char* valuesOffset;
};

constexpr Listing kSubKeys = {
    "SELECT id, name, fold, written, class FROM keys WHERE parent = ?1 AND fold >= ?2 ORDER BY fold LIMIT ?3",
    "SELECT id, name, fold, written, class FROM keys WHERE parent = ?1 AND fold > ?2 ORDER BY fold LIMIT ?3",
    "SELECT id, name, fold, written, class FROM keys WHERE parent = ?1 ORDER BY fold LIMIT ?3 OFFSET ?2",
    "SELECT key, fold, type, data FROM vals WHERE key IN "
    "(SELECT id FROM keys WHERE parent = ?1 AND fold >= ?2 ORDER BY fold LIMIT ?3)",
    "SELECT key, fold, type, data FROM vals WHERE key IN "
    "(SELECT id FROM keys WHERE parent = ?1 AND fold > ?2 ORDER BY fold LIMIT ?3)",
    "SELECT key, fold, type, data FROM vals WHERE key IN "
    "(SELECT id FROM keys WHERE parent = ?1 ORDER BY fold LIMIT ?3 OFFSET ?2)",
};
constexpr Listing kValues = {
    "SELECT 0, name, fold, type, data FROM vals WHERE key = ?1 AND fold >= ?2 ORDER BY fold LIMIT ?3",
    "SELECT 0, name, fold, type, data FROM vals WHERE key = ?1 AND fold > ?2 ORDER BY fold LIMIT ?3",
    "SELECT 0, name, fold, type, data FROM vals WHERE key = ?1 ORDER BY fold LIMIT ?3 OFFSET ?2",
    nullptr,
    nullptr,
    nullptr,
};

enum class Seek { kFrom, kAfter, kOffset };

struct Position {
    Seek seek;
    std::string fold;
    DWORD index;
};

const char* Sql(const Listing& listing, Seek seek, bool values) {
    switch (seek) {
    case Seek::kFrom:
        return values ? listing.valuesFrom : listing.from;
    case Seek::kAfter:
        return values ? listing.valuesAfter : listing.after;
    case Seek::kOffset:
        break;
    }
    return values ? listing.valuesOffset : listing.offset;
}

Statement& BindPosition(Statement& query, std::int64_t parent, const Position& at) {
    query.Bind(1, parent).Bind(3, kRun);
    if (at.seek == Seek::kOffset)
        query.Bind(2, static_cast<std::int64_t>(at.index));
    else
        query.BindText(2, at.fold);
    return query;
}

// Reads one run from `at`, and the data version it was read at.
LONG ReadRun(Store& store, const Listing& listing, std::int64_t parent, const Position& at,
             std::vector<Entry>& rows, std::uint64_t& version) {
    rows.clear();
    Statement query = store.Query(Sql(listing, at.seek, false));
    BindPosition(query, parent, at);
    int result;
    while ((result = query.Step()) == SQLITE_ROW) {
        Entry& entry = rows.emplace_back();
        entry.id = query.Int(0);
        entry.name = WideFromUtf8(query.Text(1));
        entry.fold = std::string(query.Text(2));
        entry.number = query.Int(3);
        entry.text = std::string(query.IsNull(4) ? std::string_view() : query.Blob(4));
    }
    version = store.DataVersion();
    return result == SQLITE_DONE ? ERROR_SUCCESS : ErrorCode(result);
}

// Keeps the keys of a run of sub-keys, and reads their values into the cache when the data has
// not changed since the run was read.
void CacheRun(Store& store, ReadCache& cache, std::int64_t parent, const Position& at, const Cursor& cursor) {
    for (const Entry& entry : cursor.batch) {
        cache.children[CacheKey(parent, entry.fold)] = entry.id;
        cache.existing.insert(entry.id);
    }
    Statement query = store.Query(Sql(kSubKeys, at.seek, true));
    BindPosition(query, parent, at);
    std::vector<std::pair<std::string, ReadCache::Value>> values;
    std::unordered_set<std::int64_t> incomplete;
    int result;
    while ((result = query.Step()) == SQLITE_ROW) {
        std::int64_t key = query.Int(0);
        std::string_view data = query.Blob(3);
        if (data.size() > kLargestCachedValue) {
            incomplete.insert(key);
            continue;
        }
        auto type = static_cast<DWORD>(query.Int(2));
        values.emplace_back(CacheKey(key, query.Text(1)), ReadCache::Value{true, type, HomeForm(type, data)});
    }
    if (result != SQLITE_DONE || store.DataVersion() != cursor.version)
        return;
    for (auto& [key, value] : values)
        cache.values.insert_or_assign(std::move(key), std::move(value));
    for (const Entry& entry : cursor.batch)
        if (!incomplete.count(entry.id))
            cache.complete.insert(entry.id);
}

LONG EntryAt(Store& store, ReadCache* cache, const Listing& listing, std::int64_t parent, Cursor& cursor,
             DWORD index, Entry& entry) {
    std::size_t held = cursor.batch.size();
    bool inOrAfterRun = cursor.valid && held > 0 && index >= cursor.start && index - cursor.start <= held;
    // Nothing changed since the run was read: answer from it.
    if (cache && cursor.valid && cursor.cached && cursor.generation == cache->Generation() &&
        index >= cursor.start) {
        if (index - cursor.start < held) {
            entry = cursor.batch[index - cursor.start];
            return ERROR_SUCCESS;
        }
        if (index - cursor.start == held && cursor.atEnd)
            return ERROR_NO_MORE_ITEMS;
    }
    // Else seek by name from the run when the index is in it or just after it, and count from the
    // start when that is not possible or the data changed since the run was read.
    Position at{Seek::kOffset, std::string(), index};
    if (inOrAfterRun && index - cursor.start < held)
        at = {Seek::kFrom, cursor.batch[index - cursor.start].fold, index};
    else if (inOrAfterRun)
        at = {Seek::kAfter, cursor.batch.back().fold, index};
    else if (index == 0)
        at = {Seek::kFrom, std::string(), 0};
    std::vector<Entry> rows;
    std::uint64_t version = 0;
    LONG read = ReadRun(store, listing, parent, at, rows, version);
    if (read == ERROR_SUCCESS && inOrAfterRun && version != cursor.version) {
        at = {Seek::kOffset, std::string(), index};
        read = ReadRun(store, listing, parent, at, rows, version);
    }
    if (read != ERROR_SUCCESS) {
        cursor.valid = false;
        return read;
    }
    bool atEnd = static_cast<std::int64_t>(rows.size()) < kRun;
    cursor = {
        true, index, std::move(rows), atEnd, version, cache != nullptr, cache ? cache->Generation() : 0};
    if (cache && listing.valuesFrom)
        CacheRun(store, *cache, parent, at, cursor);
    if (cursor.batch.empty())
        return ERROR_NO_MORE_ITEMS;
    entry = cursor.batch.front();
    return ERROR_SUCCESS;
}

LONG ListedAt(Store& store, ReadCache* cache, const Listing& listing, std::int64_t id, Cursor& cursor,
              DWORD index, Entry& entry) {
    LONG found = EntryAt(store, cache, listing, id, cursor, index, entry);
    return found == ERROR_NO_MORE_ITEMS ? UnlessDeleted(store, cache, id, ERROR_NO_MORE_ITEMS) : found;
}

} // namespace

std::string Fold(std::wstring_view name) {
    std::wstring upper(name);
    for (wchar_t& c : upper)
        c = FoldCharacter(c);
    return Utf8FromWide(upper);
}

std::wstring_view NameOf(const wchar_t* name) {
    return name ? std::wstring_view(name) : std::wstring_view();
}

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

std::int64_t Now() {
    // 100-nanosecond intervals since 1601-01-01.
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

DWORD KeptSize(DWORD type, const BYTE* data, DWORD size) {
    std::size_t units = size / sizeof(wchar_t);
    if (!data || !IsText(type) || units == 0)
        return size;
    if (UnitAt(data, units - 1) != 0 && UnitAt(data, units) == 0)
        return static_cast<DWORD>((units + 1) * sizeof(wchar_t));
    return size;
}

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

std::string HomeForm(DWORD type, std::string_view stored) {
    if (!IsText(type))
        return std::string(stored);
    std::wstring text =
        WideFromUtf16Le(reinterpret_cast<const std::uint8_t*>(stored.data()), stored.size() / 2);
    return std::string(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(wchar_t));
}

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

bool CopyName(const std::wstring& name, wchar_t* out, DWORD* capacity) {
    if (name.size() >= *capacity)
        return false;
    std::memcpy(out, name.c_str(), (name.size() + 1) * sizeof(wchar_t));
    *capacity = static_cast<DWORD>(name.size());
    return true;
}

ReadCache* ReadCache::Usable(Store& store) {
    std::optional<std::uint64_t> generation = store.CacheableGeneration();
    if (!generation) {
        Clear();
        return nullptr;
    }
    if (!valid_ || *generation != generation_ ||
        children.size() + values.size() + existing.size() + complete.size() > kMostCached) {
        Clear();
        generation_ = *generation;
        valid_ = true;
    }
    return this;
}

void ReadCache::Clear() {
    valid_ = false;
    // Fresh containers give their buckets back; clearing in place would keep them, and walk them.
    if (!children.empty() || !values.empty() || !existing.empty() || !complete.empty()) {
        children = {};
        values = {};
        existing = {};
        complete = {};
    }
}

std::string CacheKey(std::int64_t id, std::string_view fold) {
    std::string key(reinterpret_cast<const char*>(&id), sizeof id);
    key.append(fold);
    return key;
}

LONG Exists(Store& store, ReadCache* cache, std::int64_t id) {
    if (cache && cache->existing.count(id))
        return ERROR_SUCCESS;
    Statement query = store.Query("SELECT 1 FROM keys WHERE id = ?1");
    LONG result = StepResult(query.Bind(1, id).Step(), ERROR_KEY_DELETED);
    if (cache && result == ERROR_SUCCESS)
        cache->existing.insert(id);
    return result;
}

LONG UnlessDeleted(Store& store, ReadCache* cache, std::int64_t id, LONG answer) {
    LONG exists = Exists(store, cache, id);
    return exists == ERROR_SUCCESS ? answer : exists;
}

LONG Walk(Store& store, ReadCache* cache, std::int64_t& id, const std::vector<std::wstring_view>& names) {
    std::int64_t start = id;
    if (names.empty())
        return Exists(store, cache, id);
    for (std::wstring_view name : names) {
        LONG found = Child(store, cache, id, name, id);
        if (found == ERROR_FILE_NOT_FOUND)
            return UnlessDeleted(store, cache, start, ERROR_FILE_NOT_FOUND);
        if (found != ERROR_SUCCESS)
            return found;
    }
    return ERROR_SUCCESS;
}

LONG CreatePath(Store& store, std::int64_t& id, const std::vector<std::wstring_view>& names,
                const wchar_t* keyClass, bool& created) {
    LONG exists = Exists(store, nullptr, id);
    if (exists != ERROR_SUCCESS)
        return exists;
    for (std::size_t i = 0; i < names.size(); ++i) {
        LONG found = Child(store, nullptr, id, names[i], id);
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

LONG Touch(Store& store, std::int64_t id) {
    LONG touched = store.Query("UPDATE keys SET written = ?2 WHERE id = ?1").Bind(1, id).Bind(2, Now()).Run();
    if (touched != ERROR_SUCCESS)
        return touched;
    return store.Changes() == 0 ? ERROR_KEY_DELETED : ERROR_SUCCESS;
}

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

LONG ReadValue(Store& store, ReadCache* cache, std::int64_t id, const std::string& fold, DWORD& type,
               std::string& data) {
    std::string key = cache ? CacheKey(id, fold) : std::string();
    if (cache) {
        auto found = cache->values.find(key);
        if (found != cache->values.end()) {
            if (!found->second.present)
                return ERROR_FILE_NOT_FOUND;
            type = found->second.type;
            data = found->second.data;
            return ERROR_SUCCESS;
        }
        if (cache->complete.count(id))
            return ERROR_FILE_NOT_FOUND;
    }
    Statement query = store.Query("SELECT type, data FROM vals WHERE key = ?1 AND fold = ?2");
    int result = query.Bind(1, id).BindText(2, fold).Step();
    if (result == SQLITE_DONE) {
        LONG missing = UnlessDeleted(store, cache, id, ERROR_FILE_NOT_FOUND);
        if (cache && missing == ERROR_FILE_NOT_FOUND)
            cache->values[key] = ReadCache::Value{false, REG_NONE, std::string()};
        return missing;
    }
    if (result != SQLITE_ROW)
        return ErrorCode(result);
    type = static_cast<DWORD>(query.Int(0));
    std::string_view stored = query.Blob(1);
    data = HomeForm(type, stored);
    if (cache && stored.size() <= kLargestCachedValue)
        cache->values[key] = ReadCache::Value{true, type, data};
    return ERROR_SUCCESS;
}

LONG SubKeyAt(Store& store, ReadCache* cache, std::int64_t id, Cursor& cursor, DWORD index, Entry& entry) {
    return ListedAt(store, cache, kSubKeys, id, cursor, index, entry);
}

LONG ValueAt(Store& store, ReadCache* cache, std::int64_t id, Cursor& cursor, DWORD index, Entry& entry) {
    return ListedAt(store, cache, kValues, id, cursor, index, entry);
}

} // namespace ut::platform::registry
