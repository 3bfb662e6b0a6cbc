// Installation paths of the application.
#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>
#include <ut/platform/process.h>
#include <ut/sdk/paths.h>

HRESULT KXGetFactoryPath(CKXString& path) {
    return ut::ExportBoundary([&] {
        path = L"";
        std::wstring library = ut::platform::ModuleFileName(
            ut::platform::ModuleOf(reinterpret_cast<const void*>(&KXGetFactoryPath)));
        // Two levels up: from the library to its folder, and from there to the prefix.
        std::size_t folder = library.find_last_of(L"/\\");
        if (folder == std::wstring::npos || folder == 0)
            return E_FAIL;
        std::size_t prefix = library.find_last_of(L"/\\", folder - 1);
        if (prefix == std::wstring::npos)
            return E_FAIL;
        path = std::wstring_view(library).substr(0, prefix);
        return S_OK;
    });
}

BOOL KXIsFileExist(const wchar_t* path) {
    return path && *path && _waccess(path, 0) == 0 ? TRUE : FALSE;
}
