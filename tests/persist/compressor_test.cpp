// The compact encoding, byte for byte, and what its reader does with bytes it did not write.
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>

#include "persist/save_load.h"

namespace {

using ut::test::Bytes;
using ut::test::Form;
using ut::test::kMarker;
using ut::test::Load;
using ut::test::Save;

class Compact : public ::testing::Test {
protected:
    void SetUp() override {
        if (ut::test::CompressionDisabled())
            GTEST_SKIP() << "compression is switched off in this run";
    }
};

template <class T>
struct Case {
    T value;
    Bytes bytes;
};

template <class T>
void ExpectEncodings(const std::vector<Case<T>>& cases, HRESULT (C3DStreamHelper::*put)(T),
                     HRESULT (C3DStreamHelper::*get)(T&)) {
    for (const Case<T>& c : cases) {
        SCOPED_TRACE(::testing::Message() << "value " << c.value);
        ut::test::Saved saved =
            Save(Form::Compact, [&](C3DStreamHelper& h) { EXPECT_EQ((h.*put)(c.value), S_OK); });
        EXPECT_EQ(saved.data, ut::test::Concat(kMarker, c.bytes));
        Load(saved, [&](C3DStreamHelper& h) {
            T back{};
            EXPECT_EQ((h.*get)(back), S_OK);
            EXPECT_EQ(back, c.value);
        });
    }
}

TEST_F(Compact, PacksUnsignedIntegers) {
    ExpectEncodings<ULONG>({{5, {0xF5}},
                            {15, {0xFF}},
                            {16, {0xE0, 0x01}},
                            {291, {0xE3, 0x12}},
                            {4096, {0xD0, 0x00, 0x01}},
                            {0x12345, {0xD5, 0x34, 0x12}},
                            {0x1234567, {0xC7, 0x56, 0x34, 0x12}},
                            {0x10000000, {0xB0, 0x00, 0x00, 0x00, 0x10}},
                            {0xFFFFFFFF, {0xB0, 0xFF, 0xFF, 0xFF, 0xFF}}},
                           &C3DStreamHelper::PutUInt32, &C3DStreamHelper::GetUInt32);
    // Patch-back slots keep a fixed size whatever the value.
    ExpectEncodings<ULONG>({{3, {0xB0, 0x03, 0x00, 0x00, 0x00}}}, &C3DStreamHelper::StoreUInt32,
                           &C3DStreamHelper::GetUInt32);
}

TEST_F(Compact, PacksSignedIntegersWithSymmetricBounds) {
    ExpectEncodings<LONG>({{0, {0xF0}},
                           {7, {0xF7}},
                           {-1, {0xAF}},
                           {-7, {0xA9}},
                           {-8, {0x98, 0xFF}},
                           {100, {0xE4, 0x06}},
                           {-100, {0x9C, 0xF9}},
                           {2047, {0xEF, 0x7F}},
                           {-2048, {0x80, 0x80, 0xFF}},
                           {-524288, {0x70, 0x00, 0x80, 0xFF}},
                           {8388607, {0xCF, 0xFF, 0xFF, 0x07}},
                           {-8388608, {0x60, 0x00, 0x00, 0x80, 0xFF}},
                           {0x7FFFFFFF, {0xB0, 0xFF, 0xFF, 0xFF, 0x7F}},
                           {std::numeric_limits<LONG>::min(), {0x60, 0x00, 0x00, 0x00, 0x80}}},
                          &C3DStreamHelper::PutInt32, &C3DStreamHelper::GetInt32);
}

TEST_F(Compact, PacksDoublesByTheirShortestExactForm) {
    auto whole = [](double x) {
        Bytes bytes(9, 0xFC);
        std::memcpy(bytes.data() + 1, &x, 8);
        return bytes;
    };
    ExpectEncodings<double>({{0.0, {0xFF}},
                             {1.0, {0xFE}},
                             {-1.0, {0xFD}},
                             {100.0, {0xF8, 0x64}},
                             {-127.0, {0xF8, 0x81}},
                             {128.0, {0xF9, 0x80, 0x00}},
                             {-32767.0, {0xF9, 0x01, 0x80}},
                             {40000.0, whole(40000.0)},
                             {0.5, {0xFB, 0x00, 0x00, 0x00, 0x3F}},
                             {0.1, whole(0.1)},
                             {1e300, whole(1e300)},
                             // Around the 32-bit truncation the classification rests on.
                             {40000.5, {0xFB, 0x80, 0x40, 0x1C, 0x47}},
                             {16777216.0, whole(16777216.0)},
                             {2147483648.0, whole(2147483648.0)},
                             {-2147483648.0, whole(-2147483648.0)},
                             {-2147483648.5, whole(-2147483648.5)},
                             {1099511627776.0, whole(1099511627776.0)},
                             {0x1p-140, {0xFB, 0x00, 0x02, 0x00, 0x00}},
                             {3.4028234663852886e38, whole(3.4028234663852886e38)}},
                            &C3DStreamHelper::PutDouble, &C3DStreamHelper::GetDouble);

    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        h.PutDouble(-0.0);
        h.PutDouble(std::numeric_limits<double>::quiet_NaN());
        h.PutDouble(-std::numeric_limits<double>::infinity());
    });
    EXPECT_EQ(saved.data[kMarker.size()], 0xFF);
    Load(saved, [](C3DStreamHelper& h) {
        double x = 1;
        EXPECT_EQ(h.GetDouble(x), S_OK);
        EXPECT_FALSE(std::signbit(x)) << "-0.0 reads back as +0.0";
        EXPECT_EQ(h.GetDouble(x), S_OK);
        EXPECT_TRUE(std::isnan(x));
        EXPECT_EQ(h.GetDouble(x), S_OK);
        EXPECT_EQ(x, -std::numeric_limits<double>::infinity());
    });
}

