// Windows home: IStream and its companions come from the system headers.
#pragma once

#include <ut/platform/native/com.h>

#include <objidl.h>
