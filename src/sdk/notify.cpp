// GWPropertyNotify: a property owner's notification, sent to the sinks it keeps.
#include <ut/sdk/notify.h>

HRESULT GWPropertyNotify(ULONG kind, REFGUID property, const VARIANT* value, IUnknown* owner,
                         const GWPARAMS* parameters, USHORT first, USHORT second,
                         std::map<IGwPropertyNotifySink*, unsigned long>& sinks) {
    HRESULT result = S_FALSE;
    for (const auto& [sink, mask] : sinks) {
        if (!sink || (mask != 0 && (mask & (1u << kind)) == 0))
            continue;
        HRESULT told = sink->OnPropertyNotify(kind, property, value, owner, parameters, first, second);
        if (FAILED(told) && SUCCEEDED(result))
            result = told;
        else if (result == S_FALSE)
            result = S_OK;
    }
    return result;
}
