// Persistence: the feature-version table and persisted-version codes, user data blocks, and the
// chunked streams.
#pragma once

#include <map>
#include <memory>
#include <vector>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/platform/stream.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/stream_helper.h>
#include <ut/sdk/string.h>

// ---------------------------------------------------------------------------------------------
// Feature and persisted versions

// The features whose format revision a stream records.
enum tagEFeaturesVersion : ULONG { eFeaturesVersionScene = 0, eFeaturesVersionCount };

// Columns of a row of g_uiFeaturesVersion.
enum : ULONG { eFeatureNumber = 0, eFeatureCurrent = 1, eFeatureLoaded = 2 };

// One row per feature: its number, the version this library writes, the version found in the
// stream being loaded.
UT_API extern ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3];

class C3DStreamHelper;
namespace ut::persist {
struct StockCodec;
}

// Fills the loaded column of g_uiFeaturesVersion from the stream's feature-version chunk. A stream
// without one reports loaded version 0 for the scene feature. S_OK whatever the stream holds.
UT_API HRESULT KXLoadFeaturesVersion(C3DStreamHelper& stream);

// The loaded and current versions of a feature; either pointer may be null. A feature outside
// the table reports nothing.
UT_API void KXGetFeatureVersion(tagEFeaturesVersion feature, ULONG* loaded, ULONG* current);

// The format revision a scene was written with, told from the host that wrote it. Each value is
// its four digits in ASCII, most significant first.
enum tagVersion : ULONG {
    ePersistedVersion1000 = 0x31303030, // the scene's own version chunk is missing
    ePersistedVersion1500 = 0x31353030, // major version 2000, builds up to 0901
    ePersistedVersion1510 = 0x31353130, // major version 2000, builds 0902 to 1023
    ePersistedVersion1511 = 0x31353131, // major version 2000, builds after 1109 or unknown build
    ePersistedVersion1520 = 0x31353230, // major version 2000, builds 1024 to 1109
    ePersistedVersion1531 = 0x31353331, // any other major version
};

// Classifies the running host's build. `openResult` is what opening the caller's version chunk
// answered; STG_E_INVALIDHEADER (the chunk was not there) gives ePersistedVersion1000. The second
// argument is not used.
UT_API tagVersion F3DGetVersionPersisted(HRESULT openResult, ULONG unused);

// Maps the ambient construction mode 0, 1, 2, 3 to the version id 3, 4, 5, 6. Another mode
// leaves `versionId` as it was (S_OK); a failure to read the mode is returned.
UT_API HRESULT F3DGetVersionIdFromMode(ULONG& versionId);

// 1 when the host's active database is in `mode`, 0 otherwise or when it cannot be asked.
UT_API int IsCurrentActiveDBMode(ULONG mode);

// ---------------------------------------------------------------------------------------------
// User data blocks

// The kinds of optional user data a scene object may carry, at most one block of each.
enum eUserDataBlockType : LONG {
    eUserDataBlockType0 = 0,
    eUserDataBlockType1 = 1,
    // The base block's own type, which no class implements.
    eUserDataBlockTypeBase = 2,
};

// {4AF0E60F-DC45-4C99-98FE-03E9468DBAFC}
inline constexpr CLSID CLSID_UserDataBlockType0 = {
    0x4AF0E60F, 0xDC45, 0x4C99, {0x98, 0xFE, 0x03, 0xE9, 0x46, 0x8D, 0xBA, 0xFC}};
// {DC0F9FF8-9C5E-4048-8766-2C4017EF6A18}
inline constexpr CLSID CLSID_UserDataBlockType1 = {
    0xDC0F9FF8, 0x9C5E, 0x4048, {0x87, 0x66, 0x2C, 0x40, 0x17, 0xEF, 0x6A, 0x18}};
// {AD51D1E3-C45C-4B22-B862-F93882B4205F}: answered with the CUserDataBlock itself.
inline constexpr IID IID_CUserDataBlock = {
    0xAD51D1E3, 0xC45C, 0x4B22, {0xB8, 0x62, 0xF9, 0x38, 0x82, 0xB4, 0x20, 0x5F}};

// The base of a block of user data. Concrete blocks live outside the library, registered under
// the class id of their type; this base persists nothing (E_NOTIMPL).
class UT_API CUserDataBlock : public CGWCOMObject {
public:
    CUserDataBlock() = default;

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    ~CUserDataBlock() override;
    void OnFinalRelease() override;

