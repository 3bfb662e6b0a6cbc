// Windows home: IDataObject, dropped-file lists and clipboard formats come from the system headers.
#pragma once

#include <ut/platform/native/bitmap.h>
#include <ut/platform/native/global.h>
#include <ut/platform/native/storage.h>

#include <shellapi.h>
#include <shlobj.h>
