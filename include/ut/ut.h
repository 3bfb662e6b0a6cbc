// Everything the library exports.
#pragma once

#include <ut/export.h>
#include <ut/memory.h>
#include <ut/persist.h>
#include <ut/registration.h>
