// The explorer's and the animation editor's registrations: default trees, views and editors, and
// the source operators with the views that can show them, per class or per family.
#include <cstring>
#include <memory>

#include <ut/registration.h>
#include <ut/sdk/families.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/registration.h>
#include <ut/sdk/views.h>

#include "registration/keys.h"

namespace ut::registration {
namespace {

constexpr const wchar_t* kAnimationEditor = L"Animation Editor";
constexpr const wchar_t* kExplorer = L"QVX Explorer";
constexpr const wchar_t* kDefaultTree = L"DefaultTree";
constexpr const wchar_t* kDefaultView = L"DefaultView";
constexpr const wchar_t* kDefaultEditor = L"DefaultEditor";
constexpr const wchar_t* kSourceOps = L"SourceOps";
constexpr const wchar_t* kFamilySourceOps = L"FamilySourceOps";
constexpr const wchar_t* kClassValue = L"CLSID";
constexpr const wchar_t* kSourceOpValue = L"SOURCEOP";
constexpr const wchar_t* kViewerPreference = L"qvx_explorer.viewer";

// Capacities in characters: identifier values read back, names listed, and view names.
constexpr DWORD kIdentifierCapacity = 40;
constexpr DWORD kListedNameCapacity = 80;
constexpr DWORD kViewNameCapacity = 80;

bool IsNull(REFGUID id) {
    return IsEqualGUID(id, GUID_NULL);
}

using TaskBlock = std::unique_ptr<GUID, TaskMemDeleter>;

// --- Defaults

HRESULT RegisterDefault(const wchar_t* tool, const wchar_t* item, const GUID& clsid, const GUID& sourceOp) {
    UniqueHKey toolKey = Create(HKEY_LOCAL_MACHINE, CategoryKey(tool));
    if (!toolKey)
        return E_FAIL;
    UniqueHKey itemKey = Create(toolKey.get(), item);
    if (!itemKey || sdk::SetText(itemKey.get(), kClassValue, CKXString::FromGUID(clsid)) != ERROR_SUCCESS)
        return E_FAIL;
    if (!IsNull(sourceOp) &&
        sdk::SetText(itemKey.get(), kSourceOpValue, CKXString::FromGUID(sourceOp)) != ERROR_SUCCESS)
        return E_FAIL;
    return S_OK;
}

// Reads an identifier value with the checked read; false when it cannot be read.
bool ReadIdentifierText(HKEY key, const wchar_t* name, wchar_t (&text)[kIdentifierCapacity]) {
    DWORD bytes = TextBytes(kIdentifierCapacity);
    return ReadCheckedText(key, name, text, &bytes) == ERROR_SUCCESS;
}

HRESULT UnregisterDefault(const wchar_t* tool, const wchar_t* item, const GUID& clsid) {
    std::wstring path = CategoryKey(tool, item);
    {
        UniqueHKey key = Open(HKEY_LOCAL_MACHINE, path, kReadWrite);
        wchar_t text[kIdentifierCapacity];
        if (!key || !ReadIdentifierText(key.get(), kClassValue, text))
            return S_FALSE;
        GUID stored = GUID_NULL;
        // Another class's default is left alone.
        if (SUCCEEDED(ParseGuid(text, &stored)) && IsEqualGUID(stored, clsid) &&
            RegDeleteValueW(key.get(), kClassValue) != ERROR_SUCCESS)
            return E_FAIL;
    }
    (void)GwRegCleanKey(HKEY_LOCAL_MACHINE, path.c_str()); // tidying only
    return S_OK;
}

HRESULT ReadDefault(const wchar_t* tool, const wchar_t* item, GUID* first, GUID* second) {
    if (!first)
        return E_INVALIDARG;
    *first = GUID_NULL;
    if (second)
        *second = GUID_NULL;
    UniqueHKey key = Open(HKEY_LOCAL_MACHINE, CategoryKey(tool, item));
    if (!key)
        return S_FALSE; // the caller falls back to its built-in default
    wchar_t text[kIdentifierCapacity];
    if (!ReadIdentifierText(key.get(), kClassValue, text))
        return E_FAIL;
    (void)ParseGuid(text, first); // deliberately unchecked
    if (second && ReadIdentifierText(key.get(), kSourceOpValue, text))
        (void)ParseGuid(text, second); // likewise
    return S_OK;
}

// --- Source operators

HRESULT RegisterSourceOpView(const wchar_t* tool, const wchar_t* list, const GUID& owner, const GUID& view) {
    UniqueHKey key = Create(HKEY_LOCAL_MACHINE, CategoryKey(tool, list, GuidToString(owner).c_str()));
    if (!key)
        return E_FAIL;
    const DWORD one = 1;
    return RegSetValueExW(key.get(), GuidToString(view).c_str(), 0, REG_DWORD,
                          reinterpret_cast<const BYTE*>(&one), sizeof one) == ERROR_SUCCESS
               ? S_OK
               : E_FAIL;
}

HRESULT UnregisterSourceOpView(const wchar_t* tool, const wchar_t* list, const GUID& owner,
                               const GUID& view) {
    std::wstring path = CategoryKey(tool, list, GuidToString(owner).c_str());
    UniqueHKey key = Open(HKEY_LOCAL_MACHINE, path, kReadWrite);
    if (!key)
        return S_FALSE;
    if (RegDeleteValueW(key.get(), GuidToString(view).c_str()) != ERROR_SUCCESS)
        return E_FAIL;
    DWORD values = 0;
    LONG info = RegQueryInfoKeyW(key.get(), nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, &values,
                                 nullptr, nullptr, nullptr, nullptr);
    key.reset();
    if (info == ERROR_SUCCESS && values == 0)
        (void)GwRegCleanKey(HKEY_LOCAL_MACHINE, path.c_str()); // tidying only
    return S_OK;
}

enum class Listed { SubKeys, Values };

// Calls `visit(name)` for each sub-key or value name of `key`, up to `limit` of them, skipping
// names that do not fit the listing's buffer. ERROR_SUCCESS at the end of the names.
template <class Visit>
LONG ForEachName(HKEY key, Listed what, DWORD limit, Visit&& visit) {
    wchar_t name[kListedNameCapacity];
    for (DWORD index = 0; index < limit; ++index) {
        DWORD length = kListedNameCapacity;
        LONG found = what == Listed::SubKeys
                         ? RegEnumKeyExW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr)
                         : RegEnumValueW(key, index, name, &length, nullptr, nullptr, nullptr, nullptr);
        if (found == ERROR_NO_MORE_ITEMS)
            return ERROR_SUCCESS;
        if (found == ERROR_MORE_DATA)
            continue;
        if (found != ERROR_SUCCESS)
            return found;
        if (HRESULT hr = visit(static_cast<const wchar_t*>(name)); FAILED(hr))
            return hr;
    }
    return ERROR_SUCCESS;
}

// The names of `key` that are identifiers, into a block of one entry per name.
HRESULT CollectIds(HKEY key, Listed what, DWORD* count, GUID** ids) {
    DWORD names = 0;
    LONG info = what == Listed::SubKeys
                    ? RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, &names, nullptr, nullptr, nullptr,
                                       nullptr, nullptr, nullptr, nullptr)
                    : RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, &names,
                                       nullptr, nullptr, nullptr, nullptr);
    if (info != ERROR_SUCCESS)
        return E_FAIL;
    TaskBlock block(static_cast<GUID*>(CoTaskMemAlloc(names * sizeof(GUID))));
    if (!block)
        return E_OUTOFMEMORY;
    DWORD found = 0;
    (void)ForEachName(key, what, names, [&](const wchar_t* name) { // a walk cut short keeps what it found
        if (SUCCEEDED(ParseGuid(name, &block.get()[found])))
            ++found;
        return S_OK;
    });
    *count = found;
    *ids = block.release();
    return S_OK;
}

