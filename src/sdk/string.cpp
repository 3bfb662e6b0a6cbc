// CKXString: the SDK's wide string.
#include <algorithm>
#include <cstdlib>
#include <cwctype>

#include <ut/sdk/string.h>

namespace {

wchar_t Fold(wchar_t c) {
    if (c >= L'A' && c <= L'Z')
        return static_cast<wchar_t>(c - L'A' + L'a');
    if (c < 0x80)
        return c;
    return static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
}

std::size_t Clamp(int count, std::size_t size) {
    return count <= 0 ? 0 : std::min(static_cast<std::size_t>(count), size);
}

} // namespace

CKXString::CKXString(const wchar_t* text) : text_(text ? text : L"") {}

CKXString::CKXString(const wchar_t* text, int count) {
    if (text && count > 0)
        text_.assign(text, static_cast<std::size_t>(count));
}

CKXString& CKXString::operator=(const wchar_t* text) {
    text_ = text ? text : L"";
    return *this;
}

CKXString CKXString::FromGUID(REFGUID guid) {
    return CKXString(ut::GuidToString(guid));
}

CKXString CKXString::Left(int count) const {
    return CKXString(text_.substr(0, Clamp(count, text_.size())));
}

CKXString CKXString::Right(int count) const {
    std::size_t n = Clamp(count, text_.size());
    return CKXString(text_.substr(text_.size() - n));
}

void CKXString::TruncateLeft(int count) {
    text_.erase(0, Clamp(count, text_.size()));
}

void CKXString::TruncateRight(int count) {
    text_.resize(text_.size() - Clamp(count, text_.size()));
}

int CKXString::Compare(const wchar_t* text, bool caseless) const {
    const wchar_t* a = text_.c_str();
    const wchar_t* b = text ? text : L"";
    for (;; ++a, ++b) {
        wchar_t ca = caseless ? Fold(*a) : *a;
        wchar_t cb = caseless ? Fold(*b) : *b;
        if (ca != cb)
            return ca < cb ? -1 : 1;
        if (ca == L'\0')
            return 0;
    }
}

int CKXString::Find(wchar_t c, int start) const {
    if (start < 0 || static_cast<std::size_t>(start) > text_.size())
        return -1;
    std::size_t at = text_.find(c, static_cast<std::size_t>(start));
    return at == std::wstring::npos ? -1 : static_cast<int>(at);
}

int CKXString::Find(const wchar_t* text, int start) const {
    if (!text || start < 0 || static_cast<std::size_t>(start) > text_.size())
        return -1;
    std::size_t at = text_.find(text, static_cast<std::size_t>(start));
    return at == std::wstring::npos ? -1 : static_cast<int>(at);
}

void CKXString::Attach_CRT(wchar_t* buffer) {
    text_ = buffer ? buffer : L"";
    std::free(buffer);
}

void CKXString::Attach_OLE(wchar_t* buffer) {
    text_ = buffer ? buffer : L"";
    CoTaskMemFree(buffer);
}

CKXString& CKXString::operator+=(const CKXString& other) {
    text_ += other.text_;
    return *this;
}

CKXString& CKXString::operator+=(const wchar_t* text) {
    if (text)
        text_ += text;
    return *this;
}

CKXString& CKXString::operator+=(wchar_t c) {
    text_ += c;
    return *this;
}
