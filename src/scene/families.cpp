// Object families (find by name, membership tests) and the shared-GUID cache with its watch map and
// linear-hashing map.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <new>

#include <ut/families.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/strings.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/variant.h>

namespace ut::scene {
namespace {

// Entries a bucket in use may hold on average before the next bucket is split.
constexpr unsigned int kEntriesPerBucket = 2;
constexpr unsigned int kInitialBuckets = 8;
constexpr unsigned int kWatchGrowth = 8;
// What the cache's estimate counts for the cache itself and for each entry.
constexpr unsigned int kCacheBytes = 32;
constexpr unsigned int kEntryBytes = 24;
// How the nested hierarchies of an object are asked for.
constexpr ULONG kNestedScope = 16;
constexpr ULONG kNestedDepth = 4;

std::uint32_t Hash(REFGUID guid) {
    return guid.Data1 ^ guid.Data2;
}

// Keys in a bucket go by their four 32-bit words as signed numbers, the first word first.
bool KeyLess(REFGUID a, REFGUID b) {
    std::int32_t left[4], right[4];
    std::memcpy(left, &a, sizeof left);
    std::memcpy(right, &b, sizeof right);
    return std::lexicographical_compare(left, left + 4, right, right + 4);
}

bool SameComponent(const tagGWComponent& a, const tagGWComponent& b) {
    std::size_t bytes = std::min<std::size_t>(std::size_t{a.size} + 4, sizeof a);
    return std::memcmp(&a, &b, bytes) == 0;
}

HRESULT WithManager(ut::ComPtr<IGWFamiliesManager>& manager) {
    return GWGetFamiliesManager(manager.Put());
}

// The next GUID of `list`: S_OK, S_FALSE at the end, or the failure.
HRESULT NextGuid(IGWEnumGUID& list, GUID& guid) {
    ULONG fetched = 0;
    HRESULT hr = list.Next(1, &guid, &fetched);
    return FAILED(hr) ? hr : (hr == S_OK && fetched == 1 ? S_OK : S_FALSE);
}

} // namespace
} // namespace ut::scene

using namespace ut::scene;

HRESULT KXFindFamily(const wchar_t* name, GUID* family) {
    if (!name || !family)
        return E_POINTER;
    ut::ComPtr<IGWFamiliesManager> manager;
    if (HRESULT hr = WithManager(manager); FAILED(hr))
        return hr;
    ut::ComPtr<IGWEnumGUID> families;
    if (HRESULT hr = manager->EnumFamilies(families.Put()); FAILED(hr))
        return hr;
    if (HRESULT hr = families->Reset(); FAILED(hr))
        return hr;
    GUID candidate{};
    for (HRESULT next = NextGuid(*families, candidate); next != S_FALSE;
         next = NextGuid(*families, candidate)) {
        if (FAILED(next))
            return next;
        LPOLESTR found = nullptr;
        if (HRESULT hr = manager->GetFamilyName(candidate, &found); FAILED(hr))
            return hr;
        bool same = found && ut::platform::CompareWideNoCase(found, name) == 0;
        CoTaskMemFree(found);
        if (same) {
            *family = candidate;
            return S_OK;
        }
    }
    return E_FAIL;
}

int F3DIsCLSIDInFamily(REFGUID clsid, REFGUID family) {
    ut::ComPtr<IGWFamiliesManager> manager;
    if (HRESULT hr = WithManager(manager); FAILED(hr))
        return hr; // deliberately non-zero: callers take the class as a member
    return manager->IsMember(clsid, family) == S_OK ? 1 : 0;
}

