// Sources and clips of the current scene: their containers, lists of one class, the source of a
// file, the clips of a source, and an object's top-most operator of a class.
//
// Not found is S_FALSE (DISP_E_MEMBERNOTFOUND for F3DGetTopMostOp); out-parameters are cleared
// first and stay null on failure, except the list of F3DFindAllSources, which is made first and
// handed back with what was found when the search fails part way.
#pragma once

#include <utility>
#include <vector>

#include <ut/export.h>
#include <ut/sdk/list.h>
#include <ut/sdk/sources.h>
#include <ut/sdk/string.h>

// The current scene's sources or clips container, through `iid`.
UT_API HRESULT F3DGetSourcesContainer(const GUID& iid, void** out);
UT_API HRESULT F3DGetClipsContainer(const GUID& iid, void** out);

// The members of class `classId` of the container kept under `containerKey` (the sources key,
// the clips key, or any key of the content container), in the container's order: S_OK with a
// list of at least one, S_FALSE with an empty list, E_FAIL when a step fails.
UT_API HRESULT F3DGetObjectsListFromContainer(const GUID& containerKey, const GUID& classId, I3DList** out);
UT_API HRESULT F3DGetSourcesList(const GUID& classId, I3DList** out);
UT_API HRESULT F3DGetClipsList(const GUID& classId, I3DList** out);

// The first source of `sourceClass` whose path equals `path` (GWFilePathsEqual), through `iid`.
// An empty `path`, or a source without a path met before the match, ends the search: S_FALSE.
UT_API HRESULT F3DFindSource(const GUID& sourceClass, const CKXString& path, const GUID& iid, void** out);
// Every such source, in order; a source without a path is passed over.
UT_API HRESULT F3DFindAllSources(const GUID& sourceClass, const CKXString& path, I3DList** out);
UT_API HRESULT F3DFindImageSource(const wchar_t* path, const GUID& iid, void** out);

// The first clip of `clipClass` whose source is `source` itself (its IUnknown identity: no
// other interface pointer of the source matches), through `iid`. E_INVALIDARG for a null source.
UT_API HRESULT F3DFindClip(const GUID& clipClass, IUnknown* source, const GUID& iid, void** out);
UT_API HRESULT F3DFindImageClip(IUnknown* source, const GUID& iid, void** out);

// The first operator of class `classId` on the operator stack of `object`, top first, through
// `iid`; `scope` and `depth` go to the host as its filters. DISP_E_MEMBERNOTFOUND when there is
// none or the object has no stack.
UT_API HRESULT F3DGetTopMostOp(IUnknown* object, unsigned long scope, unsigned long depth,
                               const GUID& classId, const GUID& iid, void** out);

// (index, name) of the image clips, or of the image sources and then the CLSID_3DListedSource
// sources, leaving out hidden ones; the index counts every element of the list, hidden ones too.
// With `sort`, ordered by name without regard to case (indexes kept). S_FALSE for none.
UT_API HRESULT F3DMakeClipList(std::vector<std::pair<unsigned int, CKXString>>& entries, bool sort);
UT_API HRESULT F3DMakeSourceList(std::vector<std::pair<unsigned int, CKXString>>& entries, bool sort);

// The folder that holds `action` (the first of its owners, IGWActiveData's GWQUERY_OWNERS),
// through `iid`; E_FAIL when it has none.
UT_API HRESULT KXGetPrimaryFolderForAction(IUnknown* action, const GUID& iid, void** out);
