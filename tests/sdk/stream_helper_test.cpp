// CGWStreamHelper: the host encodings byte for byte, failures that consume nothing, and a
// buffer that keeps positions exact across its window and between helpers sharing it.
#include <algorithm>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/platform/stream.h>
#include <ut/platform/text.h>
#include <ut/sdk/stream_helper.h>
#include <ut/sdk/variant.h>

#include "support/streams.h"

namespace {

using ut::ComPtr;
using ut::test::Bytes;
using ut::test::BytesOf;
using ut::test::PositionOf;
using ut::test::StreamOf;

Bytes Written(const std::function<void(CGWStreamHelper&)>& write) {
    ComPtr<IStream> stream = StreamOf();
    {
        CGWStreamHelper helper(stream.Get());
        write(helper);
    }
    return BytesOf(stream.Get());
}

TEST(StreamHelperEncoding, FixedWidthValuesAreTheirLittleEndianBytes) {
    struct Case {
        const char* what;
        std::function<HRESULT(CGWStreamHelper&)> put;
        Bytes bytes;
    };
    // clang-format off
    const Case cases[] = {
        {"Int8", [](CGWStreamHelper& h) { return h.PutInt8(-2); }, {0xFE}},
        {"UInt16", [](CGWStreamHelper& h) { return h.PutUInt16(0x1234); }, {0x34, 0x12}},
        {"Int32", [](CGWStreamHelper& h) { return h.PutInt32(-2); }, {0xFE, 0xFF, 0xFF, 0xFF}},
        {"UInt64", [](CGWStreamHelper& h) { return h.PutUInt64(0x0102030405060708ull); }, {8, 7, 6, 5, 4, 3, 2, 1}},
        {"Int64 as LARGE_INTEGER", [](CGWStreamHelper& h) { LARGE_INTEGER v; v.QuadPart = -1; return h.PutInt64(v); },
         Bytes(8, 0xFF)},
        {"bool", [](CGWStreamHelper& h) { return h.PutBool(true); }, {0x01}},
        {"BOOL", [](CGWStreamHelper& h) { return h.PutBool(7); }, {0x01}},
        {"float", [](CGWStreamHelper& h) { return h.PutFloat(0.5f); }, {0, 0, 0, 0x3F}},
        {"double", [](CGWStreamHelper& h) { return h.PutDouble(-2.0); }, {0, 0, 0, 0, 0, 0, 0, 0xC0}},
        {"TChar", [](CGWStreamHelper& h) { return h.PutTChar(L'\u00E9'); }, {0xE9, 0x00}},
        {"GUID", [](CGWStreamHelper& h) { return h.PutGUID({0x01020304, 0x0506, 0x0708, {9, 10, 11, 12, 13, 14, 15, 16}}); },
         {4, 3, 2, 1, 6, 5, 8, 7, 9, 10, 11, 12, 13, 14, 15, 16}},
    };
    // clang-format on
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        EXPECT_EQ(Written([&](CGWStreamHelper& h) { EXPECT_EQ(c.put(h), S_OK); }), c.bytes);
    }
}

TEST(StreamHelperEncoding, WideTextIsUtf16OnTheStream) {
    const wchar_t text[] = L"A\u00E9\U0001F600";
    Bytes expected = {4, 0, 0, 0, 'A', 0, 0xE9, 0, 0x3D, 0xD8, 0x00, 0xDE};
    EXPECT_EQ(Written([&](CGWStreamHelper& h) { h.PutUnicodeString(text); }), expected);
    EXPECT_EQ(Written([&](CGWStreamHelper& h) { h.PutTString(text); }), expected);
    EXPECT_EQ(Written([](CGWStreamHelper& h) { h.PutUnicodeString(nullptr); }),
              (Bytes{0xFF, 0xFF, 0xFF, 0xFF}));
    EXPECT_EQ(Written([](CGWStreamHelper& h) { h.PutAnsiString("ab"); }), (Bytes{2, 0, 0, 0, 'a', 'b'}));

    ComPtr<IStream> stream = StreamOf(expected);
    CGWStreamHelper h(stream.Get());
    ULONG length = 0;
    ASSERT_EQ(h.GetStringLength(&length), S_OK);
    EXPECT_EQ(length, std::wcslen(text)) << "counted in wchar_t, without consuming";
    wchar_t small[3];
    EXPECT_EQ(h.GetUnicodeString(small, 3), HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER));
    std::vector<wchar_t> buffer(length + 1);
    ASSERT_EQ(h.GetUnicodeString(buffer.data(), static_cast<LONG>(buffer.size())), S_OK);
    EXPECT_STREQ(buffer.data(), text);
}

