// Reference counting and interface lookup for the face's own objects, on both homes.
#pragma once

#include <atomic>

#include <ut/platform/com.h>

namespace ut::platform {

// An object that implements `Interfaces`: QueryInterface answers IUnknown (with the first
// interface) and each of them by its ut::InterfaceId. The object dies with its last reference.
template <class First, class... Rest>
class Object : public First, public Rest... {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (IsEqualGUID(iid, IID_IUnknown))
            *object = static_cast<First*>(this);
        else
            (void)(Answer<First>(iid, object) || ... || Answer<Rest>(iid, object)); // the first match wins
        if (!*object)
            return E_NOINTERFACE;
        AddRef();
        return S_OK;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references_; }
    ULONG STDMETHODCALLTYPE Release() override {
        ULONG left = --references_;
        if (left == 0)
            delete this;
        return left;
    }

protected:
    Object() = default;
    virtual ~Object() = default;

private:
    template <class Interface>
    bool Answer(REFIID iid, void** object) {
        if (!IsEqualGUID(iid, InterfaceId<Interface>::Get()))
            return false;
        *object = static_cast<Interface*>(this);
        return true;
    }

    std::atomic<ULONG> references_{1};
};

} // namespace ut::platform
