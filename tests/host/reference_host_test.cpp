#include <functional>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/content.h>
#include <ut/sdk/database.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
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
    const CLSID services[] = {CLSID_GWVersionInfo, CLSID_GWAmbientValues, CLSID_GWActiveDatabase,
                              CLSID_GWTimeManager, CLSID_GWPlayControl,   CLSID_GWFileDialogs};
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
    // Its container class and its current container are gone too.
    void* out = nullptr;
    EXPECT_EQ(KXCreateInstance(CLSID_GWContentContainer, IID_IUnknown, &out), REGDB_E_CLASSNOTREG);
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

TEST(TimeServices, AnswerTheScenesSettingsInSeconds) {
    struct Case {
        ut::host::Settings settings;
        double playSeconds;
        double firstSeconds;
        double lastSeconds;
    };
    const Case cases[] = {
        {{}, 1.0 / 30.0, 1.0 / 30.0, 100.0 / 30.0}, // a scene at 30 frames a second
        {{.timeFormat = GWTIMEFORMAT_PAL,
          .frameRate = 25.0,
          .timeDisplay = GWTIMEDISPLAY_TIMECODE,
          .playFrame = 50.0,
          .firstFrame = -25.0,
          .lastFrame = 0.0},
         2.0,
         -1.0,
         0.0},
        {{.timeFormat = GWTIMEFORMAT_SAMPLES, .frameRate = 48000.0, .playFrame = 24000.0},
         0.5,
         1.0 / 48000.0,
         100.0 / 48000.0},
    };
    for (const Case& c : cases) {
        ut::host::ReferenceHost host(c.settings);
        ut::ComPtr<IGWTimeManager> manager;
        ut::ComPtr<IGWPlayControl> play;
        ASSERT_EQ(GWQueryGenericObject(CLSID_GWTimeManager, IID_IGWTimeManager, manager.PutVoid()), S_OK);
        ASSERT_EQ(GWQueryGenericObject(CLSID_GWPlayControl, IID_IGWPlayControl, play.PutVoid()), S_OK);
        tagGWTIMEFORMAT format{};
        double rate = 0.0;
        auto display = static_cast<GWTIMEDISPLAYFORMAT>(-1);
        EXPECT_EQ(manager->GetFormat(GWTIMEFORMATTYPE_SCENE, &format, &rate), S_OK);
        EXPECT_EQ(format, c.settings.timeFormat);
        EXPECT_EQ(rate, c.settings.frameRate);
        EXPECT_EQ(manager->GetDisplayFormat(&display, nullptr, nullptr), S_OK);
        EXPECT_EQ(display, c.settings.timeDisplay);
        EXPECT_EQ(manager->GetFormat(static_cast<GWTIMEFORMATTYPE>(1), &format, nullptr), E_INVALIDARG);

        tagGWTIME now{};
        tagGWTIMESPAN span{};
        EXPECT_EQ(play->GetTime(&now), S_OK);
        EXPECT_EQ(play->GetTimeSpan(&span), S_OK);
        for (const tagGWTIME& time : {now, span.start, span.end}) {
            EXPECT_EQ(time.format, c.settings.timeFormat);
            EXPECT_EQ(time.rate, c.settings.frameRate);
        }
        EXPECT_DOUBLE_EQ(now.time, c.playSeconds);
        EXPECT_DOUBLE_EQ(span.start.time, c.firstSeconds);
        EXPECT_DOUBLE_EQ(span.end.time, c.lastSeconds);
        EXPECT_EQ(play->GetTime(nullptr), E_POINTER);
        EXPECT_EQ(play->GetTimeSpan(nullptr), E_POINTER);
    }
}

