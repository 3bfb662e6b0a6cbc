// Linked into a shared library so that its load step runs when the loader maps it.
#include <cstdio>
#include <string>

#include <ut/platform/module_entry.h>
#include <ut/platform/process.h>

namespace {

HINSTANCE ThisModule() { return ut::platform::ModuleOf(reinterpret_cast<const void*>(&ThisModule)); }

__attribute__((constructor)) void AttachModule() {
    HINSTANCE self = ThisModule();
    HRESULT hr = ut::module::OnAttach(self);
    if (SUCCEEDED(hr))
        return;
    char code[16];
    std::snprintf(code, sizeof code, "0x%08X", static_cast<unsigned>(hr));
    ut::platform::ReportError(L"ut: loading " + ut::platform::ModuleFileName(self) + L" failed (" +
                              std::wstring(code, code + std::char_traits<char>::length(code)) +
                              L"); every call will answer E_UNEXPECTED");
}

__attribute__((destructor)) void DetachModule() { ut::module::OnDetach(); }

} // namespace
