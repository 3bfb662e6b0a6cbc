#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/persist.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

ut::host::Settings Host(std::wstring major, std::wstring build) {
    ut::host::Settings settings;
    settings.major = std::move(major);
    settings.build = std::move(build);
    return settings;
}

TEST(FeatureVersions, ReportTheTableAndToleratePartialRequests) {
    ULONG loaded = 99, current = 99;
    KXGetFeatureVersion(eFeaturesVersionScene, &loaded, &current);
    EXPECT_EQ(current, 64u);
    EXPECT_EQ(loaded, g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureLoaded]);

    current = 99;
    KXGetFeatureVersion(eFeaturesVersionScene, nullptr, &current);
    EXPECT_EQ(current, 64u);
    KXGetFeatureVersion(eFeaturesVersionScene, nullptr, nullptr);

    // A feature the table does not have is not read past the table's end.
    loaded = current = 99;
    KXGetFeatureVersion(eFeaturesVersionCount, &loaded, &current);
    KXGetFeatureVersion(static_cast<tagEFeaturesVersion>(0xFFFFFFFF), &loaded, &current);
    EXPECT_EQ(loaded, 99u);
    EXPECT_EQ(current, 99u);
}

TEST(PersistedVersion, IsToldFromTheHostsMajorVersionAndBuild) {
    struct Case {
        const wchar_t* major;
        const wchar_t* build;
        tagVersion expected;
    };
    // Builds compare as text: "1" lies between "0901" and "1023", "11090" after "1109".
    const Case cases[] = {
        {L"2000", L"0000", ePersistedVersion1500},  {L"2000", L"0901", ePersistedVersion1500},
        {L"2000", L"0902", ePersistedVersion1510},  {L"2000", L"1023", ePersistedVersion1510},
        {L"2000", L"1024", ePersistedVersion1520},  {L"2000", L"1109", ePersistedVersion1520},
        {L"2000", L"1110", ePersistedVersion1511},  {L"2000", L"9999", ePersistedVersion1511},
        {L"2000", L"", ePersistedVersion1511},      {L"2000", L"09", ePersistedVersion1500},
        {L"2000", L"1", ePersistedVersion1510},     {L"2000", L"11090", ePersistedVersion1511},
        {L"2001", L"0901", ePersistedVersion1531},  {L"2001", L"", ePersistedVersion1531},
        {L"2003", L"1200", ePersistedVersion1531},  {L"", L"0901", ePersistedVersion1531},
        {L"2000 ", L"0901", ePersistedVersion1531},
    };
    for (const Case& c : cases) {
        ut::host::ReferenceHost host(Host(c.major, c.build));
        EXPECT_EQ(F3DGetVersionPersisted(S_OK, 0), c.expected)
            << "major \"" << c.major << "\" build \"" << c.build << "\"";
    }
}

TEST(PersistedVersion, AMissingVersionChunkMeansTheOldestFormat) {
    for (const wchar_t* major : {L"2000", L"2003"}) {
        ut::host::ReferenceHost host(Host(major, L"0901"));
        EXPECT_EQ(F3DGetVersionPersisted(STG_E_INVALIDHEADER, 0), ePersistedVersion1000);
        // Only that one failure says so: others classify the host as usual.
        EXPECT_NE(F3DGetVersionPersisted(E_FAIL, 0), ePersistedVersion1000);
        EXPECT_NE(F3DGetVersionPersisted(STG_E_OLDFORMAT, 0), ePersistedVersion1000);
    }
}

TEST(PersistedVersion, ReleasesTheHostObjectOnEveryPath) {
    ut::host::ReferenceHost host(Host(L"2000", L"1024"));
    ut::ComPtr<IGWVersionInfo> info;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWVersionInfo, IID_IGWVersionInfo, info.PutVoid()), S_OK);
    ut::test::RefTracker refs;
    refs.Track(info.Get(), 2, "version information"); // the host's and ours

    EXPECT_EQ(F3DGetVersionPersisted(S_OK, 0), ePersistedVersion1520);
    EXPECT_EQ(F3DGetVersionPersisted(STG_E_INVALIDHEADER, 0), ePersistedVersion1000);
    // Walk each host call failing in turn: a missing object or string degrades the answer.
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

TEST(PersistedVersion, WithoutAHostEveryAnswerIsTheNewestOtherMajor) {
    EXPECT_EQ(F3DGetVersionPersisted(S_OK, 0), ePersistedVersion1531);
    EXPECT_EQ(F3DGetVersionPersisted(STG_E_INVALIDHEADER, 0), ePersistedVersion1000);
}

TEST(VersionIdFromMode, MapsTheFourConstructionModes) {
    struct Case {
        LONG mode;
        ULONG expected;
    };
    for (const Case& c :
         {Case{0, 3}, Case{1, 4}, Case{2, 5}, Case{3, 6}, Case{4, 77}, Case{-1, 77}, Case{1000, 77}}) {
        ut::host::Settings settings;
        settings.constructionMode = c.mode;
        ut::host::ReferenceHost host(settings);
        ULONG versionId = 77;
        EXPECT_EQ(F3DGetVersionIdFromMode(versionId), S_OK) << "mode " << c.mode;
        EXPECT_EQ(versionId, c.expected) << "mode " << c.mode;
    }
}

TEST(VersionIdFromMode, PassesOnFailuresToReadTheMode) {
    ULONG versionId = 77;
    EXPECT_EQ(F3DGetVersionIdFromMode(versionId), REGDB_E_CLASSNOTREG); // no ambient values at all

    ut::host::Settings settings;
    settings.constructionMode = 2;
    ut::host::ReferenceHost host(settings);
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n, E_ACCESSDENIED);
        HRESULT hr = F3DGetVersionIdFromMode(versionId);
        if (!plan.Fired())
            break;
        EXPECT_EQ(hr, E_ACCESSDENIED) << "host call " << n << " failing";
        EXPECT_EQ(versionId, 77u);
    }
}

TEST(ActiveDatabaseMode, ComparesWithTheHostsCurrentMode) {
    EXPECT_EQ(IsCurrentActiveDBMode(0), 0); // no host to ask

    ut::host::Settings settings;
    settings.activeDatabaseMode = 2;
    ut::host::ReferenceHost host(settings);
    EXPECT_EQ(IsCurrentActiveDBMode(2), 1);
    EXPECT_EQ(IsCurrentActiveDBMode(0), 0);
    EXPECT_EQ(IsCurrentActiveDBMode(0x80000002), 0);
    for (int n = 1;; ++n) {
        ut::test::FaultPlan plan(n);
        int answer = IsCurrentActiveDBMode(2);
        if (!plan.Fired())
            break;
        EXPECT_EQ(answer, 0) << "host call " << n << " failing";
    }
}

} // namespace
