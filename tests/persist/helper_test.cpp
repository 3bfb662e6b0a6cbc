// C3DStreamHelper: what goes to the compressor, what falls back, chunk ids, counting and the
// closing of chunks left open.
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "persist/save_load.h"
#include "support/com_mock.h"
#include "support/ref_tracker.h"

namespace {

using testing::_;
using testing::Return;
using ut::test::Bytes;
using ut::test::Form;

class MockCompressor : public ut::test::ComMock<I3DStreamCompressor> {
public:
    MockCompressor() : ComMock(IID_I3DStreamCompressor) {}
    MOCK_METHOD(HRESULT, SaveVarLenDouble, (const double&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, LoadVarLenDouble, (double&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SkipVarLenDouble, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SavePackedVarLenInt32ForPatchBack, (const LONG&),
                (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SavePackedVarLenInt32, (const LONG&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, LoadPackedVarLenInt32, (LONG&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SkipPackedVarLenInt32, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SavePackedVarLenUInt32ForPatchBack, (const ULONG&),
                (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SavePackedVarLenUInt32, (const ULONG&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, LoadPackedVarLenUInt32, (ULONG&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SkipPackedVarLenUInt32, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkPeekHeader, (ULONG*, ULONG*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkWriteOpen, (ULONG, ULONG), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkWriteClose, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkReadOpen, (ULONG, ULONG*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkReadClose, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SkipChunk, (), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkSafeReadOpen, (ULONG, ULONG*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, ChunkSafeWriteOpen, (ULONG, ULONG), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, SaveGUID, (const GUID&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, LoadGUID, (GUID&), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, GetStartCount, (ULONG&, ULONG&), (override, Calltype(STDMETHODCALLTYPE)));
};

class MockCapabilities : public ut::test::ComMock<IGWStreamCapabilities> {
public:
    MockCapabilities() : ComMock(IID_IGWStreamCapabilities) {}
    MOCK_METHOD(BOOL, HasCapability, (ULONG), (override, Calltype(STDMETHODCALLTYPE)));
};

// A memory stream that also answers a compressor and, optionally, the capability interface.
class StreamWithCompressor final : public ut::test::ForwardingStream {
public:
    StreamWithCompressor(I3DStreamCompressor* compressor, IGWStreamCapabilities* capabilities)
        : compressor_(compressor), capabilities_(capabilities) {}

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        IUnknown* answer = IsEqualGUID(iid, IID_I3DStreamCompressor)     ? compressor_
                           : IsEqualGUID(iid, IID_IGWStreamCapabilities) ? capabilities_
                                                                         : nullptr;
        if (!answer)
            return ForwardingStream::QueryInterface(iid, object);
        answer->AddRef();
        *object = answer;
        return S_OK;
    }

private:
    IUnknown* compressor_;
    IUnknown* capabilities_;
};

TEST(StreamHelperRouting, OnlyDeclinedChunkCallsFallBackToTheBaseFraming) {
    MockCompressor compressor;
    ut::test::RefTracker refs;
    refs.Track(&compressor, 1, "compressor");
    StreamWithCompressor stream(&compressor, nullptr);
    EXPECT_CALL(compressor, GetStartCount(_, _)).WillOnce(Return(S_OK));
    EXPECT_CALL(compressor, SavePackedVarLenInt32(-5)).WillOnce(Return(E_FAIL));
    EXPECT_CALL(compressor, ChunkWriteOpen(7u, 1u))
        .WillOnce(Return(E_ACCESSDENIED))
        .WillOnce(Return(STG_E_OLDFORMAT));
    EXPECT_CALL(compressor, ChunkSafeWriteOpen(_, _)).WillOnce(Return(STG_E_OLDFORMAT));
    EXPECT_CALL(compressor, ChunkWriteClose()).WillRepeatedly(Return(STG_E_OLDFORMAT));
    {
        C3DStreamHelper helper(&stream);
        EXPECT_EQ(helper.PutInt32(-5), E_FAIL)
            << "values go to the compressor, failures come back as they are";
        EXPECT_EQ(helper.ChunkWriteOpen(7, 1), E_ACCESSDENIED) << "only STG_E_OLDFORMAT falls back";
        EXPECT_EQ(helper.ChunkSafeWriteOpen(0x01020304, 2), S_OK);
        EXPECT_EQ(helper.ChunkWriteOpen(7, 1), S_OK);
        EXPECT_EQ(helper.PutGUID(GUID_NULL), S_OK) << "GUIDs never go to the compressor";
        // Both chunks are left open: the helper closes them, innermost first.
    }
    Bytes expected = {4, 3, 2, 1, 2, 0, 0, 0, 28, 0, 0, 0, 7, 0, 0, 0, 1, 0, 0, 0, 16, 0, 0, 0};
    expected.resize(expected.size() + sizeof(GUID));
    EXPECT_EQ(stream.Content(), expected);
}

TEST(StreamHelperCounting, StartDepthAndCapabilityDecideWhetherReadsCount) {
    struct Case {
        ULONG known;
        ULONG startDepth;
        int capability;       // -1: the stream does not answer the interface
        bool failedWriteOpen; // a write open that fails comes first
        bool counts;
    };
    const Case cases[] = {
        {1, 0, -1, false, true}, {0, 0xFFFFFFFF, -1, false, false},
        {0, 0, 0, false, false}, {0, 0, 1, false, true},
        {1, 0, 0, false, true},  {0, 0xFFFFFFFF, -1, true, true},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(::testing::Message() << c.known << " " << c.startDepth << " " << c.capability);
        MockCompressor compressor;
        MockCapabilities capabilities;
        StreamWithCompressor stream(&compressor, c.capability < 0 ? nullptr : &capabilities);
        EXPECT_CALL(compressor, GetStartCount(_, _))
            .WillOnce(testing::DoAll(testing::SetArgReferee<0>(c.known),
                                     testing::SetArgReferee<1>(c.startDepth), Return(S_OK)));
        EXPECT_CALL(capabilities, HasCapability(2u)).WillRepeatedly(Return(c.capability == 1));
        if (c.failedWriteOpen) {
            EXPECT_CALL(compressor, ChunkWriteOpen(2u, 0u)).WillOnce(Return(E_FAIL));
        }
        EXPECT_CALL(compressor, ChunkReadOpen(1u, _)).WillOnce(Return(S_OK));
        ON_CALL(compressor, ChunkReadClose()).WillByDefault(Return(S_OK));
        EXPECT_CALL(compressor, ChunkReadClose()).Times(c.counts ? 1 : 0);
        C3DStreamHelper helper(&stream);
        if (c.failedWriteOpen) {
            EXPECT_EQ(helper.ChunkWriteOpen(2, 0), E_FAIL) << "and counting is on from here";
        }
        EXPECT_EQ(helper.ChunkReadOpen(1, nullptr), S_OK);
    }
}

TEST(StreamHelperCounting, PlainStreamsCountOnlyOnceWritingStarts) {
    ut::ComPtr<IStream> stream = ut::test::StreamOf({1, 0, 0, 0, 0, 0, 0, 0, 4, 0, 0, 0, 9, 9, 9, 9});
    {
        C3DStreamHelper helper(stream.Get());
        ASSERT_EQ(helper.ChunkReadOpen(1, nullptr), S_OK);
    }
    ULARGE_INTEGER position{};
    LARGE_INTEGER zero{};
    stream->Seek(zero, STREAM_SEEK_CUR, &position);
    EXPECT_EQ(position.QuadPart, 12u) << "a read open is not counted, so nothing is closed";

    ut::ComPtr<IStream> written = ut::test::NewMemoryStream();
    {
        C3DStreamHelper helper(written.Get());
        ASSERT_EQ(helper.ChunkWriteOpen(1, 0), S_OK);
        EXPECT_EQ(helper.StoreUInt32(9), S_OK) << "without a compressor, a plain UInt32";
    }
    EXPECT_EQ(ut::test::BytesOf(written.Get()), (Bytes{1, 0, 0, 0, 0, 0, 0, 0, 4, 0, 0, 0, 9, 0, 0, 0}));
}

TEST(StreamHelperChunks, NamesAndGuidsMapToNumericIds) {
    const std::pair<const char*, ULONG> names[] = {{"ABCD", 0x44434241},
                                                   {"\xC4\x41\x42\x43", 0xFFFFFFC4},
                                                   {"AB\xC4\x44", 0xFFC44241},
                                                   {"ABCDEF", 0x44434241}};
    for (const auto& [name, id] : names)
        EXPECT_EQ(ut::sdk::ChunkIdFromName(name), id) << name;

    const GUID written = {0xDEADBEEF, 1, 2, {3, 4, 5, 6, 7, 8, 9, 10}};
    const GUID other = {0xDEADBEEF, 9, 9, {9, 9, 9, 9, 9, 9, 9, 9}};
    ut::test::Saved saved = ut::test::Save(Form::Compact, [&](C3DStreamHelper& h) {
        EXPECT_EQ(h.ChunkWriteOpen("ABCD", 1), S_OK);
        EXPECT_EQ(h.ChunkWriteClose(), S_OK);
        EXPECT_EQ(h.ChunkWriteOpen(written, 2), S_OK);
    });
    ut::test::Load(saved, [&](C3DStreamHelper& h) {
        ULONG version = 0;
        EXPECT_EQ(h.ChunkReadOpen(0x44434241, &version), S_OK);
        EXPECT_EQ(h.ChunkReadClose(), S_OK);
        EXPECT_EQ(h.ChunkReadOpen(other, &version), S_OK) << "only the first 32 bits of a GUID count";
        EXPECT_EQ(version, 2u);
    });
}

TEST(StreamHelperChunks, OpenChunksAreClosedWhenTheHelperGoes) {
    for (Form form : {Form::Plain, Form::Compact}) {
        ut::test::Saved saved = ut::test::Save(form, [](C3DStreamHelper& h) {
            h.ChunkWriteOpen(1, 0);
            h.PutUInt32(1);
            h.ChunkWriteOpen(2, 0);
            h.PutUInt32(2);
        });
        Bytes body = form == Form::Plain ? Bytes{1, 0, 0, 0, 0, 0, 0, 0, 20, 0, 0, 0, 1, 0, 0, 0,
                                                 2, 0, 0, 0, 0, 0, 0, 0, 4,  0, 0, 0, 2, 0, 0, 0}
                                         : Bytes{0x00, 1, 0, 0, 0, 0, 0, 0, 0, 15, 0, 0, 0, 0xF1,
                                                 0x01, 2, 0, 0, 0, 0, 0, 0, 0, 1,  0, 0, 0, 0xF2};
        if (form == Form::Compact && !ut::test::CompressionDisabled())
            body = ut::test::Concat(ut::test::kMarker, body);
        if (form == Form::Plain || !ut::test::CompressionDisabled()) {
            EXPECT_EQ(saved.data, body);
        }
    }
}

TEST(StreamHelperStrings, EmptyAndDefaultStringsAreTheSameAndTextSurvives) {
    for (Form form : {Form::Plain, Form::Compact}) {
        const CKXString texts[] = {CKXString(), CKXString(L""), CKXString(L"name"),
                                   CKXString(std::wstring(L"smile \U0001F600 and \u00E9"))};
        ut::test::Saved saved = ut::test::Save(form, [&](C3DStreamHelper& h) {
            for (const CKXString& text : texts)
                EXPECT_EQ(h.PutString(text), S_OK);
        });
        std::size_t start =
            form == Form::Plain || ut::test::CompressionDisabled() ? 0 : ut::test::kMarker.size();
        EXPECT_EQ(Bytes(saved.data.begin() + start, saved.data.begin() + start + 8),
                  (Bytes{0, 0, 0, 0, 0, 0, 0, 0}));
        ut::test::Load(saved, [&](C3DStreamHelper& h) {
            for (const CKXString& text : texts) {
                CKXString back(L"x");
                EXPECT_EQ(h.GetString(back), S_OK);
                EXPECT_EQ(back, text);
            }
            CKXString untouched(L"kept");
            EXPECT_TRUE(FAILED(h.GetString(untouched)));
            EXPECT_EQ(untouched, CKXString(L"kept"));
        });
    }
}

} // namespace
