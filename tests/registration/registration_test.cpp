// Registering plug-in classes of every category and reading them back, the registry layout they
// leave, the family's deliberate quirks, and what each failing host call ends in.
#include "registration/registration_test.h"

#include <string_view>

#include <ut/platform/process.h>
#include <ut/sdk/families.h>

#include "support/fault_plan.h"

namespace ut::test {
namespace {

using Getter = HRESULT (*)(const GUID&, wchar_t*, DWORD*);

std::wstring ComName(const GUID& clsid) {
    return TextAt(HKEY_CLASSES_ROOT, L"CLSID\\" + GuidToString(clsid), nullptr);
}

std::wstring FamilyKey(const GUID& family) {
    return L"Software\\ut\\Families\\" + GuidToString(family);
}

const GUID kClass = TestGuid(1), kCompanion = TestGuid(2), kFamily = TestGuid(50),
           kOtherFamily = TestGuid(51);
const GUID kControls[] = {TestGuid(5), TestGuid(6)};
const wchar_t* const kPath = L"c:\\plugins\\twist.dll";

struct Form {
    const char* label;
    std::function<HRESULT()> add, remove;
    const wchar_t* category;
    std::wstring name; // the "Name" written, or empty for a "Path" record of kPath without COM entry
    Getter getter;     // the category's own getter, if it has one
    HRESULT removed;
    bool categoryStays; // the removal leaves the category key for GwRegCleanKey's caller
};

TEST_F(RegistrationTest, EveryFormWritesItsRecordThatReadsBackAndGoes) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const GUID null = GUID_NULL;
    // clang-format off
    const Form forms[] = {
        {"operator", [&] { return KXRegisterOperator(g, m, kTwist); }, [&] { return KXUnRegisterOperator(g); },
         L"Operator", kTwist, KXGetOperatorName, S_OK, false},
        {"property", [&] { return KXRegisterProperty(g, m, kTwist); }, [&] { return KXUnRegisterProperty(g); },
         L"Property", kTwist, KXGetPropertyName, S_OK, false},
        {"primitive", [&] { return KXRegisterPrimitive(g, m, kTwist); }, [&] { return KXUnRegisterPrimitive(g); },
         L"Primitive", kTwist, KXGetPrimitiveName, S_OK, false},
        {"view", [&] { return KXRegisterView(g, m, kTwist); }, [&] { return KXUnRegisterView(g); },
         L"View", kTwist, KXGetViewName, S_OK, false},
        {"point locators", [&] { return KXRegisterPointLocatorArray(g, m, kTwist); }, [&] { return KXUnRegisterPointLocatorArray(g); },
         L"PointLocatorArray", kTwist, nullptr, S_OK, false},
        {"operator by id", [&] { return KXRegisterOperator(g, m, kTwistId); }, [&] { return KXUnRegisterOperator(g); },
         L"Operator", kTwist, KXGetOperatorName, S_OK, false},
        {"operator ex", [&] { return KXRegisterOperatorEx(g, m, kTwistId, null, 0, null); },
         [&] { return KXUnRegisterOperatorEx(g, null, null, m); }, L"Operator", kTwist, nullptr, S_OK, false},
        {"property ex, list", [&] { return KXRegisterPropertyEx(g, m, kTwistId, true, null, 0, 0, nullptr); },
         [&] { return KXUnRegisterPropertyEx(g, null, 0, nullptr, m); }, L"Property", kTwist, nullptr, S_OK, false},
        {"primitive ex", [&] { return KXRegisterPrimitiveEx(g, m, kTwistId, true, null, 0, 0, nullptr); },
         [&] { return KXUnRegisterPrimitiveEx(g, null, 0, nullptr, m); }, L"Primitive", kTwist, nullptr, S_OK, false},
        {"constraint", [&] { return KXRegisterConstraint(g, m, kTwistId, true, null, 0, 0, nullptr); },
         [&] { return KXUnRegisterConstraint(g, null, 0, nullptr, m); }, L"Constraint", kTwist, nullptr, S_OK, false},
        {"caller's category", [&] { return KXRegisterKeyName(g, L"Deformers", m, kTwist); },
         [&] { return KXUnRegisterKeyName(g, L"Deformers"); }, L"Deformers", kTwist, nullptr, S_OK, true},
        {"caller's path", [&] { return KXRegisterKeyPath(g, L"Shaders", kPath); },
         [&] { return KXUnRegisterKeyName(g, L"Shaders"); }, L"Shaders", L"", nullptr, S_OK, true},
        {"translator", [&] { return KXRegisterTranslator(g, kPath); }, [&] { return KXUnRegisterTranslator(g); },
         L"Translator", L"", nullptr, S_OK, true},
        {"resources", [&] { return KXRegisterResources(g, kPath); }, [&] { return KXUnRegisterResources(g); },
         L"Resources", L"", nullptr, S_OK, true},
        {"view inspector", [&] { return KXRegisterViewInspector(g, m, TestGuid(99)); }, [&] { return KXUnRegisterViewInspector(g); },
         L"Inspector View", GuidToString(TestGuid(99)), nullptr, S_OK, false},
        {"manipulator", [&] { return KXRegisterManipulator(g, m, kTwist, 2, kControls); }, [&] { return KXUnRegisterManipulator(g); },
         L"Manipulator", kTwist, nullptr, S_FALSE, false},
    };
    // clang-format on
    for (const Form& form : forms) {
        SCOPED_TRACE(form.label);
        const bool named = !form.name.empty();
        ASSERT_EQ(form.add(), S_OK);
        EXPECT_EQ(Listed(form.category), Ids{g});
        EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, Base(form.category) + L"\\" + GuidToString(g),
                         named ? L"Name" : L"Path"),
                  named ? form.name : kPath);
        EXPECT_EQ(NameOf(form.category, g), named ? form.name : L"");
        wchar_t name[80] = L"";
        DWORD bytes = sizeof name;
        EXPECT_TRUE(!form.getter || (form.getter(g, name, &bytes) == S_OK && form.name == name));
        EXPECT_EQ(ComName(g), named ? form.name : L"<none>");

