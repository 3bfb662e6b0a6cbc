// A Windows plug-in includes <windows.h> after the library's headers and gets all of it.
#include <ut/ut.h>

#include <windows.h>

// The common dialogs are among what a trimmed (WIN32_LEAN_AND_MEAN) <windows.h> leaves out.
bool SystemHeadersWhole() {
    OPENFILENAMEW dialog{};
    dialog.lStructSize = sizeof dialog;
    return dialog.lStructSize != 0;
}
