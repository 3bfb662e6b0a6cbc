// The reference host's content container: a scene root that holds one property, the key time,
// whose value parameter is a frame count. Containers are made by a class factory that starts
// their key time at the settings' key frame.
#pragma once

#include <ut/host/reference_host.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/content.h>

namespace ut::host {

class KeyTimeProperty final : public ut::sdk::ComObject<IGWProperty, IGWParameter> {
public:
    explicit KeyTimeProperty(double frames) : frames_(frames) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetParameterValue(REFGUID id, GWVARIANT* value) override;
    HRESULT STDMETHODCALLTYPE SetValue(const tagGWREQUEST* request, const GWVARIANT* value) override;
    // Nothing is shown, so nothing is redrawn; the request is checked and dropped.
    HRESULT STDMETHODCALLTYPE Refresh(const tagGWREQUEST* request, BOOL redraw, LONG reserved1,
                                      LONG reserved2) override;

    HRESULT STDMETHODCALLTYPE GetParamValue(GWVARIANT* value) override;
    HRESULT STDMETHODCALLTYPE SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) override;

private:
    HRESULT Read(GWVARIANT* value);
    HRESULT Write(const tagGWREQUEST* request, const GWVARIANT* value);

    double frames_;
};

class ContentContainer final : public ut::sdk::ComObject<IGWContentContainer> {
public:
    explicit ContentContainer(double keyFrame) : keyFrame_(keyFrame) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;
    HRESULT Construct() override;

    HRESULT STDMETHODCALLTYPE FindProperty(REFGUID id, REFIID iid, void** property) override;

private:
    double keyFrame_;
    ut::ComPtr<IGWProperty> keyTime_;
};

class ContentContainerFactory final : public ut::sdk::ComObject<IClassFactory> {
public:
    explicit ContentContainerFactory(const Settings& settings) : keyFrame_(settings.keyFrame) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID iid, void** object) override;
    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

private:
    double keyFrame_;
};

} // namespace ut::host
