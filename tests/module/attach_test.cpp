// The load step on its own, compiled into this test: a failed attach must leave the library
// marked unloaded (so that every export answers E_UNEXPECTED) and must not half-register.
#include <gtest/gtest.h>

#include <ut/detail/names.h>
#include <ut/platform/module_entry.h>
#include <ut/platform/process.h>
#include <ut/sdk/resources.h>

#include "module/state.h"

namespace {

HINSTANCE ThisExecutable() {
    return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisExecutable));
}

class AttachTest : public ::testing::Test {
protected:
    // The library linked into this test registered "QVXUT" when it loaded; put it back after.
    void SetUp() override { library_ = KXDictFindInstance(ut::kDictionaryName); }
    void TearDown() override {
        ut::module::OnDetach();
        if (library_)
            KXDictRegisterInstance(library_, ut::kDictionaryName);
    }
    HINSTANCE library_ = nullptr;
};

TEST_F(AttachTest, AnUnknownModuleIsRefused) {
    EXPECT_TRUE(FAILED(ut::module::OnAttach(nullptr)));
    EXPECT_FALSE(ut::module::Loaded());
    EXPECT_TRUE(ut::module::Current().baseKey.IsEmpty());
}

TEST_F(AttachTest, AKnownModuleLoadsWithItsKey) {
    ASSERT_EQ(ut::module::OnAttach(ThisExecutable()), S_OK);
    EXPECT_TRUE(ut::module::Loaded());
    EXPECT_EQ(ut::module::Current().baseKey, L"Software\\ut\\Modules\\ut_module_tests\\");
    EXPECT_EQ(KXDictFindInstance(ut::kDictionaryName), ThisExecutable());
    ASSERT_NE(ut::module::Current().time, nullptr);
    EXPECT_FALSE(ut::module::Current().time->renderTime.IsDefined());
    ut::module::OnDetach();
    EXPECT_FALSE(ut::module::Loaded());
    EXPECT_EQ(ut::module::Current().time, nullptr);
}

} // namespace
