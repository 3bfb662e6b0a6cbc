// Registering plug-in classes of every category and reading them back, the registry layout they
// leave, and the family's deliberate quirks.
#include "registration/registration_test.h"

#include <functional>

#include <ut/platform/process.h>
#include <ut/registration.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/resources.h>

namespace ut::test {

void RegistrationTest::SetUp() {
    ASSERT_EQ(host_.Status(), S_OK);
    const KXDictString strings[] = {{kTwistId, kTwist}, {kInspectorId, kInspector}, {kUnusedId, kUnused}};
    ASSERT_EQ(KXDictAddInstanceStrings(Module(), strings, 3), S_OK);
}

std::vector<GUID> Listed(const wchar_t* category, HRESULT* hr) {
    DWORD count = 0;
    GUID* list = nullptr;
    HRESULT listed = KXGetCLSIDList(category, &count, &list);
    std::unique_ptr<GUID, TaskMemDeleter> owned(list);
    if (hr)
        *hr = listed;
    if (FAILED(listed))
        return {GUID_NULL};
    return std::vector<GUID>(list, list + count);
}

std::wstring NameOf(const wchar_t* category, const GUID& clsid) {
    wchar_t name[80] = L"";
    DWORD bytes = sizeof name;
    return KXGetKeyName(category, clsid, name, &bytes) == S_OK ? std::wstring(name) : L"<failed>";
}

std::wstring TextAt(HKEY root, const std::wstring& path, const wchar_t* value) {
    UniqueHKey key = sdk::OpenKey(root, path.c_str());
    std::wstring text;
    return key && sdk::ReadText(key.get(), value, text) == ERROR_SUCCESS ? text : L"<none>";
}

bool KeyExists(HKEY root, const std::wstring& path) {
    return sdk::OpenKey(root, path.c_str()) != nullptr;
}

std::wstring Base(const std::wstring& path) {
    return LibraryBaseKey() + path;
}

std::wstring ClassText(const GUID& clsid) {
    return GuidToString(clsid);
}

namespace {

using Getter = HRESULT (*)(const GUID&, wchar_t*, DWORD*);

std::wstring ComName(const GUID& clsid) {
    return TextAt(HKEY_CLASSES_ROOT, L"CLSID\\" + ClassText(clsid), nullptr);
}

std::wstring ByGetter(Getter getter, const GUID& clsid) {
    wchar_t name[80] = L"";
    DWORD bytes = sizeof name;
    return getter(clsid, name, &bytes) == S_OK ? std::wstring(name) : L"<failed>";
}

const GUID kClass = TestGuid(1);
const GUID kControls[] = {TestGuid(5), TestGuid(6)};
const std::wstring kInspected = ClassText(TestGuid(99));

struct Form {
    const char* label;
    std::function<HRESULT()> add;
    const wchar_t* category;
    const wchar_t* value; // "Name" or "Path"
    std::wstring text;
    bool entersClass; // a COM entry under the same text
    Getter getter;    // the category's own name getter, if it has one
    std::function<HRESULT()> remove;
    HRESULT removed;
    bool categoryStays; // the removal does not clean the category key
};

TEST_F(RegistrationTest, EveryFormWritesItsRecordThatReadsBackAndGoes) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const wchar_t* path = L"c:\\plugins\\twist.dll";
    const Form forms[] = {
        {"operator", [&] { return KXRegisterOperator(g, m, kTwist); }, L"Operator", L"Name", kTwist, true,
         KXGetOperatorName, [&] { return KXUnRegisterOperator(g); }, S_OK, false},
        {"property", [&] { return KXRegisterProperty(g, m, kTwist); }, L"Property", L"Name", kTwist, true,
         KXGetPropertyName, [&] { return KXUnRegisterProperty(g); }, S_OK, false},
        {"primitive", [&] { return KXRegisterPrimitive(g, m, kTwist); }, L"Primitive", L"Name", kTwist, true,
         KXGetPrimitiveName, [&] { return KXUnRegisterPrimitive(g); }, S_OK, false},
        {"view", [&] { return KXRegisterView(g, m, kTwist); }, L"View", L"Name", kTwist, true, KXGetViewName,
         [&] { return KXUnRegisterView(g); }, S_OK, false},
        {"point locators", [&] { return KXRegisterPointLocatorArray(g, m, kTwist); }, L"PointLocatorArray",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterPointLocatorArray(g); }, S_OK, false},
        {"operator by id", [&] { return KXRegisterOperator(g, m, kTwistId); }, L"Operator", L"Name", kTwist,
         true, KXGetOperatorName, [&] { return KXUnRegisterOperator(g); }, S_OK, false},
        {"property by id", [&] { return KXRegisterProperty(g, m, kTwistId); }, L"Property", L"Name", kTwist,
         true, KXGetPropertyName, [&] { return KXUnRegisterProperty(g); }, S_OK, false},
        {"primitive by id", [&] { return KXRegisterPrimitive(g, m, kTwistId); }, L"Primitive", L"Name",
         kTwist, true, KXGetPrimitiveName, [&] { return KXUnRegisterPrimitive(g); }, S_OK, false},
        {"view by id", [&] { return KXRegisterView(g, m, kTwistId); }, L"View", L"Name", kTwist, true,
         KXGetViewName, [&] { return KXUnRegisterView(g); }, S_OK, false},
        {"operator ex, one family",
         [&] { return KXRegisterOperatorEx(g, m, kTwistId, GUID_NULL, 0, GUID_NULL); }, L"Operator", L"Name",
         kTwist, true, nullptr, [&] { return KXUnRegisterOperatorEx(g, GUID_NULL, GUID_NULL, m); }, S_OK,
         false},
        {"property ex, one family",
         [&] { return KXRegisterPropertyEx(g, m, kTwistId, GUID_NULL, 0, GUID_NULL); }, L"Property", L"Name",
         kTwist, true, nullptr, [&] { return KXUnRegisterPropertyEx(g, GUID_NULL, GUID_NULL, m); }, S_OK,
         false},
        {"operator ex, family list",
         [&] { return KXRegisterOperatorEx(g, m, kTwistId, true, GUID_NULL, 0, 0, nullptr); }, L"Operator",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterOperatorEx(g, GUID_NULL, 0, nullptr, m); },
         S_OK, false},
        {"property ex, family list",
         [&] { return KXRegisterPropertyEx(g, m, kTwistId, true, GUID_NULL, 0, 0, nullptr); }, L"Property",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterPropertyEx(g, GUID_NULL, 0, nullptr, m); },
         S_OK, false},
        {"primitive ex",
         [&] { return KXRegisterPrimitiveEx(g, m, kTwistId, true, GUID_NULL, 0, 0, nullptr); }, L"Primitive",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterPrimitiveEx(g, GUID_NULL, 0, nullptr, m); },
         S_OK, false},
        {"constraint", [&] { return KXRegisterConstraint(g, m, kTwistId, true, GUID_NULL, 0, 0, nullptr); },
         L"Constraint", L"Name", kTwist, true, nullptr,
         [&] { return KXUnRegisterConstraint(g, GUID_NULL, 0, nullptr, m); }, S_OK, false},
        {"caller's category", [&] { return KXRegisterKeyName(g, L"Deformers", m, kTwist); }, L"Deformers",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterKeyName(g, L"Deformers"); }, S_OK, true},
        {"caller's category by id", [&] { return KXRegisterKeyNameId(g, L"Deformers", m, kTwistId); },
         L"Deformers", L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterKeyName(g, L"Deformers"); },
         S_OK, true},
        {"caller's path", [&] { return KXRegisterKeyPath(g, L"Shaders", path); }, L"Shaders", L"Path", path,
         false, nullptr, [&] { return KXUnRegisterKeyName(g, L"Shaders"); }, S_OK, true},
        {"translator", [&] { return KXRegisterTranslator(g, path); }, L"Translator", L"Path", path, false,
         nullptr, [&] { return KXUnRegisterTranslator(g); }, S_OK, true},
        {"resources", [&] { return KXRegisterResources(g, path); }, L"Resources", L"Path", path, false,
         nullptr, [&] { return KXUnRegisterResources(g); }, S_OK, true},
        {"view inspector", [&] { return KXRegisterViewInspector(g, m, TestGuid(99)); }, L"Inspector View",
         L"Name", kInspected, true, nullptr, [&] { return KXUnRegisterViewInspector(g); }, S_OK, false},
        {"manipulator", [&] { return KXRegisterManipulator(g, m, kTwist, 2, kControls); }, L"Manipulator",
         L"Name", kTwist, true, nullptr, [&] { return KXUnRegisterManipulator(g); }, S_FALSE, false},
    };
    for (const Form& form : forms) {
        SCOPED_TRACE(form.label);
        ASSERT_EQ(form.add(), S_OK);
        EXPECT_EQ(Listed(form.category), std::vector<GUID>{g});
        EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, Base(form.category) + L"\\" + ClassText(g), form.value),
                  form.text);
        if (std::wstring(form.value) == L"Name") {
            EXPECT_EQ(NameOf(form.category, g), form.text);
        }
        if (form.getter) {
            EXPECT_EQ(ByGetter(form.getter, g), form.text);
        }
        EXPECT_EQ(ComName(g), form.entersClass ? form.text : L"<none>");

        EXPECT_EQ(form.remove(), form.removed);
        HRESULT listed = S_OK;
        EXPECT_EQ(Listed(form.category, &listed),
                  form.categoryStays ? std::vector<GUID>{} : std::vector<GUID>{GUID_NULL});
        EXPECT_EQ(KeyExists(HKEY_LOCAL_MACHINE, Base(form.category)), form.categoryStays);
        EXPECT_EQ(ComName(g), L"<none>");
        ClearRegistrations();
    }
}

