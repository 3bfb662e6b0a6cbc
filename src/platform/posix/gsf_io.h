// libgsf as the POSIX storage uses it: its reader over one of our byte arrays, and owners for
// its objects. Only the POSIX storage includes this (libgsf's headers bring GLib's macros).
#pragma once

#include <memory>
#include <string>

// Ours first: GLib defines TRUE and FALSE as macros only where nobody has named them yet.
#include <ut/platform/storage.h>

#include <gsf/gsf.h>

namespace ut::platform::posix {

struct GObjectDeleter {
    void operator()(void* object) const noexcept {
        if (object)
            g_object_unref(object);
    }
};
template <class T>
using GsfOwner = std::unique_ptr<T, GObjectDeleter>;

// Opens libgsf's compound-file reader over `bytes`, which CompoundFile has checked.
HRESULT OpenGsfReader(ILockBytes* bytes, ULONGLONG size, GsfOwner<GsfInfile>& reader);

// The element `name` of a storage that libgsf reads, or null.
GsfOwner<GsfInput> GsfChild(GsfInfile* storage, const std::string& name);

// Reads exactly `count` bytes at `offset` of an element.
HRESULT GsfReadAt(GsfInput* input, ULONGLONG offset, void* buffer, std::size_t count);

} // namespace ut::platform::posix
