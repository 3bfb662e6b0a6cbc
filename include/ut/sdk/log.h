// The application's log: numbered kinds of message, the message record CKXMsgString, and the
// sink that receives every logged line.
//
// Until an application sets its own sink, each message is written as one line on standard error:
// "<kind>: <text> [<source>] <details>" (the parts in brackets only when given; line breaks inside
// the text become spaces). Kinds are "info", "warning", "error", and "kind <n>" for others.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/export.h>
#include <ut/sdk/string.h>

enum : ULONG { KXLOG_INFO = 0, KXLOG_WARNING = 1, KXLOG_ERROR = 2 };

// A message ready to be logged: its text and where it came from.
class UT_SDK_API CKXMsgString {
public:
    CKXMsgString() = default;
    explicit CKXMsgString(CKXString text, CKXString catalog = {}, ULONG id = 0)
        : text_(std::move(text)), catalog_(std::move(catalog)), id_(id) {}

    const CKXString& Text() const { return text_; }
    // The catalog and message number the text was formatted from; empty and 0 for a plain text.
    const CKXString& Catalog() const { return catalog_; }
    ULONG Id() const { return id_; }

private:
    CKXString text_;
    CKXString catalog_;
    ULONG id_ = 0;
};

// Receives each message; what it answers is what KXLogMessage answers.
using KXLogSinkProc = HRESULT (*)(void* context, ULONG kind, const wchar_t* text, const wchar_t* source,
                                  const wchar_t* details);
// Sends every message to `sink` from now on; a null sink restores standard error.
UT_SDK_API void KXSetLogSink(KXLogSinkProc sink, void* context);

// Logs `text`; `source` and `details` may be null. E_POINTER for a null text.
UT_SDK_API HRESULT KXLogMessage(ULONG kind, const wchar_t* text, const wchar_t* source,
                                const wchar_t* details);
// Logs the message's text with "<catalog> <number>" as its source (none for a plain text).
UT_SDK_API HRESULT KXLogMessage(CKXMsgString& message, ULONG kind);
