// C3DStreamCompressor: packed integers and doubles, and chunk headers as table indexes.
#include <cwchar>
#include <new>

#include <ut/persist.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/ambient.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/version.h>

#include "module/state.h"
#include "persist/packing.h"
#include "persist/stock_codec.h"

namespace {

// "IGAM": a compact stream starts with this empty chunk.
constexpr ULONG kMarkerId = 0x4D414749;
constexpr ULONG kMarkerVersion = 256;
// "KNHC", version "0010": the header table written apart from the stream.
constexpr ULONG kTableId = 0x43484E4B;
constexpr ULONG kTableVersion = 0x30313030;
constexpr ULONG kTableRows = 256;
// Reported as the id of a header whose index byte could not be read.
constexpr ULONG kUnreadableId = 0x30303030;

LONG VersionNumber(IGWVersionInfo* info, ULONG index) {
    wchar_t* text = nullptr;
    if (FAILED(info->GetVersionString(index, &text)) || !text)
        return 0;
    std::unique_ptr<wchar_t, ut::TaskMemDeleter> owned(text);
    return static_cast<LONG>(std::wcstol(text, nullptr, 10));
}

bool HasVersionString(IGWVersionInfo* info, ULONG index) {
    wchar_t* text = nullptr;
    HRESULT hr = info->GetVersionString(index, &text);
    std::unique_ptr<wchar_t, ut::TaskMemDeleter> owned(text);
    return SUCCEEDED(hr) && text;
}

// Hosts of the 2000 line and early 2001 builds could not take back the closing of chunks
// opened for reading; StartDepth -1 tells the helper not to count them there.
void ReadHostVersion(BYTE& known, LONG& startDepth) {
    known = 0;
    startDepth = -1;
    ut::ComPtr<IGWVersionInfo> info;
    if (FAILED(GWQueryGenericObject(CLSID_GWVersionInfo, IID_IGWVersionInfo, info.PutVoid())) || !info)
        return;
    if (!HasVersionString(info.Get(), GWVERSION_PRODUCT))
        return;
    known = 1;
    startDepth = 0;
    LONG major = VersionNumber(info.Get(), GWVERSION_MAJOR);
    LONG build = VersionNumber(info.Get(), GWVERSION_BUILD);
    if ((major == 2001 && build < 1015) || major == 2000)
        startDepth = -1;
}

} // namespace

C3DStreamCompressor::C3DStreamCompressor() {
    ReadHostVersion(hostVersionKnown_, startDepth_);
}

C3DStreamCompressor::~C3DStreamCompressor() = default;

// Binding to a stream.

HRESULT C3DStreamCompressor::Init(IStream* stream, int tableMode, int) {
    stream_ = ut::ComPtr<IStream>(stream);
    helper_.reset();
    buffer_ = nullptr;
    tableMode_ = tableMode;
    if (HRESULT hr = ut::ExportBoundary([&] {
            helper_ = std::make_shared<CGWStreamHelper>(stream);
            return S_OK;
        });
        FAILED(hr))
        return hr;
    buffer_ = &helper_->Buffer();
    if (!stream)
        return S_OK;

    LARGE_INTEGER zero{};
    ULARGE_INTEGER position{};
    if (FAILED(stream->Seek(zero, STREAM_SEEK_CUR, &position)) || position.QuadPart != 0)
        return S_OK;
    STATSTG stat{};
    if (FAILED(stream->Stat(&stat, STATFLAG_DEFAULT)))
        return S_OK;
    std::unique_ptr<wchar_t, ut::TaskMemDeleter> name(stat.pwcsName);
    streamName_ = name.get();

    if (stat.cbSize.QuadPart == 0) {
        // Switched off for new streams: a compressor rebound from a compact stream must not keep
        // writing compact values onto a stream that carries no marker.
        if (ut::module::Current().streamCompressionDisabled) {
            active_ = 0;
            return S_OK;
        }
        // Into the window: a stream that refuses the bytes says so when the window is written back.
        (void)helper_->ChunkWriteOpen(kMarkerId, kMarkerVersion);
        (void)helper_->ChunkWriteClose();
        active_ = 1;
        return S_OK;
    }
    ULONG version = 0;
    if (helper_->ChunkReadOpen(kMarkerId, &version) == S_OK) {
        (void)helper_->ChunkReadClose(); // an empty chunk: nothing to step over
        active_ = 1;
    } else {
        active_ = 0;
    }
    return S_OK;
}