    virtual bool IsPersistable() const;
    virtual HRESULT Load(IStream* stream);
    // Runs once every object of the scene has been loaded.
    virtual HRESULT OnEndLoad();
    virtual HRESULT Save(IStream* stream);
    virtual HRESULT GetAsTextVersion(std::map<CKXString, CKXString>& text);
    virtual HRESULT SetFromTextVersion(std::map<CKXString, CKXString>& text);
    // The base answers eUserDataBlockTypeBase.
    virtual HRESULT GetType(eUserDataBlockType& type);

    // The class that implements blocks of `type`; E_UNEXPECTED, `clsid` untouched, when none does.
    static HRESULT GetCLSIDFromType(const eUserDataBlockType& type, CLSID& clsid);

private:
    CUserDataBlock(const CUserDataBlock&) = delete;
    CUserDataBlock& operator=(const CUserDataBlock&) = delete;
};

template <>
struct ut::InterfaceId<CUserDataBlock> : ut::Iid<IID_CUserDataBlock> {};

// The user data blocks of one owner, created on first request and released with the collection.
class UT_API CUserDataBlocks {
public:
    CUserDataBlocks() = default;
    virtual ~CUserDataBlocks();

    // The block of `type`, borrowed (no AddRef): S_OK when it was there already. When it was not,
    // S_FALSE, and with `create` the new block is handed out too, so the pointer tells the two
    // apart. E_UNEXPECTED for a type without a class; a failed creation's error is returned.
    HRESULT GetBlock(const eUserDataBlockType& type, CUserDataBlock** block, bool create);

    // The collection persists nothing of its own: S_FALSE.
    HRESULT Save(IStream* stream);
    HRESULT Load(IStream* stream);

protected:
    // Releases every block, in type order, and empties the collection.
    void Clear();

private:
    CUserDataBlocks(const CUserDataBlocks&) = delete;
    CUserDataBlocks& operator=(const CUserDataBlocks&) = delete;

    std::map<eUserDataBlockType, ut::ComPtr<CUserDataBlock>> blocks_;
};

// ---------------------------------------------------------------------------------------------
// Chunked streams: the typed reader/writer every persisted object uses, and the compact encoding
// (packed integers and doubles, chunk headers as one-byte indexes into a table of (id, version)
// pairs) that the stream objects opened below apply.

// The header table of a compact stream holds 256 (id, version) pairs; writing a chunk with a
// 257th distinct pair fails with this code and writes nothing.
inline constexpr HRESULT KX_E_CHUNKTABLEFULL = static_cast<HRESULT>(0x80040201);

// {1C36C8C0-A6A4-11D3-B4B3-00A0244EEB76}
inline constexpr IID IID_I3DStreamCompressor = {
    0x1C36C8C0, 0xA6A4, 0x11D3, {0xB4, 0xB3, 0x00, 0xA0, 0x24, 0x4E, 0xEB, 0x76}};

