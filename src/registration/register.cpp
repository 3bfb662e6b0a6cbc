// Registration and unregistration of plug-in classes: the COM entry through the host, the
// category record, companions, families and manipulator controls.
#include <ut/registration.h>
#include <ut/sdk/families.h>
#include <ut/sdk/registration.h>
#include <ut/sdk/resources.h>

#include "registration/keys.h"

namespace ut::registration {
namespace {

constexpr const wchar_t* kName = L"Name";
constexpr const wchar_t* kPath = L"Path";
constexpr const wchar_t* kManipulator = L"Manipulator";

bool IsNull(REFGUID id) {
    return IsEqualGUID(id, GUID_NULL);
}

const wchar_t* TextOf(HINSTANCE module, unsigned int id) {
    return KXDictLoadInstanceIdstring(module, id);
}

// Every export of this file: its body under the guard, a registry write that is lost giving 1.
template <class Body>
HRESULT Registration(Body&& body) {
    return Guarded(S_FALSE, static_cast<Body&&>(body));
}

// The COM entry, then the category's "Name" record (0, or 1 when it could not be written).
HRESULT RegisterNamed(const GUID& clsid, const wchar_t* category, HINSTANCE module, const wchar_t* name) {
    return Registration([&] {
        HRESULT hr = GWRegisterCOMObject(clsid, module, name);
        return FAILED(hr) ? hr : KXAddRegistryKey(clsid, category, kName, name);
    });
}

HRESULT RegisterNamedId(const GUID& clsid, const wchar_t* category, HINSTANCE module, unsigned int nameId) {
    return nameId == 0 ? E_FAIL : RegisterNamed(clsid, category, module, TextOf(module, nameId));
}

// The Ex forms: the class and its record, then its companion and families (`more`); the record's
// result does not count.
template <class More>
HRESULT RegisterEx(const GUID& clsid, const wchar_t* category, HINSTANCE module, unsigned int nameId,
                   More&& more) {
    return Registration([&] {
        HRESULT hr = RegisterNamedId(clsid, category, module, nameId);
        return FAILED(hr) ? hr : more();
    });
}

HRESULT RegisterInspectable(const GUID& clsid, const wchar_t* category, HINSTANCE module, unsigned int nameId,
                            const GUID& companion, unsigned int companionNameId, const GUID& family) {
    return RegisterEx(clsid, category, module, nameId, [&] {
        return KXRegisterInspectableObject(clsid, module, nameId, companion, companionNameId, family);
    });
}

HRESULT RegisterInspectable(const GUID& clsid, const wchar_t* category, HINSTANCE module, unsigned int nameId,
                            bool flag, const GUID& companion, unsigned int companionNameId,
                            unsigned int familyCount, const GUID* families) {
    return RegisterEx(clsid, category, module, nameId, [&] {
        return KXRegisterInspectableObject(clsid, module, nameId, flag, companion, companionNameId,
                                           familyCount, families);
    });
}

void CleanCategory(const wchar_t* category) {
    (void)GwRegCleanKey(HKEY_LOCAL_MACHINE, CategoryKey(category).c_str()); // tidying only
}

HRESULT UnregisterCategory(const GUID& clsid, const wchar_t* category) {
    return Registration([&] {
        (void)GWUnregisterCOMObject(clsid); // the record goes whether or not the class was entered
        HRESULT hr = KXRemRegistryKey(clsid, category);
        CleanCategory(category);
        return hr;
    });
}

// The first steps of the Ex forms' removal, whose results are not used.
void UnregisterExClass(const GUID& clsid, const wchar_t* category) {
    (void)GWUnregisterCOMObject(clsid);      // the removal goes on whatever it answers
    (void)KXRemRegistryKey(clsid, category); // likewise
    CleanCategory(category);
}

HRESULT UnregisterInspectable(const GUID& clsid, const wchar_t* category, const GUID& companion,
                              unsigned int familyCount, const GUID* families, HINSTANCE module) {
    return Registration([&] {
        UnregisterExClass(clsid, category);
        return KXUnRegisterInspectableObject(clsid, companion, familyCount, families, module);
    });
}

HRESULT UnregisterInspectable(const GUID& clsid, const wchar_t* category, const GUID& companion,
                              const GUID& family, HINSTANCE module) {
    return Registration([&] {
        UnregisterExClass(clsid, category);
        return KXUnRegisterInspectableObject(clsid, companion, family, module);
    });
}

HRESULT RegisterManipulator(const GUID& clsid, HINSTANCE module, const wchar_t* name,
                            unsigned int controlCount, const GUID* controls) {
    (void)KXUnRegisterManipulator(clsid); // a registration always starts clean
    HRESULT hr = GWRegisterCOMObject(clsid, module, name);
    if (FAILED(hr))
        return hr;
    (void)KXAddRegistryKey(clsid, kManipulator, kName,
                           name); // a record that failed does not stop the controls
    UniqueHKey category = Open(HKEY_LOCAL_MACHINE, CategoryKey(kManipulator), kReadWrite);
    if (!category)
        return E_FAIL;
    UniqueHKey classKey = Open(category.get(), GuidToString(clsid), kReadWrite);
    if (!classKey)
        return E_FAIL;
    for (unsigned int i = 0; i < controlCount; ++i) {
        HKEY control = nullptr;
        if (RegCreateKeyExW(classKey.get(), GuidToString(controls[i]).c_str(), 0, nullptr,
                            REG_OPTION_NON_VOLATILE, kReadWrite, nullptr, &control,
                            nullptr) != ERROR_SUCCESS ||
            RegCloseKey(control) != ERROR_SUCCESS)
            return E_FAIL;
    }
    return S_OK;
}

HRESULT UnregisterManipulator(const GUID& clsid) {
    (void)GWUnregisterCOMObject(clsid);          // the class key goes whatever it answers
    (void)KXRemRegistryKey(clsid, kManipulator); // fails while the controls are below the class key
    UniqueHKey category = Open(HKEY_LOCAL_MACHINE, CategoryKey(kManipulator), kReadWrite);
    if (!category)
        return E_FAIL;
    (void)GWRegDeleteKey(category.get(), GuidToString(clsid).c_str()); // the next step tells what is left
    category.reset();
    HRESULT hr = KXRemRegistryKey(clsid, kManipulator);
    CleanCategory(kManipulator);
    return hr;
}

} // namespace
} // namespace ut::registration

