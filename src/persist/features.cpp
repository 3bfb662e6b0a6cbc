// The feature-version table and its chunk.
#include <ut/persist.h>

#include "module/state.h"
#include "persist/feature_chunk.h"

ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3] = {{eFeaturesVersionScene, 64, 0}};

void KXGetFeatureVersion(tagEFeaturesVersion feature, ULONG* loaded, ULONG* current) {
    if (feature >= eFeaturesVersionCount)
        return;
    if (loaded)
        *loaded = g_uiFeaturesVersion[feature][eFeatureLoaded];
    if (current)
        *current = g_uiFeaturesVersion[feature][eFeatureCurrent];
}

HRESULT KXLoadFeaturesVersion(C3DStreamHelper& stream) {
    if (!ut::module::Loaded())
        return E_UNEXPECTED;
    return ut::persist::LoadFeaturesVersion(stream);
}