TEST_F(Compact, ChunkHeadersBecomeIndexesIntoTheTable) {
    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        h.ChunkWriteOpen(0x11223344, 2);
        h.PutUInt32(5);
        h.ChunkWriteClose();
        h.ChunkWriteOpen(0x11223344, 2); // the same pair: one byte
        h.ChunkWriteClose();
        h.ChunkWriteOpen(0x11223344, 3); // a new version is a new pair
        h.ChunkWriteClose();
    });
    EXPECT_EQ(saved.data, ut::test::Concat(kMarker, {0x00, 0x44, 0x33, 0x22, 0x11, 0x02, 0x00,
                                                     0x00, 0x00, 0x01, 0x00, 0x00, 0x00, 0xF5, //
                                                     0x00, 0x00, 0x00, 0x00, 0x00,             //
                                                     0x01, 0x44, 0x33, 0x22, 0x11, 0x03, 0x00,
                                                     0x00, 0x00, 0x00, 0x00, 0x00, 0x00}));
}

// The size is patched into bytes that a flush already wrote back: the patch must still reach
// the stream.
TEST_F(Compact, AChunkClosedAfterAFlushStillGetsItsSize) {
    for (Form form : {Form::Plain, Form::Compact}) {
        SCOPED_TRACE(form == Form::Plain ? "plain" : "compact");
        ut::test::Saved saved = Save(form, [](C3DStreamHelper& h) {
            h.ChunkWriteOpen(0x11223344, 2);
            h.PutUInt32(5);
            EXPECT_EQ(h.Flush(), S_OK);
            EXPECT_EQ(h.ChunkWriteClose(), S_OK);
        });
        Bytes expected =
            form == Form::Plain
                ? Bytes{0x44, 0x33, 0x22, 0x11, 0x02, 0x00, 0x00, 0x00, 0x04, 0x00, 0x00, 0x00, //
                        0x05, 0x00, 0x00, 0x00}
                : ut::test::Concat(kMarker, {0x00, 0x44, 0x33, 0x22, 0x11, 0x02, 0x00, 0x00, 0x00, 0x01, 0x00,
                                             0x00, 0x00, 0xF5});
        EXPECT_EQ(saved.data, expected);
    }
}

