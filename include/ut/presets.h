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

// `folder` + "\" + `fileName` when that file exists, else the first match in the sub-folders,
// depth first in the order the file system lists them, folders whose names begin with "."
// skipped; the empty string when there is none.
UT_API CKXString KXFindFileRecursive(const CKXString& fileName, const CKXString& folder);
// The preset file of class `clsid` named `presetName`: from the preset cache, else searched over
// the install locations of kinds 0 to 7, a later kind's find replacing an earlier one's.
// S_OK with the path, E_FAIL with an empty one.
UT_API HRESULT KXFindPresetPath(const GUID& clsid, const wchar_t* presetName, CKXString& path);
// The class of the object the preset creates (".Preset" appended to the name when missing).
UT_API HRESULT KXGetObjectCLSIDFromPreset(const GUID& clsid, const wchar_t* presetName, GUID* objectClsid);
// The host preset manager's answers for command presets.
UT_API HRESULT KXGetObjectCLSIDFromPreset(const GUID& first, const GUID& second, const wchar_t* presetName,
                                          GUID* objectClsid);
UT_API HRESULT KXValidateCmdPreset(const GUID& first, const GUID& second, IGWPreset* preset);
UT_API HRESULT KXLoadCmdPreset(const GUID& first, const GUID& second, wchar_t* presetName, IGWPreset** preset);
// Loads the preset `presetName` of class `clsid` (or, for GUID_NULL, the preset file named by
// `presetName`) and creates its object, handed out through `iid` in `object` (IUnknown for
// GUID_NULL); `preset` receives the loaded preset. `folders`, when given, are searched for the
// class's preset sub-folder before the install locations.
UT_API HRESULT KXCreateObjectFromPreset(const GUID& clsid, const wchar_t* presetName, const GUID& iid,
                                        void** object, IGWPreset** preset, std::vector<CKXString>* folders);
// The preset's file, as a new[] array the caller deletes with delete[].
UT_API HRESULT KXGetFilePathFromPreset(IGWPreset* preset, wchar_t** path);

// ---- Thumbnails ---------------------------------------------------------------------------

// S_OK, with 1 when the application has a picture of the scene to give now, else 0.
UT_API HRESULT KXIsThumbnailAvaiable(int* available);
// The scene's picture fitted, aspect kept, into a 64 x 64 device bitmap the caller deletes with
// DeleteObject. E_FAIL when there is no picture.
UT_API HRESULT KXGetThumbnail(HBITMAP* bitmap);
// Writes the scene's picture into the compound file `fileName`; S_FALSE when there is no
// picture (the file is then not opened).
UT_API HRESULT KXPutThumnailInFile(const CKXString& fileName);
