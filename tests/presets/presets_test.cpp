// Presets over a real folder tree on the reference host: the search and its precedence, links,
// dot-folders and unreadable folders, the cache, objects made from files and by family commands,
// command presets, and every host call failed in turn.
#include <algorithm>
#include <filesystem>
#include <functional>
#include <iostream>
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/presets.h>
#include <ut/sdk/families.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/properties.h>
#include <ut/sdk/variant.h>

#include "scene/test_scene.h"
#include "support/fault_plan.h"
#include "support/registrations.h"
#include "support/scene_mocks.h"
#include "support/temp_folder.h"

namespace {

using ut::ComPtr;
using ut::test::Narrow;
namespace fs = std::filesystem;

constexpr GUID Id(unsigned char n) {
    return {0x9E5E0000u + n, 0, 0, {n, n, n, n, n, n, n, n}};
}
constexpr CLSID kLight = Id(1), kOther = Id(2), kSpotA = Id(3), kSpotB = Id(4), kCommand = Id(5);
constexpr GUID kFamily = Id(6), kWidth = Id(7);

ut::host::PresetDescription Spot(const CLSID& clsid, double width) {
    return {.objectClass = clsid, .values = {{kWidth, L"width", width}}};
}

ut::host::Settings PresetSettings() {
    ut::host::Settings settings;
    settings.pluginClasses = {kSpotA, kSpotB};
    settings.presetFolders = {{kLight, L"Lights"}};
    ut::host::PresetDescription factory = Spot(kSpotA, 7);
    factory.command = kCommand;
    factory.name = L"Factory.Preset";
    settings.commandPresets = {factory};
    return settings;
}

// Install locations of kinds 0, 1, 4 and 5 in a temporary folder, with presets in them.
class Presets : public ::testing::Test {
protected:
    void SetUp() override {
        ut::ClearPresetCache();
        const std::pair<const wchar_t*, const wchar_t*> locations[] = {{L"paths.project", L"project"},
                                                                       {L"paths.user", L"user"},
                                                                       {L"paths.addons", L"addons"},
                                                                       {L"paths.user_addons", L"uaddons"}};
        ComPtr<IGWPreferences> preferences;
        ASSERT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
        for (const auto& [name, folder] : locations)
            ASSERT_EQ(preferences->SetText(name, temp_.MakeFolder(folder).c_str()), S_OK);
        Put(L"user/Data/GWPresets/Lights/Spot.Preset", Spot(kSpotA, 1));
        Put(L"uaddons/Mine/Data/GWPresets/Lights/Spot.Preset", Spot(kSpotB, 2));
        Put(L"project/Data/GWPresets/Lights/Only0.Preset", Spot(kSpotA, 3));
        Put(L"addons/.hidden/Data/GWPresets/Lights/Dot.Preset", Spot(kSpotA, 4));
        Put(L"addons/a/b/Data/GWPresets/Lights/Deep.Preset", Spot(kSpotB, 5));
        Put(L"user/Data/GWPresets/Loose.Preset", Spot(kSpotA, 6));
        Put(L"extra/Lights/Spot.Preset", Spot(kSpotA, 8));
        Put(L"listed/Data/GWPresets/Odd.Preset",
            {.objectClass = CLSID_3DList, .values = {{kWidth, L"w", 1.0}}});
        Write(L"user/Data/GWPresets/Lights/Broken.Preset", "{\"class\": 12}");
        ASSERT_EQ(
            GWRegisterFamily(kFamily, kCommand, GUID_NULL, L"Lights", nullptr, nullptr, GUID_NULL, GUID_NULL),
            S_OK);
        ASSERT_EQ(GWRegisterObjectFamilies(kLight, 1, &kFamily, false, L"Light", nullptr), S_OK);
    }
    void TearDown() override { ut::ClearPresetCache(); }

    // Writes a file, or a preset file, making its folders.
    void Write(const std::wstring& name, const char* content = "") {
        fs::create_directories(fs::path(temp_ / name).parent_path());
        temp_.Write(name, content);
    }
    void Put(const std::wstring& name, const ut::host::PresetDescription& preset) {
        Write(name);
        EXPECT_EQ(ut::host::WritePresetFile(temp_ / name, preset), S_OK);
    }
    // A path of the tree as the library writes it, with backslashes.
    std::wstring Native(const std::wstring& name) const {
        std::wstring path = temp_ / name;
        std::replace(path.begin() + static_cast<long>(temp_.Path().size()) + 1, path.end(), L'/', L'\\');
        return path;
    }

