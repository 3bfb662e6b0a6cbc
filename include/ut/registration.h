// Class registration: the registry entries by which plug-in classes, their names and paths, views,
// editors and source operators are known, written by the modules' register and unregister entry
// points and read back by the application.
//
// Layout, under HKEY_LOCAL_MACHINE. The module's base key is the text GWResourceConstructRegKey
// gives for this library when it loads; it ends in a backslash. A category key is the base key
// with the category's name appended ("Operator", "Property", "Primitive", "View",
// "PointLocatorArray", "Constraint", "Inspector View", "Manipulator", "Translator", "Resources", or
// any name a caller gives). A class key below it is named by the class's braced upper-case
// identifier text and holds one REG_SZ value, "Name" (display name) or "Path", with its
// terminator. A manipulator's class key also holds one empty sub-key per 3D control class.
// Explorer and animation-editor registrations live below the base key too:
//   "Animation Editor\DefaultTree", "QVX Explorer\DefaultTree"  "CLSID"
//   "Animation Editor\DefaultView"                  "CLSID", and "SOURCEOP" when one is given
//   "QVX Explorer\DefaultEditor"                    "CLSID" (read and removed, never written here)
//   "<tool>\SourceOps\<source operator>"            REG_DWORD 1 named by each view's identifier
//   "QVX Explorer\FamilySourceOps\<family>"         REG_DWORD 1 named by each view's identifier
// Keys opened for reading ask for KEY_READ, keys opened or created for writing for
// KEY_READ | KEY_WRITE. GUID_NULL stands for an absent class, companion or family.
//
// Results. Registration returns the first negative result of the host's registration services
// unchanged and stops there; a registry write of its own that fails gives 1 (S_FALSE), never a
// failure code, and the Ex forms then still go on to the families. Nothing is rolled back.
// Unregistration never stops early (except KXUnRegisterManipulator, see there) and returns the
// result of its last step. Callers test results for being non-negative.
//
// Every call runs its registry calls in one registry transaction where the registry has them: a
// registration reaches the disk once, and a lookup sees one state of the registry. What was
// written is kept even when a later step fails. Calls that need the base key answer E_UNEXPECTED
// while the library is not loaded.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/sdk/string.h>

// --- Primitives --------------------------------------------------------------------------------

// Writes the REG_SZ value `valueName` = `value` into the class key of `clsid` under the category
// `keyName`, creating both keys as needed. 0 on success, 1 when a registry step failed. A null
// `value` is a programming error: the keys are created and E_FAIL is returned.
UT_API HRESULT KXAddRegistryKey(const GUID& clsid, const wchar_t* keyName, const wchar_t* valueName,
                                const wchar_t* value);
// Deletes the class key of `clsid` from the category `keyName`: 0 when it was deleted, 1
// otherwise (a class key that still has sub-keys stays). The category key is created when it is
// missing, deliberately, rather than treated as absent.
UT_API HRESULT KXRemRegistryKey(const GUID& clsid, const wchar_t* keyName);

// --- Registration ------------------------------------------------------------------------------
// Each form enters the class through GWRegisterCOMObject (except the path forms) and writes its
// category record. Name texts given by string identifier come from KXDictLoadInstanceIdstring of
// `module`; an identifier of 0 answers E_FAIL before anything is touched.

UT_API HRESULT KXRegisterOperator(const GUID& clsid, HINSTANCE module, const wchar_t* name);
UT_API HRESULT KXRegisterProperty(const GUID& clsid, HINSTANCE module, const wchar_t* name);
UT_API HRESULT KXRegisterPrimitive(const GUID& clsid, HINSTANCE module, const wchar_t* name);
UT_API HRESULT KXRegisterView(const GUID& clsid, HINSTANCE module, const wchar_t* name);
UT_API HRESULT KXRegisterPointLocatorArray(const GUID& clsid, HINSTANCE module, const wchar_t* name);
UT_API HRESULT KXRegisterOperator(const GUID& clsid, HINSTANCE module, unsigned int nameId);
UT_API HRESULT KXRegisterProperty(const GUID& clsid, HINSTANCE module, unsigned int nameId);
UT_API HRESULT KXRegisterPrimitive(const GUID& clsid, HINSTANCE module, unsigned int nameId);
UT_API HRESULT KXRegisterView(const GUID& clsid, HINSTANCE module, unsigned int nameId);

