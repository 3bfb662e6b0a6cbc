// Global memory, dropped-file lists, registered formats and the data object, alike on both homes.
#include <cstring>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/dataobject.h>
#include <ut/platform/stream.h>

#include "support/ref_tracker.h"
#include "support/streams.h"

namespace {

using ut::ComPtr;

FORMATETC Format(CLIPFORMAT format, DWORD tymed = TYMED_HGLOBAL, DWORD aspect = DVASPECT_CONTENT,
                 LONG index = -1) {
    return FORMATETC{format, nullptr, aspect, index, tymed};
}

std::string BlockText(HGLOBAL block) {
    ut::GlobalLockGuard lock(block);
    return lock.Data() ? std::string(static_cast<const char*>(lock.Data()), GlobalSize(block))
                       : std::string();
}

TEST(GlobalMemory, BlocksLockCountResizeAndFree) {
    HGLOBAL block = GlobalAlloc(GHND, 16);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(GlobalSize(block), 16u);
    EXPECT_EQ(BlockText(block), std::string(16, '\0'));
    void* first = GlobalLock(block);
    void* second = GlobalLock(block);
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(first, second);
    std::memcpy(first, "0123456789abcdef", 16);
    EXPECT_TRUE(GlobalUnlock(block));
    EXPECT_FALSE(GlobalUnlock(block));
    HGLOBAL grown = GlobalReAlloc(block, 64, GMEM_MOVEABLE | GMEM_ZEROINIT);
    EXPECT_EQ(grown, block);
    EXPECT_EQ(GlobalSize(block), 64u);
    EXPECT_EQ(BlockText(block), "0123456789abcdef" + std::string(48, '\0'));
    EXPECT_EQ(GlobalFree(block), nullptr);

    HGLOBAL fixed = GlobalAlloc(GPTR, 8);
    ASSERT_NE(fixed, nullptr);
    EXPECT_EQ(GlobalLock(fixed), fixed);
    EXPECT_EQ(GlobalFree(fixed), nullptr);
}

TEST(ClipboardFormats, OneNumberPerNameWhateverItsCase) {
    UINT url = RegisterClipboardFormatW(L"UniformResourceLocator");
    UINT corvane = RegisterClipboardFormatW(L"Corvane IUnknown");
    EXPECT_GE(url, 0xC000u);
    EXPECT_GE(corvane, 0xC000u);
    EXPECT_NE(url, corvane);
    EXPECT_EQ(RegisterClipboardFormatW(L"uniformresourcelocator"), url);
    EXPECT_EQ(RegisterClipboardFormatW(L"CORVANE IUNKNOWN"), corvane);
}

TEST(DropFiles, NamesCountLengthsAndCutCopies) {
    std::vector<std::wstring> names = {L"C:\\scenes\\first.scn", L"/renders/second.avi", L"x"};
    ut::UniqueGlobal block(ut::platform::CreateDropFiles(names));
    ASSERT_TRUE(block);
    auto drop = static_cast<HDROP>(block.get());
    EXPECT_EQ(DragQueryFileW(drop, 0xFFFFFFFF, nullptr, 0), 3u);
    wchar_t buffer[64];
    // The index, the room given, the length answered and the text copied.
    const std::tuple<UINT, UINT, UINT, const wchar_t*> cases[] = {{0, 64, 19, L"C:\\scenes\\first.scn"},
                                                                  {1, 64, 19, L"/renders/second.avi"},
                                                                  {2, 64, 1, L"x"},
                                                                  {0, 6, 5, L"C:\\sc"},
                                                                  {1, 1, 0, L""}};
    for (const auto& [index, room, length, text] : cases) {
        EXPECT_EQ(DragQueryFileW(drop, index, buffer, room), length) << index;
        EXPECT_STREQ(buffer, text) << index;
    }
    EXPECT_EQ(DragQueryFileW(drop, 1, nullptr, 0), 19u);
    EXPECT_EQ(DragQueryFileW(drop, 3, buffer, 64), 0u);
}

class DataObjectTest : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(ut::platform::CreateDataObject(data_.Put()), S_OK); }
    ComPtr<IDataObject> data_;
};

