// The reference host's families, views and preferences, kept in the registry.
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/platform/process.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/families.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/views.h>

#include "support/ref_tracker.h"
#include "support/registrations.h"

namespace {

using ut::ComPtr;
using ut::UniqueHKey;
using ut::test::TestGuid;

class Managers : public testing::Test {
protected:
    ut::test::RegistrationScope scope_;
    ut::host::ReferenceHost host_;
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
    ComPtr<IGWFamiliesManager> manager;
    ASSERT_EQ(GWGetFamiliesManager(manager.Put()), S_OK);
    HINSTANCE module = ut::test::TestModule();
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
    ComPtr<IGWFamiliesManager> manager;
    ASSERT_EQ(GWGetFamiliesManager(manager.Put()), S_OK);
    HINSTANCE module = ut::test::TestModule();
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

} // namespace