// The compact encoding of a stream, answered by the stream object. The chunk operations answer
// STG_E_OLDFORMAT while the stream is in the plain form: the caller then uses its own chunk code.
struct I3DStreamCompressor : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE SaveVarLenDouble(const double& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE LoadVarLenDouble(double& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SkipVarLenDouble() = 0;
    virtual HRESULT STDMETHODCALLTYPE SavePackedVarLenInt32ForPatchBack(const LONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SavePackedVarLenInt32(const LONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE LoadPackedVarLenInt32(LONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SkipPackedVarLenInt32() = 0;
    virtual HRESULT STDMETHODCALLTYPE SavePackedVarLenUInt32ForPatchBack(const ULONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SavePackedVarLenUInt32(const ULONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE LoadPackedVarLenUInt32(ULONG& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE SkipPackedVarLenUInt32() = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkPeekHeader(ULONG* id, ULONG* version) = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkWriteOpen(ULONG id, ULONG version) = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkWriteClose() = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkReadOpen(ULONG id, ULONG* version) = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkReadClose() = 0;
    virtual HRESULT STDMETHODCALLTYPE SkipChunk() = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkSafeReadOpen(ULONG id, ULONG* version) = 0;
    virtual HRESULT STDMETHODCALLTYPE ChunkSafeWriteOpen(ULONG id, ULONG version) = 0;
    virtual HRESULT STDMETHODCALLTYPE SaveGUID(const GUID& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE LoadGUID(GUID& value) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetStartCount(ULONG& hostVersionKnown, ULONG& startDepth) = 0;
    virtual ~I3DStreamCompressor() = default;
};

template <>
struct ut::InterfaceId<I3DStreamCompressor> : ut::Iid<IID_I3DStreamCompressor> {};

// The compact encoding. The object that embeds it supplies QueryInterface, AddRef and Release,
// and calls Init for each stream, PreRead before reading a stream whose header table travels
// apart, and Term after writing one.
class UT_API C3DStreamCompressor : public I3DStreamCompressor {
public:
    C3DStreamCompressor();
    C3DStreamCompressor(const C3DStreamCompressor&) = default;
    C3DStreamCompressor& operator=(const C3DStreamCompressor&) = default;
    ~C3DStreamCompressor() override;

    HRESULT STDMETHODCALLTYPE SaveVarLenDouble(const double& value) override;
    HRESULT STDMETHODCALLTYPE LoadVarLenDouble(double& value) override;
    HRESULT STDMETHODCALLTYPE SkipVarLenDouble() override;
    HRESULT STDMETHODCALLTYPE SavePackedVarLenInt32ForPatchBack(const LONG& value) override;
    HRESULT STDMETHODCALLTYPE SavePackedVarLenInt32(const LONG& value) override;
    HRESULT STDMETHODCALLTYPE LoadPackedVarLenInt32(LONG& value) override;
    HRESULT STDMETHODCALLTYPE SkipPackedVarLenInt32() override;
    HRESULT STDMETHODCALLTYPE SavePackedVarLenUInt32ForPatchBack(const ULONG& value) override;
    HRESULT STDMETHODCALLTYPE SavePackedVarLenUInt32(const ULONG& value) override;
    HRESULT STDMETHODCALLTYPE LoadPackedVarLenUInt32(ULONG& value) override;
    HRESULT STDMETHODCALLTYPE SkipPackedVarLenUInt32() override;
    HRESULT STDMETHODCALLTYPE ChunkPeekHeader(ULONG* id, ULONG* version) override;
    HRESULT STDMETHODCALLTYPE ChunkWriteOpen(ULONG id, ULONG version) override;
    HRESULT STDMETHODCALLTYPE ChunkWriteClose() override;
    HRESULT STDMETHODCALLTYPE ChunkReadOpen(ULONG id, ULONG* version) override;
    HRESULT STDMETHODCALLTYPE ChunkReadClose() override;
    HRESULT STDMETHODCALLTYPE SkipChunk() override;
    HRESULT STDMETHODCALLTYPE ChunkSafeReadOpen(ULONG id, ULONG* version) override;
    HRESULT STDMETHODCALLTYPE ChunkSafeWriteOpen(ULONG id, ULONG version) override;
    HRESULT STDMETHODCALLTYPE SaveGUID(const GUID& value) override;
    HRESULT STDMETHODCALLTYPE LoadGUID(GUID& value) override;
    HRESULT STDMETHODCALLTYPE GetStartCount(ULONG& hostVersionKnown, ULONG& startDepth) override;

    // Binds the compressor to `stream`. A stream at position 0 becomes compact: an empty one gets
    // the marker chunk (unless KX_DISABLE_STREAM_COMPRESSION was set when the library loaded), a
    // non-empty one is compact when it starts with the marker. The header table is kept.
    HRESULT Init(IStream* stream, int tableMode, int reserved);
    // Reads a header table written by Term from `stream`: S_OK, or S_FALSE when there is none.
    HRESULT PreRead(IStream* stream);
    // Writes the header table to `stream` unless `skip`.
    HRESULT Term(IStream* stream, int skip);

private:
    friend struct ut::persist::StockCodec; // the value operations, also called directly by the helper

    struct HeaderRow {
        ULONG version;
        ULONG id;
    };

    HRESULT PutChunkHeader(ULONG id, ULONG version);
    // The row that defines the header, or -1.
    int FindRow(ULONG id, ULONG version) const;
    // Opens a chunk for writing when its header refers to a known row and the window has room;
    // false when the general path has to (`hr` is then untouched).
    bool WriteReferencedChunk(ULONG id, ULONG version, HRESULT& hr);
    // Writes the header and opens the chunk, whatever the header is.
    HRESULT WriteChunkHeader(ULONG id, ULONG version);
    HRESULT GetChunkHeader(ULONG& id, ULONG& version, bool record);
    // Opens a chunk whose header refers to a known row, when the window holds it; false when
    // the general path has to decide (`hr` is then untouched).
    bool OpenReferencedChunk(ULONG id, ULONG* version, HRESULT& hr);
    // Opens the chunk whose header is at the position, whatever the header holds.
    HRESULT OpenChunkFromHeader(ULONG id, ULONG* version);
    // Drops the rows recorded after `lastKept` (by an open that then failed).
    void ForgetRowsAfter(int lastKept);

    bool Packing(int kind) const { return active_ && kind; }
    bool ImportingDelta() const;

    std::shared_ptr<CGWStreamHelper> helper_;
    ut::sdk::StreamBuffer* buffer_ = nullptr;
    ut::ComPtr<IStream> stream_;
    CKXString streamName_;
    int active_ = 0;
    int packUInt32_ = 1;
    int packInt32_ = 1;
    int packDouble_ = 1;
    int tableMode_ = 0;
    HeaderRow headerTable_[256] = {};
    ULONG headerPos_[256] = {};
    int lastIndex_ = -1;
    bool packHeaders_ = true;
    std::vector<ULONGLONG> readEnds_;
    std::vector<ULONGLONG> writeStarts_;
    LONG startDepth_ = -1;
    BYTE hostVersionKnown_ = 0;
};

// The typed reader and writer through which persisted objects save and load. Over a stream
// that answers I3DStreamCompressor, 32-bit integers, doubles and chunk framing go through the
// compressor; everything else, and everything on other streams, is CGWStreamHelper's. Chunks
// opened through the helper and still open when it goes are closed then.
class UT_API C3DStreamHelper : public CGWStreamHelper {
public:
    explicit C3DStreamHelper(IStream* stream);
    ~C3DStreamHelper() override;

    using CGWStreamHelper::ChunkReadOpen;
    using CGWStreamHelper::ChunkWriteOpen;

    HRESULT PutInt32(LONG value) override;
    HRESULT PutUInt32(ULONG value) override;
    HRESULT PutDouble(double value) override;
    HRESULT GetInt32(LONG& value) override;
    HRESULT GetUInt32(ULONG& value) override;
    HRESULT GetDouble(double& value) override;
    HRESULT SkipInt32() override;
    HRESULT SkipUInt32() override;
    HRESULT SkipDouble() override;
    HRESULT SkipChunk() override;
    HRESULT ChunkPeekHeader(ULONG* id, ULONG* version) override;
    HRESULT ChunkWriteOpen(ULONG id, ULONG version) override;
    HRESULT ChunkWriteClose() override;
    HRESULT ChunkReadOpen(ULONG id, ULONG* version) override;
    HRESULT ChunkReadClose() override;

    // A wide string; an empty one is stored as an empty string, never as a missing one.
    virtual HRESULT PutString(const CKXString& text);
    // A 32-bit value in a slot of fixed size, so that it can be overwritten later.
    virtual HRESULT StoreUInt32(ULONG value);
    virtual HRESULT GetString(CKXString& text);
    // Chunks with a plain header, found by readers that know nothing of the header table.
    virtual HRESULT ChunkSafeReadOpen(ULONG id, ULONG* version);
    virtual HRESULT ChunkSafeWriteOpen(ULONG id, ULONG version);

private:
    // The closes themselves, without the counting of open chunks.
    HRESULT RawChunkWriteClose();
    HRESULT RawChunkReadClose();
    HRESULT CountWriteOpen(HRESULT hr);
    HRESULT CountReadOpen(HRESULT hr);
    HRESULT CountClose(HRESULT hr);

    ut::ComPtr<I3DStreamCompressor> compressor_;
    // The same compressor when it is the library's own: its value operations are then called
    // directly, without a virtual call per value. Null otherwise.
    C3DStreamCompressor* stock_ = nullptr;
    BYTE lastOpenWasRead_ = 1;
    ULONG openDepth_ = 0;
};

// The stream objects that applications open around the streams they save to and load from.
// They answer IStream (all access goes through one shared buffer), I3DStreamCompressor and the
// request to count chunks (IID_IGWChunkCountingStream), so that a C3DStreamHelper built over
// them writes and reads the compact form and closes chunks left open.
//
// Saving: `target` is written from its current position. At position 0 it is emptied first and
// written in the compact form (or the plain form when KX_DISABLE_STREAM_COMPRESSION was set when
// the library loaded); elsewhere in the plain form. With a `table` stream the header table is
// written there by KXClosePersistStream (out of line) instead of inside the data.
UT_API HRESULT KXOpenPersistStreamForSave(IStream* target, IStream* table, IStream** stream);
// Loading: the form is found from `source` itself (compact streams start with a marker chunk).
// Give the `table` stream that the save wrote, or null when it had none.
UT_API HRESULT KXOpenPersistStreamForLoad(IStream* source, IStream* table, IStream** stream);
// Ends a save: writes the out-of-line header table, then every pending byte, and leaves the
// target at the end of what was written. Releasing the stream without closing it writes the
// pending bytes but no table. A second close answers S_FALSE; a stream not opened by the calls
// above answers E_INVALIDARG.
UT_API HRESULT KXClosePersistStream(IStream* stream);