HRESULT C3DStreamCompressor::PreRead(IStream* stream) {
    if (!stream)
        return E_POINTER;
    CGWStreamHelper table(stream);
    ULONG version = 0;
    if (FAILED(table.ChunkReadOpen(kTableId, &version))) {
        tableMode_ = 0;
        return S_FALSE;
    }
    tableMode_ = 1;
    if (version < kTableVersion)
        return S_FALSE;
    ULONG count = 0;
    if (HRESULT hr = table.GetUInt32(count); FAILED(hr))
        return hr;
    if (count > kTableRows)
        return E_FAIL;
    lastIndex_ = static_cast<int>(count) - 1;
    for (ULONG k = 0; k < count; ++k) {
        LONG id = 0;
        if (HRESULT hr = table.GetInt32(id); FAILED(hr))
            return hr;
        if (HRESULT hr = table.GetUInt32(headerTable_[k].version); FAILED(hr))
            return hr;
        headerTable_[k].id = static_cast<ULONG>(id);
        headerPos_[k] = k;
    }
    return table.ChunkReadClose();
}

HRESULT C3DStreamCompressor::Term(IStream* stream, int skip) {
    if (skip)
        return S_OK;
    if (!stream)
        return E_POINTER;
    CGWStreamHelper table(stream);
    HRESULT hr = table.ChunkWriteOpen(kTableId, kTableVersion);
    if (SUCCEEDED(hr))
        hr = table.PutUInt32(kTableRows);
    for (ULONG k = 0; k < kTableRows && SUCCEEDED(hr); ++k) {
        hr = table.PutInt32(static_cast<LONG>(headerTable_[k].id));
        if (SUCCEEDED(hr))
            hr = table.PutUInt32(headerTable_[k].version);
    }
    if (SUCCEEDED(hr))
        hr = table.ChunkWriteClose();
    if (SUCCEEDED(hr))
        hr = table.Flush();
    return hr;
}

HRESULT C3DStreamCompressor::GetStartCount(ULONG& hostVersionKnown, ULONG& startDepth) {
    hostVersionKnown = hostVersionKnown_;
    startDepth = static_cast<ULONG>(startDepth_);
    return S_OK;
}

// Packed values: the bodies are shared with C3DStreamHelper's direct calls.

HRESULT C3DStreamCompressor::SavePackedVarLenUInt32(const ULONG& value) {
    return ut::persist::StockCodec::SaveUInt32(*this, value);
}

HRESULT C3DStreamCompressor::SavePackedVarLenUInt32ForPatchBack(const ULONG& value) {
    if (!buffer_)
        return E_UNEXPECTED;
    if (!Packing(packUInt32_))
        return buffer_->WriteValue(value);
    BYTE bytes[5] = {ut::persist::kTagWhole};
    std::memcpy(bytes + 1, &value, 4);
    return buffer_->Write(bytes, 5);
}

HRESULT C3DStreamCompressor::LoadPackedVarLenUInt32(ULONG& value) {
    return ut::persist::StockCodec::LoadUInt32(*this, value);
}

HRESULT C3DStreamCompressor::SkipPackedVarLenUInt32() {
    if (!buffer_)
        return E_UNEXPECTED;
    if (!Packing(packUInt32_))
        return buffer_->Move(false, 4);
    ULONG scratch = 0;
    return LoadPackedVarLenUInt32(scratch);
}

HRESULT C3DStreamCompressor::SavePackedVarLenInt32(const LONG& value) {
    return ut::persist::StockCodec::SaveInt32(*this, value);
}

HRESULT C3DStreamCompressor::SavePackedVarLenInt32ForPatchBack(const LONG&) {
    return E_NOTIMPL;
}

HRESULT C3DStreamCompressor::LoadPackedVarLenInt32(LONG& value) {
    return ut::persist::StockCodec::LoadInt32(*this, value);
}

