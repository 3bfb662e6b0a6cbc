// CGWStreamHelper: the host's typed reader and writer over an IStream.
//
// On the stream, the same on every home:
// - Int8/UInt8: 1 byte. Int16/UInt16: 2, Int32/UInt32: 4, Int64/UInt64: 8, all little-endian.
//   Float and Double: the 4 and 8 IEEE bytes. Bool (either form): 1 byte, 0 or 1 (any non-zero
//   byte reads as true). TChar: one UTF-16LE code unit (a character beyond U+FFFF answers
//   E_INVALIDARG).
// - GUID: 16 bytes, Data1 (4), Data2 (2), Data3 (2) little-endian, then the 8 bytes of Data4.
// - Strings (ANSI, Unicode, T, GWRO, BSTR, string buffers): UInt32 count, then `count` units:
//   bytes for ANSI strings, UTF-16LE code units for wide ones; no terminator. The count
//   0xFFFFFFFF stands for a null string, which reads back as an empty one with S_FALSE (a null
//   BSTR for GetBSTR). Wide text is UTF-16 on the stream whatever the width of wchar_t.
// - Byte and double arrays: UInt32 count, then the elements.
// - SAFEARRAY: UInt16 element type, UInt16 dimension count (0 for a null array, at most 64),
//   then for each dimension from the first: UInt32 element count, Int32 lower bound; then the
//   elements in memory order, each as its VARIANT payload below.
// - VARIANT: UInt16 type, then the payload: none for VT_EMPTY and VT_NULL; the raw little-endian
//   bytes of the value for the numbers, VT_BOOL (2 bytes), VT_ERROR, VT_CY and VT_DATE; a string
//   for VT_BSTR; 16 GUID bytes for GW_VT_GUID; a SAFEARRAY without its element type for
//   VT_ARRAY|type (the type is in the VARIANT's). Inside arrays of VT_VARIANT each element is a
//   whole VARIANT, nested at most 8 deep. Interfaces, references and decimals are not stored:
//   DISP_E_BADVARTYPE.
// - Chunk: UInt32 id, UInt32 version, UInt32 size of the body (the bytes after the size
//   field), patched when the chunk is closed.
//
// Reading: a Get that fails consumes nothing. A stream that ends early answers STG_E_READFAULT;
// a string or array that does not fit the caller's buffer answers
// HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER) and is left on the stream (for arrays the stored
// count is still reported). ChunkReadOpen with another id than the next chunk's answers
// STG_E_INVALIDHEADER with the stream where it was.
#pragma once

#include <memory>
#include <vector>

#include <ut/platform/stream.h>
#include <ut/platform/variant.h>
#include <ut/sdk/detail/stream_buffer.h>
#include <ut/sdk/export.h>

enum STMHELPERDIR : ULONG { STMHELPER_FORWARD = 0, STMHELPER_BACKWARD = 1 };

// Streams that answer this interface ask the helpers built over them to count the chunks they
// open and close the ones left open ({9E61BBF4-654D-11D3-80F2-00A0C9AC19A9}).
inline constexpr IID IID_IGWChunkCountingStream = {
    0x9E61BBF4, 0x654D, 0x11D3, {0x80, 0xF2, 0x00, 0xA0, 0xC9, 0xAC, 0x19, 0xA9}};

// {531DFCF0-984A-11D1-8846-00A024EE6238}: what a stream can do, asked by number.
inline constexpr IID IID_IGWStreamCapabilities = {
    0x531DFCF0, 0x984A, 0x11D1, {0x88, 0x46, 0x00, 0xA0, 0x24, 0xEE, 0x62, 0x38}};

struct IGWStreamCapabilities : IUnknown {
    // Non-zero when the stream has the capability. Capability 2: chunks opened for reading
    // may be counted and closed by the helper.
    virtual BOOL STDMETHODCALLTYPE HasCapability(ULONG capability) = 0;

protected:
    ~IGWStreamCapabilities() = default;
};

template <>
struct ut::InterfaceId<IGWStreamCapabilities> : ut::Iid<IID_IGWStreamCapabilities> {};