TEST_F(RegistrationTest, IdentifierZeroFailsBeforeAnythingIsWritten) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const std::function<HRESULT()> forms[] = {
        [&] { return KXRegisterOperator(g, m, 0u); },
        [&] { return KXRegisterProperty(g, m, 0u); },
        [&] { return KXRegisterPrimitive(g, m, 0u); },
        [&] { return KXRegisterView(g, m, 0u); },
        [&] { return KXRegisterKeyNameId(g, L"Deformers", m, 0u); },
        [&] { return KXRegisterOperatorEx(g, m, 0u, TestGuid(2), kInspectorId, TestGuid(50)); },
        [&] { return KXRegisterPropertyEx(g, m, 0u, TestGuid(2), kInspectorId, TestGuid(50)); },
        [&] { return KXRegisterOperatorEx(g, m, 0u, true, TestGuid(2), kInspectorId, 1, &g); },
        [&] { return KXRegisterPropertyEx(g, m, 0u, true, TestGuid(2), kInspectorId, 1, &g); },
        [&] { return KXRegisterPrimitiveEx(g, m, 0u, true, TestGuid(2), kInspectorId, 1, &g); },
        [&] { return KXRegisterConstraint(g, m, 0u, true, TestGuid(2), kInspectorId, 1, &g); },
    };
    for (std::size_t i = 0; i < std::size(forms); ++i) {
        SCOPED_TRACE(i);
        EXPECT_EQ(forms[i](), E_FAIL);
        EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, L"Software\\ut"));
        EXPECT_EQ(ComName(g), L"<none>");
        EXPECT_EQ(ComName(TestGuid(2)), L"<none>");
    }
}

