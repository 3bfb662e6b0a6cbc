// The process-wide state that the load step creates, read by every subsystem.
#pragma once

#include <map>
#include <memory>

#include <ut/platform/com.h>
#include <ut/sdk/string.h>
#include <ut/sdk/time.h>

namespace ut::module {

// The time family's process-wide objects.
struct TimeState {
    // Starts undefined; a finite render time overrides the play position.
    CGWTime renderTime = CGWTime::Undefined;
    CGWTimeManagerHelper timeManager;
};

// The file helpers' process-wide state: whether the recovery file was looked for, and its name.
struct FileState {
    enum class Recovery { NotLooked, None, Found } recovery = Recovery::NotLooked;
    char recoveryFile[260] = {};
    // How deep the property-container dump is nested.
    int dumpDepth = 0;
};

// The presets found so far: by class, then by preset name, the preset's file and the class of
// the object it creates.
struct PresetEntry {
    CKXString path;
    CLSID objectClass = GUID_NULL;
};
using PresetCache = std::map<GUID, std::map<CKXString, PresetEntry>, ut::GuidLess>;

struct State {
    HINSTANCE instance = nullptr;
    // The registry key below which registrations are written; ends in a backslash.
    CKXString baseKey;
    // "KX_DISABLE_STREAM_COMPRESSION" was in the environment at load.
    bool streamCompressionDisabled = false;
    // Made by the load step, gone after the unload. The render time is written through it.
    std::unique_ptr<TimeState> time;
    FileState files;
    PresetCache presets;
    // The load step completed; when false every export answers E_UNEXPECTED.
    bool loaded = false;
};

const State& Current();
// The file helpers' state, the one part that the exports change after the load step.
FileState& Files();
// The preset cache, filled as objects are created from presets.
PresetCache& Presets();

inline bool Loaded() {
    return Current().loaded;
}

} // namespace ut::module