TEST(StreamHelperEncoding, CountedFormsKeepNullsEmbeddedZerosAndTheirCounts) {
    ComPtr<IStream> stream = StreamOf();
    CGWStreamHelper h(stream.Get());
    ut::UniqueBstr withZero(SysAllocStringLen(L"a\0b", 3));
    const double values[] = {1.5, -2, 1e300};
    h.PutUnicodeString(nullptr);
    h.PutUnicodeString(L"");
    h.PutBSTR(withZero.get());
    h.PutDoubleArray(values, 3);
    h.PutSAFEARRAY(nullptr);
    h.MovePos(STMHELPER_BACKWARD, static_cast<ULONG>(h.Buffer().Position()));

    wchar_t text[8] = L"junk";
    EXPECT_EQ(h.GetUnicodeString(text, 8), S_FALSE) << "a null string";
    EXPECT_STREQ(text, L"");
    EXPECT_EQ(h.GetUnicodeString(text, 8), S_OK);
    BSTR back = nullptr;
    ASSERT_EQ(h.GetBSTR(&back), S_OK);
    ut::UniqueBstr owned(back);
    EXPECT_EQ(SysStringLen(back), 3u);
    EXPECT_EQ(std::wmemcmp(back, L"a\0b", 3), 0);
    double numbers[3] = {};
    ULONG count = 0;
    EXPECT_EQ(h.GetDoubleArray(numbers, 2, &count), HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER));
    EXPECT_EQ(count, 3u) << "the stored count is reported and the array left in place";
    ASSERT_EQ(h.GetDoubleArray(numbers, 3, &count), S_OK);
    EXPECT_EQ(std::memcmp(numbers, values, sizeof values), 0);
    SAFEARRAY* array = SafeArrayCreateVector(VT_I4, 0, 1);
    SafeArrayDestroy(array);
    EXPECT_EQ(h.GetSAFEARRAY(&array), S_OK);
    EXPECT_EQ(array, nullptr);
}

// VARIANTs and SAFEARRAYs.

SAFEARRAY* IntMatrix() {
    SAFEARRAYBOUND bounds[2] = {{2, -1}, {3, 5}};
    SAFEARRAY* array = SafeArrayCreate(VT_I4, 2, bounds);
    const LONG values[] = {-7, 93, 193, 293, 393, 493};
    std::memcpy(array->pvData, values, sizeof values);
    return array;
}

void ExpectSameValue(const VARIANT& written, const VARIANT& read) {
    if (written.vt == VT_BSTR) {
        EXPECT_STREQ(read.bstrVal, written.bstrVal);
    } else if (written.vt == GW_VT_GUID) {
        EXPECT_TRUE(IsEqualGUID(*static_cast<GUID*>(read.byref), *static_cast<GUID*>(written.byref)));
    } else if (written.vt & VT_ARRAY) {
        LONG lower = 0, upper = 0;
        ASSERT_EQ(SafeArrayGetDim(read.parray), SafeArrayGetDim(written.parray));
        SafeArrayGetLBound(read.parray, 1, &lower);
        SafeArrayGetUBound(read.parray, 2, &upper);
        EXPECT_EQ(lower, written.vt == (VT_ARRAY | VT_I4) ? -1 : 0);
        EXPECT_EQ(upper, written.vt == (VT_ARRAY | VT_I4) ? 7 : upper);
        if (written.vt == (VT_ARRAY | VT_I4))
            EXPECT_EQ(std::memcmp(read.parray->pvData, written.parray->pvData, 6 * sizeof(LONG)), 0);
        else
            EXPECT_STREQ(static_cast<VARIANT*>(read.parray->pvData)[0].bstrVal, L"t\u00E9xt");
    } else {
        EXPECT_EQ(std::memcmp(&read.llVal, &written.llVal, 8), 0);
    }
}

