// Windows home: files read by name through the system's file handles.
#include <algorithm>
#include <new>

#include <ut/platform/input_file.h>

namespace ut::platform {

struct InputFile {
    HANDLE handle;
};

InputFile* OpenInputFile(const char* path) {
    if (!path)
        return nullptr;
    HANDLE handle = CreateFileA(path, GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == INVALID_HANDLE_VALUE)
        return nullptr;
    InputFile* file = new (std::nothrow) InputFile{handle};
    if (!file)
        CloseHandle(handle);
    return file;
}

std::size_t ReadInputFile(InputFile* file, void* buffer, std::size_t size) {
    if (!file || !buffer)
        return 0;
    DWORD got = 0;
    DWORD wanted = static_cast<DWORD>(std::min<std::size_t>(size, 1u << 30));
    if (!ReadFile(file->handle, buffer, wanted, &got, nullptr))
        return 0;
    return got;
}

void CloseInputFile(InputFile* file) {
    if (!file)
        return;
    (void)CloseHandle(file->handle); // read-only: nothing is lost when closing reports an error
    delete file;
}

} // namespace ut::platform
