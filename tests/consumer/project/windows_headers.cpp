// A Windows plug-in includes <windows.h> after the library's headers and gets all of it.
#include <ut/ut.h>

#include <windows.h>

#include <algorithm>

// The common dialogs are among what a trimmed <windows.h> leaves out, and the min macro among
// what NOMINMAX takes away.
bool SystemHeadersWhole() {
    OPENFILENAMEW dialog{};
    dialog.lStructSize = sizeof dialog;
    return dialog.lStructSize != 0 && min(1, 2) == 1;
}
