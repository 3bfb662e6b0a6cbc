// The library's load and unload steps.
#include <new>

#include <ut/platform/module_entry.h>
#include <ut/platform/process.h>
#include <ut/sdk/resources.h>

#include <ut/detail/names.h>

#include "module/state.h"

namespace ut::module {
namespace {

// Built on first use, because the load step may run before this library's static initialisers,
// and never destroyed, because the unload step runs after them.
State& MutableState() {
    static State* state = new State;
    return *state;
}

constexpr int kRegistryKeyCapacity = ut::kPathCapacity;

} // namespace

const State& Current() { return MutableState(); }

} // namespace ut::module

namespace ut::platform {

HRESULT OnModuleAttach(HINSTANCE self) {
    ut::module::State& state = ut::module::MutableState();
    state = {};
    state.instance = self;
    if (HRESULT hr = KXDictRegisterInstance(self, ut::kDictionaryName); FAILED(hr))
        return hr;
    wchar_t key[ut::module::kRegistryKeyCapacity];
    if (LONG error = GWResourceConstructRegKey(self, L"", key, ut::module::kRegistryKeyCapacity); error != ERROR_SUCCESS)
        return HRESULT_FROM_WIN32(static_cast<DWORD>(error));
    state.baseKey = key;
    state.streamCompressionDisabled = HasEnvironmentVariable("KX_DISABLE_STREAM_COMPRESSION");
    state.time.reset(new (std::nothrow) ut::module::TimeState);
    if (!state.time)
        return E_OUTOFMEMORY;
    state.loaded = true;
    return S_OK;
}

void OnModuleDetach() {
    KXDictUnregisterInstance(ut::kDictionaryName);
    ut::module::State& state = ut::module::MutableState();
    state.loaded = false;
    state.time.reset();
}

} // namespace ut::platform
