// Persisted-version codes, version ids from the construction mode, database-mode queries.
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/persist.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

TEST(PersistedVersion, IsToldFromTheVersionChunkAndTheHostsBuild) {
    struct Case {
        const wchar_t* major;
        const wchar_t* build;
        HRESULT openResult;
        tagVersion expected;
    };
    // Builds compare as text: "1" lies between "0901" and "1023", "11090" after "1109".
    const Case cases[] = {
        {L"2000", L"0901", S_OK, ePersistedVersion1500},
        {L"2000", L"0902", S_OK, ePersistedVersion1510},
        {L"2000", L"1023", S_OK, ePersistedVersion1510},
        {L"2000", L"1024", S_OK, ePersistedVersion1520},
        {L"2000", L"1109", S_OK, ePersistedVersion1520},
        {L"2000", L"1110", S_OK, ePersistedVersion1511},
        {L"2000", L"", S_OK, ePersistedVersion1511},
        {L"2000", L"1", S_OK, ePersistedVersion1510},
        {L"2000", L"11090", S_OK, ePersistedVersion1511},
        {L"2001", L"0901", S_OK, ePersistedVersion1531},
        {L"2000", L"0901", E_FAIL, ePersistedVersion1500},
        {L"2003", L"1200", STG_E_INVALIDHEADER, ePersistedVersion1000},
    };
    for (const Case& c : cases) {
        ut::host::ReferenceHost host({.build = c.build, .major = c.major});
        EXPECT_EQ(F3DGetVersionPersisted(c.openResult, 0), c.expected)
            << "major \"" << c.major << "\" build \"" << c.build << "\" open " << c.openResult;
    }
}

TEST(PersistedVersion, DegradesAndReleasesWhenTheHostFails) {
    ut::host::ReferenceHost host({.build = L"1024", .major = L"2000"});
    ut::ComPtr<IGWVersionInfo> info;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWVersionInfo, IID_IGWVersionInfo, info.PutVoid()), S_OK);
    ut::test::RefTracker refs;
    refs.Track(info.Get(), 2, "version information"); // the host's and ours
    // The object, the build string, the major string.
    const tagVersion whenFailing[] = {ePersistedVersion1531, ePersistedVersion1511, ePersistedVersion1531};
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        tagVersion version = F3DGetVersionPersisted(S_OK, 0);
        if (!plan.Fired())
            break;
        ASSERT_LE(n, 3);
        EXPECT_EQ(version, whenFailing[n - 1]) << "host call " << n << " failing";
    }
}

TEST(VersionIdFromMode, MapsTheFourConstructionModesAndPassesOnFailures) {
    struct Case {
        LONG mode;
        ULONG expected;
    };
    for (const Case& c : {Case{0, 3}, Case{1, 4}, Case{2, 5}, Case{3, 6}, Case{4, 77}, Case{-1, 77}}) {
        ut::host::ReferenceHost host({.constructionMode = c.mode});
        ULONG versionId = 77;
        EXPECT_EQ(F3DGetVersionIdFromMode(versionId), S_OK) << "mode " << c.mode;
        EXPECT_EQ(versionId, c.expected) << "mode " << c.mode;
        for (int n = 1;; ++n) {
            ut::test::FaultPlan plan(n, E_ACCESSDENIED);
            versionId = 77;
            HRESULT hr = F3DGetVersionIdFromMode(versionId);
            if (!plan.Fired())
                break;
            EXPECT_EQ(hr, E_ACCESSDENIED) << "host call " << n << " failing";
            EXPECT_EQ(versionId, 77u);
        }
    }
}

TEST(ActiveDatabaseMode, ComparesWithTheHostsCurrentMode) {
    EXPECT_EQ(IsCurrentActiveDBMode(0), 0); // no host to ask
    ut::host::ReferenceHost host({.activeDatabaseMode = 2});
    EXPECT_EQ(IsCurrentActiveDBMode(2), 1);
    EXPECT_EQ(IsCurrentActiveDBMode(0), 0);
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        int answer = IsCurrentActiveDBMode(2);
        if (!plan.Fired())
            break;
        EXPECT_EQ(answer, 0) << "host call " << n << " failing";
    }
}

} // namespace
