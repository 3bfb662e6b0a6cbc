// The registration family's shared steps: key texts below the module's base key, the checked
// string read, identifier lists, and the error boundary of its exports.
#pragma once

#include <string>

#include <ut/detail/names.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/detail/registry.h>

#include "module/state.h"

namespace ut::registration {

using sdk::kReadWrite;
using sdk::TextBytes;

// The base key followed by `name` (no separator added: the base key ends in one), or by
// "name\item" and "name\item\leaf".
std::wstring CategoryKey(const wchar_t* name);
std::wstring CategoryKey(const wchar_t* name, const wchar_t* item);
std::wstring CategoryKey(const wchar_t* name, const wchar_t* item, const wchar_t* leaf);

// Opens `path` below `parent` for `access`, or creates it (non-volatile, default security) for
// reading and writing; null on failure.
UniqueHKey Open(HKEY parent, const std::wstring& path, REGSAM access = KEY_READ);
UniqueHKey Create(HKEY parent, const std::wstring& path);

// Reads a text value into the caller's buffer of `*byteCount` bytes, and checks it: when the
// value has bytes, it must be REG_SZ or REG_EXPAND_SZ ending in a zero unit, or REG_MULTI_SZ of
// at least two units ending in two zero units; otherwise the buffer is emptied and the read
// answers ERROR_INVALID_DATA. A value without bytes empties the buffer too.
LONG ReadCheckedText(HKEY key, const wchar_t* name, wchar_t* buffer, DWORD* byteCount);

// Lists the sub-keys of `key` as identifiers into a CoTaskMemAlloc block, then closes the key:
// E_FAIL when the key cannot be asked, walked or closed, the parse's failure for a name that is
// not an identifier, E_OUTOFMEMORY (with *count left at the number of sub-keys) when the block
// cannot be had. On every other failure the list is null and the count 0.
HRESULT ListSubKeyIds(UniqueHKey key, DWORD* count, GUID** list);

// An export's body under the error boundary, in one registry transaction where the registry has
// them (sdk::Batched): its reads see one state of the store, and its writes reach the disk
// together. A body that succeeded but whose writes could not be committed answers `lost`.
// E_UNEXPECTED while the library is not loaded.
template <class Body>
HRESULT Guarded(HRESULT lost, Body&& body) {
    if (!module::Loaded())
        return E_UNEXPECTED;
    return ExportBoundary([&] { return sdk::Batched(body, lost); });
}

} // namespace ut::registration