        EXPECT_EQ(form.remove(), form.removed);
        EXPECT_EQ(Listed(form.category), form.categoryStays ? Ids{} : Ids{GUID_NULL});
        EXPECT_EQ(ComName(g), L"<none>");
        ClearRegistrations();
    }
}

TEST_F(RegistrationTest, IdentifierZeroFailsBeforeAnythingIsWritten) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const std::function<HRESULT()> forms[] = {
        [&] { return KXRegisterOperator(g, m, 0u); },
        [&] { return KXRegisterView(g, m, 0u); },
        [&] { return KXRegisterKeyNameId(g, L"Deformers", m, 0u); },
        [&] { return KXRegisterPropertyEx(g, m, 0u, kCompanion, kInspectorId, kFamily); },
        [&] { return KXRegisterConstraint(g, m, 0u, true, kCompanion, kInspectorId, 1, &kFamily); },
    };
    for (const auto& form : forms) {
        EXPECT_EQ(form(), E_FAIL);
        EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, L"Software\\ut"));
        EXPECT_EQ(ComName(kCompanion), L"<none>");
    }
}

TEST_F(RegistrationTest, CompanionsAndFamiliesFollowTheirForm) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const GUID both[] = {kFamily, kOtherFamily};
    auto membership = [&](const GUID& family, const GUID& clsid) {
        return TextAt(HKEY_LOCAL_MACHINE, FamilyKey(family) + L"\\Members\\" + GuidToString(clsid), L"Name");
    };

    // Eight arguments: the companion under its own text, memberships under the class's.
    ASSERT_EQ(KXRegisterOperatorEx(g, m, kTwistId, false, kCompanion, kInspectorId, 2, both), S_OK);
    EXPECT_EQ(ComName(kCompanion), kInspector);
    EXPECT_EQ(membership(kOtherFamily, g), kTwist);
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, FamilyKey(kFamily), L"Kind"), L"<none>"); // no family is made
    EXPECT_EQ(KXUnRegisterOperatorEx(g, kCompanion, 2, both, m), S_OK);
    EXPECT_EQ(ComName(kCompanion), L"<none>");
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, FamilyKey(kFamily)));

    // Six arguments, deliberately: the name identifier is not used, the companion's text names
    // both the companion and the membership, the family is made first, and the flag is true.
    ASSERT_EQ(KXRegisterInspectableObject(g, m, kUnusedId, kCompanion, kInspectorId, kFamily), S_OK);
    EXPECT_EQ(ComName(kCompanion), kInspector);
    EXPECT_EQ(membership(kFamily, g), kInspector);
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, FamilyKey(kFamily), L"Kind"), L"MISC_FAMILY");
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, FamilyKey(kFamily), L"Path"), L"c:\\material");
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, FamilyKey(kFamily), L"Class"), GuidToString(kFamily));
    DWORD flag = 0, bytes = sizeof flag;
    UniqueHKey member =
        sdk::OpenKey(HKEY_LOCAL_MACHINE, (FamilyKey(kFamily) + L"\\Members\\" + GuidToString(g)).c_str());
    EXPECT_EQ(
        RegQueryValueExW(member.get(), L"Flag", nullptr, nullptr, reinterpret_cast<BYTE*>(&flag), &bytes),
        ERROR_SUCCESS);
    EXPECT_EQ(flag, 1u);
    member.reset();
    EXPECT_EQ(KXUnRegisterInspectableObject(g, kCompanion, kFamily, m), S_OK); // the family goes too
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, FamilyKey(kFamily)));

    // Seven arguments: one family, or, for GUID_NULL, none, which leaves the companion's result.
    ASSERT_EQ(KXRegisterInspectableObject(g, m, kTwistId, true, kCompanion, kInspectorId, kFamily), S_OK);
    EXPECT_EQ(membership(kFamily, g), kTwist);
    ASSERT_EQ(KXRegisterInspectableObject(TestGuid(3), m, kTwistId, true, GUID_NULL, 0, GUID_NULL), S_OK);
    ASSERT_EQ(KXRegisterObjectFamilies(TestGuid(3), m, kUnusedId, false, 1, &kFamily), S_OK);
    EXPECT_EQ(membership(kFamily, TestGuid(3)), kUnused);
}

