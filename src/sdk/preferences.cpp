// Access to the host's preferences manager.
#include <ut/sdk/objects.h>
#include <ut/sdk/preferences.h>

HRESULT KXGetPreferencesMgr(IGWPreferences** manager) {
    if (!manager)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWPreferences, IID_IGWPreferences, reinterpret_cast<void**>(manager));
}
