// Access to the host's image loader.
#include <ut/sdk/image.h>
#include <ut/sdk/objects.h>

HRESULT KXGetImageLoader(IGWImageLoader** loader) {
    if (!loader)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWImageLoader, IID_IGWImageLoader, reinterpret_cast<void**>(loader));
}
