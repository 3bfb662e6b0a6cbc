// Windows home: file search and temporary names come from the system, access tests and path
// splitting from the C runtime.
#pragma once

#include <ut/platform/native/com.h>

#include <io.h>
#include <stdlib.h>
