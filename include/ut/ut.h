// Everything the library exports.
#pragma once

#include <ut/export.h>
#include <ut/persist.h>
