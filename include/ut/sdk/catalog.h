// Message catalogs: numbered messages with printf-style arguments, and the error-handling object
// that formats and logs them.
//
// Catalog <name> is read on first use from "<name>.cat" in "../share/ut" beside this library, in
// the format of KXDictLoadFile. Its texts follow the C library's wide printf conventions: %ls for a
// wide string, %d and %u for 32-bit integers, %g for a double, %% for a percent sign.
#pragma once

#include <cstdarg>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/log.h>
#include <ut/sdk/string.h>

// The catalog has no message of that number.
inline constexpr HRESULT KX_E_MSG_NOT_FOUND = static_cast<HRESULT>(0x8007013D);

// Reads catalog `name` from the file `path`, replacing what was read before. E_INVALIDARG for a
// null path or name; the failure to read the file otherwise.
UT_SDK_API HRESULT KXCatalogLoadFile(const wchar_t* name, const wchar_t* path);

class UT_SDK_API CKXCatalog {
public:
    explicit CKXCatalog(const wchar_t* name);

    const CKXString& GetName() const { return name_; }
    // What the last GetMsgEx answered (S_OK before the first).
    HRESULT GetLastResult() const { return lastResult_; }

    // Formats message `id` with `arguments` into `out`. The failure to read the catalog, or
    // KX_E_MSG_NOT_FOUND; `out` is left as it was on failure.
    HRESULT GetMsgEx(CKXString& out, ULONG id, va_list arguments);
    HRESULT GetMsg(CKXString& out, ULONG id, ...);

private:
    CKXString name_;
    HRESULT lastResult_ = S_OK;
};

// Reports numbered messages of a catalog. A derived class names the catalog and may say how its
// messages are logged.
class UT_SDK_API CKXErrorHandling {
public:
    CKXErrorHandling() = default;
    CKXErrorHandling(const CKXErrorHandling&) = default;
    CKXErrorHandling& operator=(const CKXErrorHandling&) = default;
    virtual ~CKXErrorHandling();

    // Prepares the class's message map; called once, before the first report. Does nothing here.
    virtual HRESULT OnCreateMsgMap();
    // The catalog the messages come from; null here (nothing can be reported).
    virtual wchar_t* GetCatalogName();
    // Logs a formatted message; here as an error.
    virtual HRESULT LogMessage(CKXMsgString& message);

    // Formats message `id` of the catalog with the arguments and logs it with LogMessage. E_FAIL
    // when there is no catalog; the failure to format or to log otherwise.
    HRESULT ReportMsg(ULONG id, ...);

protected:
    // The key of the class's message map; 0 here.
    virtual ULONG GetMsgMapKey();

private:
    ULONG msgMapKey_ = 0;
    BOOL msgMapCreated_ = FALSE;
};
