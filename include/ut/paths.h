// Install paths and file helpers: where the project, the user's, the workgroup's and the
// add-ons' folders are, whether a file lies in a project, the image that stands for a missing
// picture, plug-in items by name, the scene file to recover, and structured storage on a file
// (or a temporary one) in one call.
#pragma once

#include <vector>

#include <ut/export.h>
#include <ut/platform/storage.h>
#include <ut/sdk/application.h>
#include <ut/sdk/string.h>

enum tagE3D_INSTALL_PATH_TYPE : int {
    E3D_INSTALL_PATH_PROJECT = 0,
    E3D_INSTALL_PATH_USER = 1,
    E3D_INSTALL_PATH_WORKGROUP = 2,
    E3D_INSTALL_PATH_ROOT_LOCATION = 3,
    E3D_INSTALL_PATH_ADDONS = 4,
    E3D_INSTALL_PATH_USER_ADDONS = 5,
    E3D_INSTALL_PATH_WORKGROUP_ADDONS = 6,
    E3D_INSTALL_PATH_NONE = 7,
};

// The folder of `type`: S_OK, or S_FALSE when there is none (type 7 always); E_FAIL past type 7.
UT_API HRESULT KXGetInstallPath(tagE3D_INSTALL_PATH_TYPE type, CKXString& path);
// Appends every folder of `type`; S_OK when `paths` is not empty afterwards, else S_FALSE.
UT_API HRESULT KXGetInstallPaths(tagE3D_INSTALL_PATH_TYPE type, std::vector<CKXString>& paths);
// 1 when `file` starts with `project`, letter case ignored (no separator is required), else 0.
UT_API int KXIsFileRelativeToProject(const CKXString& project, const CKXString& file);
// Opens the compound file `path` (create 0) or creates it, replacing it (create nonzero), over a
// byte array; a null path makes a temporary file that goes with the storage. STG_E_FILENOTFOUND
// for a missing file that is not to be created, E_INVALIDARG when the byte array fails.
UT_API HRESULT F3DOpenStorageOnFile(const wchar_t* path, unsigned long mode, int create, IStorage** storage,
                                    ILockBytes** lockBytes);
// The user's image for a missing picture when it can be read, else the factory "noIcon.pic".
UT_API HRESULT KXGetUserPrefDefaultImage(CKXString* path);
// S_OK (and the item when `item` is given) when a plug-in item of `kind` and `name` is registered.
UT_API HRESULT KXIsPluginItem(CKXString* name, const GUID& kind, IKXPluginItem** item);
// The scene file to recover at start-up, or null; the text belongs to the library.
UT_API char* KXFindRecoveryFile();
