// The reference host: its services, the notification service, the managers kept in the registry,
// and the scene description.
#include <cstdlib>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/host/reference_scene.h>
#include <ut/platform/process.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/components.h>
#include <ut/sdk/content.h>
#include <ut/sdk/database.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/dialogs.h>
#include <ut/sdk/families.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/play.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/undo.h>
#include <ut/sdk/version.h>
#include <ut/sdk/views.h>

#include "support/com_mock.h"
#include "support/ref_tracker.h"
#include "support/registrations.h"

namespace {

using testing::Return;
using testing::StrEq;
using ut::ComPtr;
using ut::UniqueHKey;
using ut::test::TestGuid;

// The version string, "<absent>" when the object answers S_FALSE with no text.
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

TEST(VersionInfo, DescribesARecentHostOrAnswersTheConfiguredStringsAndNothingElse) {
    {
        ut::host::ReferenceHost host;
        const std::wstring build = VersionString(GWVERSION_BUILD);
        EXPECT_NE(VersionString(GWVERSION_PRODUCT), L"<absent>");
        EXPECT_EQ(build.size(), 4u);
        EXPECT_GT(build, L"1109"); // past every build that older formats are told apart by
        EXPECT_EQ(VersionString(GWVERSION_MAJOR), L"2003");
    }
    ut::host::ReferenceHost host({.productName = L"", .build = L"0901", .major = L"2000"});
    const std::pair<ULONG, const wchar_t*> strings[] = {{GWVERSION_PRODUCT, L"<absent>"},
                                                        {GWVERSION_BUILD, L"0901"},
                                                        {GWVERSION_MAJOR, L"2000"},
                                                        {3, L"<absent>"}};
    for (auto [index, expected] : strings)
        EXPECT_EQ(VersionString(index), expected) << index;
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

// The reference notification service: advise, unadvise and re-entrant broadcasts.
class MockSink : public ut::test::ComMock<IGwNotifySink> {
public:
    MockSink() : ComMock(IID_IGwNotifySink) {}
    MOCK_METHOD(HRESULT, PropertyChanged, (const wchar_t*, ULONG, const VARIANT*, int),
                (override, Calltype(STDMETHODCALLTYPE)));
};

// Owned only by the service: it withdraws inside its own call and then still uses a member.
class SelfWithdrawingSink final : public ut::sdk::ComObject<IGwNotifySink> {
public:
    explicit SelfWithdrawingSink(IGWNotificationService* service) : service_(service) {}
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<SelfWithdrawingSink, IGwNotifySink>(IID_IGwNotifySink)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE PropertyChanged(const wchar_t* name, ULONG, const VARIANT*, int) override {
        service_->Unadvise(name, this);
        ++calls_;
        return S_OK;
    }

private:
    IGWNotificationService* service_;
    int calls_ = 0;
};

class NotificationService : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service_.PutVoid()),
            S_OK);
    }
    void AdviseAll(std::initializer_list<MockSink*> sinks) {
        for (MockSink* sink : sinks)
            ASSERT_EQ(service_->Advise(L"Alpha", sink), S_OK);
    }
    void UnadviseAll(std::initializer_list<MockSink*> sinks) {
        for (MockSink* sink : sinks)
            service_->Unadvise(L"Alpha", sink);
    }

    ut::host::ReferenceHost host_;
    ut::ComPtr<IGWNotificationService> service_;
};

TEST_F(NotificationService, TellsEverySinkOfTheNameInOrderAndAnswersTheFirstFailure) {
    MockSink first, second, third, other;
    AdviseAll({&first, &second, &third});
    service_->Advise(L"Beta", &other);
    VARIANT value{};
    {
        testing::InSequence order;
        EXPECT_CALL(first, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(S_OK));
        EXPECT_CALL(second, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(E_INVALIDARG));
        EXPECT_CALL(third, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(E_FAIL));
    }
    EXPECT_EQ(service_->Broadcast(L"Alpha", 7, &value), E_INVALIDARG);
    EXPECT_EQ(service_->Broadcast(L"alpha", 7, &value), S_FALSE) << "names are case-sensitive";
    UnadviseAll({&first, &second, &third});
    service_->Unadvise(L"Beta", &other);
}

