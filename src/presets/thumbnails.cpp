// A 64 x 64 picture of the current scene, as a device bitmap or inside a scene file.
#include <ut/presets.h>
