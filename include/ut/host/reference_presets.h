// The reference host's presets: what a preset file holds, and its files read and written.
#pragma once

#include <string>
#include <vector>

#include <ut/host/reference_scene.h>
#include <ut/platform/com.h>

namespace ut::host {

// A preset: the class of the object it creates and the values set on it (parameters by id). A
// preset that a family command makes also names the command and the preset (with ".Preset").
struct PresetDescription {
    CLSID objectClass = GUID_NULL;
    std::vector<ParameterDescription> values = {};
    CLSID command = GUID_NULL;
    std::wstring name = {};
};

// Preset files as ut/sdk/presets.h describes them. Reading: STG_E_FILENOTFOUND for a missing
// file, STG_E_INVALIDHEADER for one that holds no preset; other failures of the file pass through.
HRESULT ReadPresetFile(const std::wstring& path, PresetDescription& preset);
HRESULT WritePresetFile(const std::wstring& path, const PresetDescription& preset);

} // namespace ut::host
