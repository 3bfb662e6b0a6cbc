// Windows home: the common dialogs' record and codes come from the system headers.
#pragma once

#include <ut/platform/native/com.h>

#include <cderr.h>
#include <commdlg.h>