TEST_F(Compact, OutOfLineTableTravelsInItsOwnChunk) {
    ut::test::Saved saved = Save(Form::CompactTable, [](C3DStreamHelper& h) {
        h.ChunkWriteOpen(0x0A0B0C0D, 7);
        h.ChunkWriteClose();
        h.ChunkWriteOpen(0x0A0B0C0D, 7);
        h.ChunkWriteClose();
    });
    EXPECT_EQ(saved.data, ut::test::Concat(kMarker, {0x00, 0, 0, 0, 0, 0x00, 0, 0, 0, 0}));
    ASSERT_EQ(saved.table.size(), 12u + 4 + 256 * 8);
    Bytes head(saved.table.begin(), saved.table.begin() + 24);
    EXPECT_EQ(head, (Bytes{0x4B, 0x4E, 0x48, 0x43, 0x30, 0x30, 0x31, 0x30, 0x04, 0x08, 0x00, 0x00,
                           0x00, 0x01, 0x00, 0x00, 0x0D, 0x0C, 0x0B, 0x0A, 0x07, 0x00, 0x00, 0x00}));
    Load(saved, [](C3DStreamHelper& h) {
        ULONG version = 0;
        EXPECT_EQ(h.ChunkReadOpen(0x0A0B0C0D, &version), S_OK);
        EXPECT_EQ(version, 7u);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
        EXPECT_EQ(h.SkipChunk(), S_OK);
        ULONG id = 0;
        EXPECT_TRUE(FAILED(h.ChunkPeekHeader(&id, nullptr)));
    });
}

TEST_F(Compact, A257thPairFailsAndLeavesTheStreamUsable) {
    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        ASSERT_EQ(h.ChunkWriteOpen(1000, 1), S_OK);
        for (ULONG id = 0; id < 255; ++id) {
            ASSERT_EQ(h.ChunkWriteOpen(id, 1), S_OK);
            h.PutUInt32(id);
            ASSERT_EQ(h.ChunkWriteClose(), S_OK);
        }
        ULONG before = 0, after = 0;
        h.GetPos(&before);
        EXPECT_EQ(h.ChunkWriteOpen(5000, 1), KX_E_CHUNKTABLEFULL);
        h.GetPos(&after);
        EXPECT_EQ(after, before);
        EXPECT_EQ(h.ChunkWriteOpen(7, 1), S_OK) << "known pairs still work";
        EXPECT_EQ(h.ChunkWriteClose(), S_OK);
        // The error path returns here with the outer chunk open: the helper closes it.
    });
    Load(saved, [](C3DStreamHelper& h) {
        ASSERT_EQ(h.ChunkReadOpen(1000, nullptr), S_OK);
        for (ULONG id = 0; id < 255; ++id) {
            ASSERT_EQ(h.ChunkReadOpen(id, nullptr), S_OK);
            ULONG value = 0;
            EXPECT_EQ(h.GetUInt32(value), S_OK);
            EXPECT_EQ(value, id);
            EXPECT_EQ(h.ChunkReadClose(), S_OK);
        }
        EXPECT_EQ(h.ChunkReadOpen(7, nullptr), S_OK);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
    });
}

TEST_F(Compact, PeekedProbedAndPartlyReadChunksKeepTheStreamInStep) {
    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        h.ChunkWriteOpen(42, 9);
        h.PutInt32(-3);
        h.PutDouble(0.1);
        h.ChunkWriteClose();
        h.ChunkWriteOpen(1, 1);
        h.PutUInt32(0x12345);
        h.ChunkWriteClose();
        h.PutUInt32(9);
    });
    Load(saved, [](C3DStreamHelper& h) {
        ULONG id = 0, version = 0, start = 0, now = 0, value2 = 0;
        h.GetPos(&start);
        ASSERT_EQ(h.ChunkPeekHeader(&id, &version), S_OK);
        EXPECT_EQ(id, 42u);
        EXPECT_EQ(version, 9u);
        h.GetPos(&now);
        EXPECT_EQ(now, start);
        // A probe with the wrong id records the definition and puts the stream back.
        EXPECT_EQ(h.ChunkReadOpen(43, &version), STG_E_INVALIDHEADER);
        h.GetPos(&now);
        EXPECT_EQ(now, start);
        ASSERT_EQ(h.ChunkReadOpen(42, &version), S_OK);
        LONG value = 0;
        EXPECT_EQ(h.GetInt32(value), S_OK);
        EXPECT_EQ(value, -3);
        EXPECT_EQ(h.ChunkReadClose(), S_OK) << "read in part, closed to its end";
        // A definition recorded by a wrong probe is still skipped whole.
        EXPECT_EQ(h.ChunkReadOpen(7, nullptr), STG_E_INVALIDHEADER);
        EXPECT_EQ(h.SkipChunk(), S_OK);
        EXPECT_EQ(h.GetUInt32(value2), S_OK);
        EXPECT_EQ(value2, 9u);
    });
}