HRESULT C3DStreamCompressor::SkipPackedVarLenInt32() {
    LONG scratch = 0;
    LoadPackedVarLenInt32(scratch);
    return S_OK;
}

HRESULT C3DStreamCompressor::SaveVarLenDouble(const double& value) {
    return ut::persist::StockCodec::SaveDouble(*this, value);
}

HRESULT C3DStreamCompressor::LoadVarLenDouble(double& value) {
    return ut::persist::StockCodec::LoadDouble(*this, value);
}

// A plain double takes 8 bytes, but the skip moves 4 like the integer skips: streams written so
// are read so.
HRESULT C3DStreamCompressor::SkipVarLenDouble() {
    if (!buffer_)
        return E_UNEXPECTED;
    if (!Packing(packDouble_))
        return buffer_->Move(false, 4);
    double scratch = 0;
    return LoadVarLenDouble(scratch);
}

HRESULT C3DStreamCompressor::SaveGUID(const GUID&) {
    return E_NOTIMPL;
}
HRESULT C3DStreamCompressor::LoadGUID(GUID&) {
    return E_NOTIMPL;
}

// Chunk headers.

int C3DStreamCompressor::FindRow(ULONG id, ULONG version) const {
    for (int row = 0; row <= lastIndex_; ++row) {
        if (headerTable_[row].id == id && headerTable_[row].version == version)
            return row;
    }
    return -1;
}

HRESULT C3DStreamCompressor::PutChunkHeader(ULONG id, ULONG version) {
    if (!active_ || !packHeaders_) {
        ULONG plain[2] = {id, version};
        return buffer_->WriteValue(plain);
    }
    if (int row = FindRow(id, version); row >= 0)
        return buffer_->WriteValue(static_cast<BYTE>(row));
    if (lastIndex_ + 1 >= static_cast<int>(kTableRows))
        return KX_E_CHUNKTABLEFULL;
    int row = lastIndex_ + 1;
    HRESULT hr = S_OK;
    if (tableMode_) {
        hr = buffer_->WriteValue(static_cast<BYTE>(row));
    } else {
        BYTE definition[9] = {static_cast<BYTE>(row)};
        std::memcpy(definition + 1, &id, 4);
        std::memcpy(definition + 5, &version, 4);
        hr = buffer_->WriteValue(definition);
    }
    if (FAILED(hr))
        return hr;
    headerTable_[row] = {version, id};
    lastIndex_ = row;
    return S_OK;
}

HRESULT C3DStreamCompressor::GetChunkHeader(ULONG& id, ULONG& version, bool record) {
    if (!active_ || !packHeaders_) {
        ULONG plain[2] = {};
        HRESULT hr = buffer_->ReadValue(plain);
        id = plain[0];
        version = plain[1];
        return hr;
    }
    BYTE index = 0;
    if (HRESULT hr = buffer_->ReadValue(index); FAILED(hr)) {
        id = kUnreadableId;
        return hr;
    }
    auto position = static_cast<ULONG>(buffer_->Position());
    HeaderRow& row = headerTable_[index];
    if (headerPos_[index] != 0 && headerPos_[index] != position) {
        id = row.id;
        version = row.version;
        return S_OK;
    }
    // The row's definition: first sight, or the same definition again at the same place.
    if (record)
        headerPos_[index] = position;
    if (!tableMode_) {
        ULONG pair[2] = {};
        if (HRESULT hr = buffer_->ReadValue(pair); FAILED(hr))
            return hr;
        if (record)
            row = {pair[1], pair[0]};
        id = pair[0];
        version = pair[1];
        return S_OK;
    }
    id = row.id;
    version = row.version;
    return S_OK;
}

// Chunks.

namespace {

// Growing a stack of chunk positions is the only step of a chunk's open that can throw. It goes
// through the boundary out of line, which keeps the exception machinery out of the path taken
// for nearly every chunk.
[[gnu::noinline]] HRESULT PushGrowing(std::vector<ULONGLONG>& stack, ULONGLONG value) {
    return ut::ExportBoundary([&] {
        stack.push_back(value);
        return S_OK;
    });
}

HRESULT Push(std::vector<ULONGLONG>& stack, ULONGLONG value) {
    if (stack.size() == stack.capacity())
        return PushGrowing(stack, value);
    stack.push_back(value);
    return S_OK;
}

} // namespace

