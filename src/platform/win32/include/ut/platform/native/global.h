// Windows home: global memory blocks come from the system headers.
#pragma once

#include <ut/platform/native/com.h>