TEST_F(RegistrationTest, ManipulatorsKeepTheirControlsAndGoWithThem) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    EXPECT_EQ(KXRegisterManipulator(g, m, kTwist, 0, kControls), E_INVALIDARG);
    EXPECT_EQ(KXRegisterManipulator(g, m, kTwist, 2, nullptr), E_POINTER);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, L"Software\\ut"));

    ASSERT_EQ(KXRegisterManipulator(g, m, kTwist, 2, kControls), S_OK);
    ASSERT_EQ(KXRegisterManipulator(g, m, kTwist, 1, &kControls[1]), S_OK); // starts clean
    auto controls = [&](DWORD* count, GUID** list) { return KXGetManipulator3DControls(g, count, list); };
    EXPECT_EQ(Listing(controls, S_OK), Ids{kControls[1]});
    EXPECT_EQ(Listing(KXGetManipulators, S_OK), Ids{g});
    DWORD count = 0;
    GUID* list = nullptr;
    EXPECT_EQ(KXRemRegistryKey(g, L"Manipulator"), S_FALSE); // a class key with sub-keys stays
    EXPECT_EQ(KXGetManipulator3DControls(GUID_NULL, &count, &list), E_INVALIDARG);
    EXPECT_EQ(KXGetManipulator3DControls(g, nullptr, &list), E_POINTER);
    EXPECT_EQ(KXGetManipulator3DControls(TestGuid(7), &count, &list), E_FAIL);
    EXPECT_EQ(KXUnRegisterManipulator(g), S_FALSE); // deliberately 1 after a removal
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Manipulator")));
}

TEST_F(RegistrationTest, ThePrimitivesAnswerZeroOrOne) {
    const GUID& g = kClass;
    EXPECT_EQ(KXRemRegistryKey(g, L"Fresh"), S_FALSE); // deliberately makes the missing category
    EXPECT_TRUE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Fresh")));
    EXPECT_EQ(KXAddRegistryKey(g, L"Fresh", L"Name", kTwist), S_OK);
    EXPECT_EQ(KXRemRegistryKey(g, L"Fresh"), S_OK);
    EXPECT_EQ(KXAddRegistryKey(g, L"Fresh", L"Name", nullptr), E_FAIL); // after the keys were made
    EXPECT_EQ(Listed(L"Fresh"), Ids{g});
    // A key the registry refuses gives 1, also after a COM entry that succeeded.
    const std::wstring tooLong(300, L'x');
    EXPECT_EQ(KXAddRegistryKey(g, tooLong.c_str(), L"Name", kTwist), S_FALSE);
    EXPECT_EQ(KXRegisterKeyName(g, tooLong.c_str(), Module(), kTwist), S_FALSE);
    EXPECT_EQ(ComName(g), kTwist);
}

