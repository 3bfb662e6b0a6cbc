// The library's load and unload steps.
#include <new>
#include <ut/detail/names.h>
#include <ut/platform/module_entry.h>
#include <ut/platform/process.h>
#include <ut/sdk/resources.h>

#include "module/state.h"

namespace ut::module {
namespace {

// Built on first use, because the load step may run before this library's static initialisers,
// and never destroyed, because the unload step runs after them.
State& MutableState() {
    static State* state = new State;
    return *state;
}

} // namespace

const State& Current() {
    return MutableState();
}

FileState& Files() {
    return MutableState().files;
}

PresetCache& Presets() {
    return MutableState().presets;
}

HRESULT OnAttach(HINSTANCE self) {
    State& state = MutableState();
    state = {};
    state.instance = self;
    if (HRESULT hr = KXDictRegisterInstance(self, kDictionaryName); FAILED(hr))
        return hr;
    wchar_t key[kPathCapacity];
    if (LONG error = GWResourceConstructRegKey(self, L"", key, kPathCapacity); error != ERROR_SUCCESS)
        return HRESULT_FROM_WIN32(static_cast<DWORD>(error));
    state.baseKey = key;
    state.streamCompressionDisabled = ut::platform::HasEnvironmentVariable("KX_DISABLE_STREAM_COMPRESSION");
    state.time.reset(new (std::nothrow) TimeState);
    if (!state.time)
        return E_OUTOFMEMORY;
    state.loaded = true;
    return S_OK;
}

void OnDetach() {
    (void)KXDictUnregisterInstance(kDictionaryName); // S_FALSE when it was never registered: nothing to undo
    State& state = MutableState();
    state.loaded = false;
    state.time.reset();
}

} // namespace ut::module
