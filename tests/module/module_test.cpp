// The load step ran when the test linked the library: it registered the "QVXUT" dictionary
// under the library's own module and built its registry base key from it.
#include <gtest/gtest.h>

#include <ut/detail/names.h>
#include <ut/persist.h>
#include <ut/platform/process.h>
#include <ut/platform/text.h>
#include <ut/sdk/resources.h>

namespace {

TEST(ModuleLoad, RegistersTheDictionaryUnderTheLibrary) {
    // Reading the exported table keeps the library linked on every home.
    ASSERT_EQ(g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureNumber], 0u);
    HINSTANCE library = KXDictFindInstance(ut::kDictionaryName);
    ASSERT_NE(library, nullptr);
    std::wstring file = ut::platform::ModuleFileName(library);
    std::wstring name = file.substr(file.find_last_of(L"/\\") + 1);
    EXPECT_TRUE(name == L"libut.so" || name == L"ut.dll") << ut::platform::Utf8FromWide(file);
}

TEST(ModuleLoad, BaseKeyNamesTheLibrary) {
    wchar_t key[ut::kPathCapacity];
    ASSERT_EQ(GWResourceConstructRegKey(KXDictFindInstance(ut::kDictionaryName), L"", key, ut::kPathCapacity),
              ERROR_SUCCESS);
    EXPECT_STREQ(key, L"Software\\ut\\Modules\\ut\\");
}

} // namespace
