// Message catalogs and the error-handling object.
#include <cwchar>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/catalog.h>

#include "text_tables.h"

namespace {

// Longest formatted message, in characters; a format that needs more fails.
constexpr std::size_t kLongestMessage = 64 * 1024;

HRESULT Format(const wchar_t* format, va_list arguments, std::wstring& out) {
    std::wstring buffer(256, L'\0');
    for (;;) {
        va_list attempt;
        va_copy(attempt, arguments);
        int written = std::vswprintf(buffer.data(), buffer.size(), format, attempt);
        va_end(attempt);
        if (written >= 0 && static_cast<std::size_t>(written) < buffer.size()) {
            buffer.resize(static_cast<std::size_t>(written));
            out = std::move(buffer);
            return S_OK;
        }
        if (buffer.size() >= kLongestMessage)
            return E_INVALIDARG;
        buffer.resize(buffer.size() * 4);
    }
}

} // namespace

HRESULT KXCatalogLoadFile(const wchar_t* name, const wchar_t* path) {
    if (!name)
        return E_INVALIDARG;
    return ut::ExportBoundary([&] { return ut::sdk::LoadTextTable(ut::sdk::TextKind::Catalog, name, path); });
}

CKXCatalog::CKXCatalog(const wchar_t* name) : name_(name ? name : L"") {}

HRESULT CKXCatalog::GetMsgEx(CKXString& out, ULONG id, va_list arguments) {
    lastResult_ = ut::ExportBoundary([&] {
        HRESULT found = S_OK;
        const wchar_t* format =
            ut::sdk::FindText(ut::sdk::TextKind::Catalog, name_.View(), id, nullptr, &found);
        if (FAILED(found))
            return found;
        if (!format)
            return KX_E_MSG_NOT_FOUND;
        std::wstring text;
        if (HRESULT hr = Format(format, arguments, text); FAILED(hr))
            return hr;
        out = CKXString(std::move(text));
        return S_OK;
    });
    return lastResult_;
}

HRESULT CKXCatalog::GetMsg(CKXString& out, ULONG id, ...) {
    va_list arguments;
    va_start(arguments, id);
    HRESULT hr = GetMsgEx(out, id, arguments);
    va_end(arguments);
    return hr;
}

CKXErrorHandling::~CKXErrorHandling() = default;

HRESULT CKXErrorHandling::OnCreateMsgMap() {
    return S_OK;
}

wchar_t* CKXErrorHandling::GetCatalogName() {
    return nullptr;
}

HRESULT CKXErrorHandling::LogMessage(CKXMsgString& message) {
    return KXLogMessage(message, KXLOG_ERROR);
}

ULONG CKXErrorHandling::GetMsgMapKey() {
    return 0;
}

HRESULT CKXErrorHandling::ReportMsg(ULONG id, ...) {
    if (!msgMapCreated_) {
        if (HRESULT hr = OnCreateMsgMap(); FAILED(hr))
            return hr;
        msgMapKey_ = GetMsgMapKey();
        msgMapCreated_ = TRUE;
    }
    const wchar_t* name = GetCatalogName();
    if (!name)
        return E_FAIL;
    va_list arguments;
    va_start(arguments, id);
    HRESULT hr = ut::ExportBoundary([&] {
        CKXCatalog catalog(name);
        CKXString text;
        if (HRESULT formatted = catalog.GetMsgEx(text, id, arguments); FAILED(formatted))
            return formatted;
        CKXMsgString message(std::move(text), CKXString(name), id);
        return LogMessage(message);
    });
    va_end(arguments);
    return hr;
}
