// Reading registrations back: class keys however their names are written, checked string reads,
// the paths kept in the registry, the sizing of the factory's resource folder; and the explorer's
// and the animation editor's defaults, editor preference and source operators.
#include "registration/registration_test.h"

#include <cwctype>
#include <optional>
#include <tuple>

#include <ut/sdk/families.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/preferences.h>

namespace ut::test {
namespace {

using Bytes = std::vector<BYTE>;

Bytes Units(const std::wstring& text) {
    const auto* first = reinterpret_cast<const BYTE*>(text.data());
    return Bytes(first, first + text.size() * sizeof(wchar_t));
}

// Sets a value to exactly `data`: a unit that is not zero follows it in memory, so that the
// registry does not complete text that lacks its terminator.
void SetRaw(HKEY root, const std::wstring& path, const wchar_t* name, DWORD type, Bytes data) {
    UniqueHKey key;
    ASSERT_EQ(sdk::CreateKey(root, path.c_str(), key), ERROR_SUCCESS);
    auto size = static_cast<DWORD>(data.size());
    data.insert(data.end(), sizeof(wchar_t), 1);
    ASSERT_EQ(RegSetValueExW(key.get(), name, 0, type, data.data(), size), ERROR_SUCCESS);
}

const GUID kClass = TestGuid(1);

TEST_F(RegistrationTest, ClassKeysAreFoundByTheIdentifierTheirNameParsesTo) {
    const std::wstring operators = Base(L"Operator\\");
    std::wstring lower = GuidToString(kClass);
    for (wchar_t& c : lower)
        c = static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
    SetText(HKEY_LOCAL_MACHINE, operators + lower, L"Name", L"in lower case");
    EXPECT_EQ(NameOf(L"Operator", kClass), L"in lower case");
    // A class key is enough, deliberately: without "Name", or with one too long for the buffer.
    SetRaw(HKEY_LOCAL_MACHINE, operators + GuidToString(TestGuid(2)), L"Other", REG_SZ, Units(L"x"));
    SetText(HKEY_LOCAL_MACHINE, operators + GuidToString(TestGuid(3)), L"Name", std::wstring(100, L'n'));
    for (ULONG n : {2, 3}) {
        wchar_t name[8] = L"kept";
        DWORD bytes = sizeof name;
        EXPECT_EQ(KXGetKeyName(L"Operator", TestGuid(n), name, &bytes), S_OK) << n;
        EXPECT_TRUE(n == 3 ||
                    std::wstring(name) == L"kept"); // what a value too large leaves is the registry's
    }
    // A name that is no identifier breaks the list, not the lookups.
    SetText(HKEY_LOCAL_MACHINE, operators + L"not an identifier", L"Name", L"stray");
    DWORD count = 7;
    GUID* list = reinterpret_cast<GUID*>(&count);
    EXPECT_EQ(KXGetCLSIDList(L"Operator", &count, &list), CO_E_CLASSSTRING);
    EXPECT_EQ(count, 0u);
    EXPECT_EQ(list, nullptr);
    EXPECT_EQ(NameOf(L"Operator", kClass), L"in lower case");
    EXPECT_EQ(NameOf(L"Operator", TestGuid(4)), L"<failed>");
    EXPECT_EQ(NameOf(L"Nothing here", kClass), L"<failed>");
    // A name the home's parser resolves some other way (a program id) is found by the walk.
    SetText(HKEY_CLASSES_ROOT, L"UtTest.Twist\\CLSID", nullptr, GuidToString(TestGuid(5)));
    SetText(HKEY_LOCAL_MACHINE, operators + L"UtTest.Twist", L"Name", L"by program id");
    GUID resolved{};
    bool resolves = SUCCEEDED(CLSIDFromString(L"UtTest.Twist", &resolved));
    EXPECT_EQ(NameOf(L"Operator", TestGuid(5)), resolves ? L"by program id" : L"<failed>");

    EXPECT_EQ(KXGetCLSIDList(L"Operator", nullptr, &list), E_POINTER);
    EXPECT_EQ(KXGetCLSIDList(L"Operator", &count, nullptr), E_POINTER);
    EXPECT_EQ(Listed(L"Nothing here"), Ids{GUID_NULL});
    ASSERT_EQ(KXSetPathAtRegKey(L"Empty", L"only a path"), S_OK);
    ASSERT_EQ(KXGetCLSIDList(L"Empty", &count, &list), S_OK);
    EXPECT_EQ(count, 0u);
    EXPECT_NE(list, nullptr); // a block of no entries, which the caller frees
    CoTaskMemFree(list);
}

TEST_F(RegistrationTest, PathsAtACategoryAreReadWithChecks) {
    // The value's type and bytes; the result and the path read (none: whatever the registry left).
    const std::tuple<DWORD, std::wstring, HRESULT, std::optional<std::wstring>> cases[] = {
        {REG_SZ, std::wstring(L"c:\\a\0", 5), S_OK, L"c:\\a"},
        {REG_EXPAND_SZ, std::wstring(L"c:\\a\0", 5), S_OK, L"c:\\a"},
        {REG_SZ, L"c:\\a", E_FAIL, L""}, // no terminator
        {REG_SZ, L"", S_OK, L""},
        {REG_MULTI_SZ, std::wstring(L"a\0b\0\0", 5), S_OK, L"a"},
        {REG_MULTI_SZ, std::wstring(L"\0", 1), E_FAIL, L""},
        {REG_MULTI_SZ, std::wstring(L"a\0b", 3), E_FAIL, L""},
        {REG_DWORD, std::wstring(4 / sizeof(wchar_t), L'\1'), E_FAIL, L""},
        {REG_SZ, std::wstring(50, L'p') + L'\0', E_FAIL, std::nullopt}, // too long for the buffer
    };
    for (const auto& [type, data, result, read] : cases) {
        SCOPED_TRACE(platform::Utf8FromWide(data) + " of type " + std::to_string(type));
        SetRaw(HKEY_LOCAL_MACHINE, Base(L"Shaders"), L"Path", type, Units(data));
        wchar_t path[20] = L"untouched";
        EXPECT_EQ(KXGetPathAtRegKey(L"Shaders", sizeof path, path), result);
        EXPECT_TRUE(!read || *read == path);
    }
    wchar_t path[20];
    EXPECT_EQ(KXGetPathAtRegKey(L"Nothing here", sizeof path, path), E_FAIL);
    EXPECT_EQ(KXSetPathAtRegKey(L"Shaders", L"c:\\shaders"), S_OK);
    EXPECT_EQ(KXGetPathAtRegKey(L"Shaders", sizeof path, path), S_OK);
    EXPECT_STREQ(path, L"c:\\shaders");
    EXPECT_EQ(KXSetPathAtRegKey(L"Fresh", nullptr), E_FAIL);
    EXPECT_TRUE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Fresh")));
}

TEST_F(RegistrationTest, ViewNamesFallBackToTheIdentifierText) {
    const std::wstring key = Base(L"View\\") + GuidToString(kClass), id = GuidToString(kClass);
    // The value's type and text; the result and the name read.
    const std::tuple<DWORD, std::wstring, HRESULT, std::wstring> cases[] = {
        {REG_SZ, std::wstring(39, L'v'), S_OK, std::wstring(39, L'v')},
        {REG_SZ, std::wstring(40, L'v'), E_FAIL, id},
        {REG_DWORD, L"", E_FAIL, id}};
    for (const auto& [type, stored, result, read] : cases) {
        SetRaw(HKEY_LOCAL_MACHINE, key, L"Name", type, Units(stored + L'\0'));
        wchar_t name[40] = L"untouched";
        EXPECT_EQ(KXGetCorvaneViewName(kClass, name), result) << stored.size();
        EXPECT_EQ(std::wstring(name), read) << stored.size();
    }
    wchar_t name[40] = L"untouched";
    EXPECT_EQ(KXGetCorvaneViewName(TestGuid(2), name), E_FAIL);
    EXPECT_STREQ(name, L"");

    CKXString hostName = L"untouched";
    EXPECT_EQ(KXGetGWViewName(TestGuid(2), hostName), HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND));
    EXPECT_EQ(hostName, CKXString(L""));
    ASSERT_EQ(KXRegisterView(TestGuid(2), Module(), L"Curve view"), S_OK);
    EXPECT_EQ(KXGetGWViewName(TestGuid(2), hostName), S_OK);
    EXPECT_EQ(hostName, CKXString(L"Curve view"));
}

TEST_F(RegistrationTest, InspectorsAreReadBackByTheClassGiven) {
    GUID inspector = TestGuid(9);
    EXPECT_EQ(KXGetObjectInspectorView(kClass, nullptr), E_INVALIDARG);
    EXPECT_EQ(KXGetObjectInspectorView(kClass, &inspector), S_FALSE);
    EXPECT_EQ(inspector, GUID_NULL);
    ASSERT_EQ(KXRegisterViewInspector(kClass, Module(), TestGuid(99)), S_OK);
    EXPECT_EQ(KXGetObjectInspectorView(kClass, &inspector), S_OK);
    EXPECT_EQ(inspector, TestGuid(99));
    SetText(HKEY_LOCAL_MACHINE, Base(L"Inspector View\\") + GuidToString(kClass), L"Name", L"no identifier");
    EXPECT_EQ(KXGetObjectInspectorView(kClass, &inspector), CO_E_CLASSSTRING);
}

TEST_F(RegistrationTest, PathsOfTheClassesRootKeepTheirLimits) {
    const std::wstring key = L"QVX\\Shaders\\" + GuidToString(kClass), fits(39, L'p'), tooLong(40, L'p');
    wchar_t path[80] = L"";
    EXPECT_EQ(KXFindPathInRegistry(kClass, L"Shaders", path), E_FAIL);
    ASSERT_EQ(KXSetPathInRegistry(key.c_str(), fits.c_str()), S_OK);
    EXPECT_EQ(KXGetPathInRegistry(key.c_str(), sizeof path, path), S_OK);
    EXPECT_EQ(std::wstring(path), fits);
    EXPECT_EQ(KXFindPathInRegistry(kClass, L"Shaders", path), S_OK);
    EXPECT_EQ(std::wstring(path), fits);
    ASSERT_EQ(KXSetPathInRegistry(key.c_str(), tooLong.c_str()), S_OK);
    EXPECT_EQ(KXFindPathInRegistry(kClass, L"Shaders", path), E_FAIL);
    EXPECT_EQ(KXGetPathInRegistry(key.c_str(), 8, path), E_FAIL);
    EXPECT_EQ(KXFindPathInRegistry(kClass, L"Textures", path), E_FAIL);
    EXPECT_EQ(KXSetPathInRegistry(key.c_str(), nullptr), E_FAIL);
}

TEST_F(RegistrationTest, DescriptionFilesComeFromTheCoreBranch) {
    SetText(HKEY_LOCAL_MACHINE, L"Software\\ut\\Core\\QDEF\\" + GuidToString(kClass), nullptr, L"twist.qdef");
    wchar_t file[40] = L"";
    DWORD bytes = sizeof file, none = 0;
    EXPECT_EQ(KXGetQDEFFilename(kClass, nullptr, &bytes), E_POINTER);
    EXPECT_EQ(KXGetQDEFFilename(kClass, file, &none), E_POINTER);
    EXPECT_EQ(KXGetQDEFFilename(GUID_NULL, file, &bytes), E_INVALIDARG);
    EXPECT_EQ(KXGetQDEFFilename(TestGuid(2), file, &bytes), E_FAIL);
    EXPECT_EQ(KXGetQDEFFilename(kClass, file, &bytes), S_OK);
    EXPECT_STREQ(file, L"twist.qdef");
}

TEST_F(RegistrationTest, TheResourceFolderSizesItsOwnBuffer) {
    CKXString factory;
    ASSERT_EQ(KXGetFactoryPath(factory), S_OK);
    const std::wstring folder = factory.Str() + L"\\Application\\rsrc";
    const auto n = static_cast<DWORD>(folder.size());
    std::wstring buffer(n + 1, L'?');
    EXPECT_EQ(KXGetFactoryRsrcPath(0, nullptr), n);
    EXPECT_EQ(KXGetFactoryRsrcPath(0, buffer.data()), n);
    EXPECT_EQ(buffer[0], L'?'); // no room: untouched
    EXPECT_EQ(KXGetFactoryRsrcPath(n, buffer.data()), n);
    EXPECT_EQ(buffer[0], L'\0'); // one short: emptied
    EXPECT_EQ(KXGetFactoryRsrcPath(n + 1, buffer.data()), n);
    EXPECT_EQ(std::wstring(buffer.c_str()), folder);
}

const GUID kTree = TestGuid(1), kOther = TestGuid(2), kView = TestGuid(3), kSourceOp = TestGuid(4),
           kFamily = TestGuid(50);

// A tree's getter has no second identifier: it reads as GUID_NULL.
HRESULT TreeOnly(HRESULT (*get)(GUID*), GUID* tree, GUID* second) {
    if (second)
        *second = GUID_NULL;
    return get(tree);
}

struct Default {
    const char* label;
    std::function<HRESULT(const GUID&, const GUID&)> add;
    std::function<HRESULT(const GUID&)> remove;
    std::function<HRESULT(GUID*, GUID*)> get;
    bool keepsSourceOp;
};

TEST_F(RegistrationTest, DefaultsAreReadBackAndOnlyTheirOwnClassRemovesThem) {
    HINSTANCE m = Module();
    const Default defaults[] = {
        {"animation editor tree",
         [&](const GUID& c, const GUID&) { return KXRegisterAnimationEditorTree(c, m); },
         KXUnRegisterAnimationEditorTree,
         [](GUID* a, GUID* b) { return TreeOnly(KXGetDefaultAnimationEditorTree, a, b); }, false},
        {"animation editor view",
         [&](const GUID& c, const GUID& op) { return KXRegisterAnimationEditorView(c, op, m); },
         KXUnRegisterAnimationEditorView, KXGetDefaultAnimationEditorView, true},
        {"explorer tree", [&](const GUID& c, const GUID&) { return KXRegisterQVXExplorerTree(c, m); },
         KXUnRegisterQVXExplorerTree,
         [](GUID* a, GUID* b) { return TreeOnly(KXGetDefaultQVXExplorerTree, a, b); }, false},
    };
    for (const Default& d : defaults) {
        SCOPED_TRACE(d.label);
        GUID first = kOther, second = kOther;
        auto read = [&](HRESULT expected) {
            EXPECT_EQ(d.get(&first, &second), expected);
            return std::pair(first, second);
        };
        EXPECT_EQ(d.get(nullptr, &second), E_INVALIDARG);
        EXPECT_EQ(read(S_FALSE), std::pair(GUID_NULL, GUID_NULL)); // nothing registered: the caller's default
        ASSERT_EQ(d.add(kTree, GUID_NULL), S_OK);
        EXPECT_EQ(read(S_OK), std::pair(kTree, GUID_NULL));
        ASSERT_EQ(d.add(kOther, kSourceOp), S_OK);
        EXPECT_EQ(read(S_OK), std::pair(kOther, d.keepsSourceOp ? kSourceOp : GUID_NULL));
        EXPECT_EQ(d.remove(kTree), S_OK); // another class's default stays
        EXPECT_EQ(d.get(&first, nullptr), S_OK);
        EXPECT_EQ(first, kOther);
        EXPECT_EQ(d.remove(kOther), S_OK);
        read(d.keepsSourceOp ? E_FAIL : S_FALSE); // "SOURCEOP" stays
        EXPECT_EQ(d.remove(kOther), S_FALSE);
        ClearRegistrations();
    }
}

// The host's preferences, where the explorer's viewer is kept.
ComPtr<IGWPreferences> Preferences() {
    ComPtr<IGWPreferences> preferences;
    EXPECT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
    return preferences;
}

TEST_F(RegistrationTest, TheExplorersEditorIsAPreferenceWithTheRegistryBehindIt) {
    HINSTANCE m = Module();
    ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK);
    // Deliberately no key: the view's name goes to the preferences.
    EXPECT_EQ(KXRegisterQVXExplorerEditor(kOther, GUID_NULL, m), E_FAIL); // not a view
    EXPECT_EQ(KXRegisterQVXExplorerEditor(kView, GUID_NULL, m), S_OK);
    wchar_t* viewer = nullptr;
    ASSERT_EQ(Preferences()->GetText(L"qvx_explorer.viewer", &viewer), S_OK);
    EXPECT_STREQ((std::unique_ptr<wchar_t, TaskMemDeleter>{viewer}.get()), L"Curve view");
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"QVX Explorer")));
    GUID editor = GUID_NULL, second = kOther;
    EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, &second), S_OK);
    EXPECT_EQ(editor, kView);
    EXPECT_EQ(second, kOther); // never written

    // An empty or unknown preference falls back to the registry's default editor.
    const std::wstring defaultEditor = Base(L"QVX Explorer\\DefaultEditor");
    for (const wchar_t* preference : {L"", L"Unknown view"}) {
        ASSERT_EQ(Preferences()->SetText(L"qvx_explorer.viewer", preference), S_OK);
        EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, nullptr), S_FALSE);
        EXPECT_EQ(editor, GUID_NULL);
    }
    SetText(HKEY_LOCAL_MACHINE, defaultEditor, L"CLSID", GuidToString(kTree));
    EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, nullptr), S_OK);
    EXPECT_EQ(editor, kTree);
    // Its removal, unlike its registration, works on the key.
    EXPECT_EQ(KXUnRegisterQVXExplorerEditor(kTree), S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, defaultEditor));
}

