// CGWStreamHelper: the fixed-width, string, array and chunk encodings of the base helper.
#include <cstdlib>
#include <cstring>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/platform/text.h>
#include <ut/sdk/stream_helper.h>

namespace {

using ut::sdk::Rewind;

constexpr ULONG kNullString = 0xFFFFFFFF;
const HRESULT kBufferTooSmall = HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER);
// Longest string encoded in place in the window (four bytes a character at most).
constexpr std::size_t kMaxInPlaceCharacters = 4096;

struct ChunkHeader {
    ULONG id;
    ULONG version;
    ULONG size;
};
static_assert(sizeof(ChunkHeader) == 12);

std::size_t MeasureWide(const wchar_t* text, LONG length) {
    return length >= 0 ? static_cast<std::size_t>(length) : std::char_traits<wchar_t>::length(text);
}

HRESULT ReadStringUnits(ut::sdk::StreamBuffer& buffer, ULONG& units) {
    Rewind rewind(buffer);
    HRESULT hr = buffer.ReadValue(units);
    if (SUCCEEDED(hr) && units != kNullString)
        hr = buffer.EnsureReadable(ULONGLONG{units} * 2);
    return rewind(hr);
}

HRESULT ReadUtf16Units(ut::sdk::StreamBuffer& buffer, ULONG units, wchar_t* out, std::size_t& characters) {
    const ULONG bytes = units * 2; // below 2^32: EnsureReadable saw them inside the stream
    if (const BYTE* window = buffer.Peek(bytes)) {
        characters = ut::platform::DecodeUtf16Le(window, units, out);
        buffer.Advance(bytes);
        return S_OK;
    }
    std::string spill(bytes, '\0');
    if (HRESULT hr = buffer.Read(spill.data(), bytes); FAILED(hr))
        return hr;
    characters = ut::platform::DecodeUtf16Le(reinterpret_cast<const std::uint8_t*>(spill.data()), units, out);
    return S_OK;
}

// Reads a wide string (its count, then its code units) into the memory that `allocate(units)`
// answers (room for `units` characters, or null), and tells `finish` how many characters it
// holds. A null string allocates nothing. Consumes nothing on failure.
template <class Allocate, class Finish>
HRESULT ReadWideString(ut::sdk::StreamBuffer& buffer, bool& isNull, Allocate allocate, Finish finish) {
    Rewind rewind(buffer);
    ULONG units = 0;
    HRESULT hr = ReadStringUnits(buffer, units);
    isNull = SUCCEEDED(hr) && units == kNullString;
    if (FAILED(hr) || isNull)
        return hr;
    wchar_t* out = allocate(units);
    if (!out)
        return rewind(E_OUTOFMEMORY);
    std::size_t characters = 0;
    hr = ReadUtf16Units(buffer, units, out, characters);
    if (SUCCEEDED(hr))
        finish(characters);
    return rewind(hr);
}

} // namespace

namespace ut::sdk {

ULONG ChunkIdFromName(const char* name) {
    if (!name)
        return 0;
    // Each character is widened as a signed value before it is combined, on purpose: ids of
    // names with bytes of 0x80 and above were always built this way.
    LONG id = 0;
    for (int i = 0; i < 4; ++i)
        id |= static_cast<LONG>(static_cast<signed char>(name[i])) * (1 << (8 * i));
    return static_cast<ULONG>(id);
}

HRESULT ReadWideText(StreamBuffer& buffer, std::wstring& text) {
    text.clear();
    bool isNull = false;
    HRESULT hr = ReadWideString(
        buffer, isNull,
        [&text](std::size_t units) {
            return ut::ExportBoundary(
                [&] {
                    text.resize(units);
                    return text.data();
                },
                static_cast<wchar_t*>(nullptr)); // no room: E_OUTOFMEMORY, nothing consumed
        },
        [&text](std::size_t characters) { text.resize(characters); });
    return SUCCEEDED(hr) && isNull ? S_FALSE : hr;
}

HRESULT CloseWrittenChunk(StreamBuffer& buffer, std::vector<ULONGLONG>& bodyStarts) {
    if (bodyStarts.empty())
        return E_UNEXPECTED;
    ULONGLONG start = bodyStarts.back();
    bodyStarts.pop_back();
    ULONGLONG end = buffer.Position();
    if (end < start)
        return E_UNEXPECTED;
    if (end == start)
        return S_OK;
    const auto size = static_cast<ULONG>(end - start);
    if (buffer.Overwrite(start - sizeof size, &size, sizeof size))
        return S_OK;
    if (HRESULT hr = buffer.SetPosition(start - sizeof size); FAILED(hr))
        return hr;
    if (HRESULT hr = buffer.WriteValue(size); FAILED(hr))
        return hr;
    return buffer.SetPosition(end);
}

} // namespace ut::sdk

