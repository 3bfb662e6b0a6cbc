// Preset files found by class and name, the classes they create, and objects made from them.
#include <ut/presets.h>
