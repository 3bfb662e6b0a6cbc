// The reference host's object families, in the registry.
#include "families_manager.h"

#include <algorithm>
#include <new>
#include <string>
#include <string_view>
#include <vector>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

using sdk::CreateKey;
using sdk::SetText;

// The values that describe a family, as RegisterFamily writes them.
constexpr const wchar_t* kDescription[] = {L"Class",  L"Parent", L"Kind",     L"Path",
                                           L"Module", L"Editor", L"Inspector"};

HRESULT FromRegistry(LONG error) {
    return error == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(static_cast<DWORD>(error));
}

std::wstring FamilyKey(REFGUID family) {
    return std::wstring(sdk::kFamiliesBranch) + L"\\" + GuidToString(family);
}

std::wstring MembersKey(REFGUID family) {
    return FamilyKey(family) + L"\\Members";
}

std::wstring MemberKey(REFGUID family, REFCLSID clsid) {
    return MembersKey(family) + L"\\" + GuidToString(clsid);
}

// GUID_NULL as the class or in the list of `count` families is E_INVALIDARG, a null list with a
// count E_POINTER.
HRESULT CheckMembers(REFCLSID clsid, ULONG count, const GUID* families) {
    if (IsEqualGUID(clsid, GUID_NULL))
        return E_INVALIDARG;
    if (count != 0 && !families)
        return E_POINTER;
    for (ULONG i = 0; i < count; ++i)
        if (IsEqualGUID(families[i], GUID_NULL))
            return E_INVALIDARG;
    return S_OK;
}

LONG SetIdentifier(HKEY key, const wchar_t* name, REFGUID id) {
    return IsEqualGUID(id, GUID_NULL) ? ERROR_SUCCESS : SetText(key, name, GuidToString(id).c_str());
}

LONG SetTextIfAny(HKEY key, const wchar_t* name, const std::wstring& text) {
    return text.empty() ? ERROR_SUCCESS : SetText(key, name, text.c_str());
}

// Deletes the description values; answers whether there was one.
bool DeleteDescription(HKEY key) {
    bool had = false;
    for (const wchar_t* name : kDescription)
        had |= RegDeleteValueW(key, name) == ERROR_SUCCESS;
    return had;
}

// Drops the family's "Members" key when no member is left, then the family's key when nothing
// is left in it.
HRESULT DropWhatIsEmpty(REFGUID family) {
    HRESULT members = sdk::DropEmptyKey(HKEY_LOCAL_MACHINE, MembersKey(family).c_str());
    if (FAILED(members))
        return members;
    HRESULT whole = sdk::DropEmptyKey(HKEY_LOCAL_MACHINE, FamilyKey(family).c_str());
    return FAILED(whole) ? whole : S_OK;
}