class UT_SDK_API CGWStreamHelper {
public:
    // Borrows `stream`; the caller keeps it alive for the helper's lifetime.
    explicit CGWStreamHelper(IStream* stream);
    virtual ~CGWStreamHelper();
    CGWStreamHelper(const CGWStreamHelper&) = delete;
    CGWStreamHelper& operator=(const CGWStreamHelper&) = delete;

    virtual HRESULT PutInt8(signed char value);
    virtual HRESULT PutUInt8(BYTE value);
    virtual HRESULT PutTChar(wchar_t value);
    virtual HRESULT PutInt16(SHORT value);
    virtual HRESULT PutUInt16(USHORT value);
    virtual HRESULT PutInt32(LONG value);
    virtual HRESULT PutUInt32(ULONG value);
    virtual HRESULT PutInt64(LONGLONG value);
    virtual HRESULT PutInt64(const LARGE_INTEGER& value);
    virtual HRESULT PutUInt64(ULONGLONG value);
    virtual HRESULT PutUInt64(const ULARGE_INTEGER& value);
    virtual HRESULT PutBool(bool value);
    virtual HRESULT PutBool(int value);
    virtual HRESULT PutFloat(float value);
    virtual HRESULT PutDouble(double value);
    // A negative length measures up to the terminator.
    virtual HRESULT PutAnsiString(const char* text, LONG length = -1);
    virtual HRESULT PutUnicodeString(const wchar_t* text, LONG length = -1);
    virtual HRESULT PutBSTR(BSTR text);
    virtual HRESULT PutTString(const wchar_t* text);
    virtual HRESULT PutGWROString(const wchar_t* text);
    virtual HRESULT PutGUID(const GUID& value);
    virtual HRESULT PutVARIANT(const VARIANT& value);
    virtual HRESULT PutSAFEARRAY(SAFEARRAY* array);
    virtual HRESULT PutByteArray(const char* data, ULONG count);
    virtual HRESULT PutUByteArray(const BYTE* data, ULONG count);
    virtual HRESULT PutDoubleArray(const double* data, ULONG count);

    virtual HRESULT GetInt8(signed char& value);
    virtual HRESULT GetUInt8(BYTE& value);
    virtual HRESULT GetTChar(wchar_t& value);
    virtual HRESULT GetInt16(SHORT& value);
    virtual HRESULT GetUInt16(USHORT& value);
    virtual HRESULT GetInt32(LONG& value);
    virtual HRESULT GetUInt32(ULONG& value);
    virtual HRESULT GetInt64(LONGLONG& value);
    virtual HRESULT GetInt64(LARGE_INTEGER& value);
    virtual HRESULT GetUInt64(ULONGLONG& value);
    virtual HRESULT GetUInt64(ULARGE_INTEGER& value);
    virtual HRESULT GetBool(bool& value);
    virtual HRESULT GetBool(int& value);
    virtual HRESULT GetFloat(float& value);
    virtual HRESULT GetDouble(double& value);
    // `capacity` counts characters with the terminator.
    virtual HRESULT GetAnsiString(char* buffer, LONG capacity);
    virtual HRESULT GetUnicodeString(wchar_t* buffer, LONG capacity);
    virtual HRESULT GetBSTR(BSTR* text);
    virtual HRESULT GetTString(wchar_t* buffer, LONG capacity);
    // Hands out a task-allocated copy (null for a null string).
    virtual HRESULT GetGWROString(wchar_t** text);
    virtual HRESULT GetGUID(GUID& value);
    // `value` must be empty or cleared; a GUID comes back as GW_VT_GUID (free with GWVariantClear).
    virtual HRESULT GetVARIANT(VARIANT* value);
    virtual HRESULT GetSAFEARRAY(SAFEARRAY** array);
    virtual HRESULT GetByteArray(char* buffer, ULONG capacity, ULONG* count);
    virtual HRESULT GetUByteArray(BYTE* buffer, ULONG capacity, ULONG* count);
    virtual HRESULT GetDoubleArray(double* buffer, ULONG capacity, ULONG* count);
    // The length in wchar_t of the next string, without consuming it (0 for a null string).
    virtual HRESULT GetStringLength(ULONG* length);