TEST(StreamHelperVariants, EveryStoredTypeReadsBack) {
    ut::Variant i1, r8, flag, text, guid, matrix, nested, unknown;
    i1->vt = VT_I1;
    i1->cVal = -5;
    r8->vt = VT_R8;
    r8->dblVal = 0.1;
    flag->vt = VT_BOOL;
    flag->boolVal = VARIANT_TRUE;
    text->vt = VT_BSTR;
    text->bstrVal = SysAllocString(L"t\u00E9xt");
    ASSERT_EQ(GWVariantSetGUID(guid.Get(), {1, 2, 3, {4, 5, 6, 7, 8, 9, 10, 11}}), S_OK);
    matrix->vt = VT_ARRAY | VT_I4;
    matrix->parray = IntMatrix();
    nested->vt = VT_ARRAY | VT_VARIANT;
    nested->parray = SafeArrayCreateVector(VT_VARIANT, 0, 2);
    VARIANT* elements = nullptr;
    SafeArrayAccessData(nested->parray, reinterpret_cast<void**>(&elements));
    VariantCopy(&elements[0], text.Get());
    VariantCopy(&elements[1], matrix.Get());
    SafeArrayUnaccessData(nested->parray);
    unknown->vt = VT_UNKNOWN;

    ComPtr<IStream> stream = StreamOf();
    CGWStreamHelper h(stream.Get());
    EXPECT_EQ(h.PutVARIANT(*unknown.Get()), DISP_E_BADVARTYPE);
    EXPECT_EQ(h.Buffer().Position(), 0u) << "a refused value leaves no trace";
    const VARIANT* all[] = {i1.Get(),   r8.Get(),     flag.Get(),  text.Get(),
                            guid.Get(), matrix.Get(), nested.Get()};
    for (const VARIANT* v : all)
        ASSERT_EQ(h.PutVARIANT(*v), S_OK);
    h.MovePos(STMHELPER_BACKWARD, static_cast<ULONG>(h.Buffer().Position()));

    for (const VARIANT* v : all) {
        VARIANT back;
        VariantInit(&back);
        ASSERT_EQ(h.GetVARIANT(&back), S_OK);
        ASSERT_EQ(back.vt, v->vt);
        ExpectSameValue(*v, back);
        GWVariantClear(&back);
    }
    GWVariantClear(guid.Get()); // ut::Variant's VariantClear does not know the GUID type
}

// Reading what ends too early or holds what no writer wrote.

HRESULT ReadVariant(CGWStreamHelper& h) {
    ut::Variant value;
    HRESULT hr = h.GetVARIANT(value.Get());
    EXPECT_TRUE(SUCCEEDED(hr) || value->vt == VT_EMPTY);
    return hr;
}

// Arrays of variants, each holding the next.
Bytes DeepArrays() {
    Bytes deep;
    for (int level = 0; level < 12; ++level)
        deep.insert(deep.end(), {0x0C, 0x20, 0x01, 0x00, 0x01, 0, 0, 0, 0, 0, 0, 0});
    return deep;
}

