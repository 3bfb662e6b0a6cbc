#include <ut/persist.h>

ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3] = {{eFeaturesVersionScene, 64, 0}};

void KXGetFeatureVersion(tagEFeaturesVersion feature, ULONG* loaded, ULONG* current) {
    if (feature >= eFeaturesVersionCount)
        return;
    if (loaded)
        *loaded = g_uiFeaturesVersion[feature][eFeatureLoaded];
    if (current)
        *current = g_uiFeaturesVersion[feature][eFeatureCurrent];
}
