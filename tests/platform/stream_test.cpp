// The memory and file streams must behave alike, and alike on both homes.
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/stream.h>

#include "support/streams.h"
#include "support/temp_folder.h"

namespace {

using ut::ComPtr;
using ut::platform::OpenFileStream;
using ut::test::PositionOf;

LARGE_INTEGER Offset(LONGLONG value) {
    return {.QuadPart = value};
}

// Reads from the start in small pieces, leaving the position at the end.
std::string ReadAll(IStream* stream) {
    EXPECT_EQ(stream->Seek(Offset(0), STREAM_SEEK_SET, nullptr), S_OK);
    std::string out;
    char buffer[7];
    ULONG got = 0;
    while (SUCCEEDED(stream->Read(buffer, sizeof buffer, &got)) && got > 0)
        out.append(buffer, got);
    return out;
}

enum class Kind { Memory, File };

class StreamTest : public ::testing::TestWithParam<Kind> {
protected:
    void SetUp() override {
        ASSERT_EQ(GetParam() == Kind::Memory ? ut::platform::CreateMemoryStream(stream_.Put())
                                             : OpenFileStream((folder_ / L"stream.bin").c_str(),
                                                              STGM_READWRITE | STGM_CREATE, stream_.Put()),
                  S_OK);
    }