TEST_F(NotificationService, HoldsOneReferencePerNameUntilUnadvised) {
    MockSink sink;
    ut::test::RefTracker refs;
    refs.Track(&sink, 1, "sink");
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Advise(L"Beta", &sink), S_OK);
    EXPECT_EQ(sink.Extra(), 2u);
    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
    EXPECT_EQ(service_->Unadvise(L"Beta", &sink), S_OK);
    EXPECT_EQ(service_->Advise(L"", &sink), E_INVALIDARG);
    EXPECT_EQ(service_->Advise(nullptr, &sink), E_POINTER);
}

TEST_F(NotificationService, SinksMayChangeTheRegistrationsDuringABroadcast) {
    MockSink leaving, editor, removed, added;
    AdviseAll({&leaving, &editor, &removed});
    EXPECT_CALL(leaving, PropertyChanged).WillOnce([&](const wchar_t* name, ULONG, const VARIANT*, int) {
        return service_->Unadvise(name, &leaving);
    });
    EXPECT_CALL(editor, PropertyChanged)
        .WillOnce([&](const wchar_t* name, ULONG, const VARIANT*, int) {
            service_->Unadvise(name, &removed);
            return service_->Advise(name, &added);
        })
        .WillOnce(Return(S_OK));
    EXPECT_CALL(removed, PropertyChanged).Times(0);
    EXPECT_CALL(added, PropertyChanged).WillOnce(Return(S_OK)); // from the second broadcast on

    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    UnadviseAll({&editor, &added});
}

TEST_F(NotificationService, ASinkOwnedOnlyByTheServiceOutlivesItsOwnWithdrawal) {
    ut::test::LiveObjectCheck live;
    auto* sink = new SelfWithdrawingSink(service_.Get());
    ASSERT_EQ(service_->Advise(L"Alpha", sink), S_OK);
    sink->Release();
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
}

// The reference host's families, views and preferences, kept in the registry.
class Managers : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(GWGetFamiliesManager(manager.Put()), S_OK); }
    ut::test::RegistrationScope scope_;
    ut::host::ReferenceHost host_;
    ComPtr<IGWFamiliesManager> manager;
    HINSTANCE module = ut::test::TestModule();
};

const GUID kFamily = TestGuid(50), kOther = TestGuid(51), kA = TestGuid(1), kB = TestGuid(2);

std::vector<GUID> Members(IGWFamiliesManager& manager, const GUID& family) {
    ComPtr<IGWEnumGUID> members;
    EXPECT_EQ(manager.EnumMembers(family, members.Put()), S_OK);
    std::vector<GUID> ids;
    GUID id{};
    while (members && members->Next(1, &id, nullptr) == S_OK)
        ids.push_back(id);
    return ids;
}

