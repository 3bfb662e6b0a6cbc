// Preset files found by class and name over the install locations, the process-wide preset cache,
// objects created from presets, and the host preset manager's command presets.
#include <ut/presets.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <string_view>

#include <ut/paths.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/file_search.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/paths.h>

#include "module/state.h"

namespace {

using ut::ComPtr;

constexpr const wchar_t* kPresetFolder = L"Data\\GWPresets";
constexpr std::wstring_view kExtension = L".Preset";

const ut::module::PresetEntry* Cached(REFGUID clsid, const CKXString& name) {
    const ut::module::PresetCache& cache = ut::module::Presets();
    auto byClass = cache.find(clsid);
    if (byClass == cache.end())
        return nullptr;
    auto entry = byClass->second.find(name);
    return entry == byClass->second.end() ? nullptr : &entry->second;
}

// The class's favourite preset sub-folder; the host's failure as it came (and an empty folder).
HRESULT FavouriteFolder(REFGUID clsid, CKXString& folder) {
    wchar_t* text = nullptr;
    HRESULT hr = GWGetFavoritePresetPath(clsid, &text);
    if (FAILED(hr)) {
        CoTaskMemFree(text);
        folder = L"";
        return hr;
    }
    folder.Attach_OLE(text);
    return hr;
}

// A folder being listed by the search, and the entry its listing gave last.
struct Level {
    CKXString folder;
    ut::platform::FolderIdentity identity;
    std::unique_ptr<ut::platform::UniqueFind> listing;
    WIN32_FIND_DATAW entry;
    bool entryPending;
};

// Looks into `folder`: true with `found` when it holds `fileName`; otherwise its listing joins
// `path`, unless it cannot be listed or is already on the path (reached again through a link).
bool Enter(const CKXString& folder, const CKXString& fileName, std::vector<Level>& path, CKXString& found) {
    CKXString candidate = folder + L"\\" + fileName;
    if (KXIsFileExist(candidate)) {
        found = std::move(candidate);
        return true;
    }
    ut::platform::FolderIdentity identity;
    if (!ut::platform::IdentifyFolder(folder, identity) ||
        std::any_of(path.begin(), path.end(), [&](const Level& level) { return level.identity == identity; }))
        return false;
    Level level{folder, identity, nullptr, {}, true};
    HANDLE listing = FindFirstFileW(folder + L"\\*", &level.entry);
    if (listing == INVALID_HANDLE_VALUE)
        return false;
    level.listing = std::make_unique<ut::platform::UniqueFind>(listing);
    path.push_back(std::move(level));
    return false;
}

// Depth first without recursion: the path of open listings is as long as the tree is deep.
CKXString FindRecursive(const CKXString& fileName, const CKXString& root) {
    std::vector<Level> path;
    CKXString found;
    if (Enter(root, fileName, path, found))
        return found;
    while (!path.empty()) {
        Level& level = path.back();
        if (!level.entryPending && !FindNextFileW(level.listing->Get(), &level.entry)) {
            path.pop_back();
            continue;
        }
        level.entryPending = false;
        // "." and "..", and every other dot-folder by design.
        if (!(level.entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) || level.entry.cFileName[0] == L'.')
            continue;
        CKXString child = level.folder + L"\\" + level.entry.cFileName;
        if (Enter(child, fileName, path, found))
            return found;
    }
    return {};
}

// The preset file below one install location of `kind`, or the empty string.
CKXString FindBelow(int kind, const CKXString& location, const CKXString& inPresets) {
    // Add-ons hold their presets in their own folders, at any depth.
    if (kind >= E3D_INSTALL_PATH_ADDONS && kind <= E3D_INSTALL_PATH_WORKGROUP_ADDONS)
        return FindRecursive(inPresets, location);
    CKXString candidate = location + L"\\" + inPresets;
    return KXIsFileExist(candidate) ? candidate : CKXString();
}

// The search over the install locations: every kind in order, a later kind's find replacing an
// earlier one's.
HRESULT Search(REFGUID clsid, const wchar_t* presetName, CKXString& path,
               std::vector<ut::PresetCandidate>* examined) {
    path = L"";
    CKXString folder;
    (void)FavouriteFolder(clsid, folder); // a class without a known folder has its presets at the top
    const CKXString inPresets = CKXString(kPresetFolder) + L"\\" + folder + L"\\" + presetName;
    for (int kind = E3D_INSTALL_PATH_PROJECT; kind <= E3D_INSTALL_PATH_NONE; ++kind) {
        std::vector<CKXString> locations;
        HRESULT hr = KXGetInstallPaths(static_cast<tagE3D_INSTALL_PATH_TYPE>(kind), locations);
        if (FAILED(hr))
            return hr;
        if (hr == S_FALSE)
            continue;
        for (const CKXString& location : locations) {
            CKXString found = FindBelow(kind, location, inPresets);
            if (examined)
                examined->push_back({kind, location, found});
            if (!found.IsEmpty()) {
                path = std::move(found);
                break;
            }
        }
    }
    return path.IsEmpty() ? E_FAIL : S_OK;
}

HRESULT FindPresetPath(REFGUID clsid, const wchar_t* presetName, CKXString& path) {
    path = L"";
    if (!presetName)
        return E_POINTER;
    if (const ut::module::PresetEntry* entry = Cached(clsid, presetName)) {
        path = entry->path;
        return S_OK;
    }
    return Search(clsid, presetName, path, nullptr);
}

HRESULT ObjectClassOfPreset(REFGUID clsid, const wchar_t* presetName, GUID* objectClsid) {
    if (!objectClsid)
        return E_POINTER;
    *objectClsid = GUID_NULL;
    if (!presetName)
        return E_POINTER;
    CKXString name = ut::PresetFileName(presetName);
    if (const ut::module::PresetEntry* entry = Cached(clsid, name)) {
        *objectClsid = entry->objectClass;
        return S_OK;
    }
    ComPtr<IUnknown> object;
    if (HRESULT hr = KXCreateObjectFromPreset(clsid, name, GUID_NULL, object.PutVoid(), nullptr, nullptr);
        FAILED(hr))
        return hr;
    ComPtr<IPersist> persist;
    if (HRESULT hr = object->QueryInterface(IID_IPersist, persist.PutVoid()); FAILED(hr))
        return hr;
    if (HRESULT hr = persist->GetClassID(objectClsid); FAILED(hr)) {
        *objectClsid = GUID_NULL;
        return hr;
    }
    return S_OK;
}

// Runs `call` on the host's preset manager; any success is S_OK.
template <class Call>
HRESULT WithPresetManager(Call call) {
    ComPtr<IGWPresetManager> manager;
    if (HRESULT hr = KXGetSceneManager(IID_IGWPresetManager, manager.PutVoid(), 1); FAILED(hr))
        return hr;
    HRESULT hr = call(*manager);
    return FAILED(hr) ? hr : S_OK;
}

// The file of the preset of class `clsid` named `name`: the cached one, else the first of
// `folders` joined with the class's favourite folder that holds it, else the search's; when none
// holds it, the name in the favourite folder as the host resolves it.
HRESULT ClassPresetFile(REFGUID clsid, const CKXString& name, const std::vector<CKXString>* folders,
                        CKXString& file) {
    if (const ut::module::PresetEntry* entry = Cached(clsid, name)) {
        file = entry->path;
        return S_OK;
    }
    CKXString favourite;
    if (HRESULT hr = FavouriteFolder(clsid, favourite); FAILED(hr))
        return hr;
    static const std::vector<CKXString> none;
    for (const CKXString& folder : folders ? *folders : none) {
        CKXString resolved;
        if (CKXPathHelper::GetResolvedPath(folder + L"\\" + favourite + L"\\" + name, resolved) == S_OK) {
            file = resolved;
            return S_OK;
        }
    }
    if (SUCCEEDED(Search(clsid, name, file, nullptr)))
        return S_OK;
    // Not on disk: the loader says so, and the family's command may still make it.
    HRESULT hr = CKXPathHelper::GetResolvedPath(favourite, file);
    if (FAILED(hr))
        return hr;
    file += CKXString(L"\\") + name;
    return S_OK;
}

// The file `name` stands for when no class is given: the name itself, as the host resolves it,
// or the search's find.
HRESULT NamedPresetFile(const CKXString& name, CKXString& file) {
    if (KXIsFileExist(name)) {
        file = name;
        return S_OK;
    }
    if (SUCCEEDED(CKXPathHelper::GetResolvedPathNoIO(name, file)) && KXIsFileExist(file))
        return S_OK;
    return SUCCEEDED(Search(GUID_NULL, name, file, nullptr)) ? S_OK : E_INVALIDARG;
}

// The preset the command of the class's family makes under `name`.
HRESULT ProduceByFamilyCommand(REFGUID clsid, const CKXString& name, ComPtr<IGWPreset>& preset) {
    CLSID command = GUID_NULL;
    if (GWGetFamilyCommand(clsid, &command) != S_OK)
        return STG_E_FILENOTFOUND; // no command: the preset simply is not there
    ComPtr<IGWPresetCommand> service;
    if (HRESULT hr = GWQueryGenericObject(command, IID_IGWPresetCommand, service.PutVoid()); FAILED(hr))
        return hr;
    return service->ProducePreset(clsid, name, preset.Put());
}

// Enters a preset read from a file into the cache; a preset without a file or class stays out.
void Remember(REFGUID clsid, const CKXString& name, IGWPreset& preset) {
    wchar_t* file = nullptr;
    if (FAILED(KXGetFilePathFromPreset(&preset, &file)))
        return;
    std::unique_ptr<wchar_t[]> owned(file);
    ut::module::PresetEntry entry{CKXString(file), GUID_NULL};
    if (FAILED(preset.GetObjectClass(&entry.objectClass)))
        return;
    ut::module::Presets()[clsid][name] = std::move(entry);
}

HRESULT CreateFromPreset(REFGUID clsid, const wchar_t* presetName, REFIID iid, void** object,
                         IGWPreset** preset, const std::vector<CKXString>* folders) {
    if (object)
        *object = nullptr;
    if (preset)
        *preset = nullptr;
    if (!presetName)
        return E_POINTER;
    if (!object && !preset)
        return E_INVALIDARG;
    ComPtr<IGWFilePath> filePath;
    if (FAILED(KXCreateInstance(CLSID_GWFilePath, IID_IGWFilePath, filePath.PutVoid())) || !filePath)
        return E_OUTOFMEMORY;
    const CKXString name = ut::PresetFileName(presetName);
    const bool ofClass = !IsEqualGUID(clsid, GUID_NULL);
    CKXString file;
    if (HRESULT hr = ofClass ? ClassPresetFile(clsid, name, folders, file) : NamedPresetFile(name, file);
        FAILED(hr))
        return hr;
    if (HRESULT hr = filePath->SetPath(file); FAILED(hr))
        return hr;
    ComPtr<IGWPresetManager> manager;
    if (HRESULT hr = KXGetSceneManager(IID_IGWPresetManager, manager.PutVoid(), 1); FAILED(hr))
        return hr;
    ComPtr<IGWPreset> loaded;
    HRESULT hr = manager->LoadPreset(filePath.Get(), loaded.Put());
    if (hr == STG_E_FILENOTFOUND && ofClass)
        hr = ProduceByFamilyCommand(clsid, name, loaded);
    if (FAILED(hr))
        return hr;
    if (!loaded)
        return E_UNEXPECTED;
    // Held as IUnknown whatever `iid` it was asked for: released, if it is not handed out, as any.
    ComPtr<IUnknown> made;
    if (object) {
        if (hr = manager->CreateObject(loaded.Get(), IsEqualGUID(iid, GUID_NULL) ? IID_IUnknown : iid,
                                       made.PutVoid());
            FAILED(hr))
            return hr;
        if (!made)
            return E_UNEXPECTED;
    }
    Remember(clsid, name, *loaded);
    if (object)
        *object = made.Detach();
    if (preset)
        *preset = loaded.Detach();
    return S_OK;
}

HRESULT FilePathOf(IGWPreset* preset, wchar_t** path) {
    if (path)
        *path = nullptr;
    if (!preset || !path)
        return E_POINTER;
    ComPtr<IPersistFile> persist;
    if (FAILED(preset->QueryInterface(IID_IPersistFile, persist.PutVoid())) || !persist)
        return E_NOINTERFACE;
    wchar_t* text = nullptr;
    if (HRESULT hr = persist->GetCurFile(&text); FAILED(hr)) {
        CoTaskMemFree(text);
        return hr;
    }
    std::unique_ptr<wchar_t, decltype(&CoTaskMemFree)> owned(text, &CoTaskMemFree);
    std::size_t length = text ? std::wcslen(text) : 0;
    auto* copy = new (std::nothrow) wchar_t[length + 1];
    if (!copy)
        return E_OUTOFMEMORY;
    std::wmemcpy(copy, text ? text : L"", length + 1);
    *path = copy;
    return S_OK;
}

} // namespace