// The class, its "Name" record, then the six-argument KXRegisterInspectableObject: the companion
// class and the family, which is created first.
UT_API HRESULT KXRegisterOperatorEx(const GUID& clsid, HINSTANCE module, unsigned int nameId,
                                    const GUID& companion, unsigned int companionNameId, const GUID& family);
UT_API HRESULT KXRegisterPropertyEx(const GUID& clsid, HINSTANCE module, unsigned int nameId,
                                    const GUID& companion, unsigned int companionNameId, const GUID& family);
// The class, its "Name" record, then the eight-argument KXRegisterInspectableObject: the companion
// class and the memberships in `familyCount` families (none when `families` is null).
UT_API HRESULT KXRegisterOperatorEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                    const GUID& companion, unsigned int companionNameId,
                                    unsigned int familyCount, const GUID* families);
UT_API HRESULT KXRegisterPropertyEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                    const GUID& companion, unsigned int companionNameId,
                                    unsigned int familyCount, const GUID* families);
UT_API HRESULT KXRegisterPrimitiveEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                     const GUID& companion, unsigned int companionNameId,
                                     unsigned int familyCount, const GUID* families);
UT_API HRESULT KXRegisterConstraint(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                    const GUID& companion, unsigned int companionNameId,
                                    unsigned int familyCount, const GUID* families);

// A class in a category of the caller's: "Name" (with the COM entry) or "Path" (without).
UT_API HRESULT KXRegisterKeyName(const GUID& clsid, const wchar_t* keyName, HINSTANCE module,
                                 const wchar_t* name);
UT_API HRESULT KXRegisterKeyNameId(const GUID& clsid, const wchar_t* keyName, HINSTANCE module,
                                   unsigned int nameId);
UT_API HRESULT KXRegisterKeyPath(const GUID& clsid, const wchar_t* keyName, const wchar_t* path);
// "Path" records in "Translator" and "Resources", without a COM entry.
UT_API HRESULT KXRegisterTranslator(const GUID& clsid, const wchar_t* path);
UT_API HRESULT KXRegisterResources(const GUID& clsid, const wchar_t* path);
// An inspector class of a view: its name, in the COM entry and in "Inspector View", is the
// identifier text of the inspected view (KXGetObjectInspectorView reads it back).
UT_API HRESULT KXRegisterViewInspector(const GUID& clsid, HINSTANCE module, const GUID& inspectedView);
// A manipulator with its 3D control classes, each an empty sub-key of its class key. Any earlier
// registration of the class is removed first. E_INVALIDARG for no controls and E_POINTER for a
// null list, before anything is touched; E_FAIL when a key of the controls cannot be opened or
// created (the keys made so far stay).
UT_API HRESULT KXRegisterManipulator(const GUID& clsid, HINSTANCE module, const wchar_t* name,
                                     unsigned int controlCount, const GUID* controls);
// GWRegisterObjectFamilies with the text of `nameId` (not checked for 0).
UT_API HRESULT KXRegisterObjectFamilies(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                        unsigned int familyCount, const GUID* families);

// The companion class (under the text of `companionNameId`) when there is one, then the
// memberships of `clsid` in the families under the text of `nameId`, passing `flag` through.
// Returns the companion's result when there is no class or family list.
UT_API HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int nameId,
                                           bool flag, const GUID& companion, unsigned int companionNameId,
                                           unsigned int familyCount, const GUID* families);
// The same with one family, or none when `family` is GUID_NULL.
UT_API HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int nameId,
                                           bool flag, const GUID& companion, unsigned int companionNameId,
                                           const GUID& family);
