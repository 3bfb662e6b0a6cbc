// File validation: whether a file name the user gave is acceptable for an operation, after the
// host resolves it by its path conventions.
#pragma once

#include <ut/export.h>
#include <ut/sdk/file_path.h>
#include <ut/sdk/string.h>

// 1 when the resolved file passes the tests asked for (existence, or writability with
// `needWrite`; an extension found in `allowedExtensions`, letter case ignored; a compound file),
// 0 when not. A failed resolution is returned as its (negative) code, so compare with 1.
UT_API int KXValidateFile(const CKXString& path, const CKXString& allowedExtensions, bool mustBeAccessible,
                          bool needWrite, bool mustBeCompound, bool skipAccessForTypeOne,
                          tagEGWFilePathType* pathType);
