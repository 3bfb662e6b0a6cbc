// The reference host's preset manager, its presets (files in JSON, or made by a family command)
// and the family commands' services.
#pragma once

#include <memory>
#include <utility>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/presets.h>

#include "property_set.h"

namespace ut::host {

// A preset with the file it was read from; a preset made by a command has no file and then
// answers no IPersistFile.
class Preset final : public ut::sdk::ComObject<IGWPreset, IPersistFile> {
public:
    Preset() = default;
    explicit Preset(PresetDescription description) : description_(std::move(description)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetObjectClass(CLSID* clsid) override;
    HRESULT STDMETHODCALLTYPE GetClassID(CLSID* clsid) override;
    HRESULT STDMETHODCALLTYPE IsDirty() override { return S_FALSE; }
    HRESULT STDMETHODCALLTYPE Load(LPCOLESTR name, DWORD mode) override;
    // Writes the preset to `name` (null: its own file).
    HRESULT STDMETHODCALLTYPE Save(LPCOLESTR name, BOOL remember) override;
    HRESULT STDMETHODCALLTYPE SaveCompleted(LPCOLESTR) override { return S_OK; }
    HRESULT STDMETHODCALLTYPE GetCurFile(LPOLESTR* name) override;

    const PresetDescription& Description() const { return description_; }

private:
    PresetDescription description_;
    std::wstring file_;
};

using CommandPresets = std::shared_ptr<const std::vector<PresetDescription>>;

class PresetManager final : public ut::sdk::ComObject<IGWPresetManager> {
public:
    explicit PresetManager(const Settings& settings);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetFavoriteFolder(REFCLSID clsid, wchar_t** folder) override;
    HRESULT STDMETHODCALLTYPE GetFamilyCommand(REFCLSID clsid, CLSID* command) override;
    HRESULT STDMETHODCALLTYPE LoadPreset(IGWFilePath* file, IGWPreset** preset) override;
    HRESULT STDMETHODCALLTYPE CreateObject(IGWPreset* preset, REFIID iid, void** object) override;
    HRESULT STDMETHODCALLTYPE GetObjectCLSIDFromPreset(REFGUID command, REFGUID target, const wchar_t* name,
                                                       GUID* objectClsid) override;
    HRESULT STDMETHODCALLTYPE ValidateCmdPreset(REFGUID command, REFGUID target, IGWPreset* preset) override;
    HRESULT STDMETHODCALLTYPE LoadCmdPreset(REFGUID command, REFGUID target, const wchar_t* name,
                                            IGWPreset** preset) override;

private:
    std::vector<std::pair<CLSID, std::wstring>> folders_;
    CommandPresets commandPresets_;
};

// The service of one family command: the presets of `commandPresets` it names.
class PresetCommand final : public ut::sdk::ComObject<IGWPresetCommand> {
public:
    PresetCommand(const CLSID& command, CommandPresets presets)
        : command_(command), presets_(std::move(presets)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE ProducePreset(REFCLSID clsid, const wchar_t* name, IGWPreset** preset) override;

private:
    CLSID command_;
    CommandPresets presets_;
};

// A plug-in object of one of the settings' plug-in classes: its class, and parameters.
class PluginObject final : public PropertiesObject<IPersist> {
public:
    explicit PluginObject(const CLSID& clsid) { Data().clsid = clsid; }

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetClassID(CLSID* clsid) override;
};

// The class factory of every plug-in class of the settings, with its class.
std::vector<std::pair<CLSID, ut::ComPtr<IClassFactory>>> PluginClassFactories(const Settings& settings);

// The service of every command the settings' command presets name, with its id.
std::vector<std::pair<CLSID, ut::ComPtr<IUnknown>>> PresetCommandServices(const Settings& settings);

} // namespace ut::host
