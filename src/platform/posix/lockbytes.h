// The byte arrays of the POSIX storage: one over a file, which can replace its whole content
// atomically, and one over a global memory block.
#pragma once

#include <cstdio>
#include <functional>
#include <string>

#include <ut/platform/storage.h>

namespace ut::platform::posix {

// Writes a whole new content into `file`, positioned at its start.
using ContentWriter = std::function<HRESULT(std::FILE* file)>;

// What a byte array over a file offers beyond ILockBytes.
class FileBytes {
public:
    // Writes a new content into a temporary file beside the file and renames it over the file,
    // so that a crash at any moment leaves the old content or the new one; `durable` flushes
    // both to the disk first, so that a power loss does too. The byte array then reads the new
    // file.
    virtual HRESULT ReplaceContent(const ContentWriter& write, bool durable) = 0;
    // The file's absolute path.
    virtual const std::wstring& Path() const = 0;

protected:
    ~FileBytes() = default;
};

// The file behind a byte array made by OpenFileLockBytes, or null for any other byte array.
FileBytes* FileBehind(ILockBytes* bytes);

// How OpenFileBytes treats the file: open it as it is, create it when missing (keeping what is
// there), create it only when missing, or create it and empty what is there.
enum class Disposition { Existing, OpenOrCreate, CreateNew, Truncate };

// Opens a byte array over a file; `path` is already in the system's form. `mode` gives the
// access and STGM_DELETEONRELEASE.
HRESULT OpenFileBytes(const std::string& path, DWORD mode, Disposition disposition, ILockBytes** bytes);

// A byte array over an open descriptor that it neither owns nor closes.
HRESULT WrapDescriptor(int fd, ILockBytes** bytes);

// A new temporary file in the temporary folder, created with mkstemp; it goes when closed.
HRESULT CreateScratchFile(std::FILE** file);

} // namespace ut::platform::posix