TEST_F(Managers, FamiliesKeepTheirDescriptionAndMembersUntilBothAreGone) {
    ut::test::LiveObjectCheck live;
    const std::wstring key = L"Software\\ut\\Families\\" + ut::GuidToString(kFamily);

    ASSERT_EQ(manager->RegisterFamily(kFamily, kA, kOther, L"LIGHTS", L"c:\\lights", module, kB, GUID_NULL),
              S_OK);
    ASSERT_EQ(
        manager->RegisterFamily(kFamily, kA, GUID_NULL, L"LIGHTS", nullptr, module, GUID_NULL, GUID_NULL),
        S_OK);
    EXPECT_EQ(ut::test::ExportedText(L"HKEY_LOCAL_MACHINE\\" + key),
              L"Windows Registry Editor Version 5.00\r\n\r\n[HKEY_LOCAL_MACHINE\\" + key +
                  L"]\r\n\"Class\"=\"" + ut::GuidToString(kA) +
                  L"\"\r\n\"Kind\"=\"LIGHTS\"\r\n\"Module\"=\"" +
                  ut::test::RegQuoted(ut::platform::ModuleFileName(module)) + L"\"\r\n\r\n");

    const GUID both[] = {kFamily, kOther};
    ASSERT_EQ(manager->RegisterMembers(kB, 2, both, TRUE, L"bee", module), S_OK);
    ASSERT_EQ(manager->RegisterMembers(kA, 1, both, FALSE, L"ay", module), S_OK);
    EXPECT_EQ(Members(*manager, kFamily), (std::vector<GUID>{kA, kB}));
    EXPECT_EQ(Members(*manager, kOther), std::vector<GUID>{kB});
    EXPECT_EQ(Members(*manager, TestGuid(52)), std::vector<GUID>{});
    EXPECT_EQ(manager->IsMember(kA, kOther), S_FALSE);
    EXPECT_EQ(manager->IsMember(kB, kOther), S_OK);

    EXPECT_EQ(manager->UnregisterMembers(kB, 2, both, module), S_OK);
    EXPECT_EQ(manager->UnregisterMembers(kB, 2, both, module), S_FALSE);
    EXPECT_FALSE(ut::sdk::OpenKey(HKEY_LOCAL_MACHINE,
                                  (L"Software\\ut\\Families\\" + ut::GuidToString(kOther)).c_str()));
    EXPECT_EQ(manager->UnregisterFamily(kFamily, module), S_OK); // its member keeps it
    EXPECT_EQ(manager->UnregisterFamily(kFamily, module), S_FALSE);
    EXPECT_EQ(Members(*manager, kFamily), std::vector<GUID>{kA});
    EXPECT_EQ(manager->UnregisterMembers(kA, 1, both, module), S_OK);
    EXPECT_FALSE(ut::sdk::OpenKey(HKEY_LOCAL_MACHINE, key.c_str()));
}

TEST_F(Managers, FamiliesRefuseWhatNamesNoFamily) {
    const GUID withNull[] = {kFamily, GUID_NULL};
    IGWEnumGUID* members = nullptr;
    const HRESULT results[][2] = {
        {manager->RegisterFamily(GUID_NULL, kA, kA, L"", L"", module, kA, kA), E_INVALIDARG},
        {manager->RegisterMembers(GUID_NULL, 1, &kFamily, TRUE, L"n", module), E_INVALIDARG},
        {manager->RegisterMembers(kA, 2, withNull, TRUE, L"n", module), E_INVALIDARG},
        {manager->RegisterMembers(kA, 1, nullptr, TRUE, L"n", module), E_POINTER},
        {manager->RegisterMembers(kA, 0, nullptr, TRUE, L"n", module), S_OK},
        {manager->EnumMembers(GUID_NULL, &members), E_INVALIDARG},
        {manager->IsMember(kA, GUID_NULL), E_INVALIDARG},
    };
    for (std::size_t i = 0; i < std::size(results); ++i)
        EXPECT_EQ(results[i][0], results[i][1]) << i;
    EXPECT_FALSE(ut::sdk::OpenKey(HKEY_LOCAL_MACHINE, L"Software\\ut\\Families"));

    // Member lists hand out what is asked while it lasts, and start again.
    for (ULONG n : {1, 2, 3})
        ASSERT_EQ(GWRegisterObjectFamilies(TestGuid(n), 1, &kFamily, true, L"m", module), S_OK);
    ComPtr<IGWEnumGUID> list;
    ASSERT_EQ(manager->EnumMembers(kFamily, list.Put()), S_OK);
    GUID ids[4]{};
    ULONG fetched = 0;
    EXPECT_EQ(list->Next(2, ids, nullptr), E_POINTER);
    EXPECT_EQ(list->Next(4, ids, &fetched), S_FALSE);
    EXPECT_EQ(fetched, 3u);
    EXPECT_EQ(list->Reset(), S_OK);
    EXPECT_EQ(list->Next(1, ids, nullptr), S_OK);
    EXPECT_EQ(ids[0], TestGuid(1));
}

