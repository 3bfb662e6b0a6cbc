// Where the application's files live: the project manager with its active project, the install
// locations (user, workgroups, root locations, add-ons) and the file access test.
//
// The reference host takes every folder from its preferences first ("paths.project",
// "paths.user", "paths.workgroups", "paths.site", "paths.addons", "paths.user_addons"), then from
// the environment (UT_PROJECT_PATH, UT_USER_PATH, UT_WORKGROUPS_PATH, UT_SITE_PATH,
// UT_ADDONS_PATH, UT_USER_ADDONS_PATH), then from its defaults: no project, the user folder "ut"
// in the home folder, no workgroup, no site folder, "<factory>\Addons" and "<user>\Addons".
// Workgroups are a list separated by ';'. Every operation asks ut::sdk::CheckHostFault first,
// under "IGWProjectManager::<method>" and "IGWInstallLocations::<method>".
#pragma once

#include <vector>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/string.h>

// {0F0B4E21-5C3A-4D1E-9A57-3B1F6C2D8E01} (the reference host's)
inline constexpr CLSID CLSID_GWProjectManager = {
    0x0F0B4E21, 0x5C3A, 0x4D1E, {0x9A, 0x57, 0x3B, 0x1F, 0x6C, 0x2D, 0x8E, 0x01}};
// {0F0B4E22-5C3A-4D1E-9A57-3B1F6C2D8E01}
inline constexpr IID IID_IGWProjectManager = {
    0x0F0B4E22, 0x5C3A, 0x4D1E, {0x9A, 0x57, 0x3B, 0x1F, 0x6C, 0x2D, 0x8E, 0x01}};
// {0F0B4E23-5C3A-4D1E-9A57-3B1F6C2D8E01}
inline constexpr IID IID_IGWInstallLocations = {
    0x0F0B4E23, 0x5C3A, 0x4D1E, {0x9A, 0x57, 0x3B, 0x1F, 0x6C, 0x2D, 0x8E, 0x01}};

// A project as the manager describes it; the manager owns the record.
struct GWProjectInfo {
    const wchar_t* path; // the project's folder, empty when no project is active
    const wchar_t* name;
};

struct IGWProjectManager : IUnknown {
    // The active project's record, valid until ReleaseProject; with no active project a record
    // with an empty path. E_POINTER for a null argument.
    virtual HRESULT STDMETHODCALLTYPE GetActiveProject(GWProjectInfo** project) = 0;
    // Gives back a record GetActiveProject handed out; E_INVALIDARG for any other.
    virtual HRESULT STDMETHODCALLTYPE ReleaseProject(GWProjectInfo* project) = 0;

protected:
    ~IGWProjectManager() = default;
};

enum GWLocation : LONG {
    GWLOCATION_USER = 0,
    GWLOCATION_WORKGROUP = 1, // one per index, the default one first
    GWLOCATION_SITE = 2,
    GWLOCATION_ADDONS = 3,
    GWLOCATION_USER_ADDONS = 4,
};

struct IGWInstallLocations : IUnknown {
    // The folder of `kind` number `index`, task-allocated, without a separator at its end;
    // S_FALSE with an empty text when there is none. E_POINTER, E_INVALIDARG for another kind.
    virtual HRESULT STDMETHODCALLTYPE GetLocation(GWLocation kind, ULONG index, wchar_t** path) = 0;

protected:
    ~IGWInstallLocations() = default;
};

template <>
struct ut::InterfaceId<IGWProjectManager> : ut::Iid<IID_IGWProjectManager> {};
template <>
struct ut::InterfaceId<IGWInstallLocations> : ut::Iid<IID_IGWInstallLocations> {};

UT_SDK_API HRESULT GWGetIGWProjectManager(IGWProjectManager** manager);

// The folders, empty when the host has none (and then S_FALSE); failures of the host pass through.
UT_SDK_API HRESULT KXGetUserPath(CKXString& path);
UT_SDK_API HRESULT KXGetDefaultWorkgroupPath(CKXString& path);
// `user` false: the add-ons installed with the application; true: the user's own.
UT_SDK_API HRESULT KXGetAddonsPath(CKXString& path, bool user);
// The factory's resources: "<factory>\Resources".
UT_SDK_API HRESULT KXGetFactoryResourcePath(CKXString& path);

// Root locations by kind: 0 the factory, 1 the user, 2 the default workgroup, 3 the site.
class UT_SDK_API CKXRootLocationMgr {
public:
    static HRESULT GetRootLocationPath(int kind, CKXString& path);
    // Appends workgroup `which`, or every workgroup for -1.
    static HRESULT GetWorkgroupPaths(int which, std::vector<CKXString>& paths);
};

// The C runtime's access test (mode 0 existence, 2 write, 4 read, 6 both): 0 or -1.
UT_SDK_API int KXaccess(const wchar_t* path, int mode);
