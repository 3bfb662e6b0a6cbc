// The reference host installs and revokes its services and answers as its settings say.
#include <cstdlib>
#include <memory>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/components.h>
#include <ut/sdk/content.h>
#include <ut/sdk/database.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/undo.h>
#include <ut/sdk/version.h>
#include <ut/sdk/views.h>

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
    const CLSID services[] = {CLSID_GWVersionInfo,
                              CLSID_GWAmbientValues,
                              CLSID_GWActiveDatabase,
                              CLSID_GWTimeManager,
                              CLSID_GWPlayControl,
                              CLSID_GWFileDialogs,
                              CLSID_3DSceneManagerFactory,
                              CLSID_GWUndoManager,
                              CLSID_GWDeleteAllBracket,
                              CLSID_GWViewManager,
                              CLSID_GWViewerControllerFactory,
                              CLSID_GWSetValueProxy};
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
    // Its classes and its current container are gone too.
    void* out = nullptr;
    for (const CLSID& clsid : {CLSID_GWContentContainer, CLSID_3DList, GUID_GWTimeMappingProperty})
        EXPECT_EQ(KXCreateInstance(clsid, IID_IUnknown, &out), REGDB_E_CLASSNOTREG);
    EXPECT_EQ(GWContentGetCurrentContainer(IID_IUnknown, &out), E_FAIL);
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

// What the library reads through these services is tested with the library; here is what it
// does not reach.
TEST(TimeServices, RefuseUnknownFormatTypesAndNullOutputs) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWTimeManager> manager;
    ut::ComPtr<IGWPlayControl> play;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWTimeManager, IID_IGWTimeManager, manager.PutVoid()), S_OK);
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWPlayControl, IID_IGWPlayControl, play.PutVoid()), S_OK);
    tagGWTIMEFORMAT format = GWTIMEFORMAT_PAL;
    EXPECT_EQ(manager->GetFormat(static_cast<GWTIMEFORMATTYPE>(1), &format, nullptr), E_INVALIDARG);
    EXPECT_EQ(format, GWTIMEFORMAT_PAL);
    EXPECT_EQ(manager->GetDisplayFormat(nullptr, nullptr, nullptr), S_OK);
    EXPECT_EQ(play->GetTime(nullptr), E_POINTER);
    EXPECT_EQ(play->GetTimeSpan(nullptr), E_POINTER);
}

TEST(ContentContainer, KeepsOneCurrentContainerWhoseKeyTimeTakesOnlyFrameCounts) {
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host({.keyFrame = 4.0});
    ut::ComPtr<IGWContentContainer> current, again, made;
    ASSERT_EQ(GWContentGetCurrentContainer(IID_IGWContentContainer, current.PutVoid()), S_OK);
    ASSERT_EQ(GWContentGetCurrentContainer(IID_IGWContentContainer, again.PutVoid()), S_OK);
    ASSERT_EQ(KXCreateInstance(CLSID_GWContentContainer, IID_IGWContentContainer, made.PutVoid()), S_OK);
    EXPECT_TRUE(current == again);
    EXPECT_FALSE(current == made);
    void* none = &none;
    EXPECT_EQ(current->FindObject(GUID_GWValueParameter, IID_IGWProperties, &none), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(none, nullptr);

    ut::ComPtr<IGWProperties> keyTime;
    ASSERT_EQ(current->FindObject(GUID_GWKeyTimeProperty, IID_IGWProperties, keyTime.PutVoid()), S_OK);
    const tagGWREQUEST request = {GWREQUEST_PLUGIN};
    CGWVariant text, frames(9.0), other;
    text.vt = VT_BSTR;
    text.bstrVal = SysAllocString(L"12");
    const std::pair<HRESULT, HRESULT> refusals[] = {
        {keyTime->SetValue(&request, &text), DISP_E_TYPEMISMATCH},
        {keyTime->SetValue(nullptr, &frames), E_POINTER},
        {keyTime->SetValue(&request, nullptr), E_POINTER},
        {keyTime->Refresh(nullptr, TRUE, 0, 0), E_POINTER},
        {keyTime->GetParameterValue(GUID_GWKeyTimeProperty, &other), DISP_E_MEMBERNOTFOUND}};
    for (auto [actual, expected] : refusals)
        EXPECT_EQ(actual, expected);
    CGWVariant read;
    EXPECT_EQ(keyTime->GetParameterValue(GUID_GWValueParameter, &read), S_OK);
    EXPECT_EQ(read.vt, VT_R8);
    EXPECT_EQ(read.dblVal, 4.0);
}

TEST(FileDialogs, AnswerCancelledForThereIsNoDesktop) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWFileDialogs> dialogs;
    ASSERT_EQ(KXGetFileDialogs(dialogs.Put()), S_OK);
    // A record of another size than the platform's is refused as such.
    for (DWORD size : {DWORD{sizeof(OPENFILENAMEW)}, DWORD{76}}) {
        for (bool save : {false, true}) {
            OPENFILENAMEW record{};
            record.lStructSize = size;
            EXPECT_EQ(save ? dialogs->ShowSaveDialog(&record) : dialogs->ShowOpenDialog(&record), S_FALSE);
            DWORD error = 0;
            EXPECT_EQ(dialogs->GetExtendedError(&error), S_OK);
            EXPECT_EQ(error, size == 76 ? DWORD{CDERR_STRUCTSIZE} : DWORD{CDERR_DIALOGFAILURE});
        }
    }
    EXPECT_EQ(dialogs->ShowOpenDialog(nullptr), E_POINTER);
    EXPECT_EQ(dialogs->GetExtendedError(nullptr), E_POINTER);
}

// An application may keep its host in a static; at exit it then goes after the host's own
// statics, which must still hold for its objects.
[[noreturn]] void ExitWithAHostInAStatic() {
    static std::unique_ptr<ut::host::ReferenceHost> kept;
    ut::host::Settings settings;
    ut::host::ObjectDescription model{.name = L"Model", .model = true};
    model.children.push_back({.name = L"Object"});
    settings.scene.objects.push_back(std::move(model));
    kept = std::make_unique<ut::host::ReferenceHost>(settings);
    std::exit(0);
}

// A process of its own, so that the host's statics are made after the application's.
TEST(ReferenceHost, KeptInAStaticEndsCleanlyAtExit) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(ExitWithAHostInAStatic(), ::testing::ExitedWithCode(0), "");
}

} // namespace