// Most chunks written have a header defined earlier: its index byte and the size field to patch
// go into the window's room in one step, with the same outcome as the general path below.
bool C3DStreamCompressor::WriteReferencedChunk(ULONG id, ULONG version, HRESULT& hr) {
    if (!packHeaders_)
        return false;
    const int row = FindRow(id, version);
    if (row < 0)
        return false;
    BYTE* room = buffer_->Reserve(1 + sizeof(ULONG));
    if (!room)
        return false;
    hr = Push(writeStarts_, buffer_->Position() + 1 + sizeof(ULONG));
    if (FAILED(hr))
        return true; // nothing written yet
    room[0] = static_cast<BYTE>(row);
    std::memset(room + 1, 0, sizeof(ULONG));
    buffer_->Commit(1 + sizeof(ULONG));
    return true;
}

HRESULT C3DStreamCompressor::ChunkWriteOpen(ULONG id, ULONG version) {
    if (!active_)
        return STG_E_OLDFORMAT;
    if (HRESULT hr = S_OK; WriteReferencedChunk(id, version, hr))
        return hr;
    return WriteChunkHeader(id, version);
}

// Out of line, so that the step above needs no stack frame of its own.
[[gnu::noinline]] HRESULT C3DStreamCompressor::WriteChunkHeader(ULONG id, ULONG version) {
    ut::sdk::Rewind rewind(*buffer_);
    const int rowsBefore = lastIndex_;
    HRESULT hr = PutChunkHeader(id, version);
    if (SUCCEEDED(hr))
        hr = buffer_->WriteValue(ULONG{0});
    if (SUCCEEDED(hr))
        hr = Push(writeStarts_, buffer_->Position());
    if (FAILED(hr))
        ForgetRowsAfter(rowsBefore); // their definitions are rewound with the rest
    return rewind(hr);
}

void C3DStreamCompressor::ForgetRowsAfter(int lastKept) {
    for (int row = lastKept + 1; row <= lastIndex_; ++row)
        headerTable_[row] = {};
    lastIndex_ = lastKept;
}

// Only running out of memory is reported: a failed header write shows at the chunk's close and
// at the stream's flush, as it does for every other value written.
HRESULT C3DStreamCompressor::ChunkSafeWriteOpen(ULONG id, ULONG version) {
    if (!active_)
        return STG_E_OLDFORMAT;
    ULONG header[3] = {id, version, 0};
    (void)buffer_->WriteValue(header); // see above
    return Push(writeStarts_, buffer_->Position());
}

HRESULT C3DStreamCompressor::ChunkWriteClose() {
    if (!active_)
        return STG_E_OLDFORMAT;
    return ut::sdk::CloseWrittenChunk(*buffer_, writeStarts_);
}

// Most headers refer to a row defined earlier; with the index byte and the size field in the
// window such a chunk opens in one step, with the same outcome as the general path below.
bool C3DStreamCompressor::OpenReferencedChunk(ULONG id, ULONG* version, HRESULT& hr) {
    if (!packHeaders_)
        return false;
    const BYTE* bytes = buffer_->Peek(1 + sizeof(ULONG));
    if (!bytes)
        return false;
    const BYTE index = bytes[0];
    const ULONGLONG start = buffer_->Position();
    const ULONG definedAt = headerPos_[index];
    if (definedAt == 0 || definedAt == static_cast<ULONG>(start + 1) || headerTable_[index].id != id)
        return false; // a definition, or another chunk: the general path decides
    ULONG size = 0;
    std::memcpy(&size, bytes + 1, sizeof size);
    hr = Push(readEnds_, start + 1 + sizeof size + size);
    if (FAILED(hr))
        return true; // nothing consumed yet
    buffer_->Advance(1 + sizeof size);
    if (version)
        *version = headerTable_[index].version;
    return true;
}

