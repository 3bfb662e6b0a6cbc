// Object families and GUID caches: finding a family by name and testing classes against families,
// and CSharedGuid, which scans a component hierarchy once for a set of watched GUIDs and then
// answers, for each, the hierarchy and component that carry it.
//
// Decided here: C3DCompHierMap splits one bucket each time it holds more than two entries per
// bucket in use, and doubles its table when every allocated bucket is in use. CSharedGuid keeps
// the hierarchies it has visited by their IUnknown pointer without a reference: the scene holds
// them for the length of a BuildCache.
#pragma once

#include <set>
#include <span>
#include <vector>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/components.h>
#include <ut/sdk/families.h>

// The family whose name is `name` (compared ignoring case): S_OK with `*family` set, E_FAIL when
// no family has that name, E_POINTER for a null argument, or the manager's failure.
UT_API HRESULT KXFindFamily(const wchar_t* name, GUID* family);
// 1 when the class is a member of `family`, 0 when it is not. When the families manager cannot be
// had, its failure code comes back as it is: a non-zero value, so that callers that test for
// non-zero take the class as a member.
UT_API int F3DIsCLSIDInFamily(REFGUID clsid, REFGUID family);
// S_OK when the class belongs to one of the `count` families, S_FALSE when it belongs to none
// (or to no family at all). E_POINTER for null `families`, E_INVALIDARG for a zero `count`.
UT_API HRESULT KXValidateObjectFamily(GUID* families, unsigned long count, REFGUID clsid);

// The GUIDs a caller watches, by pointer: the GUIDs are the caller's and must outlive the map.
class UT_API C3DWatchMap {
public:
    C3DWatchMap() = default;
    C3DWatchMap(const C3DWatchMap& other);
    C3DWatchMap& operator=(const C3DWatchMap& other);
    ~C3DWatchMap();

    // Appends `guid` unless an equal GUID is watched already (S_OK either way); E_OUTOFMEMORY when
    // the storage cannot grow, E_POINTER for null.
    HRESULT Add(GUID* guid);
    // 1 when a watched GUID equals `guid` byte for byte, else 0.
    int Find(REFGUID guid) const;
    unsigned int Count() const { return count_; }
    // The bytes of storage reserved.
    unsigned int ReservedBytes() const { return capacity_ * sizeof(GUID*); }

private:
    GUID** guids_ = nullptr;
    unsigned int count_ = 0;
    unsigned int capacity_ = 0;
};

// One cache entry: the hierarchy (one reference held) and a copy of the component.
struct tagComponentHierarchy {
    IGWComponentHierarchy* hierarchy;
    tagGWComponent component;
};

// A map from GUID to cache entry by linear hashing. The map owns its entries: removing them
// releases their hierarchies; a copy holds copies of the entries.
class UT_API C3DCompHierMap {
public:
    struct Entry {
        GUID key;
        tagComponentHierarchy* info;
    };

    C3DCompHierMap();
    C3DCompHierMap(const C3DCompHierMap& other);
    C3DCompHierMap& operator=(const C3DCompHierMap& other);
    ~C3DCompHierMap();

    // The entry of `guid`; null when there is none.
    tagComponentHierarchy* FindInfo(REFGUID guid) const;
    // Takes `info` as the entry of `guid` when it has none yet: S_OK, S_FALSE when it had one
    // (`info` stays the caller's), E_OUTOFMEMORY.
    HRESULT Insert(REFGUID guid, tagComponentHierarchy* info);
    // Drops every entry; the map is as new again.
    void RemoveAll();

    // The shape of the table, for tests and statistics.
    unsigned int Count() const { return count_; }
    unsigned int Mask() const { return mask_; }
    unsigned int Limit() const { return limit_; }
    unsigned int Buckets() const { return static_cast<unsigned int>(buckets_.size()); }
    std::span<const Entry> Bucket(unsigned int index) const { return buckets_[index]; }
    // The bucket `guid` belongs to.
    unsigned int BucketOf(REFGUID guid) const;

private:
    void Split();
    void CopyFrom(const C3DCompHierMap& other);

    std::vector<std::vector<Entry>> buckets_;
    unsigned int mask_ = 1;
    unsigned int limit_ = 1;
    unsigned int count_ = 0;
};

// The shared-GUID cache. Call Construct once, then AddGuid for each watched GUID and BuildCache.
class UT_API CSharedGuid {
public:
    CSharedGuid() = default;
    CSharedGuid(const CSharedGuid& other) = default;
    CSharedGuid& operator=(const CSharedGuid& other) = default;
    ~CSharedGuid() = default;

    // Obtains the parameter dictionary (S_OK at once when held).
    HRESULT Construct();
    // Empties the cache and scans `hierarchy` (null: S_OK, the cache stays empty).
    HRESULT BuildCache(IGWComponentHierarchy* hierarchy);
    // Scans `component` of `hierarchy` and what is below it; a hierarchy is scanned once.
    HRESULT Scan(IGWComponentHierarchy* hierarchy, const tagGWComponent& component, int recurse);
    // S_OK when the component carries a watched GUID (itself or through the dictionary), S_FALSE
    // when it does not; the first hierarchy found for a GUID is kept.
    HRESULT Match(IGWComponentHierarchy* hierarchy, const tagGWComponent& component);
    // The component id and the hierarchy (asked for `iid`) that carry `guid`: E_INVALIDARG for
    // null outputs, E_FAIL for a GUID not found.
    HRESULT FindCOMPIDFromGUID(REFGUID guid, unsigned long* componentId, REFIID iid, void** object);
    HRESULT AddGuid(GUID* guid) { return watched_.Add(guid); }
    // 32 + 24 per entry + the watch map's reserved bytes.
    unsigned int GetMemSize() const;

private:
    std::set<IUnknown*> visited_;
    C3DCompHierMap map_;
    C3DWatchMap watched_;
    ut::ComPtr<IGWParamDict> dictionary_;
};