// A write of the manager: the fault hook under `operation`, then `body` in one registry batch under
// the error boundary.
template <class Body>
HRESULT Write(std::string_view operation, Body&& body) {
    if (HRESULT hr = sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    return ExportBoundary([&] { return sdk::Batched(body, E_FAIL); });
}

// A read: the fault hook, then `body` under the error boundary.
template <class Body>
HRESULT Read(std::string_view operation, Body&& body) {
    if (HRESULT hr = sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    return ExportBoundary(static_cast<Body&&>(body));
}

class GuidList final : public sdk::ComObject<IGWEnumGUID> {
public:
    explicit GuidList(std::vector<GUID> ids) : ids_(std::move(ids)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {sdk::Entry<GuidList, IGWEnumGUID>(IID_IGWEnumGUID)};
        return map;
    }

    HRESULT STDMETHODCALLTYPE Next(ULONG count, GUID* ids, ULONG* fetched) override {
        if ((count != 0 && !ids) || (count != 1 && !fetched))
            return E_POINTER;
        if (fetched)
            *fetched = 0;
        if (HRESULT hr = sdk::CheckHostFault("IGWEnumGUID::Next"); FAILED(hr))
            return hr;
        ULONG copied = 0;
        for (; copied < count && next_ < ids_.size(); ++copied)
            ids[copied] = ids_[next_++];
        if (fetched)
            *fetched = copied;
        return copied == count ? S_OK : S_FALSE;
    }
    HRESULT STDMETHODCALLTYPE Reset() override {
        next_ = 0;
        return S_OK;
    }

private:
    std::vector<GUID> ids_;
    std::size_t next_ = 0;
};

// The identifiers that name the sub-keys of `path`; none when it is missing.
HRESULT SubKeyIds(const std::wstring& path, std::vector<GUID>& ids) {
    UniqueHKey key = sdk::OpenKey(HKEY_LOCAL_MACHINE, path.c_str());
    if (!key)
        return S_OK;
    return FromRegistry(sdk::ForEachSubKey(key.get(), [&](const wchar_t* name) {
        GUID id{};
        if (SUCCEEDED(ParseGuid(name, &id)))
            ids.push_back(id);
        return true;
    }));
}

HRESULT HandOut(std::vector<GUID> ids, IGWEnumGUID** list) {
    *list = new (std::nothrow) GuidList(std::move(ids));
    return *list ? S_OK : E_OUTOFMEMORY;
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> FamiliesManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        sdk::Entry<FamiliesManager, IGWFamiliesManager>(IID_IGWFamiliesManager)};
    return map;
}

HRESULT FamiliesManager::RegisterFamily(REFGUID family, REFCLSID familyClass, REFGUID parent,
                                        const wchar_t* kind, const wchar_t* path, HINSTANCE module,
                                        REFCLSID editor, REFCLSID inspector) {
    if (IsEqualGUID(family, GUID_NULL))
        return E_INVALIDARG;
    return Write("IGWFamiliesManager::RegisterFamily", [&] {
        UniqueHKey key;
        LONG result = CreateKey(HKEY_LOCAL_MACHINE, FamilyKey(family).c_str(), key);
        if (result != ERROR_SUCCESS)
            return FromRegistry(result);
        (void)DeleteDescription(key.get()); // only the new description counts
        const LONG written[] = {SetIdentifier(key.get(), L"Class", familyClass),
                                SetIdentifier(key.get(), L"Parent", parent),
                                SetTextIfAny(key.get(), L"Kind", kind ? kind : L""),
                                SetTextIfAny(key.get(), L"Path", path ? path : L""),
                                SetTextIfAny(key.get(), L"Module", platform::ModuleFileName(module)),
                                SetIdentifier(key.get(), L"Editor", editor),
                                SetIdentifier(key.get(), L"Inspector", inspector)};
        for (LONG one : written)
            if (one != ERROR_SUCCESS)
                return FromRegistry(one);
        return S_OK;
    });
}

HRESULT FamiliesManager::UnregisterFamily(REFGUID family, HINSTANCE) {
    if (IsEqualGUID(family, GUID_NULL))
        return E_INVALIDARG;
    return Write("IGWFamiliesManager::UnregisterFamily", [&] {
        bool had = false;
        if (UniqueHKey key = sdk::OpenKey(HKEY_LOCAL_MACHINE, FamilyKey(family).c_str(), sdk::kReadWrite))
            had = DeleteDescription(key.get());
        HRESULT dropped = DropWhatIsEmpty(family);
        return FAILED(dropped) ? dropped : had ? S_OK : S_FALSE;
    });
}

HRESULT FamiliesManager::RegisterMembers(REFCLSID clsid, ULONG count, const GUID* families, BOOL flag,
                                         const wchar_t* name, HINSTANCE) {
    if (!name)
        return E_POINTER;
    if (HRESULT hr = CheckMembers(clsid, count, families); FAILED(hr))
        return hr;
    return Write("IGWFamiliesManager::RegisterMembers", [&] {
        const DWORD flagValue = flag ? 1 : 0;
        for (ULONG i = 0; i < count; ++i) {
            UniqueHKey key;
            LONG result = CreateKey(HKEY_LOCAL_MACHINE, MemberKey(families[i], clsid).c_str(), key);
            if (result == ERROR_SUCCESS)
                result = SetText(key.get(), L"Name", name);
            if (result == ERROR_SUCCESS)
                result = RegSetValueExW(key.get(), L"Flag", 0, REG_DWORD,
                                        reinterpret_cast<const BYTE*>(&flagValue), sizeof flagValue);
            if (result != ERROR_SUCCESS)
                return FromRegistry(result);
        }
        return S_OK;
    });
}

HRESULT FamiliesManager::UnregisterMembers(REFCLSID clsid, ULONG count, const GUID* families, HINSTANCE) {
    if (HRESULT hr = CheckMembers(clsid, count, families); FAILED(hr))
        return hr;
    return Write("IGWFamiliesManager::UnregisterMembers", [&] {
        bool all = true;
        for (ULONG i = 0; i < count; ++i) {
            LONG deleted = RegDeleteKeyW(HKEY_LOCAL_MACHINE, MemberKey(families[i], clsid).c_str());
            if (deleted != ERROR_SUCCESS && deleted != ERROR_FILE_NOT_FOUND)
                return FromRegistry(deleted);
            all &= deleted == ERROR_SUCCESS;
            if (HRESULT dropped = DropWhatIsEmpty(families[i]); FAILED(dropped))
                return dropped;
        }
        return all ? S_OK : S_FALSE;
    });
}

HRESULT FamiliesManager::EnumFamilies(IGWEnumGUID** families) {
    if (!families)
        return E_POINTER;
    *families = nullptr;
    return Read("IGWFamiliesManager::EnumFamilies", [&] {
        std::vector<GUID> ids;
        HRESULT hr = SubKeyIds(sdk::kFamiliesBranch, ids);
        return FAILED(hr) ? hr : HandOut(std::move(ids), families);
    });
}

HRESULT FamiliesManager::GetFamilyName(REFGUID family, LPOLESTR* name) {
    if (!name)
        return E_POINTER;
    *name = nullptr;
    return Read("IGWFamiliesManager::GetFamilyName", [&] {
        UniqueHKey key = sdk::OpenKey(HKEY_LOCAL_MACHINE, FamilyKey(family).c_str());
        if (!key)
            return DISP_E_MEMBERNOTFOUND;
        std::wstring kind;
        (void)sdk::ReadText(key.get(), L"Kind", kind); // a family with members only has no kind
        return CopyToTaskMemory(kind, name);
    });
}

HRESULT FamiliesManager::GetClassFamilies(REFCLSID clsid, ULONG capacity, GUID* families, ULONG* count) {
    if (!count)
        return E_POINTER;
    *count = 0;
    return Read("IGWFamiliesManager::GetClassFamilies", [&] {
        std::vector<GUID> all;
        if (HRESULT hr = SubKeyIds(sdk::kFamiliesBranch, all); FAILED(hr))
            return hr;
        ULONG found = 0;
        for (const GUID& family : all) {
            if (!sdk::OpenKey(HKEY_LOCAL_MACHINE, MemberKey(family, clsid).c_str()))
                continue;
            if (families && found < capacity)
                families[found] = family;
            ++found;
        }
        *count = families ? std::min(found, capacity) : found;
        return S_OK;
    });
}

HRESULT FamiliesManager::EnumMembers(REFGUID family, IGWEnumGUID** members) {
    if (!members)
        return E_POINTER;
    *members = nullptr;
    if (IsEqualGUID(family, GUID_NULL))
        return E_INVALIDARG;
    return Read("IGWFamiliesManager::EnumMembers", [&] {
        std::vector<GUID> ids;
        HRESULT hr = SubKeyIds(MembersKey(family), ids);
        return FAILED(hr) ? hr : HandOut(std::move(ids), members);
    });
}

HRESULT FamiliesManager::IsMember(REFCLSID clsid, REFGUID family) {
    if (IsEqualGUID(clsid, GUID_NULL) || IsEqualGUID(family, GUID_NULL))
        return E_INVALIDARG;
    return Read("IGWFamiliesManager::IsMember", [&] {
        return sdk::OpenKey(HKEY_LOCAL_MACHINE, MemberKey(family, clsid).c_str()) ? S_OK : S_FALSE;
    });
}

} // namespace ut::host
