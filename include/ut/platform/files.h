// Files on both homes: temporary names (GetTempPathW, GetTempFileNameW), file search
// (FindFirstFileW, FindNextFileW, FindClose with WIN32_FIND_DATAW), DeleteFileW, and the C
// runtime's _waccess and _wsplitpath. On Windows these are the system's; on POSIX ours, over
// UTF-8 paths in which a backslash separates folders as a slash does.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/file_search.h>
#include <ut/platform/native/files.h>
