// What the reference host's objects share: making them, and handing text out in task memory.
#pragma once

#include <cwchar>
#include <new>
#include <string_view>
#include <utility>

#include <ut/platform/com.h>

namespace ut::host {

// A new object owned by the returned pointer; null when memory ran out.
template <class Object, class... Arguments>
ut::ComPtr<Object> Make(Arguments&&... arguments) {
    return ut::ComPtr<Object>::Adopt(new (std::nothrow) Object(std::forward<Arguments>(arguments)...));
}

// A copy of `text` in task memory, for the caller to free with CoTaskMemFree.
inline HRESULT CopyToTaskMemory(std::wstring_view text, wchar_t** copy) {
    if (!copy)
        return E_POINTER;
    *copy = static_cast<wchar_t*>(CoTaskMemAlloc((text.size() + 1) * sizeof(wchar_t)));
    if (!*copy)
        return E_OUTOFMEMORY;
    std::wmemcpy(*copy, text.data(), text.size());
    (*copy)[text.size()] = L'\0';
    return S_OK;
}

// Writes an interface of `object` through an out-parameter that the callee clears first.
template <class Object>
HRESULT HandOut(const ut::ComPtr<Object>& object, REFIID iid, void** out) {
    if (!out)
        return E_POINTER;
    *out = nullptr;
    return object ? object->QueryInterface(iid, out) : E_OUTOFMEMORY;
}

} // namespace ut::host