HRESULT KXValidateObjectFamily(GUID* families, unsigned long count, REFGUID clsid) {
    if (!families)
        return E_POINTER;
    if (count == 0)
        return E_INVALIDARG;
    ut::ComPtr<IGWFamiliesManager> manager;
    if (HRESULT hr = WithManager(manager); FAILED(hr))
        return hr;
    ULONG total = 0;
    if (HRESULT hr = manager->GetClassFamilies(clsid, 0, nullptr, &total); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::vector<GUID> own(total);
        ULONG got = 0;
        if (HRESULT hr = manager->GetClassFamilies(clsid, total, own.data(), &got); FAILED(hr))
            return hr;
        for (ULONG i = 0; i < std::min(got, total); ++i)
            for (unsigned long j = 0; j < count; ++j)
                if (std::memcmp(&own[i], &families[j], sizeof(GUID)) == 0)
                    return S_OK;
        return S_FALSE;
    });
}

// The watch map.

C3DWatchMap::C3DWatchMap(const C3DWatchMap& other) {
    *this = other;
}

C3DWatchMap& C3DWatchMap::operator=(const C3DWatchMap& other) {
    if (this == &other)
        return *this;
    std::free(guids_);
    guids_ = nullptr;
    count_ = capacity_ = 0;
    if (other.capacity_ == 0)
        return *this;
    guids_ = static_cast<GUID**>(std::malloc(other.capacity_ * sizeof(GUID*)));
    if (!guids_)
        return *this; // an empty copy: the next Add reports the shortage
    std::memcpy(guids_, other.guids_, other.count_ * sizeof(GUID*));
    count_ = other.count_;
    capacity_ = other.capacity_;
    return *this;
}

C3DWatchMap::~C3DWatchMap() {
    std::free(guids_);
}

HRESULT C3DWatchMap::Add(GUID* guid) {
    if (!guid)
        return E_POINTER;
    if (Find(*guid))
        return S_OK;
    if (count_ == capacity_) {
        unsigned int grown = capacity_ + kWatchGrowth;
        auto* more = static_cast<GUID**>(std::realloc(guids_, grown * sizeof(GUID*)));
        if (!more)
            return E_OUTOFMEMORY;
        guids_ = more;
        capacity_ = grown;
    }
    guids_[count_++] = guid;
    return S_OK;
}

// Called for every parameter of a scene walk. Started on a cache line of its own so that its loop
// never straddles two: where the rest of the library happens to put it otherwise moved a whole
// cache build by a fifth. Kept out of line, or its callers in this file take the loop in unaligned.
[[gnu::aligned(64), gnu::noinline]] int C3DWatchMap::Find(REFGUID guid) const {
    for (unsigned int i = 0; i < count_; ++i)
        if (std::memcmp(guids_[i], &guid, sizeof(GUID)) == 0)
            return 1;
    return 0;
}

// The linear-hashing map.

C3DCompHierMap::C3DCompHierMap() : buckets_(kInitialBuckets) {}

C3DCompHierMap::C3DCompHierMap(const C3DCompHierMap& other) {
    CopyFrom(other);
}

C3DCompHierMap& C3DCompHierMap::operator=(const C3DCompHierMap& other) {
    if (this != &other) {
        RemoveAll();
        CopyFrom(other);
    }
    return *this;
}

C3DCompHierMap::~C3DCompHierMap() {
    RemoveAll();
}

void C3DCompHierMap::CopyFrom(const C3DCompHierMap& other) {
    buckets_ = other.buckets_;
    mask_ = other.mask_;
    limit_ = other.limit_;
    count_ = other.count_;
    for (std::vector<Entry>& bucket : buckets_) {
        for (Entry& entry : bucket) {
            entry.info = new tagComponentHierarchy(*entry.info);
            if (entry.info->hierarchy)
                entry.info->hierarchy->AddRef();
        }
    }
}

unsigned int C3DCompHierMap::BucketOf(REFGUID guid) const {
    unsigned int index = Hash(guid) & mask_;
    return index >= limit_ ? index & (mask_ >> 1) : index;
}

tagComponentHierarchy* C3DCompHierMap::FindInfo(REFGUID guid) const {
    const std::vector<Entry>& bucket = buckets_[BucketOf(guid)];
    auto at = std::lower_bound(bucket.begin(), bucket.end(), guid,
                               [](const Entry& entry, REFGUID key) { return KeyLess(entry.key, key); });
    return at != bucket.end() && IsEqualGUID(at->key, guid) ? at->info : nullptr;
}

