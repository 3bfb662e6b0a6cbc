// The reference host's preset manager: preset files in JSON, favourite folders, family commands
// and command presets.
#include "preset_manager.h"

#include <string>

#include <nlohmann/json.hpp>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/stream.h>
#include <ut/platform/strings.h>
#include <ut/platform/text.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/families.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/testing.h>

#include "host_support.h"
#include "property_set.h"

namespace ut::host {
namespace {

using Json = nlohmann::json;

// {65994CAB-C7CE-4C4B-A49E-69529BD2F099}: the class of the host's preset objects.
constexpr CLSID kPresetClass = {0x65994CAB, 0xC7CE, 0x4C4B, {0xA4, 0x9E, 0x69, 0x52, 0x9B, 0xD2, 0xF0, 0x99}};

std::string Utf8(const std::wstring& text) {
    return ut::platform::Utf8FromWide(text);
}

std::wstring Wide(const std::string& text) {
    return ut::platform::WideFromUtf8(text);
}

// The preset from a file's JSON text; false when the text is no preset.
bool ParsePreset(const std::string& text, PresetDescription& preset) {
    Json json = Json::parse(text, nullptr, false);
    if (!json.is_object() || !json.contains("class") || !json["class"].is_string() ||
        FAILED(ut::ParseGuid(Wide(json["class"].get<std::string>()).c_str(), &preset.objectClass)))
        return false;
    preset.values.clear();
    const Json& values = json.contains("values") ? json["values"] : Json::array();
    if (!values.is_array())
        return false;
    for (const Json& value : values) {
        ParameterDescription parameter;
        if (!value.is_object() || !value.contains("id") || !value["id"].is_string() ||
            FAILED(ut::ParseGuid(Wide(value["id"].get<std::string>()).c_str(), &parameter.id)))
            return false;
        if (value.contains("name") && value["name"].is_string())
            parameter.name = Wide(value["name"].get<std::string>());
        const Json& held = value.contains("value") ? value["value"] : Json();
        if (held.is_boolean())
            parameter.value = held.get<bool>();
        else if (held.is_number())
            parameter.value = held.get<double>();
        else if (held.is_string())
            parameter.value = Wide(held.get<std::string>());
        else
            return false;
        preset.values.push_back(std::move(parameter));
    }
    return true;
}

std::string FormatPreset(const PresetDescription& preset) {
    Json values = Json::array();
    for (const ParameterDescription& parameter : preset.values) {
        Json value = {{"id", Utf8(GuidToString(parameter.id))}, {"name", Utf8(parameter.name)}};
        std::visit(
            [&](const auto& held) {
                if constexpr (std::is_same_v<std::decay_t<decltype(held)>, std::wstring>)
                    value["value"] = Utf8(held);
                else
                    value["value"] = held;
            },
            parameter.value);
        values.push_back(std::move(value));
    }
    return Json{{"class", Utf8(GuidToString(preset.objectClass))}, {"values", values}}.dump(2) + "\n";
}

// Names of presets are compared as file names: letter case ignored.
bool SameName(const std::wstring& a, const std::wstring& b) {
    return ut::platform::CompareWideNoCase(a.c_str(), b.c_str()) == 0;
}

// The command preset `name` of `command`, ".Preset" optional; null when there is none.
const PresetDescription* FindCommandPreset(const std::vector<PresetDescription>& presets, REFCLSID command,
                                           const std::wstring& name) {
    for (const PresetDescription& preset : presets)
        if (IsEqualGUID(preset.command, command) &&
            (SameName(preset.name, name) || SameName(preset.name, name + L".Preset")))
            return &preset;
    return nullptr;
}

HRESULT HandOutPreset(ut::ComPtr<Preset> made, IGWPreset** preset) {
    if (!made)
        return E_OUTOFMEMORY;
    *preset = made.Detach();
    return S_OK;
}

// The class a family was described with, read where the families manager keeps it.
CLSID FamilyClass(REFGUID family) {
    std::wstring key = std::wstring(sdk::kFamiliesBranch) + L"\\" + GuidToString(family);
    std::wstring text;
    CLSID clsid = GUID_NULL;
    UniqueHKey opened = sdk::OpenKey(HKEY_LOCAL_MACHINE, key.c_str());
    if (opened && sdk::ReadText(opened.get(), L"Class", text) == ERROR_SUCCESS)
        (void)ut::ParseGuid(text.c_str(), &clsid); // unreadable text names no command
    return clsid;
}

// Sets the preset's values on a host object's parameters, replacing those of the same id.
void SetValues(PropertyData& data, const std::vector<ParameterDescription>& values) {
    for (const ParameterDescription& value : values) {
        if (ParameterDescription* existing = data.FindParameter(value.id))
            *existing = value;
        else
            data.parameters.push_back(value);
    }
}

// The parameters of a host object that takes values: a plug-in object or a property set.
PropertyData* ParametersOf(IUnknown* object, ut::ComPtr<PropertySet>& set) {
    if (auto* plugin = dynamic_cast<PluginObject*>(static_cast<CGWCOMObject*>(object)))
        return &plugin->Data();
    set = OwnPropertySet(object);
    return set ? &set->Data() : nullptr;
}

} // namespace

HRESULT ReadPresetFile(const std::wstring& path, PresetDescription& preset) {
    ut::ComPtr<IStream> stream;
    if (HRESULT hr = ut::platform::OpenFileStream(path.c_str(), STGM_READ, stream.Put()); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        std::string text;
        char buffer[4096];
        for (ULONG read = 0;; text.append(buffer, read)) {
            if (HRESULT hr = stream->Read(buffer, sizeof buffer, &read); FAILED(hr))
                return hr;
            if (read == 0)
                break;
        }
        return ParsePreset(text, preset) ? S_OK : STG_E_INVALIDHEADER;
    });
}