TEST_F(DataObjectTest, AnswersWhichFormatsAndMediaItHolds) {
    ASSERT_EQ(ut::platform::SetGlobalData(data_.Get(), CF_UNICODETEXT, L"text", 5 * sizeof(wchar_t)), S_OK);
    std::pair<FORMATETC, HRESULT> cases[] = {
        {Format(CF_UNICODETEXT), S_OK},
        {Format(CF_UNICODETEXT, 0xFFFFFFFF), S_OK},
        {Format(CF_HDROP), DV_E_FORMATETC},
        {Format(CF_UNICODETEXT, TYMED_ISTREAM), DV_E_TYMED},
        {Format(CF_UNICODETEXT, TYMED_HGLOBAL, DVASPECT_ICON), DV_E_DVASPECT},
        {Format(CF_UNICODETEXT, TYMED_HGLOBAL, DVASPECT_CONTENT, 0), DV_E_LINDEX},
    };
    for (auto& [format, expected] : cases) {
        EXPECT_EQ(data_->QueryGetData(&format), expected) << format.cfFormat << " " << format.tymed;
        STGMEDIUM medium{};
        HRESULT hr = data_->GetData(&format, &medium);
        EXPECT_EQ(hr, expected);
        if (SUCCEEDED(hr))
            ReleaseStgMedium(&medium);
    }
    FORMATETC text = Format(CF_UNICODETEXT);
    EXPECT_EQ(data_->QueryGetData(nullptr), E_INVALIDARG);
    EXPECT_EQ(data_->GetData(&text, nullptr), E_INVALIDARG);
    DWORD connection = 0;
    EXPECT_EQ(data_->DAdvise(&text, 0, nullptr, &connection), OLE_E_ADVISENOTSUPPORTED);
}

TEST_F(DataObjectTest, GetDataHandsOutCopiesAndSetDataReplaces) {
    auto format = static_cast<CLIPFORMAT>(RegisterClipboardFormatW(L"UniformResourceLocator"));
    ASSERT_EQ(ut::platform::SetGlobalData(data_.Get(), format, "file:///a", 9), S_OK);
    FORMATETC url = Format(format);
    STGMEDIUM medium{};
    ASSERT_EQ(data_->GetData(&url, &medium), S_OK);
    EXPECT_EQ(medium.tymed, static_cast<DWORD>(TYMED_HGLOBAL));
    EXPECT_EQ(BlockText(medium.hGlobal), "file:///a");
    {
        ut::GlobalLockGuard lock(medium.hGlobal);
        static_cast<char*>(lock.Data())[0] = 'F';
    }
    ReleaseStgMedium(&medium);
    ASSERT_EQ(data_->GetData(&url, &medium), S_OK);
    EXPECT_EQ(BlockText(medium.hGlobal), "file:///a"); // the change went to a copy
    ReleaseStgMedium(&medium);
    ASSERT_EQ(ut::platform::SetGlobalData(data_.Get(), format, "http://b", 8), S_OK);
    ASSERT_EQ(data_->GetData(&url, &medium), S_OK);
    EXPECT_EQ(BlockText(medium.hGlobal), "http://b");
    ReleaseStgMedium(&medium);

    ComPtr<IEnumFORMATETC> list;
    ASSERT_EQ(data_->EnumFormatEtc(DATADIR_GET, list.Put()), S_OK);
    FORMATETC listed[4];
    ULONG fetched = 0;
    EXPECT_EQ(list->Next(4, listed, &fetched), S_FALSE);
    ASSERT_EQ(fetched, 1u);
    EXPECT_EQ(listed[0].cfFormat, format);
}

TEST_F(DataObjectTest, CarriesDroppedFilesAndSharedStreams) {
    ASSERT_EQ(ut::platform::SetDropFiles(data_.Get(), {L"one.avi", L"two.avi"}), S_OK);
    FORMATETC drop = Format(CF_HDROP, 0xFFFFFFFF);
    STGMEDIUM medium{};
    ASSERT_EQ(data_->GetData(&drop, &medium), S_OK);
    auto files = static_cast<HDROP>(medium.hGlobal);
    wchar_t name[16];
    EXPECT_EQ(DragQueryFileW(files, 0xFFFFFFFF, nullptr, 0), 2u);
    EXPECT_EQ(DragQueryFileW(files, 1, name, 16), 7u);
    EXPECT_STREQ(name, L"two.avi");
    ReleaseStgMedium(&medium);

    ComPtr<IStream> stream = ut::test::StreamOf();
    ut::test::RefTracker references;
    references.Track(stream.Get(), 1, "stream");
    FORMATETC streamed = Format(CF_TEXT, TYMED_ISTREAM);
    STGMEDIUM given{};
    given.tymed = TYMED_ISTREAM;
    given.pstm = stream.Get();
    ASSERT_EQ(data_->SetData(&streamed, &given, FALSE), S_OK);
    STGMEDIUM taken{};
    ASSERT_EQ(data_->GetData(&streamed, &taken), S_OK);
    EXPECT_EQ(taken.pstm, stream.Get());
    ReleaseStgMedium(&taken);
    data_.Reset();
}

// A medium with a releaser gives the releaser back its reference and leaves the rest alone.
TEST(StgMedium, AReleaserTakesTheMediumsPlace) {
    ComPtr<IStream> keeper = ut::test::StreamOf();
    ut::test::RefTracker references;
    references.Track(keeper.Get(), 1, "keeper");
    HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, 4);
    STGMEDIUM medium{};
    medium.tymed = TYMED_HGLOBAL;
    medium.hGlobal = block;
    medium.pUnkForRelease = keeper.Get();
    keeper->AddRef();
    ReleaseStgMedium(&medium);
    EXPECT_EQ(GlobalSize(block), 4u);
    EXPECT_EQ(GlobalFree(block), nullptr);
}

} // namespace
