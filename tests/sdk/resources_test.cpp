// Module registry keys and string dictionaries.
#include <gtest/gtest.h>

#include <ut/detail/names.h>
#include <ut/platform/process.h>
#include <ut/sdk/resources.h>

namespace {

HINSTANCE ThisExecutable() {
    return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisExecutable));
}

TEST(RegistryKey, NamesTheModuleAndEndsInABackslash) {
    wchar_t key[ut::kPathCapacity];
    ASSERT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", key, ut::kPathCapacity), ERROR_SUCCESS);
    EXPECT_STREQ(key, L"Software\\ut\\Modules\\ut_sdk_tests\\");
    ASSERT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"Views", key, ut::kPathCapacity), ERROR_SUCCESS);
    EXPECT_STREQ(key, L"Software\\ut\\Modules\\ut_sdk_tests\\Views\\");
}

TEST(RegistryKey, RefusesWhatItCannotBuild) {
    wchar_t key[16] = L"untouched";
    EXPECT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", key, 16), ERROR_INSUFFICIENT_BUFFER);
    EXPECT_STREQ(key, L"");
    EXPECT_EQ(GWResourceConstructRegKey(nullptr, L"", key, 16), ERROR_INVALID_PARAMETER);
    EXPECT_EQ(GWResourceConstructRegKey(ThisExecutable(), L"", nullptr, 16), ERROR_INVALID_PARAMETER);
}

TEST(Dictionaries, AreFoundByNameUntilUnregistered) {
    HINSTANCE self = ThisExecutable();
    ASSERT_EQ(KXDictRegisterInstance(self, L"TESTDICT"), S_OK);
    EXPECT_EQ(KXDictFindInstance(L"TESTDICT"), self);
    EXPECT_EQ(KXDictUnregisterInstance(L"TESTDICT"), S_OK);
    EXPECT_EQ(KXDictFindInstance(L"TESTDICT"), nullptr);
    EXPECT_EQ(KXDictUnregisterInstance(L"TESTDICT"), S_FALSE);
    EXPECT_EQ(KXDictRegisterInstance(nullptr, L"TESTDICT"), E_INVALIDARG);
    EXPECT_EQ(KXDictRegisterInstance(self, L""), E_INVALIDARG);
}

} // namespace