// Deliberately different from the forms above: `nameId` is not used at all; the text of
// `companionNameId` names both the companion class and the family membership; the family is
// created first (GWRegisterFamily, as a "MISC_FAMILY"); and the membership's flag is always true.
UT_API HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int nameId,
                                           const GUID& companion, unsigned int companionNameId,
                                           const GUID& family);

// --- Unregistration ----------------------------------------------------------------------------

// Removes the COM entry and the category record, then hands the category key to GwRegCleanKey;
// returns KXRemRegistryKey's result.
UT_API HRESULT KXUnRegisterOperator(const GUID& clsid);
UT_API HRESULT KXUnRegisterProperty(const GUID& clsid);
UT_API HRESULT KXUnRegisterPrimitive(const GUID& clsid);
UT_API HRESULT KXUnRegisterView(const GUID& clsid);
UT_API HRESULT KXUnRegisterPointLocatorArray(const GUID& clsid);
UT_API HRESULT KXUnRegisterViewInspector(const GUID& clsid);
// The same without using their results, ending in the five-argument KXUnRegisterInspectableObject.
UT_API HRESULT KXUnRegisterOperatorEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                      const GUID* families, HINSTANCE module);
UT_API HRESULT KXUnRegisterPropertyEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                      const GUID* families, HINSTANCE module);
UT_API HRESULT KXUnRegisterPrimitiveEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                       const GUID* families, HINSTANCE module);
UT_API HRESULT KXUnRegisterConstraint(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                      const GUID* families, HINSTANCE module);
// The same, ending in the four-argument KXUnRegisterInspectableObject.
UT_API HRESULT KXUnRegisterOperatorEx(const GUID& clsid, const GUID& companion, const GUID& family,
                                      HINSTANCE module);
UT_API HRESULT KXUnRegisterPropertyEx(const GUID& clsid, const GUID& companion, const GUID& family,
                                      HINSTANCE module);
// Remove the record without cleaning the category key, which stays even when empty.
UT_API HRESULT KXUnRegisterKeyName(const GUID& clsid, const wchar_t* keyName);
UT_API HRESULT KXUnRegisterTranslator(const GUID& clsid);
UT_API HRESULT KXUnRegisterResources(const GUID& clsid);
// Removes the COM entry and the class key with its controls. E_FAIL when the "Manipulator"
// category cannot be opened; otherwise deliberately 1 (S_FALSE) after a successful removal, the
// result of a last KXRemRegistryKey that finds the class key already gone.
UT_API HRESULT KXUnRegisterManipulator(const GUID& clsid);

// Removes the companion's COM entry, then the memberships of `clsid` in the families. Each step's
// result replaces the one before; none stops the sequence.
UT_API HRESULT KXUnRegisterInspectableObject(const GUID& clsid, const GUID& companion,
                                             unsigned int familyCount, const GUID* families,
                                             HINSTANCE module);
// The same with one family, which is removed too (GWUnregisterFamily).
UT_API HRESULT KXUnRegisterInspectableObject(const GUID& clsid, const GUID& companion, const GUID& family,
                                             HINSTANCE module);

// --- Names and paths ---------------------------------------------------------------------------

// Reads the "Name" value of the class key of `clsid` in the category `keyName` into `name`
// (`*byteCount` bytes in, the value's size out). The class key is matched by the identifier its
// name parses to, so a key written in lower-case hexadecimal is found too. S_OK once the class key
// is found, deliberately whatever the read of "Name" gives (a missing or oversized value leaves
// `name` as the read left it); E_FAIL when the category or the class is not there.
UT_API HRESULT KXGetKeyName(const wchar_t* keyName, const GUID& clsid, wchar_t* name, DWORD* byteCount);
UT_API HRESULT KXGetPrimitiveName(const GUID& clsid, wchar_t* name, DWORD* byteCount);
UT_API HRESULT KXGetOperatorName(const GUID& clsid, wchar_t* name, DWORD* byteCount);
UT_API HRESULT KXGetPropertyName(const GUID& clsid, wchar_t* name, DWORD* byteCount);
UT_API HRESULT KXGetViewName(const GUID& clsid, wchar_t* name, DWORD* byteCount);
// The identifier held as the "Name" of the class key of `view` in "Inspector View" (the class
// given is the key). 1 (S_FALSE) with GUID_NULL when there is none; E_INVALIDARG for a null
// `inspector`; the parse's failure when the text is not an identifier.
UT_API HRESULT KXGetObjectInspectorView(const GUID& view, GUID* inspector);

