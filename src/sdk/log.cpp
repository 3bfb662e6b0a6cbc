// The log sink and the standard-error line it defaults to.
#include <mutex>
#include <string>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/process.h>
#include <ut/sdk/log.h>

namespace {

struct Sink {
    std::mutex mutex;
    KXLogSinkProc proc = nullptr;
    void* context = nullptr;
};

// Never destroyed: modules log while the process exits.
Sink& CurrentSink() {
    static Sink* sink = new Sink;
    return *sink;
}

std::wstring KindName(ULONG kind) {
    switch (kind) {
    case KXLOG_INFO:
        return L"info";
    case KXLOG_WARNING:
        return L"warning";
    case KXLOG_ERROR:
        return L"error";
    default:
        return L"kind " + std::to_wstring(kind);
    }
}

HRESULT WriteToStandardError(void*, ULONG kind, const wchar_t* text, const wchar_t* source,
                             const wchar_t* details) {
    std::wstring line = KindName(kind) + L": " + text;
    if (source && *source)
        line += std::wstring(L" [") + source + L"]";
    if (details && *details)
        line += std::wstring(L" ") + details;
    for (wchar_t& c : line)
        if (c == L'\n' || c == L'\r')
            c = L' ';
    ut::platform::ReportError(line);
    return S_OK;
}

} // namespace

void KXSetLogSink(KXLogSinkProc sink, void* context) {
    Sink& current = CurrentSink();
    std::lock_guard lock(current.mutex);
    current.proc = sink;
    current.context = context;
}

HRESULT KXLogMessage(ULONG kind, const wchar_t* text, const wchar_t* source, const wchar_t* details) {
    if (!text)
        return E_POINTER;
    KXLogSinkProc proc = nullptr;
    void* context = nullptr;
    {
        Sink& current = CurrentSink();
        std::lock_guard lock(current.mutex);
        proc = current.proc;
        context = current.context;
    }
    // The sink is called outside the lock, so that it may log or change the sink itself.
    if (proc)
        return proc(context, kind, text, source, details);
    return ut::ExportBoundary([&] { return WriteToStandardError(nullptr, kind, text, source, details); });
}

HRESULT KXLogMessage(CKXMsgString& message, ULONG kind) {
    return ut::ExportBoundary([&] {
        std::wstring source;
        if (!message.Catalog().IsEmpty())
            source = message.Catalog().Str() + L" " + std::to_wstring(message.Id());
        return KXLogMessage(kind, message.Text(), source.empty() ? nullptr : source.c_str(), nullptr);
    });
}
