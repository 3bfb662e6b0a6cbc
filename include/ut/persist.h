// Persistence: the feature-version table.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>

// The features whose format revision a stream records.
enum tagEFeaturesVersion : ULONG {
    eFeaturesVersionScene = 0,
    eFeaturesVersionCount
};

// Columns of a row of g_uiFeaturesVersion.
enum : ULONG { eFeatureNumber = 0, eFeatureCurrent = 1, eFeatureLoaded = 2 };

// One row per feature: its number, the version this library writes, the version found in the
// stream being loaded.
UT_API extern ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3];
