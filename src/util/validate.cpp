// File validation over the host's file-path object and the C runtime's file tests.
#include <ut/validate.h>

#include <cwctype>

#include <ut/detail/names.h>
#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>
#include <ut/platform/storage.h>
#include <ut/sdk/objects.h>

namespace {

std::wstring Lower(std::wstring text) {
    for (wchar_t& c : text)
        c = static_cast<wchar_t>(std::towlower(c));
    return text;
}

bool HasAllowedExtension(const CKXString& path, const CKXString& allowed) {
    wchar_t extension[_MAX_EXT] = {};
    _wsplitpath(path, nullptr, nullptr, nullptr, extension);
    // A substring test, as the lists are written: any separator serves, and an empty extension
    // or one inside a listed one passes.
    return Lower(static_cast<const wchar_t*>(allowed)).find(Lower(extension)) != std::wstring::npos;
}

int Validate(const CKXString& path, const CKXString& allowedExtensions, bool mustBeAccessible, bool needWrite,
             bool mustBeCompound, bool skipAccessForTypeOne, tagEGWFilePathType* pathType) {
    ut::ComPtr<IGWFilePath> filePath;
    // The object is required: without it there is nothing to validate with.
    (void)KXCreateInstance(CLSID_GWFilePath, IID_IGWFilePath, filePath.PutVoid());
    if (!filePath)
        return E_NOINTERFACE;
    (void)filePath->SetPath(path); // a refused path shows in the resolution
    wchar_t* text = nullptr;
    if (HRESULT hr = filePath->GetResolvedPath(&text); FAILED(hr))
        return hr;
    CKXString resolved;
    resolved.Attach_OLE(text);
    if (!resolved.Length())
        return 0;
    bool typeOne = false;
    if (pathType || skipAccessForTypeOne) {
        tagEGWFilePathType type = GWFILEPATH_ABSOLUTE;
        if (FAILED(filePath->GetPathType(&type)))
            type = GWFILEPATH_ABSOLUTE;
        if (pathType)
            *pathType = type;
        typeOne = skipAccessForTypeOne && type == 1;
    }
    if (!typeOne && mustBeAccessible && _waccess(resolved, needWrite ? 2 : 0) == -1)
        return 0;
    if (allowedExtensions.Length() && !HasAllowedExtension(resolved, allowedExtensions))
        return 0;
    if (mustBeCompound && StgIsStorageFile(resolved) != S_OK)
        return 0;
    return 1;
}

} // namespace

int KXValidateFile(const CKXString& path, const CKXString& allowedExtensions, bool mustBeAccessible,
                   bool needWrite, bool mustBeCompound, bool skipAccessForTypeOne,
                   tagEGWFilePathType* pathType) {
    return ut::ExportBoundary(
        [&] {
            return Validate(path, allowedExtensions, mustBeAccessible, needWrite, mustBeCompound,
                            skipAccessForTypeOne, pathType);
        },
        static_cast<int>(E_OUTOFMEMORY));
}