CKXString KXFindFileRecursive(const CKXString& fileName, const CKXString& folder) {
    try {
        return FindRecursive(fileName, folder);
    } catch (const std::bad_alloc&) {
        return {}; // out of memory: found nothing
    }
}

HRESULT KXFindPresetPath(const GUID& clsid, const wchar_t* presetName, CKXString& path) {
    return ut::ExportBoundary([&] { return FindPresetPath(clsid, presetName, path); });
}

HRESULT KXGetObjectCLSIDFromPreset(const GUID& clsid, const wchar_t* presetName, GUID* objectClsid) {
    return ut::ExportBoundary([&] { return ObjectClassOfPreset(clsid, presetName, objectClsid); });
}

HRESULT KXGetObjectCLSIDFromPreset(const GUID& first, const GUID& second, const wchar_t* presetName,
                                   GUID* objectClsid) {
    if (!objectClsid || !presetName)
        return E_POINTER;
    *objectClsid = GUID_NULL;
    return WithPresetManager([&](IGWPresetManager& manager) {
        return manager.GetObjectCLSIDFromPreset(first, second, presetName, objectClsid);
    });
}

HRESULT KXValidateCmdPreset(const GUID& first, const GUID& second, IGWPreset* preset) {
    if (!preset)
        return E_POINTER;
    return WithPresetManager(
        [&](IGWPresetManager& manager) { return manager.ValidateCmdPreset(first, second, preset); });
}

