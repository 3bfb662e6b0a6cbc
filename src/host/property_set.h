// The reference host's property sets: parameters and member sets under one IGWProperties
// implementation that the scene shares, and their enumeration.
#pragma once

#include <vector>

#include <ut/host/reference_scene.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/scene.h>

namespace ut::host {

class PropertySet;

// What a property set holds.
struct PropertyData {
    GUID clsid = GUID_NULL;
    GUID kind = GUID_GWPropertySetKind;
    std::wstring name;
    std::vector<ParameterDescription> parameters;
    std::vector<ut::ComPtr<PropertySet>> members;

    ParameterDescription* FindParameter(REFGUID id);
    // The members whose class or kind is `filter`.
    std::vector<PropertySet*> MembersOf(REFGUID filter) const;
};

// Writes a parameter's value into a variant the caller cleared, and the other way round; a value
// of another type than the parameter holds is DISP_E_TYPEMISMATCH.
HRESULT ToVariant(const ParameterValue& value, GWVARIANT* variant);
HRESULT FromVariant(const GWVARIANT* variant, ParameterValue& value);

// IGWProperties over a PropertyData, for property sets and for the scene's own properties.
template <class... Interfaces>
class PropertiesObject : public ut::sdk::ComObject<IGWProperties, Interfaces...> {
public:
    PropertyData& Data() { return data_; }
    const PropertyData& Data() const { return data_; }

    HRESULT STDMETHODCALLTYPE GetParameterValue(REFGUID id, GWVARIANT* value) override;
    HRESULT STDMETHODCALLTYPE SetValue(const tagGWREQUEST* request, const GWVARIANT* value) override;
    // Nothing is shown, so nothing is redrawn; the request is checked and dropped.
    HRESULT STDMETHODCALLTYPE Refresh(const tagGWREQUEST* request, BOOL redraw, LONG reserved1,
                                      LONG reserved2) override;
    HRESULT STDMETHODCALLTYPE GetProperty(REFGUID clsid, GWVARIANT* value, LONG flags) override;
    HRESULT STDMETHODCALLTYPE CountMembers(REFGUID filter, ULONG* count) override;
    HRESULT STDMETHODCALLTYPE GetMembers(REFGUID filter, ULONG first, ULONG count,
                                         IGWProperties** members) override;
    HRESULT STDMETHODCALLTYPE EnumProperties(ULONG selection, IEnumGWProperties** entries) override;

protected:
    // Sets the value parameter after the fault hook let `operation` through.
    HRESULT WriteValue(const char* operation, const tagGWREQUEST* request, const GWVARIANT* value);

private:
    PropertyData data_;
};

// A property set; its IGWParameter is its value parameter.
class PropertySet final : public PropertiesObject<IGWParameter> {
public:
    PropertySet() = default;
    explicit PropertySet(const PropertySetDescription& description);

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    HRESULT STDMETHODCALLTYPE GetParamValue(GWVARIANT* value) override;
    HRESULT STDMETHODCALLTYPE SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) override;

    PropertySetDescription Describe() const;
};

// `set` as the host's own PropertySet; null for a set of another kind.
ut::ComPtr<PropertySet> OwnPropertySet(IUnknown* set);

// Builds the property sets `descriptions` describe into `members`; false when memory ran out.
bool AddPropertySets(const std::vector<PropertySetDescription>& descriptions,
                     std::vector<ut::ComPtr<PropertySet>>& members);
std::vector<PropertySetDescription> DescribePropertySets(const std::vector<ut::ComPtr<PropertySet>>& members);

// An empty property set of class `clsid`, for the class factories of the creatable property
// classes.
HRESULT MakePropertySet(REFCLSID clsid, IUnknown** made);

} // namespace ut::host