HRESULT ListIds(const std::wstring& path, Listed what, DWORD* count, GUID** ids) {
    if (!count || !ids)
        return E_INVALIDARG;
    *count = 0;
    *ids = nullptr;
    UniqueHKey key = Open(HKEY_LOCAL_MACHINE, path);
    if (!key)
        return S_FALSE;
    return CollectIds(key.get(), what, count, ids);
}

HRESULT ListSourceOps(const wchar_t* tool, DWORD* count, GUID** ids) {
    return ListIds(CategoryKey(tool, kSourceOps), Listed::SubKeys, count, ids);
}

HRESULT ListViews(const wchar_t* tool, const wchar_t* list, const GUID& owner, DWORD* count, GUID** ids) {
    return ListIds(CategoryKey(tool, list, GuidToString(owner).c_str()), Listed::Values, count, ids);
}

// Calls `visit(family)` for each family key of the explorer's family source operators.
template <class Visit>
HRESULT ForEachFamilyKey(HKEY families, Visit&& visit) {
    LONG walked = ForEachName(families, Listed::SubKeys, ~DWORD{0}, [&](const wchar_t* name) {
        GUID family{};
        return SUCCEEDED(ParseGuid(name, &family)) ? visit(family) : S_OK;
    });
    return walked == ERROR_SUCCESS ? S_OK : walked < 0 ? walked : E_FAIL;
}

