// Windows home: file search comes from the system headers (included with the COM basics).
#pragma once

#include <ut/platform/native/com.h>
