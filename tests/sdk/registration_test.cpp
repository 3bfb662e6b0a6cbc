// The SDK's registration services: in-process classes in the class registry, the core branch,
// tidying emptied keys, deleting trees, modules' string tables and the factory folder.
#include <functional>
#include <string>
#include <tuple>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/process.h>
#include <ut/platform/text.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/registration.h>
#include <ut/sdk/resources.h>

#include "support/registrations.h"

namespace {

using ut::UniqueHKey;
using ut::test::TestGuid;

std::wstring TextAt(HKEY root, const std::wstring& path, const wchar_t* value) {
    UniqueHKey key = ut::sdk::OpenKey(root, path.c_str());
    std::wstring text;
    return key && ut::sdk::ReadText(key.get(), value, text) == ERROR_SUCCESS ? text : L"<none>";
}

TEST(CoreKey, IsBuiltInTheCallersBuffer) {
    // The sub-key and the buffer's capacity; the result and the buffer after.
    const std::tuple<const wchar_t*, int, HRESULT, const wchar_t*> cases[] = {
        {L"QDEF", 260, S_OK, L"Software\\ut\\Core\\QDEF"},
        {L"", 260, S_OK, L"Software\\ut\\Core"},
        {nullptr, 260, S_OK, L"Software\\ut\\Core"},
        {L"QDEF", 22, S_OK, L"Software\\ut\\Core\\QDEF"},
        {L"QDEF", 21, HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER), L""},
        {L"QDEF", 0, E_INVALIDARG, L"untouched"}};
    for (const auto& [subKey, capacity, result, text] : cases) {
        wchar_t buffer[260] = L"untouched";
        EXPECT_EQ(GWConstructKxcoreRegKey(subKey, buffer, capacity), result) << capacity;
        EXPECT_STREQ(buffer, text) << capacity;
    }
    EXPECT_EQ(GWConstructKxcoreRegKey(L"QDEF", nullptr, 260), E_POINTER);
}

// Their layout is checked with the library's registrations.
TEST(ComClasses, AreEnteredOverAndRemovedOnce) {
    ut::test::RegistrationScope scope;
    const GUID clsid = TestGuid(1);
    HINSTANCE module = ut::test::TestModule();
    EXPECT_EQ(GWRegisterCOMObject(clsid, module, nullptr), E_POINTER);
    EXPECT_EQ(GWRegisterCOMObject(GUID_NULL, module, L"Twist"), E_INVALIDARG);
    EXPECT_EQ(GWRegisterCOMObject(clsid, nullptr, L"Twist"), E_INVALIDARG);
    ASSERT_EQ(GWRegisterCOMObject(clsid, module, L"Twist"), S_OK);
    ASSERT_EQ(GWRegisterCOMObject(clsid, module, L"Twist deformer"), S_OK);
    EXPECT_EQ(TextAt(HKEY_CLASSES_ROOT, L"CLSID\\" + ut::GuidToString(clsid), nullptr), L"Twist deformer");
    EXPECT_EQ(GWUnregisterCOMObject(clsid), S_OK);
    EXPECT_EQ(GWUnregisterCOMObject(clsid), S_FALSE);
}

