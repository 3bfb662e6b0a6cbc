#include <memory>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/database.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

using TaskText = std::unique_ptr<wchar_t, ut::TaskMemDeleter>;

template <class Interface>
ut::ComPtr<Interface> Service(REFCLSID clsid) {
    ut::ComPtr<Interface> service;
    EXPECT_EQ(GWQueryGenericObject(clsid, ut::InterfaceId<Interface>::Get(), service.PutVoid()), S_OK);
    return service;
}

// The string, or "<absent>" when the object answers S_FALSE with no text.
std::wstring VersionString(IGWVersionInfo* info, ULONG index) {
    wchar_t* text = reinterpret_cast<wchar_t*>(&text); // must be overwritten
    HRESULT hr = info->GetVersionString(index, &text);
    TaskText owned(hr == S_OK ? text : nullptr);
    if (hr == S_FALSE && !text)
        return L"<absent>";
    return hr == S_OK && text ? std::wstring(text) : L"<hr " + std::to_wstring(hr) + L">";
}

TEST(ReferenceHost, InstallsItsServicesAndRevokesThemAtTheEnd) {
    ut::test::LiveObjectCheck live;
    {
        ut::host::ReferenceHost host;
        ASSERT_EQ(host.Status(), S_OK);
        for (const CLSID& clsid : {CLSID_GWVersionInfo, CLSID_GWAmbientValues, CLSID_GWActiveDatabase}) {
            ut::ComPtr<IUnknown> service;
            EXPECT_EQ(GWQueryGenericObject(clsid, service.PutVoid()), S_OK);
        }
    }
    for (const CLSID& clsid : {CLSID_GWVersionInfo, CLSID_GWAmbientValues, CLSID_GWActiveDatabase}) {
        void* out = nullptr;
        EXPECT_EQ(GWQueryGenericObject(clsid, &out), REGDB_E_CLASSNOTREG);
    }
}

TEST(ReferenceHost, DefaultsDescribeARecentHost) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWVersionInfo> info = Service<IGWVersionInfo>(CLSID_GWVersionInfo);
    ASSERT_TRUE(info);
    EXPECT_NE(VersionString(info.Get(), GWVERSION_PRODUCT), L"<absent>");
    std::wstring build = VersionString(info.Get(), GWVERSION_BUILD);
    EXPECT_EQ(build.size(), 4u);
    EXPECT_GT(build, L"1109"); // newer than every build that older formats are told apart by
    EXPECT_EQ(VersionString(info.Get(), GWVERSION_MAJOR), L"2003");
}

TEST(VersionInfo, AnswersTheConfiguredStringsAndNothingElse) {
    ut::host::Settings settings;
    settings.productName = L"";
    settings.build = L"0901";
    settings.major = L"2000";
    ut::host::ReferenceHost host(settings);
    ut::ComPtr<IGWVersionInfo> info = Service<IGWVersionInfo>(CLSID_GWVersionInfo);
    ASSERT_TRUE(info);

    struct Case {
        ULONG index;
        const wchar_t* expected;
    };
    for (const Case& c :
         {Case{GWVERSION_PRODUCT, L"<absent>"}, Case{GWVERSION_BUILD, L"0901"},
          Case{GWVERSION_MAJOR, L"2000"}, Case{3, L"<absent>"}, Case{0xFFFFFFFF, L"<absent>"}})
        EXPECT_EQ(VersionString(info.Get(), c.index), c.expected) << "string " << c.index;
    EXPECT_EQ(info->GetVersionString(GWVERSION_BUILD, nullptr), E_POINTER);
}

TEST(ActiveDatabase, ReportsTheConfiguredMode) {
    ut::host::Settings settings;
    settings.activeDatabaseMode = 3;
    ut::host::ReferenceHost host(settings);
    ut::ComPtr<IGWActiveDatabase> database = Service<IGWActiveDatabase>(CLSID_GWActiveDatabase);
    ASSERT_TRUE(database);
    ULONG mode = 0;
    EXPECT_EQ(database->GetCurrentMode(&mode), S_OK);
    EXPECT_EQ(mode, 3u);
    EXPECT_EQ(database->GetCurrentMode(nullptr), E_POINTER);
}

TEST(AmbientValues, AreSeededFromTheSettings) {
    struct Case {
        bool importingDelta;
        LONG constructionMode;
    };
    for (const Case& c : {Case{false, 0}, Case{true, 2}, Case{true, -5}}) {
        ut::host::Settings settings;
        settings.importingDelta = c.importingDelta;
        settings.constructionMode = c.constructionMode;
        ut::host::ReferenceHost host(settings);
        ut::ComPtr<IGWAmbientValues> values;
        ASSERT_EQ(KXGetAmbientValuesMgr(values.Put()), S_OK);
        BOOL delta = -1;
        LONG mode = -1;
        EXPECT_EQ(values->GetBool(L"referencing.importingdelta", &delta), S_OK);
        EXPECT_EQ(values->GetInt(L"context.constructionmode", &mode), S_OK);
        EXPECT_EQ(delta, c.importingDelta ? TRUE : FALSE);
        EXPECT_EQ(mode, c.constructionMode);
    }
}