// The classes of the category `keyName`, as one CoTaskMemAlloc block of `*count` identifiers that
// the caller frees (a zero-length block when the category is empty). E_POINTER for a null
// argument; E_FAIL when the category cannot be read; a sub-key whose name is not an identifier
// fails the whole call with the parse's result. On failure the list is null and the count 0,
// except E_OUTOFMEMORY, which leaves the count at the number of classes.
UT_API HRESULT KXGetCLSIDList(const wchar_t* keyName, DWORD* count, GUID** list);
UT_API HRESULT KXGetManipulators(DWORD* count, GUID** list);
// The control classes of a manipulator, as KXGetCLSIDList lists them. E_INVALIDARG for GUID_NULL.
UT_API HRESULT KXGetManipulator3DControls(const GUID& manipulator, DWORD* count, GUID** list);

// The category's own "Path" value (not a class's), read with checks: a value that is not
// terminated text empties `path` and fails. S_OK or E_FAIL.
UT_API HRESULT KXGetPathAtRegKey(const wchar_t* keyName, DWORD byteCount, wchar_t* path);
// Writes the category's own "Path", creating the category. E_FAIL on failure, also for a null path
// (after the category was created).
UT_API HRESULT KXSetPathAtRegKey(const wchar_t* keyName, const wchar_t* path);
// The "Path" value of `subKey`, a full key path under HKEY_CLASSES_ROOT (deliberately not below
// the base key), read without checks. S_OK or E_FAIL.
UT_API HRESULT KXGetPathInRegistry(const wchar_t* subKey, DWORD byteCount, wchar_t* path);
UT_API HRESULT KXSetPathInRegistry(const wchar_t* subKey, const wchar_t* path);
// The "Path" of HKEY_CLASSES_ROOT "QVX\<keyName>\<class>", read into a buffer of exactly 40
// characters (terminator included): a longer path fails. S_OK or E_FAIL.
UT_API HRESULT KXFindPathInRegistry(GUID clsid, const wchar_t* keyName, wchar_t* path);
// The default value of the class's key under the host's "QDEF" core key (GWConstructKxcoreRegKey).
// E_POINTER for a null name or a zero byte count, E_INVALIDARG for GUID_NULL, the host's failure,
// or E_FAIL.
UT_API HRESULT KXGetQDEFFilename(const GUID& clsid, wchar_t* fileName, DWORD* byteCount);
// The "Name" of a class of the "View" category into a buffer of 40 characters, read with checks.
// When the class key is there but its name cannot be read, `name` gets the class's identifier
// text (so that a caller has something to show) and E_FAIL is returned.
UT_API HRESULT KXGetCorvaneViewName(GUID clsid, wchar_t* name);
// The host's name of a view (GWFindViewNameFromCLSID); the host's non-zero result unchanged.
UT_API HRESULT KXGetGWViewName(const GUID& clsid, CKXString& name);
// Writes the factory's resource folder, KXGetFactoryPath + "\Application\rsrc", into `path` when
// `capacity` characters hold it with its terminator, or the empty text when they do not (and
// `capacity` is not 0). Returns the folder's length without terminator either way, so that a
// first call with no buffer sizes the second.
UT_API DWORD KXGetFactoryRsrcPath(DWORD capacity, wchar_t* path);

// --- Explorer and animation editor -------------------------------------------------------------
// The module argument of trees, views and editors is accepted and not used.

