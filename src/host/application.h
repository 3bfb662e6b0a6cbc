// The reference host's application object (the active database's mode, state flags, saving
// state, the dump mode) and its plug-in registry, kept in memory as ut/sdk/application.h describes.
#pragma once

#include <array>
#include <string>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/application.h>
#include <ut/sdk/comobject.h>

namespace ut::host {

class Application final : public ut::sdk::ComObject<IGWApplication> {
public:
    explicit Application(const Settings& settings) : mode_(settings.activeDatabaseMode) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetCurrentMode(ULONG* mode) override;

    HRESULT STDMETHODCALLTYPE GetStateFlag(ULONG flag, LONG* value) override;
    HRESULT STDMETHODCALLTYPE SetStateFlag(ULONG flag, LONG value) override;
    HRESULT STDMETHODCALLTYPE GetSavingState(GWSaveType* save, GWLoadType* load) override;
    HRESULT STDMETHODCALLTYPE SetSavingState(GWSaveType save, GWLoadType load) override;
    HRESULT STDMETHODCALLTYPE AllowsDumps() override;
    HRESULT STDMETHODCALLTYPE SetAllowsDumps(BOOL allow) override;

private:
    ULONG mode_;
    std::array<LONG, 32> flags_{};
    GWSaveType save_ = GWSAVE_NONE;
    GWLoadType load_ = GWLOAD_NONE;
    bool dumps_ = false;
};

class PluginRegistry final : public ut::sdk::ComObject<IKXPluginRegistry> {
public:
    explicit PluginRegistry(const Settings&) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetItem(ULONG reserved, REFGUID kind, const wchar_t* name,
                                      IKXPluginItem** item) override;
    HRESULT STDMETHODCALLTYPE AddItem(REFGUID kind, const wchar_t* name) override;

private:
    struct Item {
        GUID kind;
        std::wstring name;
    };
    const Item* Find(REFGUID kind, const wchar_t* name) const;

    std::vector<Item> items_;
};

} // namespace ut::host
