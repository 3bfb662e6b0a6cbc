// Test hooks of the SDK layer: host-call fault injection and the count of live COM objects.
// Tests and tools use them; a plug-in has no reason to.
#pragma once

#include <functional>
#include <string_view>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

namespace ut::sdk {

// Fault injection for tests of failure paths: when set, every host call made through this
// layer (the generic-object queries and creations, and host services that consult it) first
// asks the hook, and a failure code it returns is answered instead of doing the call.
using HostFaultHook = std::function<HRESULT(std::string_view operation)>;
UT_SDK_API void SetHostFaultHook(HostFaultHook hook);
// S_OK when no hook is set or the hook lets the call through.
UT_SDK_API HRESULT CheckHostFault(std::string_view operation);

// Objects derived from CGWCOMObject alive in the process, for leak checks.
UT_SDK_API long LiveCount();

} // namespace ut::sdk