TEST(CleaningKeys, DropsWhatIsEmptyUpToTheCategory) {
    const std::wstring m = L"Software\\ut\\Modules\\cleaning";
    const std::wstring cat = m + L"\\Cat", a = cat + L"\\A";
    struct Cleaning {
        const char* label;
        std::vector<std::wstring> keys; // below HKEY_LOCAL_MACHINE; "=" at the end gives the key a value
        std::wstring clean;
        HRESULT result;
        std::vector<std::wstring> remaining, gone;
    };
    // clang-format off
    const Cleaning cases[] = {
        {"class key and category", {a}, a, S_OK, {m}, {cat}},
        {"category with another class", {a, cat + L"\\B"}, a, S_OK, {cat + L"\\B"}, {a}},
        {"deeper keys", {m + L"\\Tool\\List\\Owner"}, m + L"\\Tool\\List\\Owner", S_OK, {m}, {m + L"\\Tool"}},
        {"a key with a value", {a + L"="}, a, S_FALSE, {a}, {}},
        {"a key with a sub-key", {a + L"\\X"}, a, S_FALSE, {a + L"\\X"}, {}},
        {"a missing key", {m}, cat, S_FALSE, {m}, {}},
        {"the module's key itself", {m}, m, S_FALSE, {m}, {}},
        {"a trailing backslash", {cat}, cat + L"\\", S_OK, {m}, {cat}},
        {"the branch in another case", {a}, L"software\\UT\\modules\\cleaning\\Cat\\A", S_OK, {m}, {cat}},
        {"outside the modules' branch", {L"Software\\ut\\Other\\A"}, L"Software\\ut\\Other\\A", S_OK,
         {L"Software\\ut\\Other"}, {L"Software\\ut\\Other\\A"}},
    };
    // clang-format on
    for (const Cleaning& c : cases) {
        SCOPED_TRACE(c.label);
        ut::test::RegistrationScope scope;
        for (const std::wstring& path : c.keys) {
            bool valued = path.back() == L'=';
            UniqueHKey key;
            ASSERT_EQ(
                ut::sdk::CreateKey(HKEY_LOCAL_MACHINE, path.substr(0, path.size() - valued).c_str(), key),
                ERROR_SUCCESS);
            if (valued) {
                ASSERT_EQ(ut::sdk::SetText(key.get(), L"v", L"x"), ERROR_SUCCESS);
            }
        }
        EXPECT_EQ(GwRegCleanKey(HKEY_LOCAL_MACHINE, c.clean.c_str()), c.result);
        for (bool kept : {true, false})
            for (const std::wstring& path : kept ? c.remaining : c.gone)
                EXPECT_EQ(bool(ut::sdk::OpenKey(HKEY_LOCAL_MACHINE, path.c_str())), kept)
                    << ut::platform::Utf8FromWide(path);
    }
    EXPECT_EQ(GwRegCleanKey(HKEY_LOCAL_MACHINE, nullptr), E_INVALIDARG);
}

TEST(DeletingKeys, TakesEverythingBelow) {
    ut::test::RegistrationScope scope;
    UniqueHKey parent, deep;
    ASSERT_EQ(ut::sdk::CreateKey(HKEY_LOCAL_MACHINE, L"Software\\ut\\Tree", parent), ERROR_SUCCESS);
    ASSERT_EQ(ut::sdk::CreateKey(parent.get(), L"A\\B\\C", deep), ERROR_SUCCESS);
    EXPECT_EQ(GWRegDeleteKey(parent.get(), L""), E_INVALIDARG);
    EXPECT_EQ(GWRegDeleteKey(parent.get(), nullptr), E_INVALIDARG);
    EXPECT_EQ(GWRegDeleteKey(parent.get(), L"A"), S_OK);
    EXPECT_FALSE(ut::sdk::OpenKey(parent.get(), L"A"));
    EXPECT_EQ(GWRegDeleteKey(parent.get(), L"A"), HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
}

TEST(StringTables, GiveEachModuleItsTexts) {
    HINSTANCE module = ut::test::TestModule();
    const KXDictString first[] = {{1, L"one"}, {2, L"two"}}, replacing[] = {{1, L"uno"}},
                       broken[] = {{4, L"four"}, {5, nullptr}};
    ASSERT_EQ(KXDictAddInstanceStrings(module, first, 2), S_OK);
    const wchar_t* one = KXDictLoadInstanceIdstring(module, 1);
    ASSERT_EQ(KXDictAddInstanceStrings(module, replacing, 1), S_OK);
    EXPECT_STREQ(one, L"one"); // a text handed out stays valid
    EXPECT_STREQ(KXDictLoadInstanceIdstring(module, 1), L"uno");
    EXPECT_STREQ(KXDictLoadInstanceIdstring(module, 2), L"two");
    EXPECT_STREQ(KXDictLoadInstanceIdstring(module, 3), L"");
    EXPECT_EQ(KXDictAddInstanceStrings(module, broken, 2), E_POINTER);
    EXPECT_STREQ(KXDictLoadInstanceIdstring(module, 4), L""); // nothing taken
    EXPECT_EQ(KXDictAddInstanceStrings(nullptr, first, 2), E_INVALIDARG);
}

TEST(FactoryPath, IsTheFolderAboveTheLibrarysFolder) {
    CKXString factory;
    ASSERT_EQ(KXGetFactoryPath(factory), S_OK);
    std::wstring library = ut::platform::ModuleFileName(
        ut::platform::ModuleOf(reinterpret_cast<const void*>(&KXGetFactoryPath)));
    ASSERT_GT(library.size(), factory.Str().size());
    EXPECT_EQ(library.substr(0, factory.Str().size()), factory.Str());
    std::wstring rest = library.substr(factory.Str().size() + 1);
    EXPECT_EQ(rest.find_first_of(L"/\\"), rest.find_last_of(L"/\\")) << "one folder between them";
    EXPECT_NE(rest.find_first_of(L"/\\"), std::wstring::npos);
}

} // namespace
