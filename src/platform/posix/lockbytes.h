// The byte arrays of the POSIX storage: one over a file, which can replace its whole content
// atomically, and one over a global memory block.
#pragma once

#include <string>

#include <ut/platform/storage.h>

namespace ut::platform::posix {

// What a byte array over a file offers beyond ILockBytes.
class FileBytes {
public:
    // A new content is written into a temporary file beside the file, whose descriptor (kept
    // by the byte array) BeginReplacement gives, then renamed over the file by
    // FinishReplacement, so that a crash at any moment leaves the old content or the new one;
    // `durable` flushes both to the disk first, so that a power loss does too. The byte array
    // then reads the new file. AbandonReplacement removes the temporary file.
    virtual HRESULT BeginReplacement(int& fd) = 0;
    virtual HRESULT FinishReplacement(bool durable) = 0;
    virtual void AbandonReplacement() = 0;
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

// A new temporary file in the temporary folder, created with mkstemp; it goes when closed.
HRESULT CreateScratchFile(int& fd);

} // namespace ut::platform::posix
