#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/paths.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/paths.h>
#include <ut/sdk/preferences.h>
#include <ut/validate.h>

#include "support/compound.h"
#include "support/fault_plan.h"
#include "support/registrations.h"
#include "support/temp_folder.h"
#include "support/wine.h"

namespace {

using ut::ComPtr;
using ut::test::TempFolder;

// A reference host whose preferences start empty and are cleared again after.
class Paths : public ::testing::Test {
protected:
    void Set(const wchar_t* name, const std::wstring& value) {
        ComPtr<IGWPreferences> preferences;
        ASSERT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
        ASSERT_EQ(preferences->SetText(name, value.c_str()), S_OK);
    }

    ut::test::RegistrationScope scope_;
    ut::host::ReferenceHost host_;
};

TEST_F(Paths, EveryTypeMapsToItsFolder) {
    struct Case {
        int type;
        HRESULT one;
        std::wstring path;
        std::vector<std::wstring> all;
    };
    const Case configured[] = {
        {0, S_OK, L"C:\\proj", {L"C:\\proj"}},
        {1, S_OK, L"C:\\user", {L"C:\\user"}},
        {2, S_OK, L"C:\\wg1", {L"C:\\wg1", L"D:\\wg2"}},
        {3, S_OK, L"C:\\site", {L"C:\\site"}},
        {4, S_OK, L"C:\\factory\\Addons", {L"C:\\factory\\Addons"}},
        {5, S_OK, L"C:\\user\\Addons", {L"C:\\user\\Addons"}},
        {6, S_OK, L"C:\\wg1\\Addons", {L"C:\\wg1\\Addons", L"D:\\wg2\\Addons"}},
        {7, S_FALSE, L"", {}},
        {8, E_FAIL, L"untouched", {}},
        {-1, E_FAIL, L"untouched", {}},
    };
    const Case unconfigured[] = {
        {0, S_FALSE, L"", {}}, {2, S_FALSE, L"", {}}, {3, S_FALSE, L"", {}}, {6, S_FALSE, L"", {}}};
    for (bool withSettings : {false, true}) {
        if (withSettings) {
            Set(L"paths.project", L"C:\\proj\\");
            Set(L"paths.user", L"C:\\user");
            Set(L"paths.workgroups", L"C:\\wg1;D:\\wg2\\");
            Set(L"paths.site", L"C:\\site");
            Set(L"paths.addons", L"C:\\factory\\Addons");
        }
        for (const Case& c :
             withSettings ? std::span<const Case>(configured) : std::span<const Case>(unconfigured)) {
            auto type = static_cast<tagE3D_INSTALL_PATH_TYPE>(c.type);
            CKXString path = L"untouched";
            EXPECT_EQ(KXGetInstallPath(type, path), c.one) << c.type;
            EXPECT_EQ(std::wstring(path), c.path) << c.type;
            std::vector<CKXString> all;
            EXPECT_EQ(KXGetInstallPaths(type, all), c.one == E_FAIL ? E_FAIL
                                                    : c.all.empty() ? S_FALSE
                                                                    : S_OK)
                << c.type;
            EXPECT_EQ(std::vector<std::wstring>(all.begin(), all.end()), c.all) << c.type;
        }
    }
    // Names already in the list count: type 7 adds nothing and still answers S_OK.
    std::vector<CKXString> kept{CKXString(L"kept")};
    EXPECT_EQ(KXGetInstallPaths(E3D_INSTALL_PATH_NONE, kept), S_OK);
    EXPECT_EQ(kept.size(), 1u);
}

TEST_F(Paths, ProjectFailuresPassThrough) {
    Set(L"paths.project", L"C:\\proj");
    std::vector<HRESULT> results; // host calls 1, 2, ... failing, then the clean run
    ut::test::WalkHostFaults(
        [] {
            CKXString path;
            return KXGetInstallPath(E3D_INSTALL_PATH_PROJECT, path);
        },
        [&](int, HRESULT hr) { results.push_back(hr); });
    // The manager, its project, the host's preferences it reads (an unread one is no project), the release.
    EXPECT_EQ(results, (std::vector<HRESULT>{E_FAIL, E_FAIL, S_FALSE, S_FALSE, E_FAIL, S_OK}));
}

TEST(IsFileRelativeToProject, ComparesThePrefixOnlyWithoutCase) {
    struct Case {
        const wchar_t *project, *file;
        int relative;
    } cases[] = {
        {L"C:\\proj", L"C:\\proj\\a.scn", 1},
        {L"C:\\proj", L"c:\\PROJ\\a.scn", 1},
        {L"C:\\proj", L"C:\\projects\\a.scn", 1},
        {L"", L"anything", 1},
        {L"", L"", 1},
        {L"C:\\proj", L"C:\\pro", 0},
        {L"C:\\proj", L"D:\\proj\\a.scn", 0},
    };
    for (const Case& c : cases)
        EXPECT_EQ(KXIsFileRelativeToProject(c.project, c.file), c.relative) << c.project << L" " << c.file;
}

TEST(OpenStorageOnFile, OpensCreatesReplacesAndMakesTemporaries) {
    TempFolder folder;
    const std::wstring existing = folder / L"scene.scn", missing = folder / L"missing.scn";
    {
        ComPtr<IStorage> root;
        ASSERT_EQ(StgCreateDocfile(existing.c_str(), ut::test::kCreateMode, 0, root.Put()), S_OK);
        ASSERT_EQ(ut::test::PutStream(root.Get(), L"Kept", "bytes"), S_OK);
    }
    const std::wstring text = folder.Write(L"text.txt", "not a compound file");
    const std::wstring nested = folder / L"no\\such\\folder.scn";
    constexpr DWORD kMode = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;
    struct Case {
        const wchar_t* path;
        int create;
        HRESULT result;
        std::size_t elements;
    } cases[] = {
        {existing.c_str(), 0, S_OK, 1},
        {existing.c_str(), 1, S_OK, 0},
        {missing.c_str(), 0, STG_E_FILENOTFOUND, 0},
        {missing.c_str(), 1, S_OK, 0},
        {nullptr, 0, STG_E_FILENOTFOUND, 0},
        {nullptr, 1, S_OK, 0},
        {text.c_str(), 0, STG_E_FILEALREADYEXISTS, 0},
        {nested.c_str(), 1, E_INVALIDARG, 0}, // the byte array's failure is reported as a bad argument
    };
    for (const Case& c : cases) {
        ComPtr<IStorage> storage;
        ComPtr<ILockBytes> bytes;
        HRESULT hr = F3DOpenStorageOnFile(c.path, kMode, c.create, storage.Put(), bytes.Put());
        HRESULT expected = c.result;
        if (expected == STG_E_FILEALREADYEXISTS &&
            ut::test::UnderWine("wine takes a file that is not compound for a missing one"))
            expected = STG_E_FILENOTFOUND;
        EXPECT_EQ(hr, expected) << (c.path ? c.path : L"(temporary)") << c.create;
        if (SUCCEEDED(hr)) {
            EXPECT_EQ(ut::test::ElementsOf(storage.Get()).size(), c.elements);
        }
    }
    EXPECT_EQ(F3DOpenStorageOnFile(existing.c_str(), kMode, 0, nullptr, nullptr), E_POINTER);
    // The temporary file goes with its last reference.
    std::wstring temporary;
    {
        ComPtr<IStorage> temp;
        ComPtr<ILockBytes> tempBytes;
        ASSERT_EQ(F3DOpenStorageOnFile(nullptr, ut::test::kCreateMode, 1, temp.Put(), tempBytes.Put()), S_OK);
        STATSTG stat{};
        ASSERT_EQ(tempBytes->Stat(&stat, STATFLAG_DEFAULT), S_OK);
        temporary = stat.pwcsName;
        CoTaskMemFree(stat.pwcsName);
        EXPECT_NE(temporary.find(L"K3D"), std::wstring::npos) << temporary;
        EXPECT_TRUE(std::filesystem::exists(temporary));
    }
    EXPECT_FALSE(std::filesystem::exists(temporary));
}

TEST_F(Paths, DefaultImageIsTheReadablePreferenceOrTheFactoryOne) {
    TempFolder folder;
    const std::wstring picture = folder.Write(L"missing.pic", "pic");
    CKXString factory;
    ASSERT_EQ(KXGetFactoryPath(factory), S_OK);
    const std::wstring fallback = std::wstring(factory) + L"\\Resources\\noIcon.pic";
    struct Case {
        std::wstring preference, path;
    } cases[] = {{L"", fallback}, {folder / L"absent.pic", fallback}, {picture, picture}};
    for (const Case& c : cases) {
        if (!c.preference.empty())
            Set(L"rendering.default_image_source_windows", c.preference);
        CKXString path;
        EXPECT_EQ(KXGetUserPrefDefaultImage(&path), S_OK);
        EXPECT_EQ(std::wstring(path), c.path) << c.preference;
    }
    EXPECT_EQ(KXGetUserPrefDefaultImage(nullptr), E_POINTER);
}

TEST_F(Paths, PluginItemsAreFoundByKindAndName) {
    const GUID kind = ut::test::TestGuid(1), other = ut::test::TestGuid(2);
    ComPtr<IKXPluginRegistry> registry;
    ASSERT_EQ(GWQueryGenericObject(CLSID_KXPluginRegistry, IID_IKXPluginRegistry, registry.PutVoid()), S_OK);
    ASSERT_EQ(registry->AddItem(kind, L"Blur"), S_OK);
    struct Case {
        const wchar_t* name;
        GUID kind;
        HRESULT result;
    } cases[] = {
        {L"Blur", kind, S_OK}, {L"BLUR", kind, S_OK}, {L"Blur", other, S_FALSE}, {L"Sharpen", kind, S_FALSE}};
    for (const Case& c : cases) {
        CKXString name = c.name;
        ComPtr<IKXPluginItem> item;
        EXPECT_EQ(KXIsPluginItem(&name, c.kind, item.Put()), c.result) << c.name;
        EXPECT_EQ(item.Get() != nullptr, c.result == S_OK) << c.name;
        EXPECT_EQ(KXIsPluginItem(&name, c.kind, nullptr), c.result) << c.name;
    }
    EXPECT_EQ(KXIsPluginItem(nullptr, kind, nullptr), E_POINTER);
    std::vector<HRESULT> results;
    ut::test::WalkHostFaults(
        [&] {
            CKXString name = L"Blur";
            return KXIsPluginItem(&name, kind, nullptr);
        },
        [&](int, HRESULT hr) { results.push_back(hr); });
    // The registry's failure passes through; the item's makes it no item.
    EXPECT_EQ(results, (std::vector<HRESULT>{E_FAIL, S_FALSE, S_OK}));
}

// The recovery file is looked for once per process, so each case runs in a process of its own.
TEST_F(Paths, RecoveryFileIsLookedForOnceAndShownOnlyAfterStartUp) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    struct Case {
        const char* name;
        GWLoadType load;
        const wchar_t* file;
        LONG startedAtFirst;
        const char* first;
        const char* later;
    } cases[] = {
        {"found", GWLOAD_NONE, L"C:\\scenes\\crash.scn", 1, "C:\\scenes\\crash.scn", "C:\\scenes\\crash.scn"},
        {"found before start-up", GWLOAD_NONE, L"C:\\scenes\\crash.scn", 0, "", "C:\\scenes\\crash.scn"},
        {"no recovery load", GWLOAD_NORECOVERY, L"C:\\scenes\\crash.scn", 1, "", ""},
        {"no name", GWLOAD_NONE, L"", 1, "", ""},
    };
    for (const Case& c : cases) {
        EXPECT_EXIT(
            {
                if (*c.file)
                    Set(L"data_management.load_recovery_filename", c.file);
                ComPtr<IGWApplication> application;
                (void)GWQueryGenericObject(CLSID_GWApplication, IID_IGWApplication, application.PutVoid());
                (void)application->SetSavingState(GWSAVE_NONE, c.load);
                (void)application->SetStateFlag(GWAPP_STATE_STARTED, c.startedAtFirst);
                const char* first = KXFindRecoveryFile();
                // Later answers follow the flag; the preference is not read again.
                Set(L"data_management.load_recovery_filename", L"C:\\other.scn");
                (void)application->SetStateFlag(GWAPP_STATE_STARTED, 1);
                const char* later = KXFindRecoveryFile();
                (void)application->SetStateFlag(GWAPP_STATE_STARTED, 2);
                const char* notStarted = KXFindRecoveryFile();
                bool ok = std::string(first ? first : "") == c.first &&
                          std::string(later ? later : "") == c.later && !notStarted;
                std::exit(ok ? 0 : 1);
            },
            ::testing::ExitedWithCode(0), "")
            << c.name;
    }
}