TEST_F(Compact, SafeChunksKeepAPlainHeader) {
    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        EXPECT_EQ(h.ChunkSafeWriteOpen(0x01020304, 5), S_OK);
        h.PutUInt32(1);
        EXPECT_EQ(h.ChunkWriteClose(), S_OK);
    });
    EXPECT_EQ(saved.data,
              ut::test::Concat(kMarker, {0x04, 0x03, 0x02, 0x01, 0x05, 0, 0, 0, 0x01, 0, 0, 0, 0xF1}));
    Load(saved, [](C3DStreamHelper& h) {
        ULONG version = 0;
        EXPECT_EQ(h.ChunkSafeReadOpen(0x01020304, &version), S_OK);
        EXPECT_EQ(version, 5u);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
    });
}

// What a compressor answers on its own interface, through the stream object.
class CompressorInterface : public Compact {
protected:
    ut::ComPtr<I3DStreamCompressor> Open(const Bytes& content) {
        source_ = ut::test::StreamOf(content);
        EXPECT_EQ(KXOpenPersistStreamForLoad(source_.Get(), nullptr, stream_.Put()), S_OK);
        ut::ComPtr<I3DStreamCompressor> compressor;
        EXPECT_EQ(stream_.As(compressor), S_OK);
        return compressor;
    }

    ut::ComPtr<IStream> source_;
    ut::ComPtr<IStream> stream_;
};

TEST_F(CompressorInterface, RejectsUnknownTagsAndShortInput) {
    enum Kind { Unsigned, Signed, Double };
    const std::pair<Kind, Bytes> unknown[] = {{Unsigned, {0xA5}}, {Unsigned, {0x12}}, {Signed, {0x5F}},
                                              {Double, {0xFA}},   {Double, {0xF7}},   {Unsigned, {}},
                                              {Signed, {}},       {Double, {}}};
    const std::pair<Kind, Bytes> cut[] = {
        {Unsigned, {0xC7, 0x56}}, {Signed, {0xB0, 1, 2}}, {Double, {0xFC, 1}}};
    auto load = [&](Kind kind, const Bytes& bytes) {
        ut::ComPtr<I3DStreamCompressor> c = Open(ut::test::Concat(kMarker, bytes));
        ULONG u = 7;
        LONG i = 7;
        double d = 7;
        HRESULT hr = kind == Unsigned ? c->LoadPackedVarLenUInt32(u)
                     : kind == Signed ? c->LoadPackedVarLenInt32(i)
                                      : c->LoadVarLenDouble(d);
        EXPECT_EQ(u, kind == Unsigned ? 0u : 7u) << "the unsigned loader clears its output first";
        return hr;
    };
    for (const auto& [kind, bytes] : unknown)
        EXPECT_EQ(load(kind, bytes), E_FAIL) << kind;
    for (const auto& [kind, bytes] : cut)
        EXPECT_TRUE(FAILED(load(kind, bytes))) << kind;
}

