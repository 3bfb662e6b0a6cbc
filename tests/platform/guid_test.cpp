// GUIDs and their text form.
#include <cstring>

#include <gtest/gtest.h>

#include <ut/platform/com.h>
#include <ut/platform/text.h>

namespace {

constexpr GUID kSample = {0x1C36C8C0, 0xA6A4, 0x11D3, {0xB4, 0xB3, 0x00, 0xA0, 0x24, 0x4E, 0xEB, 0x76}};

// Written braced and upper case, with room for the terminator; read back in either case.
TEST(Guid, TextIsBracedUpperCaseAndRoundTrips) {
    wchar_t text[39];
    EXPECT_EQ(StringFromGUID2(kSample, text, 38), 0);
    ASSERT_EQ(StringFromGUID2(kSample, text, 39), 39);
    EXPECT_STREQ(text, L"{1C36C8C0-A6A4-11D3-B4B3-00A0244EEB76}");
    for (const wchar_t* form :
         {static_cast<const wchar_t*>(text), L"{1c36c8c0-a6a4-11d3-b4b3-00a0244eeb76}"}) {
        GUID back{};
        ASSERT_EQ(CLSIDFromString(form, &back), S_OK);
        EXPECT_TRUE(IsEqualGUID(back, kSample));
    }
    EXPECT_EQ(ut::GuidToString(kSample), text);
    EXPECT_EQ(ut::GuidToString(GUID_NULL), L"{00000000-0000-0000-0000-000000000000}");
}

TEST(Guid, MalformedTextFailsAndLeavesNothingHalfWritten) {
    const wchar_t* malformed[] = {
        L"{1C36C8C0-A6A4-11D3-B4B3-00A0244EEB7}",  // one digit short
        L"{1C36C8C0-A6A4-11D3-B4B3-00A0244EEB7G}", // not hex
        L"{1C36C8C0+A6A4-11D3-B4B3-00A0244EEB76}", // wrong separator
        L"{1C36C8C0-A6A4-11D3-B4B3-00A0244EEB76",  // no closing brace
        L"{1C36C8C0-A6A4-11D3-B4B300A0244EEB76}",  // missing dash
    };
    for (const wchar_t* text : malformed) {
        GUID out = kSample;
        HRESULT hr = ut::ParseGuid(text, &out);
        EXPECT_TRUE(FAILED(hr)) << "accepted: " << ut::platform::Utf8FromWide(text);
        EXPECT_TRUE(IsEqualGUID(out, kSample)) << "changed by: " << ut::platform::Utf8FromWide(text);
    }
}

TEST(Guid, OneBitApartIsAnotherGuid) {
    GUID other = kSample;
    other.Data4[7] ^= 1;
    EXPECT_FALSE(IsEqualGUID(kSample, other));
    EXPECT_NE(ut::GuidLess{}(kSample, other), ut::GuidLess{}(other, kSample));
    EXPECT_NE(ut::GuidHash{}(kSample), ut::GuidHash{}(other));
}

TEST(TaskMemory, AllocatesGrowsAndFrees) {
    auto* block = static_cast<char*>(CoTaskMemAlloc(16));
    ASSERT_NE(block, nullptr);
    std::memcpy(block, "0123456789abcde", 16);
    block = static_cast<char*>(CoTaskMemRealloc(block, 4096));
    ASSERT_NE(block, nullptr);
    EXPECT_STREQ(block, "0123456789abcde");
    CoTaskMemFree(block);
    CoTaskMemFree(nullptr);
}

} // namespace
