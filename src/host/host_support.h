// What the reference host's objects share: making them, handing text out in task memory, a
// class factory, and the enumeration of kept items.
#pragma once

#include <algorithm>
#include <cwchar>
#include <functional>
#include <new>
#include <string_view>
#include <utility>
#include <vector>

#include <ut/platform/com.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/testing.h>

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

// A creatable class of the host: `make` makes one object (an owned reference in *object).
class ClassFactory final : public ut::sdk::ComObject<IClassFactory> {
public:
    using Make = std::function<HRESULT(IUnknown** object)>;
    explicit ClassFactory(Make make) : make_(std::move(make)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {ut::sdk::Entry<ClassFactory, IClassFactory>(IID_IClassFactory)};
        return map;
    }

    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (HRESULT hr = ut::sdk::CheckHostFault("IClassFactory::CreateInstance"); FAILED(hr))
            return hr;
        if (outer)
            return CLASS_E_NOAGGREGATION;
        ut::ComPtr<IUnknown> made;
        if (HRESULT hr = make_(made.Put()); FAILED(hr))
            return hr;
        return made->QueryInterface(iid, object);
    }
    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

private:
    Make make_;
};

// An enumeration of items kept when it was made. `Items` says what it is:
//   using Interface = ...;              the enumeration interface
//   using Kept = ...; using Out = ...;  what is kept, and what Next hands out
//   static constexpr char kNext[];      the operation the fault hook is asked about
//   static HRESULT HandOut(const Kept&, Out&); static void Clear(Out&);
template <class Items>
class Enumerator final : public ut::sdk::ComObject<typename Items::Interface> {
public:
    using Interface = typename Items::Interface;
    using Kept = typename Items::Kept;
    using Out = typename Items::Out;
    using InterfaceEntry = CGWCOMObject::InterfaceEntry;

    explicit Enumerator(std::vector<Kept> items, size_t next = 0) : items_(std::move(items)), next_(next) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<Enumerator, Interface>(ut::InterfaceId<Interface>::Get())};
        return map;
    }

    HRESULT STDMETHODCALLTYPE Next(ULONG count, Out* items, ULONG* fetched) override {
        if (fetched)
            *fetched = 0;
        if (HRESULT hr = ut::sdk::CheckHostFault(Items::kNext); FAILED(hr))
            return hr;
        if (!items || (count > 1 && !fetched))
            return E_POINTER;
        ULONG done = 0;
        for (; done < count && next_ < items_.size(); ++done, ++next_) {
            if (HRESULT hr = Items::HandOut(items_[next_], items[done]); FAILED(hr)) {
                while (done > 0)
                    Items::Clear(items[--done]);
                return hr;
            }
        }
        if (fetched)
            *fetched = done;
        return done == count ? S_OK : S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Skip(ULONG count) override {
        size_t left = items_.size() - next_;
        next_ += std::min<size_t>(count, left);
        return count <= left ? S_OK : S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Reset() override {
        next_ = 0;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Clone(Interface** copy) override {
        if (!copy)
            return E_POINTER;
        *copy = nullptr;
        return ut::ExportBoundary([&] {
            *copy = Make<Enumerator>(items_, next_).Detach();
            return *copy ? S_OK : E_OUTOFMEMORY;
        });
    }

private:
    std::vector<Kept> items_;
    size_t next_;
};

} // namespace ut::host
