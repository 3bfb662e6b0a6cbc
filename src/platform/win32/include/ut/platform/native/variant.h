// Windows home: VARIANT, BSTR and SAFEARRAY come from the system headers.
#pragma once

#include <ut/platform/native/com.h>

#include <oleauto.h>
