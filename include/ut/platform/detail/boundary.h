// The error boundary of exported functions: no C++ exception crosses into a caller.
#pragma once

#include <new>
#include <type_traits>

#include <ut/platform/com.h>

namespace ut {

// Runs `body`, answering `onOutOfMemory` when it runs out of memory. Every export that allocates
// through the standard library goes through here, so std::bad_alloc never reaches a plug-in.
template <class Body, class Result = std::invoke_result_t<Body>>
Result ExportBoundary(Body&& body, Result onOutOfMemory) noexcept {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return onOutOfMemory;
    }
}

// The common case: an HRESULT export answers E_OUTOFMEMORY.
template <class Body>
HRESULT ExportBoundary(Body&& body) noexcept {
    return ExportBoundary(static_cast<Body&&>(body), HRESULT{E_OUTOFMEMORY});
}

} // namespace ut