TEST_F(CompressorInterface, FixedAnswersAndAWrongSafeChunkId) {
    ut::ComPtr<I3DStreamCompressor> c = Open(ut::test::Concat(kMarker, {4, 3, 2, 1, 5, 0, 0, 0, 0, 0, 0, 0}));
    GUID guid = GUID_NULL;
    const LONG value = 1;
    EXPECT_EQ(c->SaveGUID(guid), E_NOTIMPL);
    EXPECT_EQ(c->LoadGUID(guid), E_NOTIMPL);
    EXPECT_EQ(c->SavePackedVarLenInt32ForPatchBack(value), E_NOTIMPL);
    EXPECT_EQ(c->ChunkSafeReadOpen(0x01020305, nullptr), STG_E_INVALIDHEADER);
    EXPECT_EQ(ut::test::PositionOf(stream_.Get()), kMarker.size()) << "the stream is where it was";
    ULONG version = 0;
    EXPECT_EQ(c->ChunkSafeReadOpen(0x01020304, &version), S_OK);
    EXPECT_EQ(version, 5u);
    // At the end of the stream the header cannot be read: still "another chunk", not a read fault.
    EXPECT_EQ(c->ChunkReadClose(), S_OK);
    EXPECT_EQ(c->ChunkReadOpen(0x01020304, nullptr), STG_E_INVALIDHEADER);
}

TEST_F(CompressorInterface, PlainStreamsDeclineChunkCallsAndKeepValuesPlain) {
    ut::ComPtr<I3DStreamCompressor> compressor =
        Open({0x01, 0x00, 0x00, 0x00, 0x02, 0x00, 0x00, 0x00, 0, 0, 0, 0, 0, 0});
    EXPECT_EQ(compressor->ChunkReadOpen(1, nullptr), STG_E_OLDFORMAT);
    EXPECT_EQ(compressor->ChunkWriteOpen(1, 1), STG_E_OLDFORMAT);
    EXPECT_EQ(compressor->SkipChunk(), STG_E_OLDFORMAT);
    ULONG value = 0;
    EXPECT_EQ(compressor->LoadPackedVarLenUInt32(value), S_OK);
    EXPECT_EQ(value, 1u);
    // A plain skip of a double moves as far as the integer skips.
    EXPECT_EQ(compressor->SkipVarLenDouble(), S_OK);
    EXPECT_EQ(compressor->SkipPackedVarLenUInt32(), S_OK);
    ULARGE_INTEGER position{};
    LARGE_INTEGER zero{};
    stream_->Seek(zero, STREAM_SEEK_CUR, &position);
    EXPECT_EQ(position.QuadPart, 12u);
}

TEST_F(Compact, BrokenChunksFailWithoutReadingPastTheEnd) {
    struct Broken {
        const char* what;
        Bytes bytes;
    };
    const Broken cases[] = {
        {"definition cut", {0x00, 0x01, 0x00}},
        {"size cut", {0x00, 0x01, 0, 0, 0, 0x01, 0, 0, 0, 0x05, 0x00}},
        {"nothing", {}},
    };
    for (const Broken& c : cases) {
        SCOPED_TRACE(c.what);
        Load({ut::test::Concat(kMarker, c.bytes), {}}, [](C3DStreamHelper& h) {
            ULONG version = 0;
            EXPECT_TRUE(FAILED(h.ChunkReadOpen(1, &version)));
            EXPECT_TRUE(FAILED(h.SkipChunk()));
        });
    }
    // A size past the end opens, but whatever follows fails.
    Load({ut::test::Concat(kMarker, {0x00, 0x01, 0, 0, 0, 0x01, 0, 0, 0, 0xFF, 0xFF, 0xFF, 0x7F, 0xF1}), {}},
         [](C3DStreamHelper& h) {
             ASSERT_EQ(h.ChunkReadOpen(1, nullptr), S_OK);
             EXPECT_EQ(h.ChunkReadClose(), S_OK);
             ULONG value = 0;
             EXPECT_TRUE(FAILED(h.GetUInt32(value)));
             EXPECT_TRUE(FAILED(h.ChunkReadOpen(1, nullptr)));
         });
}

TEST_F(Compact, ATableClaimingMoreThan256RowsIsRefused) {
    ut::test::Saved saved = Save(Form::CompactTable, [](C3DStreamHelper& h) { h.ChunkWriteOpen(1, 1); });
    saved.table[13] = 0x02; // 512 rows
    ut::ComPtr<IStream> data = ut::test::StreamOf(saved.data);
    ut::ComPtr<IStream> table = ut::test::StreamOf(saved.table);
    ut::ComPtr<IStream> stream;
    EXPECT_EQ(KXOpenPersistStreamForLoad(data.Get(), table.Get(), stream.Put()), E_FAIL);
    EXPECT_FALSE(stream);
    saved.table.resize(100); // rows cut short
    table = ut::test::StreamOf(saved.table);
    EXPECT_TRUE(FAILED(KXOpenPersistStreamForLoad(data.Get(), table.Get(), stream.Put())));
}