HRESULT WritePresetFile(const std::wstring& path, const PresetDescription& preset) {
    return ExportBoundary([&] {
        std::string text = FormatPreset(preset);
        ut::ComPtr<IStream> stream;
        if (HRESULT hr = ut::platform::OpenFileStream(path.c_str(), STGM_WRITE | STGM_CREATE, stream.Put());
            FAILED(hr))
            return hr;
        ULONG written = 0;
        HRESULT hr = stream->Write(text.data(), static_cast<ULONG>(text.size()), &written);
        return FAILED(hr) ? hr : written == text.size() ? S_OK : STG_E_MEDIUMFULL;
    });
}

std::span<const CGWCOMObject::InterfaceEntry> Preset::GetInterfaceMap() const {
    static const InterfaceEntry withFile[] = {sdk::Entry<Preset, IGWPreset>(IID_IGWPreset),
                                              sdk::Entry<Preset, IPersist>(IID_IPersist),
                                              sdk::Entry<Preset, IPersistFile>(IID_IPersistFile)};
    static const InterfaceEntry made[] = {sdk::Entry<Preset, IGWPreset>(IID_IGWPreset)};
    if (file_.empty())
        return made;
    return withFile;
}

HRESULT Preset::GetObjectClass(CLSID* clsid) {
    if (!clsid)
        return E_POINTER;
    *clsid = GUID_NULL;
    if (HRESULT hr = sdk::CheckHostFault("IGWPreset::GetObjectClass"); FAILED(hr))
        return hr;
    *clsid = description_.objectClass;
    return S_OK;
}

HRESULT Preset::GetClassID(CLSID* clsid) {
    if (!clsid)
        return E_POINTER;
    *clsid = kPresetClass;
    return S_OK;
}

HRESULT Preset::Load(LPCOLESTR name, DWORD) {
    if (!name)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IPersistFile::Load"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        PresetDescription read;
        if (HRESULT hr = ReadPresetFile(name, read); FAILED(hr))
            return hr;
        description_ = std::move(read);
        file_ = name;
        return S_OK;
    });
}

HRESULT Preset::Save(LPCOLESTR name, BOOL remember) {
    if (HRESULT hr = sdk::CheckHostFault("IPersistFile::Save"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        std::wstring target = name ? name : file_;
        if (target.empty())
            return E_INVALIDARG;
        HRESULT hr = WritePresetFile(target, description_);
        if (SUCCEEDED(hr) && remember)
            file_ = target;
        return hr;
    });
}