TEST(StreamHelperReading, BadInputFailsAndConsumesNothing) {
    struct Read {
        const char* what;
        Bytes bytes;
        std::function<HRESULT(CGWStreamHelper&)> read;
    };
    // clang-format off
    const Read reads[] = {
        {"UInt32", {1, 2, 3}, [](CGWStreamHelper& h) { ULONG v = 0; return h.GetUInt32(v); }},
        {"GUID", Bytes(15, 1), [](CGWStreamHelper& h) { GUID v{}; return h.GetGUID(v); }},
        {"string body", {5, 0, 0, 0, 'a', 0}, [](CGWStreamHelper& h) { wchar_t t[9]; return h.GetUnicodeString(t, 9); }},
        {"string length", {0xFE, 0xFF, 0xFF, 0x7F}, [](CGWStreamHelper& h) { ULONG n = 0; return h.GetStringLength(&n); }},
        {"ANSI", {9, 0, 0, 0, 'a'}, [](CGWStreamHelper& h) { char t[16]; return h.GetAnsiString(t, 16); }},
        {"BSTR skip", {9, 0, 0, 0, 'a', 0}, [](CGWStreamHelper& h) { return h.SkipBSTR(); }},
        {"byte array", {4, 0, 0, 0, 1}, [](CGWStreamHelper& h) { BYTE b[8]; ULONG n; return h.GetUByteArray(b, 8, &n); }},
        {"array claiming 2^31 elements", {0x05, 0x00, 0x01, 0x00, 0x00, 0x00, 0x00, 0x80, 0, 0, 0, 0},
         [](CGWStreamHelper& h) { SAFEARRAY* a; return h.GetSAFEARRAY(&a); }},
        {"interface in a VARIANT", {13, 0}, ReadVariant},
        {"GUID in a VARIANT cut short", {0x60, 0, 1, 2}, ReadVariant},
        {"arrays nested deeper than any reader goes", DeepArrays(), ReadVariant},
        {"chunk header", {1, 0, 0, 0, 1, 0, 0, 0, 4}, [](CGWStreamHelper& h) { return h.ChunkReadOpen(1, nullptr); }},
        {"peek", {1, 0, 0, 0, 1}, [](CGWStreamHelper& h) { ULONG id; return h.ChunkPeekHeader(&id, nullptr); }},
        {"skip chunk", {1, 0, 0, 0, 1, 0, 0, 0}, [](CGWStreamHelper& h) { return h.SkipChunk(); }},
    };
    // clang-format on
    for (const Read& r : reads) {
        SCOPED_TRACE(r.what);
        ComPtr<IStream> stream = StreamOf(r.bytes);
        CGWStreamHelper h(stream.Get());
        EXPECT_TRUE(FAILED(r.read(h)));
        EXPECT_EQ(h.Buffer().Position(), 0u);
    }
}

// Chunks of the host framing.

TEST(StreamBuffer, PositionsStayExactAcrossTheWindow) {
    ComPtr<IStream> stream = StreamOf();
    const ULONG big = 3 * ut::sdk::StreamBuffer::kCapacity + 17;
    {
        CGWStreamHelper h(stream.Get());
        h.ChunkWriteOpen(1u, 0);
        for (ULONG i = 0; i < big / 4; ++i)
            h.PutUInt32(i);
        std::vector<BYTE> block(ut::sdk::StreamBuffer::kCapacity + 3, 0x5A); // larger than a window
        h.PutUByteArray(block.data(), static_cast<ULONG>(block.size()));
        ASSERT_EQ(h.ChunkWriteClose(), S_OK); // patches a size far behind the window
        EXPECT_EQ(h.MovePos(STMHELPER_BACKWARD, 0x7FFFFFFF), STG_E_SEEKERROR);
        h.MovePos(STMHELPER_BACKWARD, 8);
        h.PutUInt32(0xDDCCBBAA); // rewrite inside the window
        h.MovePos(STMHELPER_BACKWARD, static_cast<ULONG>(h.Buffer().Position()) - 12);
        h.PutUInt32(0x11111111); // and far behind it
    }
    Bytes content = BytesOf(stream.Get());
    ULONG bodySize = (big / 4) * 4 + 4 + ut::sdk::StreamBuffer::kCapacity + 3;
    ASSERT_EQ(content.size(), 12 + bodySize);
    ULONG size = 0;
    std::memcpy(&size, content.data() + 8, 4);
    EXPECT_EQ(size, bodySize);
    EXPECT_EQ(content[12 + 4 * 1000], 1000 % 256);
    EXPECT_EQ(content[content.size() - 8], 0xAA);
    EXPECT_EQ(content[content.size() - 4], 0x5A);

    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
    CGWStreamHelper h(stream.Get());
    ASSERT_EQ(h.ChunkReadOpen(1u, nullptr), S_OK);
    ULONG value = 0;
    EXPECT_EQ(h.GetUInt32(value), S_OK);
    EXPECT_EQ(value, 0x11111111u);
    EXPECT_EQ(h.ChunkReadClose(), S_OK);
    EXPECT_EQ(h.Buffer().Position(), content.size());
}

