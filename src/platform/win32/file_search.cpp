// Folder identities on Windows: the volume serial number and file index of an open handle.
#include <ut/platform/file_search.h>

namespace ut::platform {

bool IdentifyFolder(const wchar_t* path, FolderIdentity& identity) {
    if (!path)
        return false;
    // Backup semantics open a folder; no access right is needed to read its identity.
    HANDLE folder = CreateFileW(path, 0, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                                OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr);
    if (folder == INVALID_HANDLE_VALUE)
        return false;
    BY_HANDLE_FILE_INFORMATION info{};
    bool known =
        GetFileInformationByHandle(folder, &info) && (info.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY);
    CloseHandle(folder);
    if (known)
        identity = {info.dwVolumeSerialNumber,
                    (static_cast<std::uint64_t>(info.nFileIndexHigh) << 32) | info.nFileIndexLow};
    return known;
}

} // namespace ut::platform
