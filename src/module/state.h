// The process-wide state that the load step creates, read by every subsystem.
#pragma once

#include <ut/platform/com.h>
#include <ut/sdk/string.h>

namespace ut::module {

struct State {
    HINSTANCE instance = nullptr;
    // The registry key below which registrations are written; ends in a backslash.
    CKXString baseKey;
    // "KX_DISABLE_STREAM_COMPRESSION" was in the environment at load.
    bool streamCompressionDisabled = false;
    // The load step completed; when false every export answers E_UNEXPECTED.
    bool loaded = false;
};

const State& Current();

inline bool Loaded() { return Current().loaded; }

} // namespace ut::module