TEST(ContentContainer, HoldsAKeyTimeWhoseValueBothSettersWrite) {
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host({.keyFrame = 4.0});
    ut::ComPtr<IGWContentContainer> current, again, made;
    ASSERT_EQ(GWContentGetCurrentContainer(IID_IGWContentContainer, current.PutVoid()), S_OK);
    ASSERT_EQ(GWContentGetCurrentContainer(IID_IGWContentContainer, again.PutVoid()), S_OK);
    ASSERT_EQ(KXCreateInstance(CLSID_GWContentContainer, IID_IGWContentContainer, made.PutVoid()), S_OK);
    EXPECT_TRUE(current == again);
    EXPECT_FALSE(current == made);

    ut::ComPtr<IGWProperty> keyTime;
    ut::ComPtr<IGWParameter> parameter;
    void* none = &none;
    EXPECT_EQ(current->FindProperty(GUID_GWValueParameter, IID_IGWProperty, &none), DISP_E_MEMBERNOTFOUND);
    EXPECT_EQ(none, nullptr);
    ASSERT_EQ(current->FindProperty(GUID_GWKeyTimeProperty, IID_IGWProperty, keyTime.PutVoid()), S_OK);
    ASSERT_EQ(keyTime.As(parameter), S_OK);

    const tagGWREQUEST request = {GWREQUEST_PLUGIN};
    const CGWVariant eight(8.0), nine(9.0), one(1.0);
    CGWVariant text;
    text.vt = VT_BSTR;
    text.bstrVal = SysAllocString(L"12");
    struct Case {
        const char* what;
        HRESULT result;
        double framesAfter;
        std::function<HRESULT()> call;
    };
    const Case cases[] = {
        {"value setter", S_OK, 8.0, [&] { return keyTime->SetValue(&request, &eight); }},
        {"parameter setter", S_OK, 9.0, [&] { return parameter->SetParamValue(&request, &nine); }},
        {"a string", DISP_E_TYPEMISMATCH, 9.0, [&] { return keyTime->SetValue(&request, &text); }},
        {"no request", E_POINTER, 9.0, [&] { return parameter->SetParamValue(nullptr, &one); }},
        {"no value", E_POINTER, 9.0, [&] { return keyTime->SetValue(&request, nullptr); }},
        {"refresh", S_OK, 9.0, [&] { return keyTime->Refresh(&request, TRUE, 0, 0); }},
        {"refresh without request", E_POINTER, 9.0, [&] { return keyTime->Refresh(nullptr, FALSE, 0, 0); }},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(c.call(), c.result) << c.what;
        CGWVariant read, viaParameter;
        EXPECT_EQ(keyTime->GetParameterValue(GUID_GWValueParameter, &read), S_OK);
        EXPECT_EQ(parameter->GetParamValue(&viaParameter), S_OK);
        EXPECT_EQ(read.vt, VT_R8);
        EXPECT_EQ(read.dblVal, c.framesAfter) << c.what;
        EXPECT_EQ(viaParameter.dblVal, c.framesAfter) << c.what;
    }
    CGWVariant other;
    EXPECT_EQ(keyTime->GetParameterValue(GUID_GWKeyTimeProperty, &other), DISP_E_MEMBERNOTFOUND);

    // A new container starts at the host's key frame.
    ut::ComPtr<IGWProperty> madeKeyTime;
    CGWVariant madeFrames;
    ASSERT_EQ(made->FindProperty(GUID_GWKeyTimeProperty, IID_IGWProperty, madeKeyTime.PutVoid()), S_OK);
    EXPECT_EQ(madeKeyTime->GetParameterValue(GUID_GWValueParameter, &madeFrames), S_OK);
    EXPECT_EQ(madeFrames.dblVal, 4.0);
}

TEST(FileDialogs, AnswerCancelledForThereIsNoDesktop) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWFileDialogs> dialogs;
    ASSERT_EQ(KXGetFileDialogs(dialogs.Put()), S_OK);
    struct Case {
        bool save;
        DWORD size;
        HRESULT result;
        DWORD error;
    };
    const Case cases[] = {
        {false, sizeof(OPENFILENAMEW), S_FALSE, CDERR_DIALOGFAILURE},
        {true, sizeof(OPENFILENAMEW), S_FALSE, CDERR_DIALOGFAILURE},
        {true, 76, S_FALSE, CDERR_STRUCTSIZE},
    };
    for (const Case& c : cases) {
        OPENFILENAMEW record{};
        record.lStructSize = c.size;
        EXPECT_EQ(c.save ? dialogs->ShowSaveDialog(&record) : dialogs->ShowOpenDialog(&record), c.result);
        DWORD error = 0;
        EXPECT_EQ(dialogs->GetExtendedError(&error), S_OK);
        EXPECT_EQ(error, c.error);
    }
    EXPECT_EQ(dialogs->ShowOpenDialog(nullptr), E_POINTER);
    EXPECT_EQ(dialogs->GetExtendedError(nullptr), E_POINTER);
}

} // namespace