UT_API HRESULT KXRegisterAnimationEditorTree(const GUID& clsid, HINSTANCE module);
UT_API HRESULT KXRegisterAnimationEditorView(const GUID& clsid, const GUID& sourceOp, HINSTANCE module);
UT_API HRESULT KXRegisterQVXExplorerTree(const GUID& clsid, HINSTANCE module);
// Deliberately writes no registry key: stores the view manager's name of `clsid` as the preference
// "qvx_explorer.viewer". S_OK, or E_FAIL for any failure.
UT_API HRESULT KXRegisterQVXExplorerEditor(const GUID& clsid, const GUID& sourceOp, HINSTANCE module);
// Delete the "CLSID" of the default only when it is `clsid` (a default another class replaced
// stays), then clean the key; "SOURCEOP" stays. 1 when the default's key or value cannot be read.
// The explorer's editor works on the "DefaultEditor" key, unlike its registration.
UT_API HRESULT KXUnRegisterAnimationEditorTree(const GUID& clsid);
UT_API HRESULT KXUnRegisterAnimationEditorView(const GUID& clsid);
UT_API HRESULT KXUnRegisterQVXExplorerTree(const GUID& clsid);
UT_API HRESULT KXUnRegisterQVXExplorerEditor(const GUID& clsid);

// A view that can show a source operator, or the operators of a family (explorer only).
UT_API HRESULT KXRegisterAnimationEditorSourceOp(const GUID& sourceOp, const GUID& view, HINSTANCE module);
UT_API HRESULT KXRegisterQVXExplorerSourceOp(const GUID& sourceOp, const GUID& view, HINSTANCE module);
UT_API HRESULT KXRegisterQVXExplorerFamilySourceOp(const GUID& family, const GUID& view, HINSTANCE module);
// Remove that view; the owner's key is cleaned when no view is left. 1 when the key is missing.
UT_API HRESULT KXUnRegisterAnimationEditorSourceOp(const GUID& sourceOp, const GUID& view);
UT_API HRESULT KXUnRegisterQVXExplorerSourceOp(const GUID& sourceOp, const GUID& view);
UT_API HRESULT KXUnRegisterQVXExplorerFamilySourceOp(const GUID& family, const GUID& view);

// The registered defaults. E_INVALIDARG for a null first argument; 1 (S_FALSE) with GUID_NULL
// when nothing is registered, so that the caller falls back to its built-in default. A view
// registered without a source operator gives GUID_NULL as its source operator.
UT_API HRESULT KXGetDefaultAnimationEditorTree(GUID* tree);
UT_API HRESULT KXGetDefaultAnimationEditorView(GUID* view, GUID* sourceOp);
UT_API HRESULT KXGetDefaultQVXExplorerTree(GUID* tree);
// The view named by the preference "qvx_explorer.viewer" when it is set and known to the view
// manager, else the "DefaultEditor" registration. `second` is never written.
UT_API HRESULT KXGetDefaultQVXExplorerEditor(GUID* editor, GUID* second);

// Source operators and their views, as CoTaskMemAlloc blocks the caller frees; `*count` may be
// smaller than the block. Names that are not identifiers are skipped. E_INVALIDARG for a null
// argument; 1 (S_FALSE) with a null list and count 0 when nothing is registered.
UT_API HRESULT KXGetAnimationEditorSourceOps(DWORD* count, GUID** list);
UT_API HRESULT KXGetAnimationEditorSourceOpViews(const GUID& sourceOp, DWORD* count, GUID** list);
// The explorer's source operators, then the members of every family under "FamilySourceOps"
// (from the families manager), duplicates kept. Without any direct source operator the answer is
// 1 and an empty list, whatever the families hold.
UT_API HRESULT KXGetQVXExplorerSourceOps(DWORD* count, GUID** list);
// The views of `sourceOp`, then the views of every family that the families manager says it
// belongs to, in the registry's order; duplicates kept.
UT_API HRESULT KXGetQVXExplorerSourceOpViews(const GUID& sourceOp, DWORD* count, GUID** list);
