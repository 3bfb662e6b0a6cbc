// Windows home: IStorage, ILockBytes and the compound-file calls come from the system headers.
#pragma once

#include <ut/platform/native/global.h>
#include <ut/platform/native/stream.h>

#include <ole2.h>