TEST(AmbientValues, UnknownNamesLeaveTheValueAndSettingCreatesIt) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWAmbientValues> values;
    ASSERT_EQ(KXGetAmbientValuesMgr(values.Put()), S_OK);
    LONG number = 77;
    BOOL flag = 77;
    EXPECT_EQ(values->GetInt(L"rendering.samples", &number), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(values->GetBool(L"rendering.samples", &flag), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(number, 77);
    EXPECT_EQ(flag, 77);

    EXPECT_EQ(values->SetInt(L"rendering.samples", 16), S_OK);
    EXPECT_EQ(values->GetInt(L"rendering.samples", &number), S_OK);
    EXPECT_EQ(number, 16);
    // Names are exact: no folding of case.
    EXPECT_EQ(values->GetInt(L"Rendering.Samples", &number), DISP_E_MEMBERNOTFOUND);
}

TEST(AmbientValues, ConvertBetweenBooleanAndInteger) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWAmbientValues> values;
    ASSERT_EQ(KXGetAmbientValuesMgr(values.Put()), S_OK);
    struct Case {
        LONG stored;
        BOOL asBool;
    };
    for (const Case& c : {Case{0, FALSE}, Case{1, TRUE}, Case{-3, TRUE}, Case{1000, TRUE}}) {
        ASSERT_EQ(values->SetInt(L"x", c.stored), S_OK);
        BOOL flag = -1;
        EXPECT_EQ(values->GetBool(L"x", &flag), S_OK);
        EXPECT_EQ(flag, c.asBool) << c.stored;
    }
    // Any non-zero BOOL is true, and reads back as the integer 1.
    ASSERT_EQ(values->SetBool(L"x", 42), S_OK);
    LONG number = -1;
    EXPECT_EQ(values->GetInt(L"x", &number), S_OK);
    EXPECT_EQ(number, 1);
    ASSERT_EQ(values->SetBool(L"x", FALSE), S_OK);
    EXPECT_EQ(values->GetInt(L"x", &number), S_OK);
    EXPECT_EQ(number, 0);
}

TEST(AmbientValues, RejectNullArguments) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWAmbientValues> values;
    ASSERT_EQ(KXGetAmbientValuesMgr(values.Put()), S_OK);
    BOOL flag = 0;
    LONG number = 0;
    EXPECT_EQ(values->GetBool(nullptr, &flag), E_POINTER);
    EXPECT_EQ(values->GetBool(L"x", nullptr), E_POINTER);
    EXPECT_EQ(values->GetInt(nullptr, &number), E_POINTER);
    EXPECT_EQ(values->GetInt(L"x", nullptr), E_POINTER);
    EXPECT_EQ(values->SetBool(nullptr, TRUE), E_POINTER);
    EXPECT_EQ(values->SetInt(nullptr, 1), E_POINTER);
}

// Each service method is a host call that a fault plan can fail, so that callers' failure paths
// can be walked on the reference host.
TEST(ReferenceHost, ServiceCallsAnswerTheFaultPlan) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWVersionInfo> info = Service<IGWVersionInfo>(CLSID_GWVersionInfo);
    ut::ComPtr<IGWActiveDatabase> database = Service<IGWActiveDatabase>(CLSID_GWActiveDatabase);
    ut::ComPtr<IGWAmbientValues> values = Service<IGWAmbientValues>(CLSID_GWAmbientValues);
    ASSERT_TRUE(info && database && values);

    ut::test::FaultPlan plan(1, E_ACCESSDENIED);
    wchar_t* text = nullptr;
    EXPECT_EQ(info->GetVersionString(GWVERSION_MAJOR, &text), E_ACCESSDENIED);
    EXPECT_EQ(text, nullptr);
    ULONG mode = 9;
    LONG number = 9;
    BOOL flag = 9;
    EXPECT_EQ(database->GetCurrentMode(&mode), S_OK);
    EXPECT_EQ(values->GetInt(L"context.constructionmode", &number), S_OK);
    EXPECT_EQ(values->GetBool(L"referencing.importingdelta", &flag), S_OK);
    EXPECT_EQ(values->SetInt(L"x", 1), S_OK);
    EXPECT_EQ(values->SetBool(L"x", TRUE), S_OK);
    EXPECT_THAT(plan.Seen(),
                testing::ElementsAre("IGWVersionInfo::GetVersionString", "IGWActiveDatabase::GetCurrentMode",
                                     "IGWAmbientValues::GetInt", "IGWAmbientValues::GetBool",
                                     "IGWAmbientValues::SetInt", "IGWAmbientValues::SetBool"));
}

} // namespace
