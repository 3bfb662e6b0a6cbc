// Access to the host's ambient values manager.
#include <ut/sdk/ambient.h>
#include <ut/sdk/objects.h>

HRESULT KXGetAmbientValuesMgr(IGWAmbientValues** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWAmbientValues, IID_IGWAmbientValues,
                                reinterpret_cast<void**>(manager));
}
