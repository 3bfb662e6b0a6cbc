// The COM basics on both homes: status codes, GUIDs and their text, IUnknown, task memory, the
// in-process class table, and ut::ComPtr, the owning smart pointer for interfaces.
#pragma once

#include <cstddef>
#include <cstring>
#include <functional>
#include <string>
#include <utility>

#include <ut/platform/native/com.h>

namespace ut {

// Maps an interface type to its identifier so that ComPtr::As can ask for it by type. Declare it
// next to the interface:
//   template <>
//   struct ut::InterfaceId<IThing> : ut::Iid<IID_IThing> {};
template <class Interface>
struct InterfaceId;

template <const IID& iid>
struct Iid {
    static const IID& Get() { return iid; }
};

template <class Interface>
concept HasInterfaceId = requires { InterfaceId<Interface>::Get(); };

// Holds one reference to an interface and releases it on every path.
template <class Interface>
class ComPtr {
public:
    ComPtr() noexcept = default;
    ComPtr(std::nullptr_t) noexcept {}
    // Takes a new reference on the pointer (the caller keeps its own).
    explicit ComPtr(Interface* pointer) noexcept : pointer_(pointer) { AddRefIfAny(); }
    ComPtr(const ComPtr& other) noexcept : pointer_(other.pointer_) { AddRefIfAny(); }
    ComPtr(ComPtr&& other) noexcept : pointer_(std::exchange(other.pointer_, nullptr)) {}
    ~ComPtr() { Reset(); }

    ComPtr& operator=(const ComPtr& other) noexcept {
        ComPtr(other).Swap(*this);
        return *this;
    }
    ComPtr& operator=(ComPtr&& other) noexcept {
        ComPtr(std::move(other)).Swap(*this);
        return *this;
    }
    ComPtr& operator=(std::nullptr_t) noexcept {
        Reset();
        return *this;
    }

    // Adopts a reference the caller already owns (typically an out-parameter's).
    static ComPtr Adopt(Interface* pointer) noexcept {
        ComPtr result;
        result.pointer_ = pointer;
        return result;
    }

    Interface* Get() const noexcept { return pointer_; }
    Interface* operator->() const noexcept { return pointer_; }
    Interface& operator*() const noexcept { return *pointer_; }
    explicit operator bool() const noexcept { return pointer_ != nullptr; }

    // Releases what is held and hands out the slot for a function that returns a new reference.
    Interface** Put() noexcept {
        Reset();
        return &pointer_;
    }
    void** PutVoid() noexcept { return reinterpret_cast<void**>(Put()); }

    // Gives the reference to the caller.
    [[nodiscard]] Interface* Detach() noexcept { return std::exchange(pointer_, nullptr); }

    void Reset() noexcept {
        if (Interface* old = std::exchange(pointer_, nullptr))
            old->Release();
    }
    void Swap(ComPtr& other) noexcept { std::swap(pointer_, other.pointer_); }

    // Hands a new reference out through a COM out-parameter.
    HRESULT CopyTo(Interface** out) const noexcept {
        if (!out)
            return E_POINTER;
        *out = pointer_;
        AddRefIfAny();
        return S_OK;
    }

    // QueryInterface by identifier into another smart pointer.
    template <class Other>
    HRESULT As(REFIID iid, ComPtr<Other>& out) const noexcept {
        if (!pointer_) {
            out.Reset();
            return E_POINTER;
        }
        return pointer_->QueryInterface(iid, out.PutVoid());
    }
    template <HasInterfaceId Other>
    HRESULT As(ComPtr<Other>& out) const noexcept {
        return As(InterfaceId<Other>::Get(), out);
    }

private:
    void AddRefIfAny() const noexcept {
        if (pointer_)
            pointer_->AddRef();
    }

    Interface* pointer_ = nullptr;
};

template <class A, class B>
bool operator==(const ComPtr<A>& a, const ComPtr<B>& b) noexcept {
    return a.Get() == b.Get();
}

// Strict weak ordering and hashing of GUIDs, for maps keyed by identifier.
struct GuidLess {
    bool operator()(REFGUID a, REFGUID b) const noexcept { return std::memcmp(&a, &b, sizeof(GUID)) < 0; }
};
struct GuidHash {
    std::size_t operator()(REFGUID g) const noexcept {
        std::size_t words[sizeof(GUID) / sizeof(std::size_t)];
        std::memcpy(words, &g, sizeof(GUID));
        std::size_t hash = 0;
        for (std::size_t word : words)
            hash = hash * 1099511628211u ^ word;
        return hash;
    }
};
struct GuidEqual {
    bool operator()(REFGUID a, REFGUID b) const noexcept { return IsEqualGUID(a, b) != 0; }
};

// The braced upper-case text of a GUID, as StringFromGUID2 writes it.
inline std::wstring GuidToString(REFGUID guid) {
    wchar_t text[40];
    int written = StringFromGUID2(guid, text, 40);
    return written > 0 ? std::wstring(text, static_cast<std::size_t>(written - 1)) : std::wstring();
}

// CLSIDFromString that leaves *guid as it was when the text is malformed, on both homes
// (the system's own may have written part of it).
inline HRESULT ParseGuid(LPCOLESTR text, GUID* guid) {
    if (!guid)
        return E_POINTER;
    CLSID parsed{};
    HRESULT hr = CLSIDFromString(text, &parsed);
    if (SUCCEEDED(hr))
        *guid = parsed;
    return hr;
}

// Owns a task-allocated block and frees it with CoTaskMemFree.
struct TaskMemDeleter {
    void operator()(void* block) const noexcept { CoTaskMemFree(block); }
};

} // namespace ut

template <>
struct ut::InterfaceId<IUnknown> : ut::Iid<IID_IUnknown> {};
template <>
struct ut::InterfaceId<IClassFactory> : ut::Iid<IID_IClassFactory> {};
