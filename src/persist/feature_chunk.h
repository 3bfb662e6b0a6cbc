// Reading the feature-version chunk into g_uiFeaturesVersion, over any reader with the chunk and
// packed-integer operations of the stream helper (KXLoadFeaturesVersion passes its
// C3DStreamHelper).
#pragma once

#include <concepts>

#include <ut/persist.h>

namespace ut::persist {

// "AEFS" as a chunk id: the bytes 41 45 46 53 on the stream.
inline constexpr ULONG kFeatureChunkId = 0x53464541;

template <class Reader>
concept FeatureChunkReader = requires(Reader& reader, ULONG& value, ULONG* version) {
    { reader.ChunkReadOpen(ULONG{}, version) } -> std::convertible_to<HRESULT>;
    { reader.GetUInt32(value) } -> std::convertible_to<HRESULT>;
    { reader.ChunkReadClose() } -> std::convertible_to<HRESULT>;
};

// The chunk holds a count and then (feature number, loaded version) pairs. A stream without it
// reports loaded version 0 for the scene feature. Features outside the table are skipped, and
// reading stops at the first value that cannot be read, so that a damaged count cannot run on.
// Always S_OK: missing or damaged version information is not a reason to refuse a load.
template <FeatureChunkReader Reader>
HRESULT LoadFeaturesVersion(Reader& reader) {
    g_uiFeaturesVersion[eFeaturesVersionScene][eFeatureLoaded] = 0;
    ULONG chunkVersion = 0;
    if (reader.ChunkReadOpen(kFeatureChunkId, &chunkVersion) != S_OK)
        return S_OK;
    ULONG count = 0;
    if (FAILED(reader.GetUInt32(count)))
        count = 0;
    for (ULONG pair = 0; pair < count; ++pair) {
        ULONG feature = 0, loaded = 0;
        if (FAILED(reader.GetUInt32(feature)) || FAILED(reader.GetUInt32(loaded)))
            break;
        if (feature < eFeaturesVersionCount)
            g_uiFeaturesVersion[feature][eFeatureLoaded] = loaded;
    }
    (void)reader.ChunkReadClose(); // the table is read; whatever follows is the caller's
    return S_OK;
}

} // namespace ut::persist