HRESULT C3DCompHierMap::Insert(REFGUID guid, tagComponentHierarchy* info) {
    return ut::ExportBoundary([&] {
        std::vector<Entry>& bucket = buckets_[BucketOf(guid)];
        auto at = std::lower_bound(bucket.begin(), bucket.end(), guid,
                                   [](const Entry& entry, REFGUID key) { return KeyLess(entry.key, key); });
        if (at != bucket.end() && IsEqualGUID(at->key, guid))
            return S_FALSE;
        bucket.insert(at, Entry{guid, info});
        ++count_;
        if (count_ > kEntriesPerBucket * limit_)
            Split(); // a failed split leaves a fuller table, still correct
        return S_OK;
    });
}

void C3DCompHierMap::Split() {
    if (limit_ == mask_ + 1)
        mask_ = (mask_ << 1) | 1;
    unsigned int from = limit_ - (mask_ + 1) / 2;
    if (limit_ == buckets_.size())
        buckets_.resize(buckets_.size() * 2);
    ++limit_;
    std::vector<Entry>& source = buckets_[from];
    std::vector<Entry>& target = buckets_[limit_ - 1];
    auto moves = [&](const Entry& entry) { return BucketOf(entry.key) != from; };
    std::copy_if(source.begin(), source.end(), std::back_inserter(target), moves);
    source.erase(std::remove_if(source.begin(), source.end(), moves), source.end());
}

void C3DCompHierMap::RemoveAll() {
    for (std::vector<Entry>& bucket : buckets_) {
        for (Entry& entry : bucket) {
            if (entry.info && entry.info->hierarchy)
                entry.info->hierarchy->Release();
            delete entry.info;
        }
    }
    buckets_.clear();
    buckets_.resize(kInitialBuckets); // never more than the table had: does not throw
    mask_ = limit_ = 1;
    count_ = 0;
}

// The shared-GUID cache.

HRESULT CSharedGuid::Construct() {
    if (dictionary_)
        return S_OK;
    return GWGetParamDict(IID_IGWParamDict, dictionary_.PutVoid(), nullptr);
}

HRESULT CSharedGuid::BuildCache(IGWComponentHierarchy* hierarchy) {
    map_.RemoveAll();
    visited_.clear();
    if (!hierarchy)
        return S_OK;
    tagGWComponent root{};
    if (HRESULT hr = hierarchy->GetRootComponent(&root); FAILED(hr))
        return hr;
    return Scan(hierarchy, root, 1);
}