// Calls `visit(member)` for each member of every family under "FamilySourceOps".
template <class Visit>
HRESULT ForEachFamilyMember(IGWFamiliesManager& manager, HKEY families, Visit&& visit) {
    return ForEachFamilyKey(families, [&](const GUID& family) {
        ComPtr<IGWEnumGUID> members;
        if (HRESULT hr = manager.EnumMembers(family, members.Put()); FAILED(hr))
            return hr;
        for (;;) {
            GUID member{};
            HRESULT hr = members->Next(1, &member, nullptr);
            if (hr != S_OK)
                return FAILED(hr) ? hr : S_OK;
            visit(member);
        }
    });
}

// The members of every family under "FamilySourceOps": counted first, then stored.
HRESULT ListFamilyMembers(IGWFamiliesManager& manager, DWORD* count, GUID** ids) {
    *count = 0;
    *ids = nullptr;
    UniqueHKey families = Open(HKEY_LOCAL_MACHINE, CategoryKey(kExplorer, kFamilySourceOps));
    if (!families)
        return S_FALSE;
    DWORD total = 0;
    if (HRESULT hr = ForEachFamilyMember(manager, families.get(), [&](const GUID&) { ++total; }); FAILED(hr))
        return hr;
    TaskBlock block(static_cast<GUID*>(CoTaskMemAlloc(total * sizeof(GUID))));
    if (!block)
        return E_OUTOFMEMORY;
    DWORD stored = 0;
    HRESULT hr = ForEachFamilyMember(manager, families.get(), [&](const GUID& member) {
        if (stored < total) // the families may have grown between the passes
            block.get()[stored++] = member;
    });
    if (FAILED(hr))
        return hr;
    *count = stored;
    *ids = block.release();
    return S_OK;
}

// Grows the caller's block by `more` identifiers; E_OUTOFMEMORY leaves it as it was.
HRESULT Append(DWORD* count, GUID** ids, DWORD moreCount, const GUID* more) {
    auto* grown = static_cast<GUID*>(
        CoTaskMemRealloc(*ids, (static_cast<std::size_t>(*count) + moreCount) * sizeof(GUID)));
    if (!grown)
        return E_OUTOFMEMORY;
    if (moreCount != 0)
        std::memcpy(grown + *count, more, moreCount * sizeof(GUID));
    *ids = grown;
    *count += moreCount;
    return S_OK;
}

// Ends a listing: on failure the block is freed and the list emptied.
HRESULT Finish(HRESULT hr, DWORD* count, GUID** ids) {
    if (FAILED(hr)) {
        CoTaskMemFree(*ids);
        *ids = nullptr;
        *count = 0;
    }
    return hr;
}

