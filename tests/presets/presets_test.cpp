// Preset search, cache and creation over a real folder tree.
#include <gtest/gtest.h>

#include <ut/presets.h>
