// Persistence: the feature-version table and persisted-version codes, and user data blocks.
#pragma once

#include <ut/export.h>
#include <ut/platform/com.h>

// ---------------------------------------------------------------------------------------------
// Feature and persisted versions

// The features whose format revision a stream records.
enum tagEFeaturesVersion : ULONG { eFeaturesVersionScene = 0, eFeaturesVersionCount };

// Columns of a row of g_uiFeaturesVersion.
enum : ULONG { eFeatureNumber = 0, eFeatureCurrent = 1, eFeatureLoaded = 2 };

// One row per feature: its number, the version this library writes, the version found in the
// stream being loaded.
UT_API extern ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3];

// The loaded and current versions of a feature; either pointer may be null. A feature outside
// the table reports nothing.
UT_API void KXGetFeatureVersion(tagEFeaturesVersion feature, ULONG* loaded, ULONG* current);

// The format revision a scene was written with, told from the host that wrote it. Each value is
// its four digits in ASCII, most significant first.
enum tagVersion : ULONG {
    ePersistedVersion1000 = 0x31303030, // the scene's own version chunk is missing
    ePersistedVersion1500 = 0x31353030, // major version 2000, builds up to 0901
    ePersistedVersion1510 = 0x31353130, // major version 2000, builds 0902 to 1023
    ePersistedVersion1511 = 0x31353131, // major version 2000, builds after 1109 or unknown build
    ePersistedVersion1520 = 0x31353230, // major version 2000, builds 1024 to 1109
    ePersistedVersion1531 = 0x31353331, // any other major version
};

// Classifies the running host's build. `openResult` is what opening the caller's version chunk
// answered; STG_E_INVALIDHEADER (the chunk was not there) gives ePersistedVersion1000. The second
// argument is not used.
UT_API tagVersion F3DGetVersionPersisted(HRESULT openResult, ULONG unused);

// Maps the ambient construction mode 0, 1, 2, 3 to the version id 3, 4, 5, 6. Another mode
// leaves `versionId` as it was (S_OK); a failure to read the mode is returned.
UT_API HRESULT F3DGetVersionIdFromMode(ULONG& versionId);

// 1 when the host's active database is in `mode`, 0 otherwise or when it cannot be asked.
UT_API int IsCurrentActiveDBMode(ULONG mode);
