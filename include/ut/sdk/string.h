// CKXString: the application's wide-character string.
//
// Lengths and positions are counts of wchar_t. Out-of-range counts are clamped rather than
// trusted: Left(100) of a 3-character string is the whole string, Right(-1) is empty.
// Caseless comparison folds ASCII letters and whatever the C library folds beyond them.
#pragma once

#include <compare>
#include <string>
#include <string_view>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

class UT_SDK_API CKXString {
public:
    CKXString() = default;
    CKXString(const wchar_t* text);
    CKXString(const wchar_t* text, int count);
    CKXString(std::wstring_view text) : text_(text) {}
    CKXString(std::wstring text) : text_(std::move(text)) {}
    CKXString(const CKXString&) = default;
    CKXString(CKXString&&) noexcept = default;
    CKXString& operator=(const CKXString&) = default;
    CKXString& operator=(CKXString&&) noexcept = default;
    CKXString& operator=(const wchar_t* text);

    // The braced upper-case text of a GUID.
    static CKXString FromGUID(REFGUID guid);

    int Length() const { return static_cast<int>(text_.size()); }
    bool IsEmpty() const { return text_.empty(); }
    operator const wchar_t*() const { return text_.c_str(); }
    const wchar_t* c_str() const { return text_.c_str(); }
    std::wstring_view View() const { return text_; }
    const std::wstring& Str() const { return text_; }

    // The first or last `count` characters.
    CKXString Left(int count) const;
    CKXString Right(int count) const;
    // Drop `count` characters from the start or from the end.
    void TruncateLeft(int count);
    void TruncateRight(int count);

    // <0, 0 or >0, as the first differing character decides (folded when caseless).
    int Compare(const wchar_t* text, bool caseless = false) const;
    bool CaseLessEqual(const wchar_t* text) const { return Compare(text, true) == 0; }

    // Position of the first occurrence at or after `start`, or -1.
    int Find(wchar_t c, int start = 0) const;
    int Find(const wchar_t* text, int start = 0) const;

    // Take over a buffer: from the C runtime's malloc (freed with free) or from task memory
    // (freed with CoTaskMemFree). A null buffer empties the string.
    void Attach_CRT(wchar_t* buffer);
    void Attach_OLE(wchar_t* buffer);

    CKXString& operator+=(const CKXString& other);
    CKXString& operator+=(const wchar_t* text);
    CKXString& operator+=(wchar_t c);

    friend CKXString operator+(CKXString a, const CKXString& b) { return a += b; }
    friend CKXString operator+(CKXString a, const wchar_t* b) { return a += b; }
    friend bool operator==(const CKXString& a, const CKXString& b) { return a.text_ == b.text_; }
    friend bool operator==(const CKXString& a, const wchar_t* b) { return a.Compare(b) == 0; }
    friend std::strong_ordering operator<=>(const CKXString& a, const CKXString& b) {
        return a.text_ <=> b.text_;
    }

private:
    std::wstring text_;
};
