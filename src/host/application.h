// The reference host's plug-in registry, kept in memory as ut/sdk/application.h describes. The
// application object itself is the active database (active_database.h).
#pragma once

#include <string>
#include <vector>

#include <ut/host/reference_host.h>
#include <ut/sdk/application.h>
#include <ut/sdk/comobject.h>

namespace ut::host {

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
