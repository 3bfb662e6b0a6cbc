// Where the library finds the application: its singleton services by class id
// (GWQueryGenericObject) and its creatable classes (KXCreateInstance). An embedding application,
// or the reference host of src/host, installs both before it calls the library.
//
// Unknown class ids answer REGDB_E_CLASSNOTREG; a known object that lacks the interface answers
// E_NOINTERFACE. Out-parameters are cleared first; a null one answers E_POINTER.
#pragma once

#include <new>

#include <ut/platform/com.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/export.h>

UT_SDK_API HRESULT GWQueryGenericObject(REFCLSID clsid, REFIID iid, void** object);
// The one-identifier form hands out the object's IUnknown.
UT_SDK_API HRESULT GWQueryGenericObject(REFCLSID clsid, void** object);

// Creates an instance through the installed class factories, then through the platform's
// CoCreateInstance for classes the application did not install.
UT_SDK_API HRESULT KXCreateInstance(REFCLSID clsid, REFIID iid, void** object);

// Installation. A second installation under the same id replaces the first (S_FALSE).
// Revoking an id that is not installed answers S_FALSE.
UT_SDK_API HRESULT GWRegisterGenericObject(REFCLSID clsid, IUnknown* object);
UT_SDK_API HRESULT GWRevokeGenericObject(REFCLSID clsid);
UT_SDK_API HRESULT GWRegisterClassFactory(REFCLSID clsid, IClassFactory* factory);
UT_SDK_API HRESULT GWRevokeClassFactory(REFCLSID clsid);

namespace ut::sdk {

// CoCreateInstance with the installed class factories first: an application's creatable
// classes are found in `context` as the system's would be, and other classes go to the platform's
// CoCreateInstance with `context`.
UT_SDK_API HRESULT CreateInstance(REFCLSID clsid, DWORD context, REFIID iid, void** object);

// A class factory that creates `Object` (a CGWCOMObject) with `new` and Construct.
UT_SDK_API HRESULT CreateClassFactory(CGWCOMObject* (*create)(), IClassFactory** factory);

template <class Object>
CGWCOMObject* NewObject() {
    return new (std::nothrow) Object();
}

// Installs `Object` as the creatable class `clsid`.
template <class Object>
HRESULT RegisterClass(REFCLSID clsid) {
    ComPtr<IClassFactory> factory;
    HRESULT hr = CreateClassFactory(&NewObject<Object>, factory.Put());
    if (FAILED(hr))
        return hr;
    return GWRegisterClassFactory(clsid, factory.Get());
}

} // namespace ut::sdk
