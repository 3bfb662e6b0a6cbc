// The common dialogs' request record (OPENFILENAMEW), its flags and the extended error codes, on
// both homes. Nothing here shows a dialog: the application's file-dialog service does.
#pragma once

#include <ut/platform/com.h>
#include <ut/platform/native/dialogs.h>