void SetText(const std::wstring& path, const wchar_t* name, const wchar_t* text) {
    UniqueHKey key;
    ASSERT_EQ(ut::sdk::CreateKey(HKEY_LOCAL_MACHINE, path.c_str(), key), ERROR_SUCCESS);
    ASSERT_EQ(ut::sdk::SetText(key.get(), name, text), ERROR_SUCCESS);
}

TEST_F(Managers, ViewsAreTheModulesRegisteredViews) {
    const std::wstring modules = L"Software\\ut\\Modules\\";
    SetText(modules + L"alpha\\View\\" + ut::GuidToString(kA), L"Name", L"Curve view");
    SetText(modules + L"beta\\View\\" + ut::GuidToString(kA), L"Name", L"Later name");
    SetText(modules + L"beta\\View\\" + ut::GuidToString(kB), L"Name", L"Dope sheet");
    SetText(modules + L"beta\\View\\stray", L"Name", L"No class");
    ComPtr<IGWViewManager> views;
    ASSERT_EQ(GWGetViewMgr(views.Put()), S_OK);

    wchar_t name[11] = L"";
    EXPECT_EQ(views->GetViewName(kA, name, 11), S_OK);
    EXPECT_STREQ(name, L"Curve view"); // the first module in the registry's order
    EXPECT_EQ(views->GetViewName(kB, name, 10), HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER));
    EXPECT_STREQ(name, L"");
    EXPECT_EQ(views->GetViewName(kFamily, name, 11), HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(views->GetViewName(kA, name, 0), E_INVALIDARG);
    EXPECT_EQ(views->GetViewName(kA, nullptr, 11), E_POINTER);
    EXPECT_EQ(GWFindViewNameFromCLSID(kB, name, 11), S_OK);
    EXPECT_STREQ(name, L"Dope sheet");
    EXPECT_EQ(GWFindViewNameFromCLSID(kB, name, -1), E_INVALIDARG);

    GUID view = kFamily;
    EXPECT_EQ(views->GetViewClass(L"DOPE SHEET", &view), S_OK);
    EXPECT_EQ(view, kB);
    EXPECT_EQ(views->GetViewClass(L"No class", &view), HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(view, GUID_NULL);
    EXPECT_EQ(views->GetViewClass(nullptr, &view), E_POINTER);
}

TEST_F(Managers, PreferencesAreTextByName) {
    ComPtr<IGWPreferences> preferences;
    ASSERT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
    wchar_t* text = reinterpret_cast<wchar_t*>(&text);
    EXPECT_EQ(preferences->GetText(L"qvx_explorer.viewer", &text), HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(text, nullptr);
    ASSERT_EQ(preferences->SetText(L"qvx_explorer.viewer", L"Curve view"), S_OK);
    ASSERT_EQ(preferences->GetText(L"QVX_EXPLORER.VIEWER", &text), S_OK);
    std::unique_ptr<wchar_t, ut::TaskMemDeleter> owned(text);
    EXPECT_STREQ(text, L"Curve view");
    UniqueHKey key = ut::sdk::OpenKey(HKEY_CURRENT_USER, L"Software\\ut\\Preferences", ut::sdk::kReadWrite);
    const DWORD number = 7;
    ASSERT_EQ(RegSetValueExW(key.get(), L"a.number", 0, REG_DWORD, reinterpret_cast<const BYTE*>(&number), 4),
              ERROR_SUCCESS);
    EXPECT_EQ(preferences->GetText(L"a.number", &text), DISP_E_TYPEMISMATCH);
}

// The reference scene's JSON description: what is written reads back, through the host too, and
// a wrong description is refused with a line that names the offending element.
// Every kind of element, written compactly; the formatted text is what reads back the same.
const char kScene[] = R"({"name": "Shot 10", "objects": [
  {"name": "Robot", "model": true, "children": [{"name": "Arm", "selected": true, "hidden": true, "properties": [
    {"class": "{0E1A4F60-0509-11D1-AA94-00A0243E34C4}", "name": "Look", "parameters": [
      {"id": "{00000001-0002-0003-0405-060708090A0B}", "name": "colour", "value": "réd"},
      {"id": "{00000001-0002-0003-0405-060708090A0C}", "value": false}],
     "properties": [{"class": "{00000000-0000-0000-0000-000000000000}"}]}]}]},
  {"name": "Camera1", "families": ["{9F43B240-58E5-11D0-8469-00A024C7919C}"]}],
 "properties": [{"class": "{4A3193B2-9199-11D0-B05B-00A0C90640EC}", "name": "Time mapping",
   "parameters": [{"id": "{B20A80FB-FF66-11D3-B7DD-0008C7A011A6}", "value": 2.5}]}],
 "containers": {"layers": ["Background"], "referencePlanes": ["Ground"], "caches": ["Simulation"]}})";

