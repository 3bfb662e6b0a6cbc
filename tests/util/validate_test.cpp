#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/preferences.h>
#include <ut/validate.h>

#include "support/compound.h"
#include "support/fault_plan.h"
#include "support/registrations.h"
#include "support/temp_folder.h"

namespace {

using ut::ComPtr;

class Validate : public ::testing::Test {
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

    ut::test::RegistrationScope scope_;
    ut::host::ReferenceHost host_;
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
    ComPtr<IGWPreferences> preferences;
    ASSERT_EQ(KXGetPreferencesMgr(preferences.Put()), S_OK);
    ASSERT_EQ(preferences->SetText(L"paths.project", folder_.Path().c_str()), S_OK);
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
