// Windows home: the COM basics come from the system headers as they are.
#pragma once

// The whole of <windows.h>, as the includer would get it: the library's own sources build with
// NOMINMAX and WIN32_LEAN_AND_MEAN from the compiler's command line instead.
#include <windows.h>

#include <objbase.h>
#include <unknwn.h>

#include <ut/platform/export.h>