// The memberships that the families manager holds for a class: family text -> member's name.
std::wstring Membership(const GUID& family, const GUID& clsid) {
    return TextAt(HKEY_LOCAL_MACHINE,
                  L"Software\\ut\\Families\\" + ClassText(family) + L"\\Members\\" + ClassText(clsid),
                  L"Name");
}

TEST_F(RegistrationTest, CompanionsAndFamiliesFollowTheirForm) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    const GUID companion = TestGuid(2), family = TestGuid(50), other = TestGuid(51);
    const GUID both[] = {family, other};
    std::wstring familyKey = L"Software\\ut\\Families\\" + ClassText(family);

    // Eight arguments: the companion under its own text, memberships under the class's.
    ASSERT_EQ(KXRegisterOperatorEx(g, m, kTwistId, false, companion, kInspectorId, 2, both), S_OK);
    EXPECT_EQ(ComName(companion), kInspector);
    EXPECT_EQ(Membership(family, g), kTwist);
    EXPECT_EQ(Membership(other, g), kTwist);
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, familyKey, L"Kind"), L"<none>"); // no family is described
    EXPECT_EQ(KXUnRegisterOperatorEx(g, companion, 2, both, m), S_OK);
    EXPECT_EQ(ComName(companion), L"<none>");
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, familyKey));

    // Six arguments, deliberately: the name identifier is not used, the companion's text names
    // both the companion and the membership, the family is created, and the flag is true.
    ASSERT_EQ(KXRegisterInspectableObject(g, m, kUnusedId, companion, kInspectorId, family), S_OK);
    EXPECT_EQ(ComName(companion), kInspector);
    EXPECT_EQ(Membership(family, g), kInspector);
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, familyKey, L"Kind"), L"MISC_FAMILY");
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, familyKey, L"Path"), L"c:\\material");
    EXPECT_EQ(TextAt(HKEY_LOCAL_MACHINE, familyKey, L"Class"), ClassText(family));
    DWORD flag = 0, bytes = sizeof flag;
    UniqueHKey member = sdk::OpenKey(HKEY_LOCAL_MACHINE, (familyKey + L"\\Members\\" + ClassText(g)).c_str());
    ASSERT_TRUE(member);
    EXPECT_EQ(
        RegQueryValueExW(member.get(), L"Flag", nullptr, nullptr, reinterpret_cast<BYTE*>(&flag), &bytes),
        ERROR_SUCCESS);
    EXPECT_EQ(flag, 1u);
    member.reset();
    // Its removal takes the family with it.
    EXPECT_EQ(KXUnRegisterInspectableObject(g, companion, family, m), S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, familyKey));

    // Seven arguments: one family, or none for GUID_NULL, which registers only the companion.
    ASSERT_EQ(KXRegisterInspectableObject(g, m, kTwistId, true, companion, kInspectorId, family), S_OK);
    EXPECT_EQ(Membership(family, g), kTwist);
    ASSERT_EQ(KXRegisterInspectableObject(other, m, kTwistId, true, companion, kInspectorId, GUID_NULL),
              S_OK);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, L"Software\\ut\\Families\\" + ClassText(GUID_NULL)));
    ASSERT_EQ(KXRegisterObjectFamilies(other, m, kUnusedId, false, 1, &family), S_OK);
    EXPECT_EQ(Membership(family, other), kUnused);

    // Without companion and family list only the class is entered, with the category's result.
    ASSERT_EQ(KXRegisterOperatorEx(TestGuid(3), m, kTwistId, true, GUID_NULL, 0, 0, nullptr), S_OK);
    EXPECT_EQ(ComName(TestGuid(3)), kTwist);
}