HRESULT Preset::GetCurFile(LPOLESTR* name) {
    if (!name)
        return E_POINTER;
    *name = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IPersistFile::GetCurFile"); FAILED(hr))
        return hr;
    return ExportBoundary([&] { return CopyToTaskMemory(file_, name); });
}

PresetManager::PresetManager(const Settings& settings)
    : folders_(settings.presetFolders),
      commandPresets_(std::make_shared<const std::vector<PresetDescription>>(settings.commandPresets)) {}

std::span<const CGWCOMObject::InterfaceEntry> PresetManager::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<PresetManager, IGWPresetManager>(IID_IGWPresetManager)};
    return map;
}

HRESULT PresetManager::GetFavoriteFolder(REFCLSID clsid, wchar_t** folder) {
    if (!folder)
        return E_POINTER;
    *folder = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::GetFavoriteFolder"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        std::wstring found;
        for (const auto& [owner, sub] : folders_)
            if (IsEqualGUID(owner, clsid))
                found = sub;
        HRESULT hr = CopyToTaskMemory(found, folder);
        return SUCCEEDED(hr) && found.empty() ? S_FALSE : hr;
    });
}

HRESULT PresetManager::GetFamilyCommand(REFCLSID clsid, CLSID* command) {
    if (!command)
        return E_POINTER;
    *command = GUID_NULL;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::GetFamilyCommand"); FAILED(hr))
        return hr;
    ut::ComPtr<IGWFamiliesManager> families;
    if (HRESULT hr = GWGetFamiliesManager(families.Put()); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        ULONG count = 0;
        if (HRESULT hr = families->GetClassFamilies(clsid, 0, nullptr, &count); FAILED(hr))
            return hr;
        std::vector<GUID> ids(count);
        if (HRESULT hr = families->GetClassFamilies(clsid, count, ids.data(), &count); FAILED(hr))
            return hr;
        ids.resize(std::min<std::size_t>(count, ids.size()));
        for (const GUID& family : ids) {
            *command = FamilyClass(family);
            if (!IsEqualGUID(*command, GUID_NULL))
                return S_OK;
        }
        return S_FALSE;
    });
}

HRESULT PresetManager::LoadPreset(IGWFilePath* file, IGWPreset** preset) {
    if (!file || !preset)
        return E_POINTER;
    *preset = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::LoadPreset"); FAILED(hr))
        return hr;
    wchar_t* text = nullptr;
    if (HRESULT hr = file->GetResolvedPath(&text); FAILED(hr)) {
        CoTaskMemFree(text);
        return hr;
    }
    CKXString path;
    path.Attach_OLE(text);
    ut::ComPtr<Preset> made = Make<Preset>();
    if (!made)
        return E_OUTOFMEMORY;
    if (HRESULT hr = made->Load(path, STGM_READ); FAILED(hr))
        return hr;
    return HandOutPreset(std::move(made), preset);
}