TEST(SceneDescription, WhatIsWrittenReadsBackAlsoThroughTheHost) {
    ut::host::SceneDescription scene, again;
    std::string error;
    ASSERT_EQ(ut::host::ParseSceneDescription(kScene, scene, error), S_OK) << error;
    const std::string formatted = ut::host::FormatSceneDescription(scene);
    ASSERT_EQ(ut::host::ParseSceneDescription(formatted, again, error), S_OK) << error;
    EXPECT_EQ(ut::host::FormatSceneDescription(again), formatted);
    EXPECT_NE(formatted.find("\"value\": \"réd\""), std::string::npos) << formatted;
    ut::test::LiveObjectCheck live;
    ut::host::ReferenceHost host({.scene = scene});
    ASSERT_EQ(host.Status(), S_OK);
    EXPECT_EQ(ut::host::FormatSceneDescription(host.DescribeScene()), formatted);
    // Every key may be left out.
    ASSERT_EQ(ut::host::ParseSceneDescription("{}", scene, error), S_OK);
    EXPECT_EQ(ut::host::FormatSceneDescription(scene), "{\n  \"name\": \"Scene\"\n}\n");
}

TEST(SceneDescription, AWrongDescriptionIsRefusedNamingTheOffendingElement) {
    const std::pair<const char*, const char*> refusals[] = {
        {"[]", "the description: expected an object"},
        {R"({"name": 7})", "name: expected a string"},
        {R"({"objects": {}})", "objects: expected an array"},
        {R"({"objects": [{"name": "A"}, {"colour": "red"}]})", "objects[1].colour: unknown key"},
        {R"({"objects": [{"children": [{"model": "yes"}]}]})",
         "objects[0].children[0].model: expected true or false"},
        {R"({"objects": [{"families": ["camera"]}]})",
         "objects[0].families[0]: expected a GUID in braces, such as {9F43B240-58E5-11D0-8469-00A024C7919C}"},
        {R"({"properties": [{"parameters": [{"name": "x"}]}]})", "properties[0].parameters[0].id: missing"},
        {R"({"properties": [{"parameters": [{"id": "{00000001-0002-0003-0405-060708090A0B}", "value": null}]}]})",
         "properties[0].parameters[0].value: expected a number, a string, true or false"},
        {R"({"containers": {"layers": [1]}})", "containers.layers[0]: expected a string"},
        {R"({"containers": {"lights": []}})", "containers.lights: unknown key"},
    };
    for (auto [json, expected] : refusals) {
        ut::host::SceneDescription scene;
        scene.name = L"untouched";
        std::string error;
        EXPECT_EQ(ut::host::ParseSceneDescription(json, scene, error), E_INVALIDARG) << json;
        EXPECT_EQ(error, expected);
        EXPECT_EQ(scene.name, L"untouched");
    }
    // Text that is not JSON at all is refused with where it broke.
    ut::host::SceneDescription scene;
    std::string error;
    EXPECT_EQ(ut::host::ParseSceneDescription("{\n  \"name\": \"A\",\n}", scene, error), E_INVALIDARG);
    EXPECT_EQ(error.rfind("the description: parse error at line 3, column 1", 0), 0u) << error;
}

} // namespace
