// POSIX home: the process's environment, modules, error output and arguments.
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>

#include <ut/platform/process.h>
#include <ut/platform/text.h>

#include "common/error_output.h"

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

void SetBinaryStandardOutput() {}

std::vector<std::string> Utf8Arguments(int argc, char** argv) {
    if (argc < 1 || !argv)
        return {};
    return std::vector<std::string>(argv + 1, argv + argc);
}

} // namespace ut::platform
