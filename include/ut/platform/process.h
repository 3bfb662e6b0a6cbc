// The process as the library sees it: its environment, its modules, and its error output.
#pragma once

#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include <ut/platform/com.h>

namespace ut::platform {

// Whether the environment holds the variable, with any value (an empty one included).
UT_PLATFORM_API bool HasEnvironmentVariable(const char* name);

// The module (shared library or executable) whose image holds `address`, or null.
UT_PLATFORM_API HINSTANCE ModuleOf(const void* address);

// The full file name of a loaded module, or an empty string when it is unknown.
UT_PLATFORM_API std::wstring ModuleFileName(HINSTANCE module);

// Whether the process runs on a compatibility layer rather than the home's own system (wine on
// Windows builds). Tests use it to mark the rare expectation that only holds there.
UT_PLATFORM_API bool RunningUnderCompatibilityLayer();

// Writes one line to the process's error output (standard error, or the debugger on Windows
// when there is no console).
UT_PLATFORM_API void ReportError(const std::wstring& line);

// Sends `text` as it is to the debugger's output channel: the system's debugger output on
// Windows; standard error (in UTF-8) on POSIX, which has no such channel.
UT_PLATFORM_API void WriteDebugOutput(const wchar_t* text);

// Where diagnostic dumps append their log: the file UT_DUMP_LOG names when it is set, else
// "c:\KXDumpActiveData.log" on Windows and, on POSIX, KXDumpActiveData.log in the user's state
// folder ($XDG_STATE_HOME/ut, or ~/.local/state/ut, made when missing).
UT_PLATFORM_API std::wstring DumpLogPath();

// Opens `path` for appending and reading (the C runtime's "a+"); null when it cannot.
UT_PLATFORM_API std::FILE* OpenFileForAppend(const std::wstring& path);

// `text` in the process's multibyte code page (the ANSI code page on Windows, UTF-8 on POSIX);
// false when a character has no form there or the result needs more than `capacity` bytes.
UT_PLATFORM_API bool MultibyteFromWide(std::wstring_view text, std::size_t capacity, std::string& out);

// Puts standard output in binary mode, so that the bytes written are the bytes that arrive
// (Windows would otherwise turn "\n" into "\r\n"). POSIX has nothing to do.
UT_PLATFORM_API void SetBinaryStandardOutput();

// The program's arguments after its name, in UTF-8: argv as it is on POSIX; on Windows read from
// the wide command line, so that names outside the ANSI code page come through.
UT_PLATFORM_API std::vector<std::string> Utf8Arguments(int argc, char** argv);

} // namespace ut::platform