using namespace ut::registration;
using ut::UniqueHKey;

// --- By name and by string identifier

HRESULT KXRegisterOperator(const GUID& clsid, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, L"Operator", module, name);
}
HRESULT KXRegisterProperty(const GUID& clsid, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, L"Property", module, name);
}
HRESULT KXRegisterPrimitive(const GUID& clsid, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, L"Primitive", module, name);
}
HRESULT KXRegisterView(const GUID& clsid, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, L"View", module, name);
}
HRESULT KXRegisterPointLocatorArray(const GUID& clsid, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, L"PointLocatorArray", module, name);
}
HRESULT KXRegisterOperator(const GUID& clsid, HINSTANCE module, unsigned int nameId) {
    return RegisterNamedId(clsid, L"Operator", module, nameId);
}
HRESULT KXRegisterProperty(const GUID& clsid, HINSTANCE module, unsigned int nameId) {
    return RegisterNamedId(clsid, L"Property", module, nameId);
}
HRESULT KXRegisterPrimitive(const GUID& clsid, HINSTANCE module, unsigned int nameId) {
    return RegisterNamedId(clsid, L"Primitive", module, nameId);
}
HRESULT KXRegisterView(const GUID& clsid, HINSTANCE module, unsigned int nameId) {
    return RegisterNamedId(clsid, L"View", module, nameId);
}

// --- Ex forms

