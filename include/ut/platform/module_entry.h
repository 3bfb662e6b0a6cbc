// The bridge between the loader and a library's load step. The platform's entry object (the
// DLL entry point on Windows, a load-time constructor on POSIX) is linked into the library and
// calls these hooks, which the library defines.
//
// On Windows a failed attach refuses the load. On POSIX the loader cannot be refused: the entry
// reports the failure on standard error and the library answers E_UNEXPECTED from then on.
#pragma once

#include <ut/platform/com.h>

// Defined by the library whose load step they are; called by the platform's entry object.
namespace ut::module {

HRESULT OnAttach(HINSTANCE self);
void OnDetach();

} // namespace ut::module
