// The application's saving and loading state as the library reaches it.
#include <ut/sdk/application.h>
#include <ut/sdk/objects.h>

HRESULT KXGetCurrentGWSavingState(GWSaveType* save, GWLoadType* load) {
    if (!save || !load)
        return E_POINTER;
    *save = GWSAVE_NONE;
    *load = GWLOAD_NONE;
    ut::ComPtr<IGWApplication> application;
    if (HRESULT hr = GWQueryGenericObject(CLSID_GWApplication, IID_IGWApplication, application.PutVoid());
        FAILED(hr))
        return hr;
    return application->GetSavingState(save, load);
}
