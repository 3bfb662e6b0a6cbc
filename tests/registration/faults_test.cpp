// The registration family against failing host calls: each host call fails in turn, and the
// result is the one each function's rules give for that call; no host object is left behind.
#include "registration/registration_test.h"

#include <functional>
#include <memory>
#include <string_view>

#include <ut/registration.h>
#include <ut/sdk/detail/registry.h>
#include <ut/sdk/families.h>
#include <ut/sdk/preferences.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace ut::test {
namespace {

constexpr HRESULT kInjected = E_ABORT;
const GUID kClass = TestGuid(1), kCompanion = TestGuid(2), kView = TestGuid(3), kTree = TestGuid(4),
           kFamily = TestGuid(50);

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
    const Walk walks[] = {
        {"operator", [] {}, [&] { return KXRegisterOperator(kClass, m, kTwist); }, Propagated},
        {"operator ex, family list", [] {},
         [&] {
             return KXRegisterOperatorEx(kClass, m, kTwistId, true, kCompanion, kInspectorId, 1, &kFamily);
         },
         Propagated},
        {"operator ex, one family", [] {},
         [&] { return KXRegisterOperatorEx(kClass, m, kTwistId, kCompanion, kInspectorId, kFamily); },
         Propagated},
        // The earlier registration's removal does not count; the new COM entry does.
        {"manipulator", [] {}, [&] { return KXRegisterManipulator(kClass, m, kTwist, 1, &kView); },
         [](int, std::string_view failed) { return failed == "GWRegisterCOMObject" ? kInjected : S_OK; }},
        {"operator removal", [&] { ASSERT_EQ(KXRegisterOperator(kClass, m, kTwist), S_OK); },
         [&] { return KXUnRegisterOperator(kClass); }, Ignored},
        // Only the last step, the memberships, gives the result.
        {"operator ex removal, family list",
         [&] {
             ASSERT_EQ(KXRegisterOperatorEx(kClass, m, kTwistId, true, kCompanion, kInspectorId, 1, &kFamily),
                       S_OK);
         },
         [&] { return KXUnRegisterOperatorEx(kClass, kCompanion, 1, &kFamily, m); },
         [](int, std::string_view failed) {
             return failed == "GWQueryGenericObject" || failed == "IGWFamiliesManager::UnregisterMembers"
                        ? kInjected
                        : S_OK;
         }},
        {"inspectable removal, one family",
         [&] {
             ASSERT_EQ(KXRegisterInspectableObject(kClass, m, 0, kCompanion, kInspectorId, kFamily), S_OK);
         },
         [&] { return KXUnRegisterInspectableObject(kClass, kCompanion, kFamily, m); },
         [](int n, std::string_view) { return n >= 4 ? kInjected : S_OK; }},
        {"explorer source operators", explorerFamilies, [&] { return Freed(KXGetQVXExplorerSourceOps); },
         Propagated},
        {"explorer source operator views", explorerFamilies,
         [&] { return Freed([](DWORD* c, GUID** l) { return KXGetQVXExplorerSourceOpViews(kTree, c, l); }); },
         Propagated},
        {"explorer editor", [&] { ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK); },
         [&] { return KXRegisterQVXExplorerEditor(kView, GUID_NULL, m); },
         [](int n, std::string_view) { return n ? E_FAIL : S_OK; }},
        // The registry's default stands in for what the host cannot tell.
        {"explorer editor lookup", viewWithEditor,
         [&] {
             GUID editor = GUID_NULL;
             HRESULT hr = KXGetDefaultQVXExplorerEditor(&editor, nullptr);
             return hr == S_OK && (editor == kView || editor == kTree) ? S_OK : E_UNEXPECTED;
         },
         Ignored},
        {"host view name", [&] { ASSERT_EQ(KXRegisterView(kView, m, L"Curve view"), S_OK); },
         [&] {
             CKXString name;
             return KXGetGWViewName(kView, name);
         },
         Propagated},
        {"description file", [] {},
         [&] {
             wchar_t file[8];
             DWORD bytes = sizeof file;
             HRESULT hr = KXGetQDEFFilename(kClass, file, &bytes);
             return hr == E_FAIL ? S_OK : hr; // there is no file: only the key text can fail otherwise
         },
         Propagated},
    };
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
