// The reference host's property sets and their enumeration.
#include "property_set.h"

#include <algorithm>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/testing.h>

#include "host_support.h"

namespace ut::host {
namespace {

// {E4B734E7-2A92-4B78-A381-ED723B2B1F0E}: answers the PropertySet object itself, so that the
// scene can keep the sets it is given only when they are its own kind.
constexpr IID IID_ReferencePropertySet = {
    0xE4B734E7, 0x2A92, 0x4B78, {0xA3, 0x81, 0xED, 0x72, 0x3B, 0x2B, 0x1F, 0x0E}};

// One entry of an enumeration, kept until it is handed out.
struct Entry {
    GUID id;
    ULONG flags;
    std::wstring name;
    ParameterValue value;
    ut::ComPtr<PropertySet> member;
};

// The parameters and member sets of a property set, handed out as enumeration entries.
struct Entries {
    using Interface = IEnumGWProperties;
    using Kept = Entry;
    using Out = tagGWPROPERTY;
    static constexpr char kNext[] = "IEnumGWProperties::Next";

    static HRESULT HandOut(const Entry& from, tagGWPROPERTY& to) {
        to = {from.id, from.flags, nullptr, {}};
        VariantInit(&to.value);
        if (HRESULT hr = CopyToTaskMemory(from.name, &to.name); FAILED(hr))
            return hr;
        if (!from.member)
            return ToVariant(from.value, &to.value);
        to.value.vt = VT_UNKNOWN;
        to.value.punkVal = static_cast<IGWProperties*>(from.member.Get());
        to.value.punkVal->AddRef();
        return S_OK;
    }
    static void Clear(tagGWPROPERTY& entry) { ut::sdk::ClearProperty(entry); }
};

} // namespace

ParameterDescription* PropertyData::FindParameter(REFGUID id) {
    auto found =
        std::find_if(parameters.begin(), parameters.end(),
                     [&](const ParameterDescription& parameter) { return IsEqualGUID(parameter.id, id); });
    return found == parameters.end() ? nullptr : &*found;
}

std::vector<PropertySet*> PropertyData::MembersOf(REFGUID filter) const {
    std::vector<PropertySet*> found;
    for (const ut::ComPtr<PropertySet>& member : members) {
        const PropertyData& data = member->Data();
        if (IsEqualGUID(data.clsid, filter) || IsEqualGUID(data.kind, filter))
            found.push_back(member.Get());
    }
    return found;
}

HRESULT ToVariant(const ParameterValue& value, GWVARIANT* variant) {
    if (!variant)
        return E_POINTER;
    if (const double* number = std::get_if<double>(&value)) {
        variant->vt = VT_R8;
        variant->dblVal = *number;
    } else if (const bool* truth = std::get_if<bool>(&value)) {
        variant->vt = VT_BOOL;
        variant->boolVal = *truth ? VARIANT_TRUE : VARIANT_FALSE;
    } else {
        BSTR text = SysAllocString(std::get<std::wstring>(value).c_str());
        if (!text)
            return E_OUTOFMEMORY;
        variant->vt = VT_BSTR;
        variant->bstrVal = text;
    }
    return S_OK;
}

HRESULT FromVariant(const GWVARIANT* variant, ParameterValue& value) {
    if (!variant)
        return E_POINTER;
    if (std::holds_alternative<double>(value) && variant->vt == VT_R8)
        value = variant->dblVal;
    else if (std::holds_alternative<bool>(value) && variant->vt == VT_BOOL)
        value = variant->boolVal != VARIANT_FALSE;
    else if (std::holds_alternative<std::wstring>(value) && variant->vt == VT_BSTR)
        return ut::ExportBoundary([&] {
            value = std::wstring(variant->bstrVal ? variant->bstrVal : L"");
            return S_OK;
        });
    else
        return DISP_E_TYPEMISMATCH;
    return S_OK;
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::GetParameterValue(REFGUID id, GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::GetParameterValue"); FAILED(hr))
        return hr;
    const ParameterDescription* parameter = data_.FindParameter(id);
    return parameter ? ToVariant(parameter->value, value) : DISP_E_MEMBERNOTFOUND;
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::SetValue(const tagGWREQUEST* request, const GWVARIANT* value) {
    return WriteValue("IGWProperties::SetValue", request, value);
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::WriteValue(const char* operation, const tagGWREQUEST* request,
                                                    const GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    if (!request)
        return E_POINTER;
    ParameterDescription* parameter = data_.FindParameter(GUID_GWValueParameter);
    return parameter ? FromVariant(value, parameter->value) : DISP_E_MEMBERNOTFOUND;
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::Refresh(const tagGWREQUEST* request, BOOL, LONG, LONG) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::Refresh"); FAILED(hr))
        return hr;
    return request ? S_OK : E_POINTER;
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::GetProperty(REFGUID clsid, GWVARIANT* value, LONG flags) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::GetProperty"); FAILED(hr))
        return hr;
    if (!value)
        return E_POINTER;
    if (flags != 0)
        return E_INVALIDARG;
    for (const ut::ComPtr<PropertySet>& member : data_.members) {
        if (IsEqualGUID(member->Data().clsid, clsid)) {
            value->vt = VT_UNKNOWN;
            return member->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(&value->punkVal));
        }
    }
    return DISP_E_MEMBERNOTFOUND;
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::CountMembers(REFGUID filter, ULONG* count) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::CountMembers"); FAILED(hr))
        return hr;
    if (!count)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        *count = static_cast<ULONG>(data_.MembersOf(filter).size());
        return S_OK;
    });
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::GetMembers(REFGUID filter, ULONG first, ULONG count,
                                                    IGWProperties** members) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::GetMembers"); FAILED(hr))
        return hr;
    if (!members)
        return E_POINTER;
    return ut::ExportBoundary([&] {
        std::vector<PropertySet*> found = data_.MembersOf(filter);
        if (first > found.size() || count > found.size() - first)
            return DISP_E_BADINDEX;
        for (ULONG i = 0; i < count; ++i) {
            members[i] = found[first + i];
            members[i]->AddRef();
        }
        return S_OK;
    });
}

template <class... Interfaces>
HRESULT PropertiesObject<Interfaces...>::EnumProperties(ULONG selection, IEnumGWProperties** entries) {
    if (!entries)
        return E_POINTER;
    *entries = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWProperties::EnumProperties"); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::vector<Entry> listed;
        if (selection & GWPROPERTY_PARAMETERS)
            for (const ParameterDescription& parameter : data_.parameters)
                listed.push_back({parameter.id, GWPROPERTY_PARAMETERS, parameter.name, parameter.value, {}});
        if (selection & GWPROPERTY_MEMBERS)
            for (const ut::ComPtr<PropertySet>& member : data_.members)
                listed.push_back(
                    {member->Data().clsid, GWPROPERTY_MEMBERS, member->Data().name, 0.0, member});
        *entries = Make<Enumerator<Entries>>(std::move(listed)).Detach();
        return *entries ? S_OK : E_OUTOFMEMORY;
    });
}