HRESULT C3DStreamCompressor::ChunkReadOpen(ULONG id, ULONG* version) {
    if (!active_)
        return STG_E_OLDFORMAT;
    if (HRESULT hr = S_OK; OpenReferencedChunk(id, version, hr))
        return hr;
    return OpenChunkFromHeader(id, version);
}

// Out of line, so that the step above needs no stack frame of its own.
[[gnu::noinline]] HRESULT C3DStreamCompressor::OpenChunkFromHeader(ULONG id, ULONG* version) {
    ut::sdk::Rewind rewind(*buffer_);
    // A header that cannot be read reports an id of its own, so that a reader probing for an
    // optional last chunk is told "another chunk" at the end of the stream too.
    ULONG foundId = 0, foundVersion = 0;
    (void)GetChunkHeader(foundId, foundVersion, true);
    if (foundId != id)
        return rewind(STG_E_INVALIDHEADER);
    ULONG size = 0;
    if (HRESULT hr = buffer_->ReadValue(size); FAILED(hr))
        return rewind(hr);
    if (HRESULT hr = Push(readEnds_, buffer_->Position() + size); FAILED(hr))
        return rewind(hr);
    if (version)
        *version = foundVersion;
    return S_OK;
}

// Reads of the plain header go unchecked: a header cut short reads as zeros, which the id
// comparison and the later reads of the body then refuse.
HRESULT C3DStreamCompressor::ChunkSafeReadOpen(ULONG id, ULONG* version) {
    if (!active_)
        return STG_E_OLDFORMAT;
    ut::sdk::Rewind rewind(*buffer_);
    ULONG foundId = 0, foundVersion = 0, size = 0;
    (void)buffer_->ReadValue(foundId);
    if (foundId != id)
        return rewind(STG_E_INVALIDHEADER);
    (void)buffer_->ReadValue(foundVersion);
    (void)buffer_->ReadValue(size);
    if (HRESULT hr = Push(readEnds_, buffer_->Position() + size); FAILED(hr))
        return rewind(hr);
    if (version)
        *version = foundVersion;
    return S_OK;
}

HRESULT C3DStreamCompressor::ChunkPeekHeader(ULONG* id, ULONG* version) {
    if (!active_)
        return STG_E_OLDFORMAT;
    if (!id)
        return E_POINTER;
    ut::sdk::Rewind rewind(*buffer_);
    ULONG foundId = 0, foundVersion = 0;
    HRESULT hr = GetChunkHeader(foundId, foundVersion, false);
    rewind.Always();
    *id = foundId;
    if (version)
        *version = foundVersion;
    return hr;
}

bool C3DStreamCompressor::ImportingDelta() const {
    ut::ComPtr<IGWAmbientValues> ambient;
    if (FAILED(KXGetAmbientValuesMgr(ambient.Put())) || !ambient)
        return false;
    BOOL importing = FALSE;
    return SUCCEEDED(ambient->GetBool(L"referencing.importingdelta", &importing)) && importing;
}

HRESULT C3DStreamCompressor::ChunkReadClose() {
    if (!active_)
        return STG_E_OLDFORMAT;
    if (readEnds_.empty())
        return E_UNEXPECTED;
    ULONGLONG end = readEnds_.back();
    readEnds_.pop_back();
    // A reader that consumed its chunk exactly is where both rules put it; the ambient value
    // is a host round trip, so it is asked only when the position would change.
    if (buffer_->Position() == end)
        return S_OK;
    // While a delta is imported the reader stays where the object left it.
    if (ImportingDelta())
        return S_OK;
    return buffer_->SetPosition(end);
}

// The header is read, not only stepped over: a definition skipped unread would leave the later
// references to its row unreadable.
HRESULT C3DStreamCompressor::SkipChunk() {
    if (!active_)
        return STG_E_OLDFORMAT;
    ut::sdk::Rewind rewind(*buffer_);
    ULONG id = 0, version = 0;
    HRESULT hr = GetChunkHeader(id, version, true);
    ULONG size = 0;
    if (SUCCEEDED(hr))
        hr = buffer_->ReadValue(size);
    if (SUCCEEDED(hr))
        hr = buffer_->Move(false, size);
    return rewind(hr);
}
