// Presets and scene thumbnails: finding a preset file by class and name over the install
// locations, the class of object a preset creates, objects created from presets, the host's
// command presets; and a 64 x 64 picture of the current scene, as a device bitmap or written into
// a scene file.
#pragma once

#include <vector>

#include <ut/export.h>
#include <ut/platform/bitmap.h>
#include <ut/sdk/presets.h>
#include <ut/sdk/string.h>

// ---- Presets ------------------------------------------------------------------------------
//
// Preset files end in ".Preset", compared without regard to letter case as a user expects of a
// file name: "Spot.preset" is taken as it is, "Spot" becomes "Spot.Preset". They lie in
// "Data\GWPresets\<the class's favourite sub-folder>" below the install locations; paths are
// built with "\", which every home takes as a separator.
//
// The folder search goes depth first and never runs forever: a folder already being searched
// further up (reached again through a link) is not entered again, a folder that cannot be listed
// is passed over, and a folder is listed as it is read, so neither its size nor the depth of the
// tree costs more than one open listing per level.
//
// The preset cache keeps, per class and preset name, the preset's file and the class of the
// object it creates; object creation fills it with every preset it loaded from a file.

// `folder` + "\" + `fileName` when that file exists, else the first match in the sub-folders,
// depth first in the order the file system lists them, folders whose names begin with "."
// skipped; the empty string when there is none.
UT_API CKXString KXFindFileRecursive(const CKXString& fileName, const CKXString& folder);
// The preset file of class `clsid` named `presetName` (its name as it stands): from the preset
// cache, else searched over the install locations of kinds 0 to 7 (kinds 4 to 6 at any depth
// below each location), a later kind's find replacing an earlier one's. S_OK with the path,
// E_FAIL with an empty one; a failure to list the locations is returned.
UT_API HRESULT KXFindPresetPath(const GUID& clsid, const wchar_t* presetName, CKXString& path);
// The class of the object the preset creates, from the cache or by creating the object.
UT_API HRESULT KXGetObjectCLSIDFromPreset(const GUID& clsid, const wchar_t* presetName, GUID* objectClsid);
// The host preset manager's command presets (see IGWPresetManager); any success is S_OK.
UT_API HRESULT KXGetObjectCLSIDFromPreset(const GUID& first, const GUID& second, const wchar_t* presetName,
                                          GUID* objectClsid);
UT_API HRESULT KXValidateCmdPreset(const GUID& first, const GUID& second, IGWPreset* preset);
UT_API HRESULT KXLoadCmdPreset(const GUID& first, const GUID& second, wchar_t* presetName,
                               IGWPreset** preset);
// Loads the preset `presetName` of class `clsid` and creates its object, handed out through `iid`
// (IUnknown for GUID_NULL) in `object`; `preset`, when given, receives the loaded preset, and
// with a null `object` the preset is only loaded. The file is the cached one, else the first of
// `folders` (each joined with the class's favourite sub-folder and resolved by the host) that
// holds it, else the preset search's; a preset no file holds is asked of the command of the
// class's family. For GUID_NULL `presetName` is a file (as given, resolved by the host, or
// searched for) and E_INVALIDARG when there is none. E_INVALIDARG when both outputs are null.
UT_API HRESULT KXCreateObjectFromPreset(const GUID& clsid, const wchar_t* presetName, const GUID& iid,
                                        void** object, IGWPreset** preset, std::vector<CKXString>* folders);
// The preset's file, as a new[] array the caller deletes with delete[]; E_NOINTERFACE for a
// preset that has no file.
UT_API HRESULT KXGetFilePathFromPreset(IGWPreset* preset, wchar_t** path);

namespace ut {

// One location the preset search looked at: its kind, the location, and the preset file found
// there (empty when none).
struct PresetCandidate {
    int kind;
    CKXString location;
    CKXString found;
};
// The preset search of KXFindPresetPath without the cache, telling every location it examined in
// order; the result and `path` are KXFindPresetPath's.
UT_API HRESULT TracePresetSearch(const GUID& clsid, const wchar_t* presetName, CKXString& path,
                                 std::vector<PresetCandidate>& examined);
// `presetName` as a preset file's name: with ".Preset" appended unless it already ends so.
UT_API CKXString PresetFileName(const wchar_t* presetName);
// Forgets every cached preset, for when preset files were moved or removed.
UT_API void ClearPresetCache();

} // namespace ut

// ---- Thumbnails ---------------------------------------------------------------------------

// S_OK, with 1 when the application has a picture of the scene to give now, else 0.
UT_API HRESULT KXIsThumbnailAvaiable(int* available);
// The scene's picture fitted, aspect kept, into a 64 x 64 device bitmap the caller deletes with
// DeleteObject. E_FAIL when there is no picture.
UT_API HRESULT KXGetThumbnail(HBITMAP* bitmap);
// Writes the scene's picture into the compound file `fileName`; S_FALSE when there is no
// picture (the file is then not opened).
UT_API HRESULT KXPutThumnailInFile(const CKXString& fileName);
