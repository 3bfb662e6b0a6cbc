// Windows home: the registry calls, types and codes come from the system headers.
#pragma once

#include <ut/platform/native/com.h>

#include <winreg.h>