Ids ViewsOf(HRESULT (*list)(const GUID&, DWORD*, GUID**), const GUID& op, HRESULT expected) {
    return Listing([&](DWORD* count, GUID** ids) { return *ids = nullptr, list(op, count, ids); }, expected);
}

TEST_F(RegistrationTest, SourceOperatorsListTheirViewsPerClassAndPerFamily) {
    HINSTANCE m = Module();
    EXPECT_EQ(KXGetAnimationEditorSourceOps(nullptr, nullptr), E_INVALIDARG);
    EXPECT_EQ(ViewsOf(KXGetAnimationEditorSourceOpViews, kSourceOp, S_FALSE), Ids{});
    EXPECT_EQ(Listing(KXGetAnimationEditorSourceOps, S_FALSE), Ids{});
    EXPECT_EQ(Listing(KXGetQVXExplorerSourceOps, S_FALSE), Ids{});

    // Registered in the order the registry lists them on both homes.
    ASSERT_EQ(KXRegisterAnimationEditorSourceOp(kSourceOp, kOther, m), S_OK);
    ASSERT_EQ(KXRegisterAnimationEditorSourceOp(kSourceOp, kView, m), S_OK);
    EXPECT_EQ(Listing(KXGetAnimationEditorSourceOps, S_OK), Ids{kSourceOp});
    EXPECT_EQ(ViewsOf(KXGetAnimationEditorSourceOpViews, kSourceOp, S_OK), (Ids{kOther, kView}));

    // The explorer adds the members of the families it has views for; duplicates stay.
    ASSERT_EQ(KXRegisterQVXExplorerSourceOp(kSourceOp, kView, m), S_OK);
    ASSERT_EQ(KXRegisterQVXExplorerFamilySourceOp(kFamily, kOther, m), S_OK);
    ASSERT_EQ(GWRegisterObjectFamilies(kSourceOp, 1, &kFamily, false, L"op", m), S_OK);
    ASSERT_EQ(GWRegisterObjectFamilies(kTree, 1, &kFamily, false, L"tree", m), S_OK);
    EXPECT_EQ(Listing(KXGetQVXExplorerSourceOps, S_OK), (Ids{kSourceOp, kTree, kSourceOp}));
    EXPECT_EQ(ViewsOf(KXGetQVXExplorerSourceOpViews, kSourceOp, S_OK), (Ids{kView, kOther}));
    EXPECT_EQ(ViewsOf(KXGetQVXExplorerSourceOpViews, kTree, S_OK), Ids{kOther});
    EXPECT_EQ(ViewsOf(KXGetQVXExplorerSourceOpViews, kView, S_FALSE), Ids{});
    // The animation editor has no family source operators; names that are no identifiers are skipped.
    EXPECT_EQ(ViewsOf(KXGetAnimationEditorSourceOpViews, kTree, S_FALSE), Ids{});
    const std::wstring views = Base(L"Animation Editor\\SourceOps\\") + GuidToString(kSourceOp);
    UniqueHKey stray, owner = sdk::OpenKey(HKEY_LOCAL_MACHINE, views.c_str(), sdk::kReadWrite);
    ASSERT_EQ(sdk::CreateKey(HKEY_LOCAL_MACHINE, Base(L"Animation Editor\\SourceOps\\stray").c_str(), stray),
              ERROR_SUCCESS);
    ASSERT_EQ(sdk::SetText(owner.get(), L"stray", L"x"), ERROR_SUCCESS);
    EXPECT_EQ(Listing(KXGetAnimationEditorSourceOps, S_OK), Ids{kSourceOp});
    EXPECT_EQ(ViewsOf(KXGetAnimationEditorSourceOpViews, kSourceOp, S_OK), (Ids{kOther, kView}));
    ASSERT_EQ(RegDeleteValueW(owner.get(), L"stray"), ERROR_SUCCESS);
    ASSERT_EQ(RegDeleteKeyW(HKEY_LOCAL_MACHINE, Base(L"Animation Editor\\SourceOps\\stray").c_str()),
              ERROR_SUCCESS);
    owner.reset();

    // Removing the last view of an owner removes its key, then its emptied parents.
    EXPECT_EQ(KXUnRegisterAnimationEditorSourceOp(kSourceOp, kView), S_OK);
    EXPECT_EQ(KXUnRegisterAnimationEditorSourceOp(kSourceOp, kView), E_FAIL);
    EXPECT_EQ(KXUnRegisterAnimationEditorSourceOp(kSourceOp, kOther), S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Animation Editor")));
    EXPECT_EQ(KXUnRegisterAnimationEditorSourceOp(kSourceOp, kOther), S_FALSE);
    EXPECT_EQ(KXUnRegisterQVXExplorerSourceOp(kSourceOp, kView), S_OK);
    // Without direct source operators the family members are not listed.
    EXPECT_EQ(Listing(KXGetQVXExplorerSourceOps, S_FALSE), Ids{});
    EXPECT_EQ(KXUnRegisterQVXExplorerFamilySourceOp(kFamily, kOther), S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"QVX Explorer")));
}

} // namespace
} // namespace ut::test