TEST_F(CompressorInterface, StartDepthFollowsTheHostVersion) {
    struct Host {
        const wchar_t* product; // "": the host does not have the string
        const wchar_t* build;
        const wchar_t* major;
        ULONG known;
        ULONG startDepth;
    };
    const Host hosts[] = {
        {L"", L"1200", L"2002", 0, 0xFFFFFFFF},    {L"App", L"1200", L"2002", 1, 0},
        {L"App", L"1014", L"2001", 1, 0xFFFFFFFF}, {L"App", L"1015", L"2001", 1, 0},
        {L"App", L"1500", L"2000", 1, 0xFFFFFFFF}, {L"App", L"", L"", 1, 0},
    };
    for (const Host& host : hosts) {
        ut::host::ReferenceHost installed(
            {.productName = host.product, .build = host.build, .major = host.major});
        ULONG known = 9, depth = 9;
        EXPECT_EQ(Open(kMarker)->GetStartCount(known, depth), S_OK);
        EXPECT_EQ(known, host.known);
        EXPECT_EQ(depth, host.startDepth);
        stream_.Reset();
    }
    ULONG known = 9, depth = 9;
    Open(kMarker)->GetStartCount(known, depth);
    EXPECT_EQ(known, 0u) << "no version object";
    EXPECT_EQ(depth, 0xFFFFFFFFu);
}

TEST_F(Compact, ImportingADeltaLeavesTheReaderInsideTheChunk) {
    ut::test::Saved saved = Save(Form::Compact, [](C3DStreamHelper& h) {
        h.ChunkWriteOpen(1, 1);
        h.PutUInt32(1);
        h.PutUInt32(2);
        h.ChunkWriteClose();
    });
    ut::host::ReferenceHost host({.importingDelta = true});
    Load(saved, [](C3DStreamHelper& h) {
        ASSERT_EQ(h.ChunkReadOpen(1, nullptr), S_OK);
        ULONG value = 0;
        h.GetUInt32(value);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
        EXPECT_EQ(h.GetUInt32(value), S_OK);
        EXPECT_EQ(value, 2u);
    });
}

// A compressor on its own, outside a stream object, for the rules of binding it to streams.
class LooseCompressor final : public C3DStreamCompressor {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
    ULONG STDMETHODCALLTYPE AddRef() override { return 1; }
    ULONG STDMETHODCALLTYPE Release() override { return 1; }

    bool Active() { return ChunkPeekHeader(nullptr, nullptr) != STG_E_OLDFORMAT; }
};

ut::ComPtr<IStream> StreamAt(const Bytes& content, LONGLONG position) {
    ut::ComPtr<IStream> stream = ut::test::StreamOf(content);
    LARGE_INTEGER offset{};
    offset.QuadPart = position;
    stream->Seek(offset, STREAM_SEEK_SET, nullptr);
    return stream;
}

TEST(CompressorInit, OnlyAStreamAtItsStartDecidesTheForm) {
    const bool on = !ut::test::CompressionDisabled();
    const Bytes plain = {1, 0, 0, 0, 1, 0, 0, 0, 0, 0, 0, 0};
    struct Binding {
        const char* what;
        Bytes first;
        LONGLONG firstAt;
        Bytes second; // bound after the first; `none` skips the rebind
        LONGLONG secondAt;
        bool active;
    };
    const Bytes none = {0xEE};
    const Binding cases[] = {
        {"a marker at the start", kMarker, 0, none, 0, true},
        {"a marker, but not at the start", kMarker, 1, none, 0, false},
        {"plain content", plain, 0, none, 0, false},
        {"a new stream", {}, 0, none, 0, on},
        {"compact, then a stream not at its start", kMarker, 0, plain, 4, true},
        {"compact, then plain content", kMarker, 0, plain, 0, false},
        {"compact, then a new stream", kMarker, 0, {}, 0, on},
    };
    for (const Binding& c : cases) {
        SCOPED_TRACE(c.what);
        LooseCompressor compressor;
        ut::ComPtr<IStream> first = StreamAt(c.first, c.firstAt);
        EXPECT_EQ(compressor.Init(first.Get(), 0, 0), S_OK);
        if (c.second != none) {
            ut::ComPtr<IStream> second = StreamAt(c.second, c.secondAt);
            EXPECT_EQ(compressor.Init(second.Get(), 0, 0), S_OK);
        }
        EXPECT_EQ(compressor.Active(), c.active);
    }
}