// Strings are encoded into and decoded from the window in place when it holds them; the same
// bytes must come out where a string straddles the window's end or is too long for that.
TEST(StreamBuffer, StringsAcrossTheWindowEdgeKeepTheirBytes) {
    constexpr ULONG kWindow = ut::sdk::StreamBuffer::kCapacity;
    const std::wstring pair = L"a\U0001F600b"; // 4 code units
    struct Case {
        ULONG lead; // bytes before the string
        std::wstring text;
    };
    const Case cases[] = {
        {kWindow - 6, L"abcdef"},             // count inside, text across the edge
        {kWindow - 2, L"xy"},                 // count across the edge
        {kWindow - 7, pair},                  // a surrogate pair split by the edge
        {10, std::wstring(5000, L'\u00E9')},  // longer than the in-place limit
        {kWindow - 4, std::wstring(3, L'q')}, // count fills the window exactly
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.lead);
        const std::vector<BYTE> lead(c.lead, 0x11);
        Bytes bytes = Written([&](CGWStreamHelper& h) {
            for (BYTE b : lead)
                h.PutUInt8(b);
            EXPECT_EQ(h.PutUnicodeString(c.text.c_str()), S_OK);
            EXPECT_EQ(h.PutUnicodeString(c.text.c_str()), S_OK);
        });
        std::string units;
        ut::platform::AppendUtf16Le(c.text, units);
        Bytes one(4 + units.size());
        auto count = static_cast<ULONG>(units.size() / 2);
        std::memcpy(one.data(), &count, 4);
        std::memcpy(one.data() + 4, units.data(), units.size());
        ASSERT_EQ(bytes.size(), c.lead + 2 * one.size());
        EXPECT_TRUE(std::equal(one.begin(), one.end(), bytes.begin() + c.lead));
        EXPECT_TRUE(std::equal(one.begin(), one.end(), bytes.begin() + c.lead + one.size()));

        ComPtr<IStream> stream = StreamOf(bytes);
        CGWStreamHelper h(stream.Get());
        for (BYTE b = 0; h.Buffer().Position() < c.lead;) // read, so that the window starts at 0
            h.GetUInt8(b);
        ULONG length = 0;
        EXPECT_EQ(h.GetStringLength(&length), S_OK);
        EXPECT_EQ(length, c.text.size());
        std::vector<wchar_t> back(c.text.size() + 1);
        EXPECT_EQ(h.GetUnicodeString(back.data(), static_cast<LONG>(back.size())), S_OK);
        EXPECT_EQ(std::wstring(back.data()), c.text);
        EXPECT_EQ(h.GetUnicodeString(back.data(), static_cast<LONG>(c.text.size())),
                  HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER));
        EXPECT_EQ(h.Buffer().Position(), c.lead + one.size()) << "a refused read consumes nothing";
    }
}

TEST(StreamBuffer, HelpersOnOneBufferedStreamInterleave) {
    ComPtr<IStream> target = StreamOf();
    ComPtr<IStream> buffered;
    ASSERT_EQ(ut::sdk::CreateBufferedStream(target.Get(), buffered.Put()), S_OK);
    {
        CGWStreamHelper first(buffered.Get());
        CGWStreamHelper second(buffered.Get());
        EXPECT_EQ(&first.Buffer(), &second.Buffer());
        first.PutUInt8(1);
        second.PutUInt8(2);
        first.PutUInt8(3);
        ULONG written = 0;
        BYTE direct = 4;
        buffered->Write(&direct, 1, &written);
    }
    EXPECT_EQ(BytesOf(target.Get()), Bytes()) << "bytes stay in the buffer until it is flushed";
    STATSTG stat{};
    ASSERT_EQ(buffered->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.cbSize.QuadPart, 4u);
    EXPECT_EQ(BytesOf(target.Get()), (Bytes{1, 2, 3, 4}));
}

TEST(StreamBuffer, AHelperOverAPlainStreamLeavesItAtTheLogicalPosition) {
    Bytes content(1000, 7);
    ComPtr<IStream> stream = StreamOf(content);
    {
        CGWStreamHelper h(stream.Get());
        ULONG value = 0;
        h.GetUInt32(value);
        h.PutUInt16(0x0101);
    }
    EXPECT_EQ(PositionOf(stream.Get()), 6u) << "the read-ahead is given back";
    EXPECT_EQ(BytesOf(stream.Get())[4], 1);
}

} // namespace