CGWStreamHelper::CGWStreamHelper(IStream* stream) {
    if (stream && SUCCEEDED(stream->QueryInterface(IID_IGWStreamBufferSource, sharedBuffer_.PutVoid())) &&
        sharedBuffer_) {
        buffer_ = sharedBuffer_->GetStreamBuffer();
        return;
    }
    sharedBuffer_.Reset();
    ownBuffer_ = std::make_unique<ut::sdk::StreamBuffer>(stream);
    buffer_ = ownBuffer_.get();
}

CGWStreamHelper::~CGWStreamHelper() = default;

// Fixed-width values.

HRESULT CGWStreamHelper::PutInt8(signed char value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutUInt8(BYTE value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutInt16(SHORT value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutUInt16(USHORT value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutInt32(LONG value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutUInt32(ULONG value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutInt64(LONGLONG value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutInt64(const LARGE_INTEGER& value) {
    return buffer_->WriteValue(value.QuadPart);
}
HRESULT CGWStreamHelper::PutUInt64(ULONGLONG value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutUInt64(const ULARGE_INTEGER& value) {
    return buffer_->WriteValue(value.QuadPart);
}
HRESULT CGWStreamHelper::PutBool(bool value) {
    return buffer_->WriteValue(static_cast<BYTE>(value ? 1 : 0));
}
HRESULT CGWStreamHelper::PutBool(int value) {
    return PutBool(value != 0);
}
HRESULT CGWStreamHelper::PutFloat(float value) {
    return buffer_->WriteValue(value);
}
HRESULT CGWStreamHelper::PutDouble(double value) {
    return buffer_->WriteValue(value);
}

HRESULT CGWStreamHelper::PutTChar(wchar_t value) {
    if ((static_cast<ULONG>(value) >> 16) != 0) // only where wchar_t is wider than a code unit
        return E_INVALIDARG;
    return buffer_->WriteValue(static_cast<USHORT>(value));
}

HRESULT CGWStreamHelper::GetInt8(signed char& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetUInt8(BYTE& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetInt16(SHORT& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetUInt16(USHORT& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetInt32(LONG& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetUInt32(ULONG& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetInt64(LONGLONG& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetInt64(LARGE_INTEGER& value) {
    return buffer_->ReadValue(value.QuadPart);
}
HRESULT CGWStreamHelper::GetUInt64(ULONGLONG& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetUInt64(ULARGE_INTEGER& value) {
    return buffer_->ReadValue(value.QuadPart);
}
HRESULT CGWStreamHelper::GetFloat(float& value) {
    return buffer_->ReadValue(value);
}
HRESULT CGWStreamHelper::GetDouble(double& value) {
    return buffer_->ReadValue(value);
}

HRESULT CGWStreamHelper::GetTChar(wchar_t& value) {
    USHORT unit = 0;
    HRESULT hr = buffer_->ReadValue(unit);
    if (SUCCEEDED(hr))
        value = static_cast<wchar_t>(unit);
    return hr;
}

HRESULT CGWStreamHelper::GetBool(bool& value) {
    BYTE stored = 0;
    HRESULT hr = buffer_->ReadValue(stored);
    if (SUCCEEDED(hr))
        value = stored != 0;
    return hr;
}

HRESULT CGWStreamHelper::GetBool(int& value) {
    bool stored = false;
    HRESULT hr = GetBool(stored);
    if (SUCCEEDED(hr))
        value = stored ? 1 : 0;
    return hr;
}

HRESULT CGWStreamHelper::SkipInt8() {
    return buffer_->Move(false, 1);
}
HRESULT CGWStreamHelper::SkipUInt8() {
    return buffer_->Move(false, 1);
}
HRESULT CGWStreamHelper::SkipTChar() {
    return buffer_->Move(false, 2);
}
HRESULT CGWStreamHelper::SkipInt16() {
    return buffer_->Move(false, 2);
}
HRESULT CGWStreamHelper::SkipUInt16() {
    return buffer_->Move(false, 2);
}
HRESULT CGWStreamHelper::SkipInt32() {
    return buffer_->Move(false, 4);
}
HRESULT CGWStreamHelper::SkipUInt32() {
    return buffer_->Move(false, 4);
}
HRESULT CGWStreamHelper::SkipBool() {
    return buffer_->Move(false, 1);
}
HRESULT CGWStreamHelper::SkipFloat() {
    return buffer_->Move(false, 4);
}
HRESULT CGWStreamHelper::SkipDouble() {
    return buffer_->Move(false, 8);
}

// Strings.

HRESULT CGWStreamHelper::ReadCount(ULONG& count, ULONGLONG unitBytes) {
    Rewind rewind(*buffer_);
    HRESULT hr = buffer_->ReadValue(count);
    if (SUCCEEDED(hr) && count != kNullString)
        hr = buffer_->EnsureReadable(count * unitBytes);
    return rewind(hr);
}

HRESULT CGWStreamHelper::SkipCounted(ULONGLONG unitBytes) {
    ULONG count = 0;
    HRESULT hr = ReadCount(count, unitBytes);
    if (FAILED(hr) || count == kNullString)
        return hr;
    return buffer_->Move(false, static_cast<ULONG>(count * unitBytes));
}

HRESULT CGWStreamHelper::PutWide(const wchar_t* text, std::size_t length) {
    if (!text)
        return buffer_->WriteValue(kNullString);
    const std::wstring_view view(text, length);
    // Encoded straight into the window when it has room for the longest encoding (two units a
    // character), which spares building the bytes apart and copying them.
    if (length < kMaxInPlaceCharacters) {
        const auto room = static_cast<ULONG>(sizeof(ULONG) + 4 * length);
        if (BYTE* out = buffer_->Reserve(room)) {
            auto units = static_cast<ULONG>(ut::platform::WriteUtf16Le(view, out + sizeof(ULONG)));
            std::memcpy(out, &units, sizeof units);
            buffer_->Commit(static_cast<ULONG>(sizeof(ULONG) + 2 * units));
            return S_OK;
        }
    }
    std::string bytes;
    ut::platform::AppendUtf16Le(view, bytes);
    if (bytes.size() / 2 >= kNullString)
        return E_INVALIDARG;
    Rewind rewind(*buffer_);
    HRESULT hr = buffer_->WriteValue(static_cast<ULONG>(bytes.size() / 2));
    if (SUCCEEDED(hr))
        hr = buffer_->Write(bytes.data(), static_cast<ULONG>(bytes.size()));
    return rewind(hr);
}

HRESULT CGWStreamHelper::ReadWide(std::wstring& text, bool& isNull) {
    HRESULT hr = ut::sdk::ReadWideText(*buffer_, text);
    isNull = hr == S_FALSE;
    return isNull ? S_OK : hr;
}

HRESULT CGWStreamHelper::ReadAnsi(std::string& text, bool& isNull) {
    Rewind rewind(*buffer_);
    ULONG count = 0;
    HRESULT hr = ReadCount(count, 1);
    isNull = SUCCEEDED(hr) && count == kNullString;
    text.clear();
    if (FAILED(hr) || isNull)
        return hr;
    text.resize(count);
    return rewind(buffer_->Read(text.data(), count));
}

HRESULT CGWStreamHelper::PutAnsiString(const char* text, LONG length) {
    if (!text)
        return buffer_->WriteValue(kNullString);
    ULONG count = length >= 0 ? static_cast<ULONG>(length) : static_cast<ULONG>(std::strlen(text));
    Rewind rewind(*buffer_);
    HRESULT hr = buffer_->WriteValue(count);
    if (SUCCEEDED(hr))
        hr = buffer_->Write(text, count);
    return rewind(hr);
}

HRESULT CGWStreamHelper::PutUnicodeString(const wchar_t* text, LONG length) {
    return PutWide(text, text ? MeasureWide(text, length) : 0);
}

HRESULT CGWStreamHelper::PutBSTR(BSTR text) {
    return PutWide(text, SysStringLen(text));
}
HRESULT CGWStreamHelper::PutTString(const wchar_t* text) {
    return PutUnicodeString(text, -1);
}
HRESULT CGWStreamHelper::PutGWROString(const wchar_t* text) {
    return PutUnicodeString(text, -1);
}

HRESULT CGWStreamHelper::PutUnicodeStringBuffer(const wchar_t* buffer, ULONG count) {
    if (!buffer && count)
        return E_POINTER;
    return PutWide(buffer ? buffer : L"", count);
}

HRESULT CGWStreamHelper::GetAnsiString(char* buffer, LONG capacity) {
    if (!buffer)
        return E_POINTER;
    Rewind rewind(*buffer_);
    std::string text;
    bool isNull = false;
    HRESULT hr = ReadAnsi(text, isNull);
    if (FAILED(hr))
        return hr;
    if (capacity < 1 || text.size() >= static_cast<ULONG>(capacity))
        return rewind(kBufferTooSmall);
    std::memcpy(buffer, text.c_str(), text.size() + 1);
    return isNull ? S_FALSE : S_OK;
}

HRESULT CGWStreamHelper::GetUnicodeString(wchar_t* buffer, LONG capacity) {
    if (!buffer)
        return E_POINTER;
    Rewind rewind(*buffer_);
    std::wstring text;
    bool isNull = false;
    HRESULT hr = ReadWide(text, isNull);
    if (FAILED(hr))
        return hr;
    if (capacity < 1 || text.size() >= static_cast<ULONG>(capacity))
        return rewind(kBufferTooSmall);
    std::memcpy(buffer, text.c_str(), (text.size() + 1) * sizeof(wchar_t));
    return isNull ? S_FALSE : S_OK;
}

HRESULT CGWStreamHelper::GetTString(wchar_t* buffer, LONG capacity) {
    return GetUnicodeString(buffer, capacity);
}

HRESULT CGWStreamHelper::GetBSTR(BSTR* text) {
    if (!text)
        return E_POINTER;
    *text = nullptr;
    Rewind rewind(*buffer_);
    std::wstring read;
    bool isNull = false;
    HRESULT hr = ReadWide(read, isNull);
    if (FAILED(hr) || isNull)
        return hr;
    *text = SysAllocStringLen(read.data(), static_cast<UINT>(read.size()));
    return *text ? S_OK : rewind(E_OUTOFMEMORY);
}

HRESULT CGWStreamHelper::GetGWROString(wchar_t** text) {
    if (!text)
        return E_POINTER;
    *text = nullptr;
    Rewind rewind(*buffer_);
    std::wstring read;
    bool isNull = false;
    HRESULT hr = ReadWide(read, isNull);
    if (FAILED(hr))
        return hr;
    if (isNull)
        return S_FALSE;
    std::size_t bytes = (read.size() + 1) * sizeof(wchar_t);
    *text = static_cast<wchar_t*>(CoTaskMemAlloc(bytes));
    if (!*text)
        return rewind(E_OUTOFMEMORY);
    std::memcpy(*text, read.c_str(), bytes);
    return S_OK;
}

HRESULT CGWStreamHelper::GetUnicodeStringBuffer(wchar_t* buffer, ULONG capacity, ULONG* count) {
    if (!count || (!buffer && capacity))
        return E_POINTER;
    Rewind rewind(*buffer_);
    std::wstring text;
    bool isNull = false;
    HRESULT hr = ReadWide(text, isNull);
    if (FAILED(hr))
        return hr;
    *count = static_cast<ULONG>(text.size());
    if (text.size() > capacity)
        return rewind(kBufferTooSmall);
    std::memcpy(buffer, text.data(), text.size() * sizeof(wchar_t));
    return isNull ? S_FALSE : S_OK;
}

HRESULT CGWStreamHelper::GetStringLength(ULONG* length) {
    if (!length)
        return E_POINTER;
    Rewind rewind(*buffer_);
    std::wstring text;
    bool isNull = false;
    HRESULT hr = ReadWide(text, isNull);
    if (SUCCEEDED(hr))
        *length = static_cast<ULONG>(text.size());
    rewind.Always();
    return hr;
}

HRESULT CGWStreamHelper::SkipAnsiString() {
    return SkipCounted(1);
}
HRESULT CGWStreamHelper::SkipUnicodeString() {
    return SkipCounted(2);
}
HRESULT CGWStreamHelper::SkipBSTR() {
    return SkipCounted(2);
}

// GUIDs and arrays.

HRESULT CGWStreamHelper::PutGUID(const GUID& value) {
    static_assert(sizeof(GUID) == 16);
    return buffer_->WriteValue(value);
}

HRESULT CGWStreamHelper::GetGUID(GUID& value) {
    return buffer_->ReadValue(value);
}

template <class T>
HRESULT CGWStreamHelper::PutArray(const T* data, ULONG count) {
    if (!data && count)
        return E_POINTER;
    ULONGLONG bytes = static_cast<ULONGLONG>(count) * sizeof(T);
    if (bytes > ut::sdk::StreamBuffer::kMaxPosition)
        return STG_E_MEDIUMFULL;
    Rewind rewind(*buffer_);
    HRESULT hr = buffer_->WriteValue(count);
    if (SUCCEEDED(hr))
        hr = buffer_->Write(data, static_cast<ULONG>(bytes));
    return rewind(hr);
}

template <class T>
HRESULT CGWStreamHelper::GetArray(T* buffer, ULONG capacity, ULONG* count) {
    if (!count || (!buffer && capacity))
        return E_POINTER;
    Rewind rewind(*buffer_);
    ULONG stored = 0;
    HRESULT hr = buffer_->ReadValue(stored);
    if (FAILED(hr))
        return hr;
    *count = stored;
    if (stored > capacity)
        return rewind(kBufferTooSmall);
    return rewind(buffer_->Read(buffer, static_cast<ULONG>(stored * sizeof(T))));
}

HRESULT CGWStreamHelper::PutByteArray(const char* data, ULONG count) {
    return PutArray(data, count);
}
HRESULT CGWStreamHelper::PutUByteArray(const BYTE* data, ULONG count) {
    return PutArray(data, count);
}
HRESULT CGWStreamHelper::PutDoubleArray(const double* data, ULONG count) {
    return PutArray(data, count);
}

HRESULT CGWStreamHelper::GetByteArray(char* buffer, ULONG capacity, ULONG* count) {
    return GetArray(buffer, capacity, count);
}
HRESULT CGWStreamHelper::GetUByteArray(BYTE* buffer, ULONG capacity, ULONG* count) {
    return GetArray(buffer, capacity, count);
}
HRESULT CGWStreamHelper::GetDoubleArray(double* buffer, ULONG capacity, ULONG* count) {
    return GetArray(buffer, capacity, count);
}

// Chunks.

HRESULT CGWStreamHelper::ReadChunkHeader(ULONG& id, ULONG& version, ULONG& size) {
    ChunkHeader header{};
    HRESULT hr = buffer_->ReadValue(header);
    if (FAILED(hr))
        return hr;
    id = header.id;
    version = header.version;
    size = header.size;
    return S_OK;
}

HRESULT CGWStreamHelper::ChunkWriteOpen(const char* name, ULONG version) {
    return ChunkWriteOpen(ut::sdk::ChunkIdFromName(name), version);
}

HRESULT CGWStreamHelper::ChunkWriteOpen(const GUID& id, ULONG version) {
    return ChunkWriteOpen(id.Data1, version);
}

HRESULT CGWStreamHelper::ChunkWriteOpen(ULONG id, ULONG version) {
    if (HRESULT hr = ut::ExportBoundary([&] {
            writeStarts_.reserve(writeStarts_.size() + 1);
            return S_OK;
        });
        FAILED(hr))
        return hr;
    if (HRESULT hr = buffer_->WriteValue(ChunkHeader{id, version, 0}); FAILED(hr))
        return hr;
    writeStarts_.push_back(buffer_->Position());
    return S_OK;
}

HRESULT CGWStreamHelper::ChunkWriteClose() {
    return ut::sdk::CloseWrittenChunk(*buffer_, writeStarts_);
}

HRESULT CGWStreamHelper::ChunkReadOpen(const char* name, ULONG* version) {
    return ChunkReadOpen(ut::sdk::ChunkIdFromName(name), version);
}

HRESULT CGWStreamHelper::ChunkReadOpen(const GUID& id, ULONG* version) {
    return ChunkReadOpen(id.Data1, version);
}

HRESULT CGWStreamHelper::ChunkReadOpen(ULONG id, ULONG* version) {
    Rewind rewind(*buffer_);
    ULONG storedId = 0, storedVersion = 0, size = 0;
    if (HRESULT hr = ReadChunkHeader(storedId, storedVersion, size); FAILED(hr))
        return hr;
    if (storedId != id)
        return rewind(STG_E_INVALIDHEADER);
    if (HRESULT hr = ut::ExportBoundary([&] {
            readEnds_.push_back(buffer_->Position() + size);
            return S_OK;
        });
        FAILED(hr))
        return rewind(hr);
    if (version)
        *version = storedVersion;
    return S_OK;
}

HRESULT CGWStreamHelper::ChunkReadClose() {
    if (readEnds_.empty())
        return E_UNEXPECTED;
    ULONGLONG end = readEnds_.back();
    readEnds_.pop_back();
    return buffer_->SetPosition(end);
}

HRESULT CGWStreamHelper::SkipChunk() {
    Rewind rewind(*buffer_);
    ULONG id = 0, version = 0, size = 0;
    if (HRESULT hr = ReadChunkHeader(id, version, size); FAILED(hr))
        return hr;
    return rewind(buffer_->Move(false, size));
}

HRESULT CGWStreamHelper::ChunkPeekHeader(ULONG* id, ULONG* version) {
    if (!id)
        return E_POINTER;
    Rewind rewind(*buffer_);
    ULONG header[2] = {};
    HRESULT hr = buffer_->ReadValue(header);
    rewind.Always();
    if (FAILED(hr))
        return hr;
    *id = header[0];
    if (version)
        *version = header[1];
    return S_OK;
}

// Positions.

HRESULT CGWStreamHelper::GetPos(ULONG* position) {
    if (!position)
        return E_POINTER;
    *position = static_cast<ULONG>(buffer_->Position());
    return S_OK;
}

HRESULT CGWStreamHelper::MovePos(STMHELPERDIR direction, ULONG count) {
    if (direction != STMHELPER_FORWARD && direction != STMHELPER_BACKWARD)
        return E_INVALIDARG;
    return buffer_->Move(direction == STMHELPER_BACKWARD, count);
}

HRESULT CGWStreamHelper::InitPutCounter() {
    counterStart_ = buffer_->Position();
    return S_OK;
}

HRESULT CGWStreamHelper::PrintPutCounterResult(const wchar_t* label) {
    ULONGLONG position = buffer_->Position();
    ULONGLONG written = position >= counterStart_ ? position - counterStart_ : 0;
    ut::platform::ReportError(std::wstring(label ? label : L"stream") + L": " + std::to_wstring(written) +
                              L" bytes written");
    return S_OK;
}