HRESULT PresetManager::CreateObject(IGWPreset* preset, REFIID iid, void** object) {
    if (!preset || !object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::CreateObject"); FAILED(hr))
        return hr;
    CLSID objectClass = GUID_NULL;
    if (HRESULT hr = preset->GetObjectClass(&objectClass); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> made;
    if (HRESULT hr = KXCreateInstance(objectClass, IID_IUnknown, made.PutVoid()); FAILED(hr))
        return hr;
    // Only the host's own presets carry values it can read.
    auto* own = dynamic_cast<Preset*>(preset);
    if (own && !own->Description().values.empty()) {
        ut::ComPtr<PropertySet> set;
        PropertyData* data = ParametersOf(made.Get(), set);
        if (!data)
            return E_NOINTERFACE;
        if (HRESULT hr = ExportBoundary([&] {
                SetValues(*data, own->Description().values);
                return S_OK;
            });
            FAILED(hr))
            return hr;
    }
    return made->QueryInterface(iid, object);
}

HRESULT PresetManager::GetObjectCLSIDFromPreset(REFGUID command, REFGUID target, const wchar_t* name,
                                                GUID* objectClsid) {
    if (!objectClsid)
        return E_POINTER;
    *objectClsid = GUID_NULL;
    ut::ComPtr<IGWPreset> preset;
    if (HRESULT hr = LoadCmdPreset(command, target, name, preset.Put()); FAILED(hr))
        return hr;
    return preset->GetObjectClass(objectClsid);
}

HRESULT PresetManager::ValidateCmdPreset(REFGUID, REFGUID target, IGWPreset* preset) {
    if (!preset)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::ValidateCmdPreset"); FAILED(hr))
        return hr;
    CLSID objectClass = GUID_NULL;
    if (HRESULT hr = preset->GetObjectClass(&objectClass); FAILED(hr))
        return hr;
    return IsEqualGUID(target, GUID_NULL) || IsEqualGUID(target, objectClass) ? S_OK : E_INVALIDARG;
}

HRESULT PresetManager::LoadCmdPreset(REFGUID command, REFGUID target, const wchar_t* name,
                                     IGWPreset** preset) {
    if (!name || !preset)
        return E_POINTER;
    *preset = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetManager::LoadCmdPreset"); FAILED(hr))
        return hr;
    ut::ComPtr<Preset> made;
    if (const PresetDescription* found = FindCommandPreset(*commandPresets_, command, name)) {
        made = Make<Preset>(*found);
    } else if (KXIsFileExist(name)) {
        if ((made = Make<Preset>()) && FAILED(made->Load(name, STGM_READ)))
            return STG_E_INVALIDHEADER;
    } else {
        return DISP_E_MEMBERNOTFOUND;
    }
    if (!made)
        return E_OUTOFMEMORY;
    if (HRESULT hr = ValidateCmdPreset(command, target, made.Get()); FAILED(hr))
        return hr;
    return HandOutPreset(std::move(made), preset);
}

std::span<const CGWCOMObject::InterfaceEntry> PresetCommand::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<PresetCommand, IGWPresetCommand>(IID_IGWPresetCommand)};
    return map;
}

HRESULT PresetCommand::ProducePreset(REFCLSID, const wchar_t* name, IGWPreset** preset) {
    if (!name || !preset)
        return E_POINTER;
    *preset = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWPresetCommand::ProducePreset"); FAILED(hr))
        return hr;
    const PresetDescription* found = FindCommandPreset(*presets_, command_, name);
    return found ? HandOutPreset(Make<Preset>(*found), preset) : DISP_E_MEMBERNOTFOUND;
}

std::span<const CGWCOMObject::InterfaceEntry> PluginObject::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<PluginObject, IGWProperties>(IID_IGWProperties),
                                         sdk::Entry<PluginObject, IPersist>(IID_IPersist)};
    return map;
}

HRESULT PluginObject::GetClassID(CLSID* clsid) {
    if (!clsid)
        return E_POINTER;
    *clsid = Data().clsid;
    return sdk::CheckHostFault("IPersist::GetClassID");
}

std::vector<std::pair<CLSID, ut::ComPtr<IClassFactory>>> PluginClassFactories(const Settings& settings) {
    std::vector<std::pair<CLSID, ut::ComPtr<IClassFactory>>> factories;
    for (const CLSID& clsid : settings.pluginClasses)
        factories.emplace_back(clsid, Make<ClassFactory>([clsid](IUnknown** made) -> HRESULT {
                                          ut::ComPtr<PluginObject> object = Make<PluginObject>(clsid);
                                          *made =
                                              object ? static_cast<CGWCOMObject*>(object.Detach()) : nullptr;
                                          return *made ? S_OK : E_OUTOFMEMORY;
                                      }).Get());
    return factories;
}

std::vector<std::pair<CLSID, ut::ComPtr<IUnknown>>> PresetCommandServices(const Settings& settings) {
    auto presets = std::make_shared<const std::vector<PresetDescription>>(settings.commandPresets);
    std::vector<std::pair<CLSID, ut::ComPtr<IUnknown>>> services;
    for (const PresetDescription& preset : settings.commandPresets) {
        bool known = false;
        for (const auto& service : services)
            known = known || IsEqualGUID(service.first, preset.command);
        if (!known)
            services.emplace_back(preset.command, ut::ComPtr<IUnknown>(static_cast<CGWCOMObject*>(
                                                      Make<PresetCommand>(preset.command, presets).Get())));
    }
    return services;
}

} // namespace ut::host