    ut::test::TempFolder folder_; // goes after the stream
    ComPtr<IStream> stream_;
};

TEST_P(StreamTest, WritesReadsAndSeeks) {
    ULONG written = 0;
    ASSERT_EQ(stream_->Write("hello world", 11, &written), S_OK);
    EXPECT_EQ(written, 11u);
    EXPECT_EQ(PositionOf(stream_.Get()), 11u);
    EXPECT_EQ(ReadAll(stream_.Get()), "hello world");

    ULARGE_INTEGER at{};
    ASSERT_EQ(stream_->Seek(Offset(-5), STREAM_SEEK_END, &at), S_OK);
    EXPECT_EQ(at.QuadPart, 6u);
    char word[5];
    ULONG got = 0;
    ASSERT_EQ(stream_->Read(word, 5, &got), S_OK);
    EXPECT_EQ(std::string(word, got), "world");
    ASSERT_EQ(stream_->Seek(Offset(-11), STREAM_SEEK_CUR, nullptr), S_OK);
    EXPECT_EQ(PositionOf(stream_.Get()), 0u);

    // The system's file stream answers S_FALSE at the end; both homes answer S_OK, also far past it.
    char buffer[8];
    for (auto [at, expected] : {std::pair{11LL, 0u}, {9LL, 2u}, {0x7FFF0000LL, 0u}}) {
        ULONG got = 99;
        ASSERT_EQ(stream_->Seek(Offset(at), STREAM_SEEK_SET, nullptr), S_OK);
        EXPECT_EQ(stream_->Read(buffer, sizeof buffer, &got), S_OK);
        EXPECT_EQ(got, expected) << "from " << at;
    }
}

TEST_P(StreamTest, RefusedSeeksAndNullPointersChangeNothing) {
    ASSERT_EQ(stream_->Write("abc", 3, nullptr), S_OK);
    EXPECT_EQ(stream_->Seek(Offset(-4), STREAM_SEEK_CUR, nullptr), STG_E_INVALIDFUNCTION);
    EXPECT_EQ(stream_->Seek(Offset(-1), STREAM_SEEK_SET, nullptr), STG_E_INVALIDFUNCTION);
    EXPECT_EQ(stream_->Seek(Offset(0), 7, nullptr), STG_E_INVALIDFUNCTION);
    EXPECT_EQ(PositionOf(stream_.Get()), 3u);
    ULONG count = 0;
    EXPECT_EQ(stream_->Read(nullptr, 1, &count), STG_E_INVALIDPOINTER);
    EXPECT_EQ(stream_->Write(nullptr, 1, &count), STG_E_INVALIDPOINTER);
    EXPECT_EQ(stream_->Stat(nullptr, STATFLAG_NONAME), STG_E_INVALIDPOINTER);
    EXPECT_EQ(stream_->Clone(nullptr), STG_E_INVALIDPOINTER);
}

// The system's memory stream grows its block without clearing it.
TEST_P(StreamTest, GrowingPastTheEndFillsTheGapWithZeros) {
    ASSERT_EQ(stream_->Seek(Offset(4), STREAM_SEEK_SET, nullptr), S_OK);
    ASSERT_EQ(stream_->Write("x", 1, nullptr), S_OK);
    EXPECT_EQ(ReadAll(stream_.Get()), std::string("\0\0\0\0x", 5));

    ASSERT_EQ(stream_->Write("y", 1, nullptr), S_OK);
    ASSERT_EQ(stream_->SetSize({.QuadPart = 5000}), S_OK);
    EXPECT_EQ(PositionOf(stream_.Get()), 6u);
    EXPECT_EQ(ReadAll(stream_.Get()), std::string("\0\0\0\0xy", 6) + std::string(4994, '\0'));
}

TEST_P(StreamTest, CopyToMovesTheRequestedBytesSetSizeTruncatesAndStatReportsTheSize) {
    ASSERT_EQ(stream_->Write("0123456789", 10, nullptr), S_OK);
    ASSERT_EQ(stream_->Seek(Offset(2), STREAM_SEEK_SET, nullptr), S_OK);
    ComPtr<IStream> target = ut::test::StreamOf();
    ULARGE_INTEGER read{}, written{};
    ASSERT_EQ(stream_->CopyTo(target.Get(), {.QuadPart = 5}, &read, &written), S_OK);
    EXPECT_EQ(read.QuadPart, 5u);
    EXPECT_EQ(written.QuadPart, 5u);
    EXPECT_EQ(ReadAll(target.Get()), "23456");

    ASSERT_EQ(stream_->SetSize({.QuadPart = 4}), S_OK);
    STATSTG stat{};
    ASSERT_EQ(stream_->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.type, static_cast<DWORD>(STGTY_STREAM));
    EXPECT_EQ(stat.cbSize.QuadPart, 4u);
    EXPECT_EQ(stat.pwcsName, nullptr);
    EXPECT_EQ(ReadAll(stream_.Get()), "0123");
}

INSTANTIATE_TEST_SUITE_P(BothStreams, StreamTest, ::testing::Values(Kind::Memory, Kind::File),
                         [](const auto& info) { return info.param == Kind::Memory ? "Memory" : "File"; });

TEST(MemoryStream, ClonesShareBytesButNotPosition) {
    ComPtr<IStream> stream = ut::test::StreamOf({'a', 'b', 'c', 'd', 'e', 'f'});
    ASSERT_EQ(stream->Seek(Offset(0), STREAM_SEEK_END, nullptr), S_OK);
    ComPtr<IStream> clone;
    ASSERT_EQ(stream->Clone(clone.Put()), S_OK);
    EXPECT_EQ(PositionOf(clone.Get()), 6u);
    ASSERT_EQ(clone->Seek(Offset(0), STREAM_SEEK_SET, nullptr), S_OK);
    ASSERT_EQ(clone->Write("X", 1, nullptr), S_OK);
    EXPECT_EQ(PositionOf(stream.Get()), 6u);
    EXPECT_EQ(ReadAll(stream.Get()), "Xbcdef");
}

// The system wraps a memory stream's position at 4 GiB instead of refusing it.
TEST(MemoryStream, RefusesPositionsPastFourGibibytes) {
    ComPtr<IStream> stream = ut::test::StreamOf();
    ASSERT_EQ(stream->Seek(Offset(0xFFFFFFFFll), STREAM_SEEK_SET, nullptr), S_OK);
    EXPECT_EQ(stream->Seek(Offset(0x100000000ll), STREAM_SEEK_SET, nullptr), STG_E_INVALIDFUNCTION);
    EXPECT_EQ(PositionOf(stream.Get()), 0xFFFFFFFFull);
    EXPECT_EQ(stream->Write("x", 1, nullptr), STG_E_MEDIUMFULL);
}

TEST(FileStream, KeepsItsBytesAcrossOpensReportsItsNameFollowsTheModeAndRefusesBadArguments) {
    ut::test::TempFolder folder;
    std::wstring path = folder.Path(L"ut_stream_reopen.bin");
    auto open = [&](DWORD mode) {
        ComPtr<IStream> stream;
        EXPECT_EQ(OpenFileStream(path.c_str(), mode, stream.Put()), S_OK);
        return stream;
    };
    ULONG count = 0;
    ULARGE_INTEGER size{};
    ComPtr<IStream> stream = open(STGM_READ | STGM_CREATE);
    EXPECT_EQ(stream->Write("x", 1, &count), STG_E_ACCESSDENIED);
    EXPECT_EQ(stream->SetSize(size), STG_E_ACCESSDENIED);
    stream = open(STGM_WRITE);
    ASSERT_EQ(stream->Write("persisted", 9, nullptr), S_OK);
    char byte = 0;
    EXPECT_EQ(stream->Read(&byte, 1, &count), STG_E_ACCESSDENIED);
    STATSTG stat{};
    ASSERT_EQ(stream->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.grfMode, static_cast<DWORD>(STGM_WRITE));
    stream = open(STGM_READ);
    EXPECT_EQ(ReadAll(stream.Get()), "persisted");
    ASSERT_EQ(stream->Stat(&stat, STATFLAG_DEFAULT), S_OK);
    ASSERT_NE(stat.pwcsName, nullptr);
    EXPECT_NE(std::wstring(stat.pwcsName).find(L"ut_stream_reopen.bin"), std::wstring::npos);
    CoTaskMemFree(stat.pwcsName);

    // Bad arguments, folders and missing files are refused.
    std::wstring root = folder.Path(), missing = folder / L"missing.bin",
                 inMissingFolder = folder / L"missing/file.bin";
    EXPECT_EQ(OpenFileStream(root.c_str(), STGM_READ, stream.Put()), STG_E_ACCESSDENIED);
    EXPECT_EQ(OpenFileStream(L"", STGM_READ, stream.Put()), STG_E_INVALIDNAME);
    EXPECT_EQ(OpenFileStream(root.c_str(), 3, stream.Put()), STG_E_INVALIDFLAG);
    EXPECT_EQ(OpenFileStream(root.c_str(), STGM_READ, nullptr), E_POINTER);
    EXPECT_EQ(OpenFileStream(missing.c_str(), STGM_READ, stream.Put()), STG_E_FILENOTFOUND);
    EXPECT_EQ(OpenFileStream(inMissingFolder.c_str(), STGM_READWRITE | STGM_CREATE, stream.Put()),
              STG_E_FILENOTFOUND);
    EXPECT_FALSE(stream);
}

} // namespace
