// The way to the application's file-dialog service.
#include <ut/sdk/dialogs.h>
#include <ut/sdk/objects.h>

HRESULT KXGetFileDialogs(IGWFileDialogs** dialogs) {
    if (!dialogs)
        return E_POINTER;
    return GWQueryGenericObject(CLSID_GWFileDialogs, IID_IGWFileDialogs, reinterpret_cast<void**>(dialogs));
}
