// Windows home: the process's environment, modules, error output and command line.
#include <cstdio>
#include <cstdlib>
#include <string>

#include <fcntl.h>
#include <io.h>

#include <ut/platform/process.h>
#include <ut/platform/text.h>

#include <shellapi.h> // needs the system header that the face includes first

#include "common/error_output.h"

namespace ut::platform {
namespace {

// Long-path names are at most this many characters.
constexpr DWORD kLongestPath = 32768;

} // namespace

bool HasEnvironmentVariable(const char* name) {
    if (!name)
        return false;
    // With no room, a present variable answers the room it needs (at least 1 for an empty
    // value), and a missing one answers 0 with ERROR_ENVVAR_NOT_FOUND.
    SetLastError(ERROR_SUCCESS);
    if (GetEnvironmentVariableA(name, nullptr, 0) != 0)
        return true;
    return GetLastError() != ERROR_ENVVAR_NOT_FOUND;
}

// Wine's own ntdll exports its version; the system's does not.
bool RunningUnderCompatibilityLayer() {
    HMODULE ntdll = GetModuleHandleW(L"ntdll.dll");
    return ntdll && GetProcAddress(ntdll, "wine_get_version");
}

HINSTANCE ModuleOf(const void* address) {
    HMODULE module = nullptr;
    constexpr DWORD kFlags =
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
    if (!address || !GetModuleHandleExW(kFlags, static_cast<LPCWSTR>(address), &module))
        return nullptr;
    return module;
}

std::wstring ModuleFileName(HINSTANCE module) {
    if (!module)
        return std::wstring();
    std::wstring name(MAX_PATH, L'\0');
    for (;;) {
        DWORD copied = GetModuleFileNameW(module, name.data(), static_cast<DWORD>(name.size()));
        if (copied == 0)
            return std::wstring();
        // A name that fills the buffer was cut short: grow and ask again.
        if (copied < name.size()) {
            name.resize(copied);
            return name;
        }
        if (name.size() >= kLongestPath)
            return std::wstring();
        name.resize(name.size() * 2);
    }
}

void ReportError(const std::wstring& line) {
    WriteErrorLine(line);
    OutputDebugStringW((line + L"\n").c_str());
}

void WriteDebugOutput(const wchar_t* text) {
    if (text)
        OutputDebugStringW(text);
}

std::wstring DumpLogPath() {
    const wchar_t* named = _wgetenv(L"UT_DUMP_LOG");
    return named && *named ? std::wstring(named) : std::wstring(L"c:\\KXDumpActiveData.log");
}

std::FILE* OpenFileForAppend(const std::wstring& path) {
    return _wfopen(path.c_str(), L"a+");
}

bool MultibyteFromWide(std::wstring_view text, std::size_t capacity, std::string& out) {
    out.clear();
    if (text.empty())
        return true;
    BOOL lossy = FALSE;
    int length = WideCharToMultiByte(CP_ACP, 0, text.data(), static_cast<int>(text.size()), nullptr, 0,
                                     nullptr, &lossy);
    if (length <= 0 || lossy || static_cast<std::size_t>(length) > capacity)
        return false;
    out.resize(static_cast<std::size_t>(length));
    return WideCharToMultiByte(CP_ACP, 0, text.data(), static_cast<int>(text.size()), out.data(), length,
                               nullptr, nullptr) == length;
}

void SetBinaryStandardOutput() {
    (void)_setmode(_fileno(stdout), _O_BINARY); // fails only for a closed stdout
}

std::vector<std::string> Utf8Arguments(int argc, char** argv) {
    int count = 0;
    LPWSTR* wide = CommandLineToArgvW(GetCommandLineW(), &count);
    std::vector<std::string> arguments;
    if (!wide) {
        // Without the wide form the ANSI one is all there is.
        if (argc > 1 && argv)
            arguments.assign(argv + 1, argv + argc);
        return arguments;
    }
    for (int i = 1; i < count; ++i)
        arguments.push_back(Utf8FromWide(wide[i]));
    (void)LocalFree(wide); // the block is ours alone; a failure leaves nothing to undo
    return arguments;
}

} // namespace ut::platform
