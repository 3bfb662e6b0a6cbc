// The reference host installs and revokes its services and answers as its settings say.
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/database.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "support/ref_tracker.h"

namespace {

// The string, "<absent>" when the object answers S_FALSE with no text.
std::wstring VersionString(ULONG index) {
    ut::ComPtr<IGWVersionInfo> info;
    EXPECT_EQ(GWQueryGenericObject(CLSID_GWVersionInfo, IID_IGWVersionInfo, info.PutVoid()), S_OK);
    wchar_t* text = reinterpret_cast<wchar_t*>(&text); // must be overwritten
    HRESULT hr = info ? info->GetVersionString(index, &text) : E_FAIL;
    std::unique_ptr<wchar_t, ut::TaskMemDeleter> owned(hr == S_OK ? text : nullptr);
    if (hr == S_FALSE && !text)
        return L"<absent>";
    return hr == S_OK ? std::wstring(text) : L"<failed>";
}

TEST(ReferenceHost, InstallsItsServicesAndRevokesThemAtTheEnd) {
    const CLSID services[] = {CLSID_GWVersionInfo, CLSID_GWAmbientValues, CLSID_GWActiveDatabase};
    ut::test::LiveObjectCheck live;
    {
        ut::host::ReferenceHost host;
        ASSERT_EQ(host.Status(), S_OK);
        for (const CLSID& clsid : services) {
            ut::ComPtr<IUnknown> service;
            EXPECT_EQ(GWQueryGenericObject(clsid, service.PutVoid()), S_OK);
        }
    }
    for (const CLSID& clsid : services) {
        void* out = nullptr;
        EXPECT_EQ(GWQueryGenericObject(clsid, &out), REGDB_E_CLASSNOTREG);
    }
}

TEST(VersionInfo, DefaultsDescribeARecentHost) {
    ut::host::ReferenceHost host;
    EXPECT_NE(VersionString(GWVERSION_PRODUCT), L"<absent>");
    std::wstring build = VersionString(GWVERSION_BUILD);
    EXPECT_EQ(build.size(), 4u);
    EXPECT_GT(build, L"1109"); // past every build that older formats are told apart by
    EXPECT_EQ(VersionString(GWVERSION_MAJOR), L"2003");
}

TEST(VersionInfo, AnswersTheConfiguredStringsAndNothingElse) {
    ut::host::ReferenceHost host({.productName = L"", .build = L"0901", .major = L"2000"});
    EXPECT_EQ(VersionString(GWVERSION_PRODUCT), L"<absent>");
    EXPECT_EQ(VersionString(GWVERSION_BUILD), L"0901");
    EXPECT_EQ(VersionString(GWVERSION_MAJOR), L"2000");
    EXPECT_EQ(VersionString(3), L"<absent>");
}

TEST(AmbientValues, StartFromTheSettingsAndConvertBetweenKinds) {
    ut::host::ReferenceHost host({.importingDelta = true, .constructionMode = -5});
    ut::ComPtr<IGWAmbientValues> values;
    ASSERT_EQ(KXGetAmbientValuesMgr(values.Put()), S_OK);
    BOOL flag = 77;
    LONG number = 77;
    EXPECT_EQ(values->GetInt(L"referencing.importingdelta", &number), S_OK);
    EXPECT_EQ(number, 1);
    EXPECT_EQ(values->GetBool(L"context.constructionmode", &flag), S_OK);
    EXPECT_EQ(flag, TRUE);
    EXPECT_EQ(values->SetBool(L"context.constructionmode", 42), S_OK); // any non-zero BOOL is true
    EXPECT_EQ(values->GetInt(L"context.constructionmode", &number), S_OK);
    EXPECT_EQ(number, 1);

    // Unknown names (exact, no folding of case) leave the value; setting one creates it.
    number = 77;
    EXPECT_EQ(values->GetInt(L"Context.ConstructionMode", &number), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(values->GetBool(L"rendering.samples", &flag), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(number, 77);
    EXPECT_EQ(values->SetInt(L"rendering.samples", 0), S_OK);
    EXPECT_EQ(values->GetBool(L"rendering.samples", &flag), S_OK);
    EXPECT_EQ(flag, FALSE);
}

} // namespace