HRESULT ExplorerSourceOps(DWORD* count, GUID** ids) {
    HRESULT hr = ListSourceOps(kExplorer, count, ids);
    if (hr != S_OK)
        return hr;
    ComPtr<IGWFamiliesManager> manager;
    if (hr = GWGetFamiliesManager(manager.Put()); FAILED(hr))
        return Finish(hr, count, ids);
    DWORD memberCount = 0;
    GUID* members = nullptr;
    hr = ListFamilyMembers(*manager, &memberCount, &members);
    TaskBlock ownedMembers(members);
    if (FAILED(hr))
        return Finish(hr, count, ids);
    return Finish(Append(count, ids, memberCount, members), count, ids);
}

HRESULT ExplorerSourceOpViews(const GUID& sourceOp, DWORD* count, GUID** ids) {
    HRESULT hr = ListViews(kExplorer, kSourceOps, sourceOp, count, ids);
    if (FAILED(hr))
        return hr;
    ComPtr<IGWFamiliesManager> manager;
    if (HRESULT got = GWGetFamiliesManager(manager.Put()); FAILED(got))
        return Finish(got, count, ids);
    UniqueHKey families = Open(HKEY_LOCAL_MACHINE, CategoryKey(kExplorer, kFamilySourceOps));
    if (!families)
        return hr;
    HRESULT walked = ForEachFamilyKey(families.get(), [&](const GUID& family) {
        HRESULT member = manager->IsMember(sourceOp, family);
        if (member != S_OK)
            return FAILED(member) ? member : S_OK;
        DWORD viewCount = 0;
        GUID* views = nullptr;
        HRESULT listed = ListViews(kExplorer, kFamilySourceOps, family, &viewCount, &views);
        TaskBlock ownedViews(views);
        if (FAILED(listed))
            return listed;
        return Append(count, ids, viewCount, views);
    });
    if (FAILED(walked))
        return Finish(walked, count, ids);
    return *ids ? S_OK : hr;
}

// --- The explorer's editor, by view name in the preferences

HRESULT RegisterExplorerEditor(const GUID& clsid) {
    ComPtr<IGWViewManager> views;
    wchar_t name[kViewNameCapacity];
    if (FAILED(GWGetViewMgr(views.Put())) || FAILED(views->GetViewName(clsid, name, kViewNameCapacity)))
        return E_FAIL;
    ComPtr<IGWPreferences> preferences;
    if (FAILED(KXGetPreferencesMgr(preferences.Put())) ||
        FAILED(preferences->SetText(kViewerPreference, name)))
        return E_FAIL;
    return S_OK;
}

// The view that the preference names, when it is set and the view manager knows it.
bool EditorFromPreference(GUID* editor) {
    ComPtr<IGWPreferences> preferences;
    if (FAILED(KXGetPreferencesMgr(preferences.Put())))
        return false;
    wchar_t* text = nullptr;
    HRESULT read = preferences->GetText(kViewerPreference, &text);
    std::unique_ptr<wchar_t, TaskMemDeleter> owned(text);
    if (FAILED(read) || !text || !*text)
        return false;
    ComPtr<IGWViewManager> views;
    return SUCCEEDED(GWGetViewMgr(views.Put())) && SUCCEEDED(views->GetViewClass(text, editor));
}

} // namespace
} // namespace ut::registration

using namespace ut::registration;
using ut::UniqueHKey;

HRESULT KXRegisterAnimationEditorTree(const GUID& clsid, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterDefault(kAnimationEditor, kDefaultTree, clsid, GUID_NULL); });
}
HRESULT KXRegisterAnimationEditorView(const GUID& clsid, const GUID& sourceOp, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterDefault(kAnimationEditor, kDefaultView, clsid, sourceOp); });
}
HRESULT KXRegisterQVXExplorerTree(const GUID& clsid, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterDefault(kExplorer, kDefaultTree, clsid, GUID_NULL); });
}
HRESULT KXRegisterQVXExplorerEditor(const GUID& clsid, const GUID&, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterExplorerEditor(clsid); });
}

