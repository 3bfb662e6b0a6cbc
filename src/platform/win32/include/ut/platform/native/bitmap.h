// Windows home: device contexts and bitmaps come from the system headers.
#pragma once

#include <ut/platform/native/com.h>
