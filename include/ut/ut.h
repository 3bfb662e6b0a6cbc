// Everything the library exports.
#pragma once

#include <ut/catalog.h>
#include <ut/export.h>
#include <ut/memory.h>
#include <ut/persist.h>
#include <ut/scene.h>
#include <ut/time.h>