HRESULT KXUnRegisterAnimationEditorTree(const GUID& clsid) {
    return Guarded(E_FAIL, [&] { return UnregisterDefault(kAnimationEditor, kDefaultTree, clsid); });
}
HRESULT KXUnRegisterAnimationEditorView(const GUID& clsid) {
    return Guarded(E_FAIL, [&] { return UnregisterDefault(kAnimationEditor, kDefaultView, clsid); });
}
HRESULT KXUnRegisterQVXExplorerTree(const GUID& clsid) {
    return Guarded(E_FAIL, [&] { return UnregisterDefault(kExplorer, kDefaultTree, clsid); });
}
HRESULT KXUnRegisterQVXExplorerEditor(const GUID& clsid) {
    return Guarded(E_FAIL, [&] { return UnregisterDefault(kExplorer, kDefaultEditor, clsid); });
}

HRESULT KXRegisterAnimationEditorSourceOp(const GUID& sourceOp, const GUID& view, HINSTANCE) {
    return Guarded(E_FAIL,
                   [&] { return RegisterSourceOpView(kAnimationEditor, kSourceOps, sourceOp, view); });
}
HRESULT KXRegisterQVXExplorerSourceOp(const GUID& sourceOp, const GUID& view, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterSourceOpView(kExplorer, kSourceOps, sourceOp, view); });
}
HRESULT KXRegisterQVXExplorerFamilySourceOp(const GUID& family, const GUID& view, HINSTANCE) {
    return Guarded(E_FAIL, [&] { return RegisterSourceOpView(kExplorer, kFamilySourceOps, family, view); });
}
HRESULT KXUnRegisterAnimationEditorSourceOp(const GUID& sourceOp, const GUID& view) {
    return Guarded(E_FAIL,
                   [&] { return UnregisterSourceOpView(kAnimationEditor, kSourceOps, sourceOp, view); });
}
HRESULT KXUnRegisterQVXExplorerSourceOp(const GUID& sourceOp, const GUID& view) {
    return Guarded(E_FAIL, [&] { return UnregisterSourceOpView(kExplorer, kSourceOps, sourceOp, view); });
}
HRESULT KXUnRegisterQVXExplorerFamilySourceOp(const GUID& family, const GUID& view) {
    return Guarded(E_FAIL, [&] { return UnregisterSourceOpView(kExplorer, kFamilySourceOps, family, view); });
}

HRESULT KXGetDefaultAnimationEditorTree(GUID* tree) {
    return Guarded(E_FAIL, [&] { return ReadDefault(kAnimationEditor, kDefaultTree, tree, nullptr); });
}
HRESULT KXGetDefaultAnimationEditorView(GUID* view, GUID* sourceOp) {
    return Guarded(E_FAIL, [&] { return ReadDefault(kAnimationEditor, kDefaultView, view, sourceOp); });
}
HRESULT KXGetDefaultQVXExplorerTree(GUID* tree) {
    return Guarded(E_FAIL, [&] { return ReadDefault(kExplorer, kDefaultTree, tree, nullptr); });
}
HRESULT KXGetDefaultQVXExplorerEditor(GUID* editor, GUID*) {
    return Guarded(E_FAIL, [&] {
        if (EditorFromPreference(editor))
            return S_OK;
        return ReadDefault(kExplorer, kDefaultEditor, editor, nullptr);
    });
}

HRESULT KXGetAnimationEditorSourceOps(DWORD* count, GUID** list) {
    return Guarded(E_FAIL, [&] { return ListSourceOps(kAnimationEditor, count, list); });
}
HRESULT KXGetAnimationEditorSourceOpViews(const GUID& sourceOp, DWORD* count, GUID** list) {
    return Guarded(E_FAIL, [&] { return ListViews(kAnimationEditor, kSourceOps, sourceOp, count, list); });
}
HRESULT KXGetQVXExplorerSourceOps(DWORD* count, GUID** list) {
    return Guarded(E_FAIL, [&] { return ExplorerSourceOps(count, list); });
}
HRESULT KXGetQVXExplorerSourceOpViews(const GUID& sourceOp, DWORD* count, GUID** list) {
    return Guarded(E_FAIL, [&] { return ExplorerSourceOpViews(sourceOp, count, list); });
}