// What one sample plug-in leaves below the library's key, and its class in the class registry.
TEST_F(RegistrationTest, TheLayoutIsTheRegistrysOwn) {
    HINSTANCE m = Module();
    const GUID op = TestGuid(1), view = TestGuid(3), handle = TestGuid(4), translator = TestGuid(7);
    ASSERT_EQ(KXRegisterOperatorEx(op, m, kTwistId, true, kCompanion, kInspectorId, 1, &kFamily), S_OK);
    ASSERT_EQ(KXRegisterView(view, m, L"Curve view"), S_OK);
    ASSERT_EQ(KXRegisterManipulator(handle, m, L"Twist handle", 2, kControls), S_OK);
    ASSERT_EQ(KXRegisterTranslator(translator, L"c:\\plugins\\obj.dll"), S_OK);
    ASSERT_EQ(KXRegisterAnimationEditorView(view, op, m), S_OK);
    ASSERT_EQ(KXRegisterQVXExplorerSourceOp(op, view, m), S_OK);
    ASSERT_EQ(KXRegisterQVXExplorerFamilySourceOp(kFamily, view, m), S_OK);

    std::wstring base = Base();
    base.pop_back();
    auto key = [&](const std::wstring& path) { return L"[HKEY_LOCAL_MACHINE\\" + base + path + L"]\r\n"; };
    auto empty = [&](const std::wstring& path) { return key(path) + L"\r\n"; };
    auto value = [](const std::wstring& name, const std::wstring& data) {
        return L"\"" + name + L"\"=" + data + L"\r\n";
    };
    auto text = [](const std::wstring& data) { return L"\"" + data + L"\""; };
    const std::wstring o = GuidToString(op), v = GuidToString(view),
                       h = L"\\Manipulator\\" + GuidToString(handle);
    const std::wstring expected =
        L"Windows Registry Editor Version 5.00\r\n\r\n" + empty(L"") + empty(L"\\Animation Editor") +
        key(L"\\Animation Editor\\DefaultView") + value(L"CLSID", text(v)) + value(L"SOURCEOP", text(o)) +
        L"\r\n" + empty(L"\\Manipulator") + key(h) + value(L"Name", text(L"Twist handle")) + L"\r\n" +
        empty(h + L"\\" + GuidToString(kControls[0])) + empty(h + L"\\" + GuidToString(kControls[1])) +
        empty(L"\\Operator") + key(L"\\Operator\\" + o) + value(L"Name", text(kTwist)) + L"\r\n" +
        empty(L"\\QVX Explorer") + empty(L"\\QVX Explorer\\FamilySourceOps") +
        key(L"\\QVX Explorer\\FamilySourceOps\\" + GuidToString(kFamily)) + value(v, L"dword:00000001") +
        L"\r\n" + empty(L"\\QVX Explorer\\SourceOps") + key(L"\\QVX Explorer\\SourceOps\\" + o) +
        value(v, L"dword:00000001") + L"\r\n" + empty(L"\\Translator") +
        key(L"\\Translator\\" + GuidToString(translator)) +
        value(L"Path", text(L"c:\\\\plugins\\\\obj.dll")) + L"\r\n" + empty(L"\\View") +
        key(L"\\View\\" + v) + value(L"Name", text(L"Curve view")) + L"\r\n";
    EXPECT_EQ(ExportedText(L"HKEY_LOCAL_MACHINE\\" + base), expected);

    const std::wstring classKey = L"[HKEY_CLASSES_ROOT\\CLSID\\" + o;
    EXPECT_EQ(ExportedText(L"HKEY_CLASSES_ROOT\\CLSID\\" + o),
              L"Windows Registry Editor Version 5.00\r\n\r\n" + classKey + L"]\r\n" + L"@=" + text(kTwist) +
                  L"\r\n\r\n" + classKey + L"\\InprocServer32]\r\n@=" +
                  text(RegQuoted(platform::ModuleFileName(m))) + L"\r\n" +
                  value(L"ThreadingModel", text(L"Apartment")) + L"\r\n");
}

// The family against failing host calls: each host call fails in turn, and the result is the one
// each function's rules give for that call; no host object is left behind.
constexpr HRESULT kInjected = E_ABORT;
const GUID kView = TestGuid(3), kTree = TestGuid(4);

struct Walk {
    const char* label;
    std::function<void()> prepare;
    std::function<HRESULT()> operation;
    // The result when the n-th host call, `failed`, fails; n is 0 when none did.
    std::function<HRESULT(int n, std::string_view failed)> expected;
};

const auto Propagated = [](int n, std::string_view) { return n ? kInjected : S_OK; };
const auto Ignored = [](int, std::string_view) { return S_OK; };

// Runs a listing and frees what it returned.
HRESULT Freed(const std::function<HRESULT(DWORD*, GUID**)>& listing) {
    DWORD count = 0;
    GUID* list = nullptr;
    HRESULT hr = listing(&count, &list);
    CoTaskMemFree(list);
    return hr;
}

