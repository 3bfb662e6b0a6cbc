// Linked into a DLL so that its load step runs when the loader maps it. A failed load step
// refuses the load.
#include <ut/platform/module_entry.h>

extern "C" BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID) {
    switch (reason) {
    case DLL_PROCESS_ATTACH:
        DisableThreadLibraryCalls(instance);
        return SUCCEEDED(ut::module::OnAttach(instance)) ? TRUE : FALSE;
    case DLL_PROCESS_DETACH:
        ut::module::OnDetach();
        return TRUE;
    default:
        return TRUE;
    }
}
