// The reference host's file-path object and its class factory: paths resolved by the
// conventions that ut/sdk/file_path.h describes.
#pragma once

#include <optional>
#include <string>

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/file_path.h>

namespace ut::host {

class FilePath final : public ut::sdk::ComObject<IGWFilePath> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE SetPath(const wchar_t* path) override;
    HRESULT STDMETHODCALLTYPE GetResolvedPath(wchar_t** path) override;
    HRESULT STDMETHODCALLTYPE GetPathType(tagEGWFilePathType* type) override;

private:
    std::optional<std::wstring> path_;
};

class FilePathFactory final : public ut::sdk::ComObject<IClassFactory> {
public:
    explicit FilePathFactory(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID iid, void** object) override;
    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }
};

} // namespace ut::host