HRESULT CSharedGuid::Scan(IGWComponentHierarchy* hierarchy, const tagGWComponent& component, int recurse) {
    tagGWComponent root{};
    if (HRESULT hr = hierarchy->GetRootComponent(&root); FAILED(hr))
        return hr;
    if (SameComponent(component, root)) {
        ut::ComPtr<IUnknown> identity;
        if (HRESULT hr = hierarchy->QueryInterface(IID_IUnknown, identity.PutVoid()); FAILED(hr))
            return hr;
        bool first = ut::ExportBoundary([&] { return visited_.insert(identity.Get()).second; }, true);
        if (!first)
            return S_OK; // reached again through a shared or referenced model
    }
    ut::ComPtr<IGWComponentAccess> access;
    if (FAILED(hierarchy->QueryInterface(IID_IGWComponentAccess, access.PutVoid())))
        return S_OK;
    bool matched = false;
    if (recurse) {
        ut::ComPtr<IGWActiveData> data;
        if (HRESULT hr = hierarchy->QueryInterface(IID_IGWActiveData, data.PutVoid()); FAILED(hr))
            return hr;
        ut::ComPtr<IGWEnumObjects> nested;
        if (HRESULT hr = data->QueryObjects(GWQUERY_NESTED, kNestedScope, kNestedDepth, GUID_NULL,
                                            IID_IGWComponentHierarchy, nested.Put());
            FAILED(hr))
            return hr;
        for (;;) {
            ut::ComPtr<IUnknown> object;
            HRESULT hr = nested->Next(object.Put());
            if (FAILED(hr))
                return hr;
            if (hr != S_OK || !object)
                break;
            auto* inner = static_cast<IGWComponentHierarchy*>(object.Get()); // handed out as asked
            tagGWComponent innerRoot{};
            if (hr = inner->GetRootComponent(&innerRoot); FAILED(hr))
                return hr;
            if (hr = Scan(inner, innerRoot, 1); FAILED(hr))
                return hr;
        }
    } else {
        HRESULT hr = Match(hierarchy, component);
        if (FAILED(hr))
            return hr;
        matched = hr == S_OK;
    }
    tagGWComponent child{};
    HRESULT hr = hierarchy->GetFirstChild(component, GWCOMPONENT_ANY_DEPTH, &child);
    if (FAILED(hr))
        return hr;
    if (hr == S_OK) {
        for (tagGWComponent next{}; hr == S_OK; child = next) {
            (void)Scan(hierarchy, child, 0); // a child's failure does not end the walk of its siblings
            hr = hierarchy->GetNextSibling(child, GWCOMPONENT_ANY_DEPTH, &next);
        }
        return S_OK;
    }
    ut::ComPtr<IGWComponentHierarchy> nested;
    if (hr = hierarchy->GetNestedHierarchy(component, IID_IGWComponentHierarchy, nested.PutVoid());
        FAILED(hr))
        return hr;
    if (!nested || matched)
        return S_OK;
    tagGWComponent nestedRoot{};
    if (hr = nested->GetRootComponent(&nestedRoot); FAILED(hr))
        return hr;
    return Scan(nested.Get(), nestedRoot, 1);
}

HRESULT CSharedGuid::Match(IGWComponentHierarchy* hierarchy, const tagGWComponent& component) {
    GUID guid{};
    if (HRESULT hr = hierarchy->GetComponentGuid(component, &guid); FAILED(hr))
        return hr;
    GUID key = guid;
    if (!watched_.Find(guid)) {
        ut::ComPtr<IUnknown> open; // held open for the length of the look-up
        if (FAILED(GWGetParamDict(IID_IGWParamDict, open.PutVoid(), nullptr)))
            return E_UNEXPECTED;
        ut::ComPtr<IGWProperties> entry;
        if (!dictionary_ || FAILED(dictionary_->FindEntry(guid, entry.Put())) || !entry)
            return S_FALSE;
        CGWVariant alias;
        if (FAILED(entry->GetParameterValue(GUID_GWParamAlias, &alias)) || alias.vt != GW_VT_GUID ||
            !alias.byref)
            return S_FALSE;
        key = *static_cast<const GUID*>(alias.byref);
        if (IsEqualGUID(key, GUID_NULL) || !watched_.Find(key))
            return S_FALSE;
    }
    if (map_.FindInfo(key))
        return S_OK; // the first hierarchy found for a GUID is the one kept
    auto* info = new (std::nothrow) tagComponentHierarchy{hierarchy, component};
    if (!info)
        return E_OUTOFMEMORY;
    if (HRESULT hr = map_.Insert(key, info); FAILED(hr)) {
        delete info;
        return hr;
    }
    hierarchy->AddRef();
    return S_OK;
}

HRESULT CSharedGuid::FindCOMPIDFromGUID(REFGUID guid, unsigned long* componentId, REFIID iid, void** object) {
    if (!componentId || !object)
        return E_INVALIDARG;
    tagComponentHierarchy* info = map_.FindInfo(guid);
    if (!info || !info->hierarchy)
        return E_FAIL;
    *componentId = info->component.id;
    return info->hierarchy->QueryInterface(iid, object);
}

unsigned int CSharedGuid::GetMemSize() const {
    return kCacheBytes + kEntryBytes * map_.Count() + watched_.ReservedBytes();
}
