#include <ut/persist.h>

ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3] = {{eFeaturesVersionScene, 64, 0}};