HRESULT KXRegisterOperatorEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, const GUID& companion,
                             unsigned int companionNameId, const GUID& family) {
    return RegisterInspectable(clsid, L"Operator", module, nameId, companion, companionNameId, family);
}
HRESULT KXRegisterPropertyEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, const GUID& companion,
                             unsigned int companionNameId, const GUID& family) {
    return RegisterInspectable(clsid, L"Property", module, nameId, companion, companionNameId, family);
}
HRESULT KXRegisterOperatorEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                             const GUID& companion, unsigned int companionNameId, unsigned int familyCount,
                             const GUID* families) {
    return RegisterInspectable(clsid, L"Operator", module, nameId, flag, companion, companionNameId,
                               familyCount, families);
}
HRESULT KXRegisterPropertyEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                             const GUID& companion, unsigned int companionNameId, unsigned int familyCount,
                             const GUID* families) {
    return RegisterInspectable(clsid, L"Property", module, nameId, flag, companion, companionNameId,
                               familyCount, families);
}
HRESULT KXRegisterPrimitiveEx(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                              const GUID& companion, unsigned int companionNameId, unsigned int familyCount,
                              const GUID* families) {
    return RegisterInspectable(clsid, L"Primitive", module, nameId, flag, companion, companionNameId,
                               familyCount, families);
}
HRESULT KXRegisterConstraint(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                             const GUID& companion, unsigned int companionNameId, unsigned int familyCount,
                             const GUID* families) {
    return RegisterInspectable(clsid, L"Constraint", module, nameId, flag, companion, companionNameId,
                               familyCount, families);
}

// --- Caller-named categories, paths, inspectors, manipulators and families

HRESULT KXRegisterKeyName(const GUID& clsid, const wchar_t* keyName, HINSTANCE module, const wchar_t* name) {
    return RegisterNamed(clsid, keyName, module, name);
}
HRESULT KXRegisterKeyNameId(const GUID& clsid, const wchar_t* keyName, HINSTANCE module,
                            unsigned int nameId) {
    return RegisterNamedId(clsid, keyName, module, nameId);
}
HRESULT KXRegisterKeyPath(const GUID& clsid, const wchar_t* keyName, const wchar_t* path) {
    return KXAddRegistryKey(clsid, keyName, kPath, path);
}
HRESULT KXRegisterTranslator(const GUID& clsid, const wchar_t* path) {
    return KXAddRegistryKey(clsid, L"Translator", kPath, path);
}
HRESULT KXRegisterResources(const GUID& clsid, const wchar_t* path) {
    return KXAddRegistryKey(clsid, L"Resources", kPath, path);
}

HRESULT KXRegisterViewInspector(const GUID& clsid, HINSTANCE module, const GUID& inspectedView) {
    return Registration([&] {
        CKXString name = CKXString::FromGUID(inspectedView);
        HRESULT hr = GWRegisterCOMObject(clsid, module, name);
        if (SUCCEEDED(hr))
            hr = KXAddRegistryKey(clsid, L"Inspector View", kName, name);
        return hr;
    });
}

HRESULT KXRegisterManipulator(const GUID& clsid, HINSTANCE module, const wchar_t* name,
                              unsigned int controlCount, const GUID* controls) {
    if (controlCount == 0)
        return E_INVALIDARG;
    if (!controls)
        return E_POINTER;
    return Registration([&] { return RegisterManipulator(clsid, module, name, controlCount, controls); });
}

HRESULT KXRegisterObjectFamilies(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                 unsigned int familyCount, const GUID* families) {
    return GWRegisterObjectFamilies(clsid, familyCount, families, flag, TextOf(module, nameId), module);
}

// --- Companions and families

HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                    const GUID& companion, unsigned int companionNameId,
                                    unsigned int familyCount, const GUID* families) {
    return Registration([&] {
        HRESULT hr = S_OK;
        if (!IsNull(companion)) {
            hr = GWRegisterCOMObject(companion, module, TextOf(module, companionNameId));
            if (FAILED(hr))
                return hr;
        }
        if (IsNull(clsid) || !families)
            return hr;
        return GWRegisterObjectFamilies(clsid, familyCount, families, flag, TextOf(module, nameId), module);
    });
}

HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int nameId, bool flag,
                                    const GUID& companion, unsigned int companionNameId, const GUID& family) {
    bool one = !IsNull(family);
    return KXRegisterInspectableObject(clsid, module, nameId, flag, companion, companionNameId, one ? 1u : 0u,
                                       one ? &family : nullptr);
}

