// POSIX home: controls of the registry store that only this home has. Where the store lives, a
// way to let go of it, and counters by which tests check what a call costs.
#pragma once

#include <cstdint>
#include <string>

#include <ut/platform/native/registry.h>

namespace ut::platform {

// The store file the next opening would use: UT_REGISTRY when set and not empty, else
// $XDG_DATA_HOME/ut/registry.db when XDG_DATA_HOME is an absolute path, else
// $HOME/.local/share/ut/registry.db. Empty when none of them is known.
UT_PLATFORM_API std::string RegistryStorePath();

// Closes the store: open keys become invalid handles, an open transaction is rolled back, and the
// next registry call opens the store again from the environment of that moment.
UT_PLATFORM_API void CloseRegistryStore();

struct RegistryStoreCounters {
    std::uint64_t statements = 0;   // SQL statements run
    std::uint64_t machineSteps = 0; // steps of SQLite's virtual machine over all of them
};
// What the store has run in this process since it was opened.
UT_PLATFORM_API RegistryStoreCounters GetRegistryStoreCounters();

} // namespace ut::platform
