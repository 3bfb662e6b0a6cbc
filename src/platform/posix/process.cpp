// POSIX home: the process's environment, modules, error output and arguments.
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <filesystem>
#include <system_error>

#include <ut/platform/process.h>
#include <ut/platform/text.h>

#include "common/error_output.h"
#include "path.h"

namespace ut::platform {

bool HasEnvironmentVariable(const char* name) {
    return name && std::getenv(name) != nullptr;
}

bool RunningUnderCompatibilityLayer() {
    return false;
}

HINSTANCE ModuleOf(const void* address) {
    Dl_info info{};
    if (!address || ::dladdr(address, &info) == 0)
        return nullptr;
    return static_cast<HINSTANCE>(info.dli_fbase);
}

std::wstring ModuleFileName(HINSTANCE module) {
    Dl_info info{};
    if (!module || ::dladdr(reinterpret_cast<void*>(module), &info) == 0 || !info.dli_fname)
        return std::wstring();
    return WideFromUtf8(info.dli_fname);
}

void ReportError(const std::wstring& line) {
    WriteErrorLine(line);
}

void WriteDebugOutput(const wchar_t* text) {
    if (!text)
        return;
    std::fputs(Utf8FromWide(text).c_str(), stderr);
    std::fflush(stderr);
}

std::wstring DumpLogPath() {
    if (const char* named = std::getenv("UT_DUMP_LOG"); named && *named)
        return WideFromUtf8(named);
    std::string path = posix::UserFolderFile("XDG_STATE_HOME", ".local/state", "ut/KXDumpActiveData.log");
    if (path.empty())
        return L"KXDumpActiveData.log"; // nowhere better: the working folder
    std::error_code ignored;            // a folder that cannot be made shows when the log does not open
    std::filesystem::create_directories(std::filesystem::path(path).parent_path(), ignored);
    return WideFromUtf8(path);
}

std::FILE* OpenFileForAppend(const std::wstring& path) {
    return std::fopen(Utf8FromWide(path).c_str(), "a+");
}

bool MultibyteFromWide(std::wstring_view text, std::size_t capacity, std::string& out) {
    out = Utf8FromWide(text);
    return out.size() <= capacity;
}

void SetBinaryStandardOutput() {}

std::vector<std::string> Utf8Arguments(int argc, char** argv) {
    if (argc < 1 || !argv)
        return {};
    return std::vector<std::string>(argv + 1, argv + argc);
}

} // namespace ut::platform
