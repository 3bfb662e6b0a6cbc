// POSIX home: files read by name through a plain descriptor.
#include <cerrno>
#include <fcntl.h>
#include <new>
#include <sys/stat.h>
#include <unistd.h>

#include <ut/platform/input_file.h>

namespace ut::platform {

struct InputFile {
    int fd;
};

InputFile* OpenInputFile(const char* path) {
    if (!path)
        return nullptr;
    int fd = ::open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return nullptr;
    struct stat status {};
    InputFile* file = nullptr;
    // A folder opens here but not on Windows: refuse it on both homes alike.
    if (::fstat(fd, &status) == 0 && !S_ISDIR(status.st_mode))
        file = new (std::nothrow) InputFile{fd};
    if (!file)
        ::close(fd);
    return file;
}

std::size_t ReadInputFile(InputFile* file, void* buffer, std::size_t size) {
    if (!file || !buffer)
        return 0;
    for (;;) {
        ssize_t got = ::read(file->fd, buffer, size);
        if (got < 0 && errno == EINTR)
            continue;
        return got < 0 ? 0 : static_cast<std::size_t>(got);
    }
}

void CloseInputFile(InputFile* file) {
    if (!file)
        return;
    (void)::close(file->fd); // read-only: nothing is lost when close reports an error
    delete file;
}

} // namespace ut::platform