HRESULT KXLoadCmdPreset(const GUID& first, const GUID& second, wchar_t* presetName, IGWPreset** preset) {
    if (!presetName || !preset)
        return E_POINTER;
    *preset = nullptr;
    HRESULT hr = WithPresetManager(
        [&](IGWPresetManager& manager) { return manager.LoadCmdPreset(first, second, presetName, preset); });
    if (FAILED(hr) && *preset) { // a host that hands out and fails: nothing may leak
        (*preset)->Release();
        *preset = nullptr;
    }
    return hr;
}

HRESULT KXCreateObjectFromPreset(const GUID& clsid, const wchar_t* presetName, const GUID& iid, void** object,
                                 IGWPreset** preset, std::vector<CKXString>* folders) {
    return ut::ExportBoundary(
        [&] { return CreateFromPreset(clsid, presetName, iid, object, preset, folders); });
}

HRESULT KXGetFilePathFromPreset(IGWPreset* preset, wchar_t** path) {
    return ut::ExportBoundary([&] { return FilePathOf(preset, path); });
}

namespace ut {

HRESULT TracePresetSearch(const GUID& clsid, const wchar_t* presetName, CKXString& path,
                          std::vector<PresetCandidate>& examined) {
    examined.clear();
    if (!presetName)
        return E_POINTER;
    return ExportBoundary([&] { return Search(clsid, presetName, path, &examined); });
}

CKXString PresetFileName(const wchar_t* presetName) {
    CKXString full(presetName);
    if (!full.Right(static_cast<int>(kExtension.size())).CaseLessEqual(kExtension.data()))
        full += kExtension.data();
    return full;
}

void ClearPresetCache() {
    module::Presets().clear();
}

} // namespace ut
