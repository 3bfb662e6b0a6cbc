// Installation paths of the application.
#pragma once

#include <ut/sdk/export.h>
#include <ut/sdk/string.h>

// The factory installation folder: the folder that holds the folder of the SDK's own library
// (the installation prefix, "<prefix>" for "<prefix>/lib/libut_sdk.so" or
// "<prefix>\bin\ut_sdk.dll"), without a separator at its end. E_FAIL with an empty `path` when
// the library's file name is unknown.
UT_SDK_API HRESULT KXGetFactoryPath(CKXString& path);
// TRUE when a file or folder named `path` exists (a backslash separates folders on every home).
UT_SDK_API BOOL KXIsFileExist(const wchar_t* path);