    ut::test::RegistrationScope scope_;
    ut::test::TempFolder temp_;
    ut::host::ReferenceHost host_{PresetSettings()};
};

// The class and width of an object made from a preset, "-" when there is none.
std::string Describe(IUnknown* object) {
    ComPtr<IPersist> persist;
    ComPtr<IGWProperties> properties;
    CLSID clsid = GUID_NULL;
    CGWVariant width;
    if (!object || FAILED(object->QueryInterface(IID_IPersist, persist.PutVoid())) ||
        FAILED(persist->GetClassID(&clsid)))
        return "-";
    std::string text = IsEqualGUID(clsid, kSpotA) ? "A" : IsEqualGUID(clsid, kSpotB) ? "B" : "?";
    if (SUCCEEDED(object->QueryInterface(IID_IGWProperties, properties.PutVoid())) &&
        SUCCEEDED(properties->GetParameterValue(kWidth, &width)))
        text += std::to_string(static_cast<int>(width.dblVal));
    return text;
}

TEST_F(Presets, TheLastKindThatHoldsAPresetWinsAndDotFoldersAreSkipped) {
    struct Case {
        CLSID clsid;
        const wchar_t* name;
        HRESULT result;
        std::wstring path;
    } cases[] = {
        {kLight, L"Spot.Preset", S_OK, L"uaddons/Mine/Data/GWPresets/Lights/Spot.Preset"}, // kind 5 over 1
        {kLight, L"Only0.Preset", S_OK, L"project/Data/GWPresets/Lights/Only0.Preset"},
        {kLight, L"Deep.Preset", S_OK, L"addons/a/b/Data/GWPresets/Lights/Deep.Preset"}, // any depth, kind 4
        {kLight, L"Dot.Preset", E_FAIL, L""},
        {kLight, L"Spot", E_FAIL, L""}, // the name as it stands
        // A class without a favourite folder: "\" + name right below the presets folder.
        {kOther, L"Loose.Preset", S_OK, L"user\\Data\\GWPresets\\\\Loose.Preset"},
        {kOther, L"Spot.Preset", E_FAIL, L""},
    };
    for (const Case& c : cases) {
        CKXString path = L"stale";
        EXPECT_EQ(KXFindPresetPath(c.clsid, c.name, path), c.result) << Narrow(c.name);
        std::wstring expected = c.path.empty() ? L"" : Native(c.path);
        EXPECT_EQ(path.Str(), expected);
    }
    std::vector<ut::PresetCandidate> examined;
    CKXString path;
    ASSERT_EQ(ut::TracePresetSearch(kLight, L"Spot.Preset", path, examined), S_OK);
    std::string kinds;
    for (const ut::PresetCandidate& candidate : examined)
        kinds += std::to_string(candidate.kind) + (candidate.found.IsEmpty() ? "-" : "+");
    EXPECT_EQ(kinds, "0-1+4-5+");
    EXPECT_EQ(KXFindPresetPath(kLight, nullptr, path), E_POINTER);
}

TEST_F(Presets, TheFolderSearchEndsOnLoopsMissingAndUnreadableFolders) {
    Write(L"tree/x/target.txt");
    Write(L"tree/target.txt");
    Write(L"tree/.dot/only.txt");
    Write(L"tree/y/z/deep.txt");
    struct Case {
        const wchar_t* file;
        std::wstring folder, found;
    } cases[] = {
        {L"target.txt", temp_ / L"tree", Native(L"tree") + L"\\target.txt"}, // the top wins over x
        {L"z\\deep.txt", temp_ / L"tree", Native(L"tree") + L"\\y\\z\\deep.txt"},
        {L"only.txt", temp_ / L"tree", L""},
        {L"target.txt", temp_ / L"missing", L""},
    };
    for (const Case& c : cases)
        EXPECT_EQ(KXFindFileRecursive(c.file, c.folder).Str(), c.found) << Narrow(c.file);
    // A link back to the top, and a link elsewhere, which is followed.
    std::error_code linked;
    fs::create_directory_symlink(temp_ / L"tree", temp_ / L"tree/x/up", linked);
    if (linked)
        GTEST_SKIP() << "this system does not let the test make folder links: " << linked.message();
    EXPECT_EQ(KXFindFileRecursive(L"nowhere.txt", temp_ / L"tree").Str(), L"");
    Write(L"elsewhere/linked.txt");
    fs::create_directory_symlink(temp_ / L"elsewhere", temp_ / L"tree/y/link");
    EXPECT_EQ(KXFindFileRecursive(L"linked.txt", temp_ / L"tree").Str(),
              Native(L"tree") + L"\\y\\link\\linked.txt");
    // A folder the search may not read is passed over.
    Write(L"tree/locked/in/locked.txt");
    Write(L"tree/later/after.txt");
    fs::permissions(temp_ / L"tree/locked", fs::perms::none);
    std::error_code denied;
    fs::directory_iterator stillReadable(temp_ / L"tree/locked", denied);
    if (!denied) {
        fs::permissions(temp_ / L"tree/locked", fs::perms::owner_all);
        GTEST_SKIP() << "this user reads every folder (root, or no permissions): the unreadable folder "
                        "cannot be tested";
    }
    EXPECT_EQ(KXFindFileRecursive(L"locked.txt", temp_ / L"tree").Str(), L"");
    EXPECT_EQ(KXFindFileRecursive(L"after.txt", temp_ / L"tree").Str(),
              Native(L"tree") + L"\\later\\after.txt");
    fs::permissions(temp_ / L"tree/locked", fs::perms::owner_all);
}

TEST_F(Presets, CreatesObjectsFromFilesAndThroughTheFamilyCommand) {
    const std::wstring userSpot = Native(L"user/Data/GWPresets/Lights/Spot.Preset");
    std::vector<CKXString> extra = {CKXString(temp_ / L"extra")};
    struct Case {
        CLSID clsid;
        std::wstring name;
        std::vector<CKXString>* folders;
        HRESULT result;
        std::string object;
        std::wstring file; // "-": a preset without a file
    } cases[] = {
        {kLight, L"Spot", nullptr, S_OK, "B2", Native(L"uaddons/Mine/Data/GWPresets/Lights/Spot.Preset")},
        {kLight, L"Spot", &extra, S_OK, "A8", Native(L"extra") + L"\\Lights\\Spot.Preset"},
        {GUID_NULL, userSpot, nullptr, S_OK, "A1", userSpot},
        {GUID_NULL, L"Loose", nullptr, S_OK, "A6", Native(L"user\\Data\\GWPresets\\\\Loose.Preset")},
        {GUID_NULL, temp_ / L"nothing", nullptr, E_INVALIDARG, "-", L""},
        {kLight, L"Factory", nullptr, S_OK, "A7", L"-"}, // no file: the family's command makes it
        {kOther, L"Factory", nullptr, STG_E_FILENOTFOUND, "-", L""},
        {kLight, L"Broken", nullptr, STG_E_INVALIDHEADER, "-", L""},
        // A class that cannot take the values.
        {GUID_NULL, temp_ / L"listed/Data/GWPresets/Odd.Preset", nullptr, E_NOINTERFACE, "-", L""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(Narrow(c.name.c_str()) + (c.folders ? " in the extra folder" : ""));
        ut::ClearPresetCache();
        ComPtr<IUnknown> object;
        ComPtr<IGWPreset> preset;
        EXPECT_EQ(KXCreateObjectFromPreset(c.clsid, c.name.c_str(), GUID_NULL, object.PutVoid(), preset.Put(),
                                           c.folders),
                  c.result);
        EXPECT_EQ(Describe(object.Get()), c.object);
        wchar_t* file = nullptr;
        HRESULT named = KXGetFilePathFromPreset(preset.Get(), &file);
        EXPECT_EQ(!preset ? L"" : named == E_NOINTERFACE ? L"-" : std::wstring(file ? file : L"?"), c.file);
        delete[] file;
    }
    ComPtr<IGWPreset> preset;
    EXPECT_EQ(KXCreateObjectFromPreset(kLight, L"Spot", GUID_NULL, nullptr, preset.Put(), nullptr), S_OK);
    EXPECT_EQ(KXCreateObjectFromPreset(kLight, L"Spot", GUID_NULL, nullptr, nullptr, nullptr), E_INVALIDARG);
    EXPECT_EQ(KXCreateObjectFromPreset(kLight, nullptr, GUID_NULL, nullptr, preset.Put(), nullptr),
              E_POINTER);
    EXPECT_FALSE(preset);
    void* list = reinterpret_cast<void*>(1);
    EXPECT_EQ(KXCreateObjectFromPreset(kLight, L"Spot", IID_I3DList, &list, nullptr, nullptr), E_NOINTERFACE);
    EXPECT_EQ(list, nullptr);
    ut::test::MockPreset bare;
    wchar_t* file = reinterpret_cast<wchar_t*>(1);
    EXPECT_EQ(KXGetFilePathFromPreset(&bare, &file), E_NOINTERFACE);
    EXPECT_EQ(file, nullptr);
    EXPECT_EQ(KXGetFilePathFromPreset(nullptr, &file), E_POINTER);
}

TEST_F(Presets, TheCacheAnswersANameWithOrWithoutItsExtension) {
    GUID clsid = GUID_NULL;
    ASSERT_EQ(KXGetObjectCLSIDFromPreset(kLight, L"Spot", &clsid), S_OK);
    EXPECT_TRUE(IsEqualGUID(clsid, kSpotB));
    // The files go; the cache still knows them, under the name with its extension.
    fs::remove_all(temp_ / L"uaddons");
    fs::remove_all(temp_ / L"user");
    const wchar_t* names[] = {L"Spot", L"Spot.Preset"};
    for (const wchar_t* name : names) {
        clsid = GUID_NULL;
        EXPECT_EQ(KXGetObjectCLSIDFromPreset(kLight, name, &clsid), S_OK) << Narrow(name);
        EXPECT_TRUE(IsEqualGUID(clsid, kSpotB));
    }
    CKXString path;
    EXPECT_EQ(KXFindPresetPath(kLight, L"Spot.Preset", path), S_OK);
    EXPECT_EQ(path.Str(), Native(L"uaddons/Mine/Data/GWPresets/Lights/Spot.Preset"));
    ut::ClearPresetCache();
    EXPECT_EQ(KXGetObjectCLSIDFromPreset(kLight, L"Spot", &clsid),
              DISP_E_MEMBERNOTFOUND); // nor does the command make it
    EXPECT_TRUE(IsEqualGUID(clsid, GUID_NULL));
    EXPECT_EQ(KXGetObjectCLSIDFromPreset(kLight, L"Spot", nullptr), E_POINTER);
    EXPECT_EQ(KXGetObjectCLSIDFromPreset(kLight, nullptr, &clsid), E_POINTER);
}

TEST_F(Presets, CommandPresetsGoToTheHostPresetManager) {
    struct Case {
        CLSID target;
        const wchar_t* name;
        HRESULT result;
    } cases[] = {
        {GUID_NULL, L"Factory", S_OK},
        {kSpotA, L"factory.preset", S_OK},
        {kSpotB, L"Factory", E_INVALIDARG}, // it makes another class
        {kSpotA, L"Unknown", DISP_E_MEMBERNOTFOUND},
    };
    for (const Case& c : cases) {
        std::wstring name = c.name;
        ComPtr<IGWPreset> preset;
        GUID clsid = kOther;
        EXPECT_EQ(KXLoadCmdPreset(kCommand, c.target, name.data(), preset.Put()), c.result) << Narrow(c.name);
        EXPECT_EQ(static_cast<bool>(preset), c.result == S_OK);
        EXPECT_EQ(KXGetObjectCLSIDFromPreset(kCommand, c.target, c.name, &clsid), c.result);
        EXPECT_TRUE(IsEqualGUID(clsid, c.result == S_OK ? kSpotA : GUID_NULL));
    }
    ComPtr<IGWPreset> preset;
    std::wstring name = L"Factory";
    ASSERT_EQ(KXLoadCmdPreset(kCommand, GUID_NULL, name.data(), preset.Put()), S_OK);
    EXPECT_EQ(KXValidateCmdPreset(kCommand, kSpotA, preset.Get()), S_OK);
    EXPECT_EQ(KXValidateCmdPreset(kCommand, kSpotB, preset.Get()), E_INVALIDARG);
    EXPECT_EQ(KXValidateCmdPreset(kCommand, kSpotA, nullptr), E_POINTER);
    EXPECT_EQ(KXLoadCmdPreset(kCommand, GUID_NULL, nullptr, preset.Put()), E_POINTER);
    EXPECT_EQ(KXLoadCmdPreset(kCommand, GUID_NULL, name.data(), nullptr), E_POINTER);
    EXPECT_EQ(KXGetObjectCLSIDFromPreset(kCommand, GUID_NULL, L"Factory", nullptr), E_POINTER);
}

// Every export with its 1st, 2nd, ... host call failing: a failure or a documented answer, the
// out-parameters null on a failure, and nothing left alive.
TEST_F(Presets, EveryExportSurvivesEveryHostFault) {
    ComPtr<IGWPreset> filePreset;
    ASSERT_EQ(KXCreateObjectFromPreset(kLight, L"Spot", GUID_NULL, nullptr, filePreset.Put(), nullptr), S_OK);
    std::wstring factory = L"Factory";
    struct Walk {
        const char* name;
        std::function<std::pair<HRESULT, IUnknown*>()> run;
    };
    auto none = [](HRESULT hr) { return std::pair(hr, static_cast<IUnknown*>(nullptr)); };
    // A run that fails but still hands something out answers E_UNEXPECTED.
    auto clsidOf = [&](auto find) {
        GUID clsid = kOther;
        HRESULT hr = find(&clsid);
        return none(FAILED(hr) && !IsEqualGUID(clsid, GUID_NULL) ? E_UNEXPECTED : hr);
    };
    // clang-format off
    const Walk walks[] = {
        {"find path", [&] {
             CKXString path;
             HRESULT hr = KXFindPresetPath(kLight, L"Spot.Preset", path);
             return none(FAILED(hr) && !path.IsEmpty() ? E_UNEXPECTED : hr); }},
        {"class from file", [&] { return clsidOf([](GUID* c) { return KXGetObjectCLSIDFromPreset(kLight, L"Spot", c); }); }},
        {"class from command",
         [&] { return clsidOf([](GUID* c) { return KXGetObjectCLSIDFromPreset(kCommand, kSpotA, L"Factory", c); }); }},
        {"validate", [&] { return none(KXValidateCmdPreset(kCommand, kSpotB, filePreset.Get())); }},
        {"load command preset", [&] {
             IGWPreset* preset = nullptr;
             HRESULT hr = KXLoadCmdPreset(kCommand, kSpotA, factory.data(), &preset);
             return std::pair(hr, static_cast<IUnknown*>(preset)); }},
        {"create from file", [&] {
             IUnknown* object = nullptr;
             IGWPreset* preset = nullptr;
             HRESULT hr = KXCreateObjectFromPreset(kLight, L"Spot", IID_IUnknown, reinterpret_cast<void**>(&object),
                                                   &preset, nullptr);
             if (preset && object)
                 preset->Release();
             else if (preset)
                 object = preset;
             return std::pair(hr, object); }},
        {"create by command", [&] {
             IUnknown* object = nullptr;
             HRESULT hr = KXCreateObjectFromPreset(kLight, L"Factory", GUID_NULL, reinterpret_cast<void**>(&object),
                                                   nullptr, nullptr);
             return std::pair(hr, object); }},
        {"file of a preset", [&] {
             wchar_t* file = nullptr;
             HRESULT hr = KXGetFilePathFromPreset(filePreset.Get(), &file);
             bool handedOut = file != nullptr;
             delete[] file;
             return none(FAILED(hr) && handedOut ? E_UNEXPECTED : hr); }},
    };
    // clang-format on
    int walked = 0;
    for (const Walk& walk : walks) {
        ut::test::WalkHostFaults(
            [&] {
                ut::ClearPresetCache();
                return ut::test::Released(walk.run());
            },
            [&](int row, const std::pair<HRESULT, bool>& outcome) {
                SCOPED_TRACE(std::string(walk.name) + " at call " + std::to_string(row));
                walked += row ? 1 : 0;
                // A failed host call that the search passes over (a location or favourite folder
                // that cannot be had) may end in "not found"; the clean run must succeed.
                EXPECT_TRUE(row ? FAILED(outcome.first) || outcome.first == S_OK : outcome.first == S_OK);
                EXPECT_NE(outcome.first, E_UNEXPECTED);
                EXPECT_TRUE(SUCCEEDED(outcome.first) || !outcome.second);
            },
            E_ACCESSDENIED);
    }
    std::cout << "[ walked   ] " << walked << " failure paths in " << std::size(walks) << " scenarios\n";
}

} // namespace