// File validation over real files.
class Validate : public Paths {
protected:
    Validate() {
        ComPtr<IStorage> root;
        EXPECT_EQ(StgCreateDocfile(scene_.c_str(), ut::test::kCreateMode, 0, root.Put()), S_OK);
        std::filesystem::permissions(readOnly_,
                                     std::filesystem::perms::owner_write |
                                         std::filesystem::perms::group_write |
                                         std::filesystem::perms::others_write,
                                     std::filesystem::perm_options::remove);
    }
    ~Validate() override {
        std::filesystem::permissions(readOnly_, std::filesystem::perms::owner_write,
                                     std::filesystem::perm_options::add);
    }

    ut::test::TempFolder folder_;
    std::wstring scene_ = folder_ / L"scene.SCN";
    std::wstring text_ = folder_.Write(L"notes.txt", "plain text");
    std::wstring readOnly_ = folder_.Write(L"locked.abc", "kept");
    std::wstring missing_ = folder_ / L"missing.abc";
};

enum Flags : unsigned { kAccess = 1, kWrite = 2, kCompound = 4, kSkipTypeOne = 8 };

TEST_F(Validate, AppliesTheTestsAskedFor) {
    struct Case {
        std::wstring path;
        const wchar_t* extensions;
        unsigned flags;
        int valid;
        tagEGWFilePathType type;
    } cases[] = {
        // An empty resolution fails whatever is asked; with nothing asked any name passes.
        {L"", L"", 0, 0, GWFILEPATH_ABSOLUTE},
        {missing_, L"", 0, 1, GWFILEPATH_ABSOLUTE},
        {missing_, L"", kAccess, 0, GWFILEPATH_ABSOLUTE},
        {text_, L"", kAccess | kWrite, 1, GWFILEPATH_ABSOLUTE},
        {readOnly_, L"", kAccess, 1, GWFILEPATH_ABSOLUTE},
        {readOnly_, L"", kAccess | kWrite, 0, GWFILEPATH_ABSOLUTE},
        // Extensions: substrings of the list, letter case ignored.
        {scene_, L".scn;.txt", 0, 1, GWFILEPATH_ABSOLUTE},
        {text_, L".SCN", 0, 0, GWFILEPATH_ABSOLUTE},
        {folder_ / L"a.ab", L".abc", 0, 1, GWFILEPATH_ABSOLUTE},
        {folder_ / L"noext", L".abc", 0, 1, GWFILEPATH_ABSOLUTE},
        // Compound files.
        {scene_, L"", kCompound, 1, GWFILEPATH_ABSOLUTE},
        {text_, L"", kCompound, 0, GWFILEPATH_ABSOLUTE},
        {missing_, L"", kCompound, 0, GWFILEPATH_ABSOLUTE},
        // A linked path skips the access test only when asked to.
        {L"db://server/missing.abc", L"", kAccess | kSkipTypeOne, 1, GWFILEPATH_LINKED},
        {L"db://server/missing.abc", L"", kAccess, 0, GWFILEPATH_LINKED},
        {missing_, L"", kAccess | kSkipTypeOne, 0, GWFILEPATH_ABSOLUTE},
        // A relative name resolves into the active project.
        {L"scene.SCN", L".scn", kAccess | kCompound, 1, GWFILEPATH_PROJECT},
    };
    Set(L"paths.project", folder_.Path());
    for (const Case& c : cases) {
        for (bool askType : {false, true}) {
            auto type = static_cast<tagEGWFilePathType>(-1);
            EXPECT_EQ(KXValidateFile(c.path.c_str(), c.extensions, c.flags & kAccess, c.flags & kWrite,
                                     c.flags & kCompound, c.flags & kSkipTypeOne, askType ? &type : nullptr),
                      c.valid)
                << c.path << L" " << c.extensions << L" " << c.flags;
            if (askType && !c.path.empty()) {
                EXPECT_EQ(type, c.type) << c.path;
            }
        }
    }
}

TEST_F(Validate, AFailedResolutionIsReturnedAsItsCode) {
    std::vector<int> results;
    ut::test::WalkHostFaults(
        [&] { return KXValidateFile(scene_.c_str(), L".scn", true, false, true, true, nullptr); },
        [&](int, int result) { results.push_back(result); });
    // The object's creation (without it, no interface), the path given to it (never set: nothing to resolve),
    // the resolution, the type (taken as 0); then the clean run.
    EXPECT_EQ(results, (std::vector<int>{E_NOINTERFACE, E_UNEXPECTED, E_FAIL, 1, 1}));
}

} // namespace