HRESULT KXRegisterInspectableObject(const GUID& clsid, HINSTANCE module, unsigned int /*nameId*/,
                                    const GUID& companion, unsigned int companionNameId, const GUID& family) {
    return Registration([&] {
        const wchar_t* name = TextOf(module, companionNameId);
        HRESULT hr = S_OK;
        if (!IsNull(companion)) {
            hr = GWRegisterCOMObject(companion, module, name);
            if (FAILED(hr))
                return hr;
        }
        if (!IsNull(family)) {
            hr = GWRegisterFamily(family, family, GUID_NULL, L"MISC_FAMILY", L"c:\\material", module,
                                  GUID_NULL, GUID_NULL);
            if (FAILED(hr))
                return hr;
        }
        if (IsNull(clsid) || IsNull(family))
            return hr;
        const GUID families[] = {family};
        return GWRegisterObjectFamilies(clsid, 1, families, true, name, module);
    });
}

// --- Unregistration

HRESULT KXUnRegisterOperator(const GUID& clsid) {
    return UnregisterCategory(clsid, L"Operator");
}
HRESULT KXUnRegisterProperty(const GUID& clsid) {
    return UnregisterCategory(clsid, L"Property");
}
HRESULT KXUnRegisterPrimitive(const GUID& clsid) {
    return UnregisterCategory(clsid, L"Primitive");
}
HRESULT KXUnRegisterView(const GUID& clsid) {
    return UnregisterCategory(clsid, L"View");
}
HRESULT KXUnRegisterPointLocatorArray(const GUID& clsid) {
    return UnregisterCategory(clsid, L"PointLocatorArray");
}
HRESULT KXUnRegisterViewInspector(const GUID& clsid) {
    return UnregisterCategory(clsid, L"Inspector View");
}

HRESULT KXUnRegisterOperatorEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                               const GUID* families, HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Operator", companion, familyCount, families, module);
}
HRESULT KXUnRegisterPropertyEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                               const GUID* families, HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Property", companion, familyCount, families, module);
}
HRESULT KXUnRegisterPrimitiveEx(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                const GUID* families, HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Primitive", companion, familyCount, families, module);
}
HRESULT KXUnRegisterConstraint(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                               const GUID* families, HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Constraint", companion, familyCount, families, module);
}
HRESULT KXUnRegisterOperatorEx(const GUID& clsid, const GUID& companion, const GUID& family,
                               HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Operator", companion, family, module);
}
HRESULT KXUnRegisterPropertyEx(const GUID& clsid, const GUID& companion, const GUID& family,
                               HINSTANCE module) {
    return UnregisterInspectable(clsid, L"Property", companion, family, module);
}

HRESULT KXUnRegisterKeyName(const GUID& clsid, const wchar_t* keyName) {
    return Registration([&] {
        (void)GWUnregisterCOMObject(clsid); // the record goes whether or not the class was entered
        return KXRemRegistryKey(clsid, keyName);
    });
}
HRESULT KXUnRegisterTranslator(const GUID& clsid) {
    return KXRemRegistryKey(clsid, L"Translator");
}
HRESULT KXUnRegisterResources(const GUID& clsid) {
    return KXRemRegistryKey(clsid, L"Resources");
}

HRESULT KXUnRegisterManipulator(const GUID& clsid) {
    return Registration([&] { return UnregisterManipulator(clsid); });
}

HRESULT KXUnRegisterInspectableObject(const GUID& clsid, const GUID& companion, unsigned int familyCount,
                                      const GUID* families, HINSTANCE module) {
    return Registration([&] {
        HRESULT hr = S_OK;
        if (!IsNull(companion))
            hr = GWUnregisterCOMObject(companion);
        if (IsNull(clsid) || !families)
            return hr;
        return GWUnregisterObjectFamilies(clsid, familyCount, families, module);
    });
}

HRESULT KXUnRegisterInspectableObject(const GUID& clsid, const GUID& companion, const GUID& family,
                                      HINSTANCE module) {
    return Registration([&] {
        HRESULT hr = S_OK;
        if (!IsNull(companion))
            hr = GWUnregisterCOMObject(companion);
        if (!IsNull(family))
            hr = GWUnregisterFamily(family, module);
        if (IsNull(clsid) || IsNull(family))
            return hr;
        const GUID families[] = {family};
        return GWUnregisterObjectFamilies(clsid, 1, families, module);
    });
}
