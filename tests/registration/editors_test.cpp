// The explorer's and the animation editor's registrations: defaults, the explorer's editor kept as
// a preference, and source operators per class and per family.
#include "registration/registration_test.h"

#include <functional>
#include <memory>

#include <ut/registration.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/families.h>
#include <ut/sdk/preferences.h>

namespace ut::test {
namespace {

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
        EXPECT_EQ(d.get(nullptr, &second), E_INVALIDARG);
        EXPECT_EQ(d.get(&first, &second), S_FALSE); // nothing registered: the caller's own default
        EXPECT_EQ(first, GUID_NULL);
        EXPECT_EQ(second, GUID_NULL);

        ASSERT_EQ(d.add(kTree, GUID_NULL), S_OK);
        EXPECT_EQ(d.get(&first, &second), S_OK);
        EXPECT_EQ(first, kTree);
        EXPECT_EQ(second, GUID_NULL);
        ASSERT_EQ(d.add(kOther, kSourceOp), S_OK);
        EXPECT_EQ(d.get(&first, &second), S_OK);
        EXPECT_EQ(first, kOther);
        EXPECT_EQ(second, d.keepsSourceOp ? kSourceOp : GUID_NULL);

        EXPECT_EQ(d.remove(kTree), S_OK); // another class's default stays
        EXPECT_EQ(d.get(&first, nullptr), S_OK);
        EXPECT_EQ(first, kOther);
        EXPECT_EQ(d.remove(kOther), S_OK);
        EXPECT_EQ(d.get(&first, &second), d.keepsSourceOp ? E_FAIL : S_FALSE); // "SOURCEOP" stays
        EXPECT_EQ(d.remove(kOther), S_FALSE);
        ClearRegistrations();
    }
}

// Stores `text` as the explorer's viewer preference.
void SetViewerPreference(const wchar_t* text) {
    ComPtr<IGWPreferences> preferences;
    ASSERT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
    ASSERT_EQ(preferences->SetText(L"qvx_explorer.viewer", text), S_OK);
}

std::wstring ViewerPreference() {
    ComPtr<IGWPreferences> preferences;
    wchar_t* text = nullptr;
    if (FAILED(KXGetPreferencesMgr(preferences.Put())) ||
        FAILED(preferences->GetText(L"qvx_explorer.viewer", &text)))
        return L"<none>";
    std::unique_ptr<wchar_t, TaskMemDeleter> owned(text);
    return text;
}

TEST_F(RegistrationTest, TheExplorersEditorIsAPreferenceWithTheRegistryBehindIt) {
    HINSTANCE m = Module();
    ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK);
    // Deliberately no key: the view's name goes to the preferences.
    EXPECT_EQ(KXRegisterQVXExplorerEditor(kOther, GUID_NULL, m), E_FAIL); // not a view
    EXPECT_EQ(KXRegisterQVXExplorerEditor(kView, GUID_NULL, m), S_OK);
    EXPECT_EQ(ViewerPreference(), L"Curve view");
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"QVX Explorer")));
    GUID editor = GUID_NULL, second = kOther;
    EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, &second), S_OK);
    EXPECT_EQ(editor, kView);
    EXPECT_EQ(second, kOther); // never written

    // An empty or unknown preference falls back to the registry's default editor.
    const std::wstring defaultEditor = Base(L"QVX Explorer\\DefaultEditor");
    for (const wchar_t* preference : {L"", L"Unknown view"}) {
        SetViewerPreference(preference);
        EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, nullptr), S_FALSE);
        EXPECT_EQ(editor, GUID_NULL);
    }
    {
        UniqueHKey key;
        ASSERT_EQ(sdk::CreateKey(HKEY_LOCAL_MACHINE, defaultEditor.c_str(), key), ERROR_SUCCESS);
        ASSERT_EQ(sdk::SetText(key.get(), L"CLSID", GuidToString(kTree).c_str()), ERROR_SUCCESS);
    }
    EXPECT_EQ(KXGetDefaultQVXExplorerEditor(&editor, nullptr), S_OK);
    EXPECT_EQ(editor, kTree);
    // Its removal, unlike its registration, works on the key.
    EXPECT_EQ(KXUnRegisterQVXExplorerEditor(kTree), S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, defaultEditor));
}

std::vector<GUID> Listing(HRESULT (*list)(DWORD*, GUID**), HRESULT expected) {
    DWORD count = 9;
    GUID* ids = reinterpret_cast<GUID*>(&count);
    EXPECT_EQ(list(&count, &ids), expected);
    std::unique_ptr<GUID, TaskMemDeleter> owned(ids);
    return ids ? std::vector<GUID>(ids, ids + count) : std::vector<GUID>{};
}

std::vector<GUID> ViewsOf(HRESULT (*list)(const GUID&, DWORD*, GUID**), const GUID& op, HRESULT expected) {
    DWORD count = 9;
    GUID* ids = nullptr;
    EXPECT_EQ(list(op, &count, &ids), expected);
    std::unique_ptr<GUID, TaskMemDeleter> owned(ids);
    return ids ? std::vector<GUID>(ids, ids + count) : std::vector<GUID>{};
}

TEST_F(RegistrationTest, SourceOperatorsListTheirViewsPerClassAndPerFamily) {
    HINSTANCE m = Module();
    using Ids = std::vector<GUID>;
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