TEST_F(RegistrationTest, ManipulatorsKeepTheirControlsAndGoWithThem) {
    HINSTANCE m = Module();
    const GUID& g = kClass;
    EXPECT_EQ(KXRegisterManipulator(g, m, kTwist, 0, kControls), E_INVALIDARG);
    EXPECT_EQ(KXRegisterManipulator(g, m, kTwist, 2, nullptr), E_POINTER);
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, L"Software\\ut"));

    ASSERT_EQ(KXRegisterManipulator(g, m, kTwist, 2, kControls), S_OK);
    // Registering again starts clean: the first controls go.
    ASSERT_EQ(KXRegisterManipulator(g, m, kTwist, 1, &kControls[1]), S_OK);
    DWORD count = 0;
    GUID* list = nullptr;
    ASSERT_EQ(KXGetManipulator3DControls(g, &count, &list), S_OK);
    EXPECT_EQ(std::vector<GUID>(list, list + count), std::vector<GUID>{kControls[1]});
    CoTaskMemFree(list);
    EXPECT_EQ(Listed(L"Manipulator"), std::vector<GUID>{g});
    ASSERT_EQ(KXGetManipulators(&count, &list), S_OK);
    EXPECT_EQ(std::vector<GUID>(list, list + count), std::vector<GUID>{g});
    CoTaskMemFree(list);
    // A class key with sub-keys does not go through the primitive.
    EXPECT_EQ(KXRemRegistryKey(g, L"Manipulator"), S_FALSE);
    EXPECT_EQ(Listed(L"Manipulator"), std::vector<GUID>{g});

    EXPECT_EQ(KXGetManipulator3DControls(GUID_NULL, &count, &list), E_INVALIDARG);
    EXPECT_EQ(KXGetManipulator3DControls(g, nullptr, &list), E_POINTER);
    EXPECT_EQ(KXGetManipulator3DControls(TestGuid(7), &count, &list), E_FAIL);
    EXPECT_EQ(KXUnRegisterManipulator(g), S_FALSE); // deliberately 1 after a removal
    EXPECT_FALSE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Manipulator")));
    EXPECT_EQ(ComName(g), L"<none>");
}

TEST_F(RegistrationTest, ThePrimitivesAnswerZeroOrOne) {
    const GUID& g = kClass;
    // A missing category is created, deliberately, and the class key is not found in it.
    EXPECT_EQ(KXRemRegistryKey(g, L"Fresh"), S_FALSE);
    EXPECT_TRUE(KeyExists(HKEY_LOCAL_MACHINE, Base(L"Fresh")));
    EXPECT_EQ(KXAddRegistryKey(g, L"Fresh", L"Name", kTwist), S_OK);
    EXPECT_EQ(KXRemRegistryKey(g, L"Fresh"), S_OK);
    // A null value fails after the keys were made; a key name the registry refuses gives 1.
    EXPECT_EQ(KXAddRegistryKey(g, L"Fresh", L"Name", nullptr), E_FAIL);
    EXPECT_EQ(Listed(L"Fresh"), std::vector<GUID>{g});
    const std::wstring tooLong(300, L'x');
    EXPECT_EQ(KXAddRegistryKey(g, tooLong.c_str(), L"Name", kTwist), S_FALSE);
    // After a successful COM entry, the record that fails gives 1 too.
    EXPECT_EQ(KXRegisterKeyName(g, tooLong.c_str(), Module(), kTwist), S_FALSE);
    EXPECT_EQ(ComName(g), kTwist);
}

