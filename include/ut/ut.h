// Everything the library exports.
#pragma once

#include <ut/bitmap.h>
#include <ut/catalog.h>
#include <ut/compare.h>
#include <ut/dataobject.h>
#include <ut/dump.h>
#include <ut/export.h>
#include <ut/families.h>
#include <ut/frames.h>
#include <ut/hierarchy.h>
#include <ut/memory.h>
#include <ut/mifile.h>
#include <ut/notify.h>
#include <ut/paths.h>
#include <ut/persist.h>
#include <ut/presets.h>
#include <ut/registration.h>
#include <ut/scene.h>
#include <ut/shaders.h>
#include <ut/sources.h>
#include <ut/time.h>
#include <ut/validate.h>
