// Reading a file by its narrow name, for the library's readers of text files.
#pragma once

#include <cstddef>
#include <memory>

#include <ut/platform/com.h>

namespace ut::platform {

// A file open for reading, positioned at its start. Each home defines it.
struct InputFile;

// Opens `path` for reading, shared with other readers and writers. The name is the home's narrow
// form: bytes as the file system takes them on POSIX, the ANSI code page on Windows. Null when
// the file cannot be opened or is a folder.
UT_PLATFORM_API InputFile* OpenInputFile(const char* path);
// Reads up to `size` bytes from the file's position onwards; 0 at the end or on a failure.
UT_PLATFORM_API std::size_t ReadInputFile(InputFile* file, void* buffer, std::size_t size);
// Closes the file; null is ignored.
UT_PLATFORM_API void CloseInputFile(InputFile* file);

struct InputFileCloser {
    void operator()(InputFile* file) const noexcept { CloseInputFile(file); }
};
using InputFilePtr = std::unique_ptr<InputFile, InputFileCloser>;

} // namespace ut::platform