// What one sample plug-in leaves below the library's key, and its class in the class registry.
TEST_F(RegistrationTest, TheLayoutIsTheRegistrysOwn) {
    HINSTANCE m = Module();
    const GUID op = TestGuid(1), companion = TestGuid(2), view = TestGuid(3), handle = TestGuid(4),
               translator = TestGuid(7), family = TestGuid(50);
    ASSERT_EQ(KXRegisterOperatorEx(op, m, kTwistId, true, companion, kInspectorId, 1, &family), S_OK);
    ASSERT_EQ(KXRegisterView(view, m, L"Curve view"), S_OK);
    ASSERT_EQ(KXRegisterManipulator(handle, m, L"Twist handle", 2, kControls), S_OK);
    ASSERT_EQ(KXRegisterTranslator(translator, L"c:\\plugins\\obj.dll"), S_OK);
    ASSERT_EQ(KXRegisterAnimationEditorView(view, op, m), S_OK);
    ASSERT_EQ(KXRegisterQVXExplorerSourceOp(op, view, m), S_OK);
    ASSERT_EQ(KXRegisterQVXExplorerFamilySourceOp(family, view, m), S_OK);

    std::wstring base = Base();
    base.pop_back();
    const std::wstring root = L"[HKEY_LOCAL_MACHINE\\" + base;
    auto key = [&](const std::wstring& path) { return root + path + L"]\r\n"; };
    auto named = [](const std::wstring& text) { return L"\"Name\"=\"" + text + L"\"\r\n\r\n"; };
    const std::wstring o = ClassText(op), v = ClassText(view), h = ClassText(handle);
    const std::wstring expected =
        L"Windows Registry Editor Version 5.00\r\n\r\n" + key(L"") + L"\r\n" + key(L"\\Animation Editor") +
        L"\r\n" + key(L"\\Animation Editor\\DefaultView") + L"\"CLSID\"=\"" + v + L"\"\r\n\"SOURCEOP\"=\"" +
        o + L"\"\r\n\r\n" + key(L"\\Manipulator") + L"\r\n" + key(L"\\Manipulator\\" + h) +
        named(L"Twist handle") + key(L"\\Manipulator\\" + h + L"\\" + ClassText(kControls[0])) + L"\r\n" +
        key(L"\\Manipulator\\" + h + L"\\" + ClassText(kControls[1])) + L"\r\n" + key(L"\\Operator") +
        L"\r\n" + key(L"\\Operator\\" + o) + named(kTwist) + key(L"\\QVX Explorer") + L"\r\n" +
        key(L"\\QVX Explorer\\FamilySourceOps") + L"\r\n" +
        key(L"\\QVX Explorer\\FamilySourceOps\\" + ClassText(family)) + L"\"" + v +
        L"\"=dword:00000001\r\n\r\n" + key(L"\\QVX Explorer\\SourceOps") + L"\r\n" +
        key(L"\\QVX Explorer\\SourceOps\\" + o) + L"\"" + v + L"\"=dword:00000001\r\n\r\n" +
        key(L"\\Translator") + L"\r\n" + key(L"\\Translator\\" + ClassText(translator)) +
        L"\"Path\"=\"c:\\\\plugins\\\\obj.dll\"\r\n\r\n" + key(L"\\View") + L"\r\n" + key(L"\\View\\" + v) +
        named(L"Curve view");
    EXPECT_EQ(ExportedText(L"HKEY_LOCAL_MACHINE\\" + base), expected);

    const std::wstring classKey = L"[HKEY_CLASSES_ROOT\\CLSID\\" + o;
    EXPECT_EQ(ExportedText(L"HKEY_CLASSES_ROOT\\CLSID\\" + o),
              L"Windows Registry Editor Version 5.00\r\n\r\n" + classKey + L"]\r\n@=\"" + kTwist +
                  L"\"\r\n\r\n" + classKey + L"\\InprocServer32]\r\n@=\"" +
                  RegQuoted(platform::ModuleFileName(m)) + L"\"\r\n\"ThreadingModel\"=\"Apartment\"\r\n\r\n");
}

} // namespace
} // namespace ut::test
