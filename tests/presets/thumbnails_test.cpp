// Thumbnails of the current scene, as bitmaps and in scene files.
#include <gtest/gtest.h>

#include <ut/presets.h>