template class PropertiesObject<IGWParameter>;
template class PropertiesObject<I3DScene>;
template class PropertiesObject<IPersist>;

PropertySet::PropertySet(const PropertySetDescription& description) {
    Data().clsid = description.clsid;
    Data().name = description.name;
    Data().parameters = description.parameters;
}

std::span<const CGWCOMObject::InterfaceEntry> PropertySet::GetInterfaceMap() const {
    static const InterfaceEntry map[] = {ut::sdk::Entry<PropertySet, IGWProperties>(IID_IGWProperties),
                                         ut::sdk::Entry<PropertySet, IGWParameter>(IID_IGWParameter),
                                         ut::sdk::Entry<PropertySet, PropertySet>(IID_ReferencePropertySet)};
    return map;
}

HRESULT PropertySet::GetParamValue(GWVARIANT* value) {
    if (HRESULT hr = ut::sdk::CheckHostFault("IGWParameter::GetParamValue"); FAILED(hr))
        return hr;
    const ParameterDescription* parameter = Data().FindParameter(GUID_GWValueParameter);
    return parameter ? ToVariant(parameter->value, value) : DISP_E_MEMBERNOTFOUND;
}

HRESULT PropertySet::SetParamValue(const tagGWREQUEST* request, const GWVARIANT* value) {
    return WriteValue("IGWParameter::SetParamValue", request, value);
}

PropertySetDescription PropertySet::Describe() const {
    return {Data().clsid, Data().name, Data().parameters, DescribePropertySets(Data().members)};
}

ut::ComPtr<PropertySet> OwnPropertySet(IUnknown* set) {
    ut::ComPtr<PropertySet> own;
    if (set)
        (void)set->QueryInterface(IID_ReferencePropertySet, own.PutVoid());
    return own; // null for a set of another kind
}

bool AddPropertySets(const std::vector<PropertySetDescription>& descriptions,
                     std::vector<ut::ComPtr<PropertySet>>& members) {
    for (const PropertySetDescription& description : descriptions) {
        ut::ComPtr<PropertySet> set = Make<PropertySet>(description);
        if (!set || !AddPropertySets(description.properties, set->Data().members))
            return false;
        members.push_back(std::move(set));
    }
    return true;
}

std::vector<PropertySetDescription>
DescribePropertySets(const std::vector<ut::ComPtr<PropertySet>>& members) {
    std::vector<PropertySetDescription> described;
    for (const ut::ComPtr<PropertySet>& member : members)
        described.push_back(member->Describe());
    return described;
}

HRESULT MakePropertySet(REFCLSID clsid, IUnknown** made) {
    ut::ComPtr<PropertySet> set = Make<PropertySet>();
    if (!set)
        return E_OUTOFMEMORY;
    set->Data().clsid = clsid;
    return set->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(made));
}

} // namespace ut::host