    virtual HRESULT SkipInt8();
    virtual HRESULT SkipUInt8();
    virtual HRESULT SkipTChar();
    virtual HRESULT SkipInt16();
    virtual HRESULT SkipUInt16();
    virtual HRESULT SkipInt32();
    virtual HRESULT SkipUInt32();
    virtual HRESULT SkipBool();
    virtual HRESULT SkipFloat();
    virtual HRESULT SkipDouble();
    virtual HRESULT SkipAnsiString();
    virtual HRESULT SkipUnicodeString();
    virtual HRESULT SkipBSTR();
    virtual HRESULT SkipChunk();

    // The id and version of the next chunk, without consuming it. `version` may be null.
    virtual HRESULT ChunkPeekHeader(ULONG* id, ULONG* version);
    // The name and GUID forms map to the numeric id (ut::sdk::ChunkIdFromName, GUID Data1) and
    // go on through the numeric form.
    virtual HRESULT ChunkWriteOpen(const char* name, ULONG version);
    virtual HRESULT ChunkWriteOpen(const GUID& id, ULONG version);
    virtual HRESULT ChunkWriteOpen(ULONG id, ULONG version);
    virtual HRESULT ChunkWriteClose();
    virtual HRESULT ChunkReadOpen(const char* name, ULONG* version);
    virtual HRESULT ChunkReadOpen(const GUID& id, ULONG* version);
    virtual HRESULT ChunkReadOpen(ULONG id, ULONG* version);
    // Leaves the stream at the chunk's end, whatever was read of it.
    virtual HRESULT ChunkReadClose();

    virtual HRESULT GetPos(ULONG* position);
    virtual HRESULT MovePos(STMHELPERDIR direction, ULONG count);
    // Counts the bytes written from here on; PrintPutCounterResult reports them on the error
    // output under `label`.
    virtual HRESULT InitPutCounter();
    virtual HRESULT PrintPutCounterResult(const wchar_t* label);
    // A wide string of exactly `count` characters (embedded nulls kept), framed as a string.
    virtual HRESULT PutUnicodeStringBuffer(const wchar_t* buffer, ULONG count);
    // Reads such a string into `buffer` without a terminator; `count` receives its length.
    virtual HRESULT GetUnicodeStringBuffer(wchar_t* buffer, ULONG capacity, ULONG* count);

    // Writes pending bytes to the stream. The helper flushes when it goes; call this to look at
    // the stream while the helper lives.
    HRESULT Flush() { return buffer_->Sync(); }
    // The byte window this helper reads and writes through (shared with every helper on the
    // same buffered stream).
    ut::sdk::StreamBuffer& Buffer() { return *buffer_; }

private:
    HRESULT PutWide(const wchar_t* text, std::size_t length);
    // Reads a wide string; a null one gives `isNull`. Consumes nothing on failure.
    HRESULT ReadWide(std::wstring& text, bool& isNull);
    HRESULT ReadAnsi(std::string& text, bool& isNull);
    HRESULT ReadCount(ULONG& count, ULONGLONG unitBytes);
    HRESULT SkipCounted(ULONGLONG unitBytes);
    template <class T>
    HRESULT PutArray(const T* data, ULONG count);
    template <class T>
    HRESULT GetArray(T* buffer, ULONG capacity, ULONG* count);
    HRESULT PutArrayBody(SAFEARRAY* array, VARTYPE type, int depth);
    HRESULT GetArrayBody(SAFEARRAY** array, VARTYPE type, int depth);
    HRESULT PutVariantAt(const VARIANT& value, int depth);
    HRESULT GetVariantAt(VARIANT* value, int depth);
    HRESULT ReadChunkHeader(ULONG& id, ULONG& version, ULONG& size);

    ut::ComPtr<IGWStreamBufferSource> sharedBuffer_;
    std::unique_ptr<ut::sdk::StreamBuffer> ownBuffer_;
    ut::sdk::StreamBuffer* buffer_ = nullptr;
    std::vector<ULONGLONG> writeStarts_;
    std::vector<ULONGLONG> readEnds_;
    ULONGLONG counterStart_ = 0;
};