TEST_F(RegistrationTest, EveryHostFailureEndsAsTheRulesSay) {
    HINSTANCE m = Module();
    auto explorerFamilies = [&] {
        ASSERT_EQ(KXRegisterQVXExplorerSourceOp(kClass, kView, m), S_OK);
        ASSERT_EQ(KXRegisterQVXExplorerFamilySourceOp(kFamily, kView, m), S_OK);
        ASSERT_EQ(GWRegisterObjectFamilies(kClass, 1, &kFamily, false, L"op", m), S_OK);
        ASSERT_EQ(GWRegisterObjectFamilies(kTree, 1, &kFamily, false, L"tree", m), S_OK);
    };
    auto viewWithEditor = [&] {
        ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK);
        ASSERT_EQ(KXRegisterQVXExplorerEditor(kView, GUID_NULL, m), S_OK);
        SetText(HKEY_LOCAL_MACHINE, Base(L"QVX Explorer\\DefaultEditor"), L"CLSID", GuidToString(kTree));
    };
    // clang-format off
    const Walk walks[] = {
        {"operator", [] {}, [&] { return KXRegisterOperator(kClass, m, kTwist); }, Propagated},
        {"operator ex, family list", [] {},
         [&] { return KXRegisterOperatorEx(kClass, m, kTwistId, true, kCompanion, kInspectorId, 1, &kFamily); },
         Propagated},
        {"operator ex, one family", [] {},
         [&] { return KXRegisterOperatorEx(kClass, m, kTwistId, kCompanion, kInspectorId, kFamily); }, Propagated},
        // The earlier registration's removal does not count; the new COM entry does.
        {"manipulator", [] {}, [&] { return KXRegisterManipulator(kClass, m, kTwist, 1, &kView); },
         [](int, std::string_view failed) { return failed == "GWRegisterCOMObject" ? kInjected : S_OK; }},
        {"operator removal", [&] { ASSERT_EQ(KXRegisterOperator(kClass, m, kTwist), S_OK); },
         [&] { return KXUnRegisterOperator(kClass); }, Ignored},
        // Only the last step, the memberships, gives the result.
        {"operator ex removal, family list",
         [&] { ASSERT_EQ(KXRegisterOperatorEx(kClass, m, kTwistId, true, kCompanion, kInspectorId, 1, &kFamily), S_OK); },
         [&] { return KXUnRegisterOperatorEx(kClass, kCompanion, 1, &kFamily, m); },
         [](int, std::string_view failed) {
             return failed == "GWQueryGenericObject" || failed == "IGWFamiliesManager::UnregisterMembers" ? kInjected : S_OK; }},
        {"inspectable removal, one family",
         [&] { ASSERT_EQ(KXRegisterInspectableObject(kClass, m, 0, kCompanion, kInspectorId, kFamily), S_OK); },
         [&] { return KXUnRegisterInspectableObject(kClass, kCompanion, kFamily, m); },
         [](int n, std::string_view) { return n >= 4 ? kInjected : S_OK; }},
        {"explorer source operators", explorerFamilies, [&] { return Freed(KXGetQVXExplorerSourceOps); }, Propagated},
        {"explorer source operator views", explorerFamilies,
         [&] { return Freed([](DWORD* c, GUID** l) { return KXGetQVXExplorerSourceOpViews(kTree, c, l); }); },
         Propagated},
        {"explorer editor", [&] { ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK); },
         [&] { return KXRegisterQVXExplorerEditor(kView, GUID_NULL, m); },
         [](int n, std::string_view) { return n ? E_FAIL : S_OK; }},
        // The registry's default stands in for what the host cannot tell.
        {"explorer editor lookup", viewWithEditor, [&] {
             GUID editor = GUID_NULL;
             HRESULT hr = KXGetDefaultQVXExplorerEditor(&editor, nullptr);
             return hr == S_OK && (editor == kView || editor == kTree) ? S_OK : E_UNEXPECTED; },
         Ignored},
        {"host view name", [&] { ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK); },
         [&] { CKXString name; return KXGetGWViewName(kView, name); }, Propagated},
        {"description file", [] {}, [&] {
             wchar_t file[8];
             DWORD bytes = sizeof file;
             HRESULT hr = KXGetQDEFFilename(kClass, file, &bytes);
             return hr == E_FAIL ? S_OK : hr; }, // there is no file: only the key text can fail otherwise
         Propagated},
    };
    // clang-format on
    for (const Walk& walk : walks) {
        for (int n = 1;; ++n) {
            ClearRegistrations();
            walk.prepare();
            LiveObjectCheck live;
            FaultPlan plan(n, kInjected);
            HRESULT hr = walk.operation();
            if (!plan.Fired()) {
                EXPECT_EQ(hr, walk.expected(0, "")) << walk.label;
                break;
            }
            EXPECT_EQ(hr, walk.expected(n, plan.Seen()[n - 1]))
                << walk.label << ", failing " << plan.Seen()[n - 1] << " (host call " << n << ")";
        }
    }
}

} // namespace
} // namespace ut::test
