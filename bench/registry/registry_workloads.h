// The registry workloads measured on both homes, written over the registry calls alone: a key
// with many sub-keys walked one index at a time, and keys created and deleted one call each.
#pragma once

#include <string>

#include <ut/platform/registry.h>

namespace ut::bench {

// On POSIX, points the process at a fresh store file in the temporary folder, removed at exit
// (the system's registry has no use for it). Call before the first registry call.
void UsePrivateStore();

// A key of the run's own, HKEY_CURRENT_USER\Software\ut-bench\<random>, deleted with everything
// below it at the end.
class BenchKey {
public:
    BenchKey();
    ~BenchKey();
    BenchKey(const BenchKey&) = delete;
    BenchKey& operator=(const BenchKey&) = delete;

    HKEY Get() const { return key_.get(); }

private:
    std::wstring path_;
    UniqueHKey key_;
};

// Gives `parent` `count` sub-keys "key<n>", each with a default text value and a "Name" text
// value, inside one registry transaction.
void Populate(HKEY parent, int count);

// Walks the sub-keys of `parent` one index at a time, opening each and reading its "Name";
// answers how many it read.
int EnumerateAndRead(HKEY parent);

// Creates `count` sub-keys of `parent` and deletes them again, one registry call each; with
// `batched`, all of it inside one registry transaction.
void CreateAndDelete(HKEY parent, int count, bool batched);

} // namespace ut::bench