TEST_F(Compact, PreReadFindsTheTableOrFallsBackToInlineDefinitions) {
    auto tableChunk = [](ULONG version) {
        ut::ComPtr<IStream> table = ut::test::StreamOf();
        CGWStreamHelper writer(table.Get());
        writer.ChunkWriteOpen(0x43484E4B, version);
        writer.PutUInt32(0);
        writer.ChunkWriteClose();
        writer.Flush();
        return ut::test::BytesOf(table.Get());
    };
    struct Table {
        const char* what;
        Bytes content;
        HRESULT result;
        std::size_t newChunkBytes; // what opening a chunk with a new pair then writes
    };
    const Table cases[] = {
        {"no table chunk", {}, S_FALSE, 13},
        {"a table older than the row format", tableChunk(0x30303939), S_FALSE, 5},
        {"an empty table", tableChunk(0x30313030), S_OK, 5},
    };
    for (const Table& c : cases) {
        SCOPED_TRACE(c.what);
        LooseCompressor compressor;
        ut::ComPtr<IStream> data = ut::test::StreamOf();
        ASSERT_EQ(compressor.Init(data.Get(), 1, 0), S_OK);
        ut::ComPtr<IStream> table = ut::test::StreamOf(c.content);
        EXPECT_EQ(compressor.PreRead(table.Get()), c.result);
        ASSERT_EQ(compressor.ChunkWriteOpen(3, 3), S_OK);
        ASSERT_EQ(compressor.Init(nullptr, 0, 0), S_OK); // lets go of the stream, writing it back
        EXPECT_EQ(ut::test::BytesOf(data.Get()).size(), kMarker.size() + c.newChunkBytes);
    }
}

// Opens fail when the window must go to a stream that refuses the write: a definition that
// was rewound is not left in the table, and a safe open reports only a failed push.
TEST_F(Compact, AFailedOpenLeavesNoRowBehind) {
    constexpr ULONG kWindow = ut::sdk::StreamBuffer::kCapacity;
    ut::test::RefusingStream target;
    ut::ComPtr<IStream> stream;
    ASSERT_EQ(KXOpenPersistStreamForSave(&target, nullptr, stream.Put()), S_OK);
    {
        C3DStreamHelper h(stream.Get());
        ULONG position = 0;
        for (h.GetPos(&position); position < kWindow - 9; h.GetPos(&position))
            h.PutUInt8(0xAB);
        target.refusals = 1; // the size placeholder no longer fits the window
        EXPECT_EQ(h.ChunkWriteOpen(0x51, 1), STG_E_MEDIUMFULL);
        ASSERT_EQ(h.ChunkWriteOpen(0x51, 1), S_OK) << "defined again, not referenced";
        EXPECT_EQ(h.ChunkWriteClose(), S_OK);
        target.refusals = 1;
        for (h.GetPos(&position); position < 2 * kWindow - 4; h.GetPos(&position))
            h.PutUInt8(0xCD);
        EXPECT_EQ(h.ChunkSafeWriteOpen(0x52, 1), S_OK) << "the write's failure is not the open's";
    }
    stream.Reset();
    Load({target.Content(), {}}, [&](C3DStreamHelper& h) {
        for (ULONG i = 0; i < kWindow - 9 - kMarker.size(); ++i)
            h.SkipInt8();
        ULONG version = 0;
        EXPECT_EQ(h.ChunkReadOpen(0x51, &version), S_OK);
        EXPECT_EQ(version, 1u);
    });
}

} // namespace
