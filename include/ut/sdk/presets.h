// Presets: stored sets of values that new objects start from.
#pragma once

#include <ut/platform/com.h>

// {65994CA9-C7CE-4C4B-A49E-69529BD2F099} (not fixed by the application; the one this SDK declares)
inline constexpr IID IID_IGWPreset = {
    0x65994CA9, 0xC7CE, 0x4C4B, {0xA4, 0x9E, 0x69, 0x52, 0x9B, 0xD2, 0xF0, 0x99}};

// A loaded preset, handed through to what applies it; its operations belong to the preset features.
struct IGWPreset : IUnknown {
protected:
    ~IGWPreset() = default;
};

template <>
struct ut::InterfaceId<IGWPreset> : ut::Iid<IID_IGWPreset> {};
