// The reference host's path conventions: linked, absolute and project-relative paths.
#include "file_path.h"

#include <cwctype>
#include <new>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

#include "install_locations.h"

namespace ut::host {
namespace {

tagEGWFilePathType TypeOf(const std::wstring& path) {
    std::size_t scheme = path.find(L"://");
    if (scheme != std::wstring::npos && scheme >= 2) {
        bool letters = true;
        for (std::size_t i = 0; i < scheme; ++i)
            letters = letters && std::iswalpha(path[i]);
        if (letters)
            return GWFILEPATH_LINKED;
    }
    bool fromRoot = !path.empty() && (path[0] == L'/' || path[0] == L'\\');
    bool fromDrive = path.size() >= 2 && std::iswalpha(path[0]) && path[1] == L':';
    return path.empty() || fromRoot || fromDrive ? GWFILEPATH_ABSOLUTE : GWFILEPATH_PROJECT;
}

std::wstring Resolve(const std::wstring& path) {
    if (TypeOf(path) != GWFILEPATH_PROJECT)
        return path;
    std::wstring project = LocationSetting(L"project");
    return project.empty() ? path : project + L"\\" + path;
}

} // namespace

std::span<const CGWCOMObject::InterfaceEntry> FilePath::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<FilePath, IGWFilePath>(IID_IGWFilePath)};
    return map;
}

HRESULT FilePath::SetPath(const wchar_t* path) {
    if (!path)
        return E_POINTER;
    if (HRESULT hr = sdk::CheckHostFault("IGWFilePath::SetPath"); FAILED(hr))
        return hr;
    return ExportBoundary([&] {
        path_ = path;
        return S_OK;
    });
}

HRESULT FilePath::GetResolvedPath(wchar_t** path) {
    if (!path)
        return E_POINTER;
    *path = nullptr;
    if (HRESULT hr = sdk::CheckHostFault("IGWFilePath::GetResolvedPath"); FAILED(hr))
        return hr;
    if (!path_)
        return E_UNEXPECTED;
    return ExportBoundary([&] { return CopyToTaskMemory(Resolve(*path_), path); });
}

HRESULT FilePath::GetPathType(tagEGWFilePathType* type) {
    if (!type)
        return E_POINTER;
    *type = GWFILEPATH_ABSOLUTE;
    if (HRESULT hr = sdk::CheckHostFault("IGWFilePath::GetPathType"); FAILED(hr))
        return hr;
    if (!path_)
        return E_UNEXPECTED;
    *type = TypeOf(*path_);
    return S_OK;
}

std::span<const CGWCOMObject::InterfaceEntry> FilePathFactory::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {sdk::Entry<FilePathFactory, IClassFactory>(IID_IClassFactory)};
    return map;
}

HRESULT FilePathFactory::CreateInstance(IUnknown* outer, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (outer)
        return CLASS_E_NOAGGREGATION;
    ut::ComPtr<FilePath> path = ut::ComPtr<FilePath>::Adopt(new (std::nothrow) FilePath);
    if (!path)
        return E_OUTOFMEMORY;
    return path->QueryInterface(iid, object);
}

} // namespace ut::host
