// Presets: stored sets of values that new objects start from, kept as files with the extension
// ".Preset" in "Data\GWPresets" folders below the install locations, in a sub-folder per class.
//
// The application's preset manager answers the scene-manager factory's IGWPresetManager. A
// family command (the class a family was described with, see ut/sdk/families.h) is a host
// service, found with GWQueryGenericObject under its identifier, that answers IGWPresetCommand:
// it makes the presets of its family by name when no file holds them.
//
// The reference host's preset files are UTF-8 JSON objects:
//   {"class": "{...}", "values": [{"id": "{...}", "name": "width", "value": 2.5}]}
// "class" is the class of the object the preset creates; each value is a parameter of that
// object (a number, a string or true/false), set by id. Its favourite folders and the presets its
// family commands make come from ut::host::Settings. Every operation asks
// ut::sdk::CheckHostFault first, under "IGWPresetManager::<method>", "IGWPreset::<method>",
// "IPersistFile::<method>" and "IGWPresetCommand::<method>".
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/file_path.h>
#include <ut/sdk/string.h>

// {65994CA9-C7CE-4C4B-A49E-69529BD2F099} (not fixed by the application; the one this SDK declares)
inline constexpr IID IID_IGWPreset = {
    0x65994CA9, 0xC7CE, 0x4C4B, {0xA4, 0x9E, 0x69, 0x52, 0x9B, 0xD2, 0xF0, 0x99}};
// {22ACCCC4-D280-11D2-80C5-00A0C9AC19A9}
inline constexpr IID IID_IGWPresetManager = {
    0x22ACCCC4, 0xD280, 0x11D2, {0x80, 0xC5, 0x00, 0xA0, 0xC9, 0xAC, 0x19, 0xA9}};
// {65994CAA-C7CE-4C4B-A49E-69529BD2F099}
inline constexpr IID IID_IGWPresetCommand = {
    0x65994CAA, 0xC7CE, 0x4C4B, {0xA4, 0x9E, 0x69, 0x52, 0x9B, 0xD2, 0xF0, 0x99}};

// A loaded preset. The host's presets read from a file also answer IPersistFile, whose
// GetCurFile names that file.
struct IGWPreset : IUnknown {
    // The class of the object the preset creates.
    virtual HRESULT STDMETHODCALLTYPE GetObjectClass(CLSID* clsid) = 0;

protected:
    ~IGWPreset() = default;
};

struct IGWPresetManager : IUnknown {
    // The sub-folder below "Data\GWPresets" that holds the presets of `clsid`, task-allocated;
    // S_FALSE with an empty text for a class without one.
    virtual HRESULT STDMETHODCALLTYPE GetFavoriteFolder(REFCLSID clsid, wchar_t** folder) = 0;
    // The command of the family of `clsid`: S_FALSE with GUID_NULL when none of its families
    // names one.
    virtual HRESULT STDMETHODCALLTYPE GetFamilyCommand(REFCLSID clsid, CLSID* command) = 0;
    // Reads the preset file `file` resolves to: STG_E_FILENOTFOUND when there is none,
    // STG_E_INVALIDHEADER when it holds no preset.
    virtual HRESULT STDMETHODCALLTYPE LoadPreset(IGWFilePath* file, IGWPreset** preset) = 0;
    // Creates the object `preset` describes with its values set, through `iid`.
    // E_NOINTERFACE when the object cannot take the values.
    virtual HRESULT STDMETHODCALLTYPE CreateObject(IGWPreset* preset, REFIID iid, void** object) = 0;
    // Command presets: presets of command `command` by name (made by the command, or the file the
    // name resolves to), which must create objects of class `target` (GUID_NULL: any class).
    virtual HRESULT STDMETHODCALLTYPE GetObjectCLSIDFromPreset(REFGUID command, REFGUID target,
                                                               const wchar_t* name, GUID* objectClsid) = 0;
    // S_OK when `preset` creates a `target`, E_INVALIDARG when it creates another class.
    virtual HRESULT STDMETHODCALLTYPE ValidateCmdPreset(REFGUID command, REFGUID target,
                                                        IGWPreset* preset) = 0;
    // The preset, validated; DISP_E_MEMBERNOTFOUND when the command has none of that name.
    virtual HRESULT STDMETHODCALLTYPE LoadCmdPreset(REFGUID command, REFGUID target, const wchar_t* name,
                                                    IGWPreset** preset) = 0;

protected:
    ~IGWPresetManager() = default;
};

struct IGWPresetCommand : IUnknown {
    // The preset `name` (with its extension) of class `clsid` that the command makes;
    // DISP_E_MEMBERNOTFOUND when it makes none of that name.
    virtual HRESULT STDMETHODCALLTYPE ProducePreset(REFCLSID clsid, const wchar_t* name,
                                                    IGWPreset** preset) = 0;

protected:
    ~IGWPresetCommand() = default;
};

template <>
struct ut::InterfaceId<IGWPreset> : ut::Iid<IID_IGWPreset> {};
template <>
struct ut::InterfaceId<IGWPresetManager> : ut::Iid<IID_IGWPresetManager> {};
template <>
struct ut::InterfaceId<IGWPresetCommand> : ut::Iid<IID_IGWPresetCommand> {};

// The application's preset manager.
UT_SDK_API HRESULT GWGetPresetManager(IGWPresetManager** manager);
// The preset sub-folder of `clsid` as a task-allocated text (empty for a class without one)
// that the caller hands to CKXString::Attach_OLE.
UT_SDK_API HRESULT GWGetFavoritePresetPath(REFCLSID clsid, wchar_t** folder);
// The command of the family of `clsid`; S_FALSE with GUID_NULL when it has none.
UT_SDK_API HRESULT GWGetFamilyCommand(REFCLSID clsid, CLSID* command);

// Paths resolved by the application's conventions, through its file-path object.
class UT_SDK_API CKXPathHelper {
public:
    // The resolved path: S_OK when it names a file or folder that exists, else S_FALSE.
    static HRESULT GetResolvedPath(const CKXString& path, CKXString& resolved);
    // The resolved path without asking the file system.
    static HRESULT GetResolvedPathNoIO(const CKXString& path, CKXString& resolved);
};
