#include "content_container.h"

#include <new>

#include <ut/sdk/testing.h>

namespace ut::host {

std::span<const CGWCOMObject::InterfaceEntry> KeyTimeProperty::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<KeyTimeProperty, IGWProperty>(IID_IGWProperty),
                                         ut::sdk::Entry<KeyTimeProperty, IGWParameter>(IID_IGWParameter)};
    return map;
}

HRESULT KeyTimeProperty::GetParameterValue(REFGUID id, GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperty::GetParameterValue"); FAILED(hr))
        return hr;
    if (!IsEqualGUID(id, GUID_GWValueParameter))
        return DISP_E_MEMBERNOTFOUND;
    return Read(value);
}

HRESULT KeyTimeProperty::SetValue(const tagGWREQUEST* request, const GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperty::SetValue"); FAILED(hr))
        return hr;
    return Write(request, value);
}

HRESULT KeyTimeProperty::Refresh(const tagGWREQUEST* request, BOOL, LONG, LONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperty::Refresh"); FAILED(hr))
        return hr;
    return request ? S_OK : E_POINTER;
}

HRESULT KeyTimeProperty::GetParamValue(GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWParameter::GetParamValue"); FAILED(hr))
        return hr;
    return Read(value);
}

HRESULT KeyTimeProperty::SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWParameter::SetParamValue"); FAILED(hr))
        return hr;
    return Write(request, value);
}

HRESULT KeyTimeProperty::Read(GWVARIANT* value) {
    if (!value)
        return E_POINTER;
    value->vt = VT_R8;
    value->dblVal = frames_;
    return S_OK;
}

HRESULT KeyTimeProperty::Write(const tagGWREQUEST* request, const GWVARIANT* value) {
    if (!request || !value)
        return E_POINTER;
    if (value->vt != VT_R8)
        return DISP_E_TYPEMISMATCH;
    frames_ = value->dblVal;
    return S_OK;
}

std::span<const CGWCOMObject::InterfaceEntry> ContentContainer::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ContentContainer, IGWContentContainer>(IID_IGWContentContainer)};
    return map;
}

HRESULT ContentContainer::Construct() {
    keyTime_ = ut::ComPtr<IGWProperty>::Adopt(new (std::nothrow) KeyTimeProperty(keyFrame_));
    return keyTime_ ? S_OK : E_OUTOFMEMORY;
}

HRESULT ContentContainer::FindProperty(REFGUID id, REFIID iid, void** property) {
    if (!property)
        return E_POINTER;
    *property = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWContentContainer::FindProperty"); FAILED(hr))
        return hr;
    if (!IsEqualGUID(id, GUID_GWKeyTimeProperty))
        return DISP_E_MEMBERNOTFOUND;
    return keyTime_->QueryInterface(iid, property);
}

std::span<const CGWCOMObject::InterfaceEntry> ContentContainerFactory::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {
        ut::sdk::Entry<ContentContainerFactory, IClassFactory>(IID_IClassFactory)};
    return map;
}

HRESULT ContentContainerFactory::CreateInstance(IUnknown* outer, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IClassFactory::CreateInstance"); FAILED(hr))
        return hr;
    if (outer)
        return CLASS_E_NOAGGREGATION;
    auto* created = new (std::nothrow) ContentContainer(keyFrame_);
    if (!created)
        return E_OUTOFMEMORY;
    ut::ComPtr<IUnknown> owner = ut::ComPtr<IUnknown>::Adopt(static_cast<IGWContentContainer*>(created));
    if (HRESULT hr = created->Construct(); FAILED(hr))
        return hr;
    return created->QueryInterface(iid, object);
}

} // namespace ut::host
