// The generic-object and class-factory registries. Entries are looked up under a lock and used
// outside it, so that an object's QueryInterface or Release may call back into the registry.
#include <map>
#include <mutex>

#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace {

template <class Interface>
class Registry {
public:
    HRESULT Install(REFCLSID clsid, Interface* object) {
        if (!object)
            return E_POINTER;
        ut::ComPtr<Interface> previous;
        std::lock_guard lock(mutex_);
        ut::ComPtr<Interface>& slot = entries_[clsid];
        previous = std::move(slot);
        slot = ut::ComPtr<Interface>(object);
        return previous ? S_FALSE : S_OK;
    }

    HRESULT Revoke(REFCLSID clsid) {
        ut::ComPtr<Interface> removed;
        {
            std::lock_guard lock(mutex_);
            auto it = entries_.find(clsid);
            if (it == entries_.end())
                return S_FALSE;
            removed = std::move(it->second);
            entries_.erase(it);
        }
        return S_OK;
    }

    ut::ComPtr<Interface> Find(REFCLSID clsid) {
        std::lock_guard lock(mutex_);
        auto it = entries_.find(clsid);
        return it == entries_.end() ? ut::ComPtr<Interface>() : it->second;
    }

private:
    std::mutex mutex_;
    std::map<CLSID, ut::ComPtr<Interface>, ut::GuidLess> entries_;
};

// The registries are never destroyed: modules still revoke and query them while the process
// exits, after function-local statics are gone.
Registry<IUnknown>& GenericObjects() {
    static Registry<IUnknown>* registry = new Registry<IUnknown>;
    return *registry;
}

Registry<IClassFactory>& ClassFactories() {
    static Registry<IClassFactory>* registry = new Registry<IClassFactory>;
    return *registry;
}

struct FaultState {
    std::mutex mutex;
    ut::sdk::HostFaultHook hook;
};

FaultState& Faults() {
    static FaultState* state = new FaultState;
    return *state;
}

class ObjectFactory final : public ut::sdk::ComObject<IClassFactory> {
public:
    explicit ObjectFactory(CGWCOMObject* (*create)()) : create_(create) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {ut::sdk::Entry<ObjectFactory, IClassFactory>(IID_IClassFactory)};
        return map;
    }

    HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown* outer, REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        if (outer)
            return CLASS_E_NOAGGREGATION;
        CGWCOMObject* created = create_();
        if (!created)
            return E_OUTOFMEMORY;
        // The object starts with one reference, which this pointer owns.
        ut::ComPtr<IUnknown> owner = ut::ComPtr<IUnknown>::Adopt(created);
        HRESULT hr = created->Construct();
        if (FAILED(hr))
            return hr;
        return created->QueryInterface(iid, object);
    }

    HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

private:
    CGWCOMObject* (*create_)();
};

// Creates through an installed factory, else through the platform, after the fault hook let
// `operation` through.
HRESULT Create(std::string_view operation, REFCLSID clsid, DWORD context, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault(operation); FAILED(hr))
        return hr;
    if (ut::ComPtr<IClassFactory> factory = ClassFactories().Find(clsid))
        return factory->CreateInstance(nullptr, iid, object);
    return CoCreateInstance(clsid, nullptr, context, iid, object);
}

} // namespace

HRESULT GWQueryGenericObject(REFCLSID clsid, REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWQueryGenericObject"); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> found = GenericObjects().Find(clsid);
    if (!found)
        return REGDB_E_CLASSNOTREG;
    return found->QueryInterface(iid, object);
}

HRESULT GWQueryGenericObject(REFCLSID clsid, void** object) {
    return GWQueryGenericObject(clsid, IID_IUnknown, object);
}

HRESULT KXCreateInstance(REFCLSID clsid, REFIID iid, void** object) {
    return Create("KXCreateInstance", clsid, CLSCTX_INPROC_SERVER, iid, object);
}

HRESULT GWRegisterGenericObject(REFCLSID clsid, IUnknown* object) {
    return ut::ExportBoundary([&] { return GenericObjects().Install(clsid, object); });
}

HRESULT GWRevokeGenericObject(REFCLSID clsid) {
    return GenericObjects().Revoke(clsid);
}

HRESULT GWRegisterClassFactory(REFCLSID clsid, IClassFactory* factory) {
    return ut::ExportBoundary([&] { return ClassFactories().Install(clsid, factory); });
}

HRESULT GWRevokeClassFactory(REFCLSID clsid) {
    return ClassFactories().Revoke(clsid);
}

namespace ut::sdk {

void SetHostFaultHook(HostFaultHook hook) {
    FaultState& state = Faults();
    std::lock_guard lock(state.mutex);
    state.hook = std::move(hook); // a move: nothing to allocate
}

HRESULT CheckHostFault(std::string_view operation) {
    return ut::ExportBoundary([&] {
        HostFaultHook hook;
        {
            FaultState& state = Faults();
            std::lock_guard lock(state.mutex);
            if (!state.hook)
                return S_OK;
            hook = state.hook; // a copy: the hook may replace itself while it runs
        }
        return hook(operation);
    });
}

HRESULT CreateInstance(REFCLSID clsid, DWORD context, REFIID iid, void** object) {
    return Create("CoCreateInstance", clsid, context, iid, object);
}

HRESULT CreateClassFactory(CGWCOMObject* (*create)(), IClassFactory** factory) {
    if (!factory)
        return E_POINTER;
    *factory = nullptr;
    if (!create)
        return E_INVALIDARG;
    auto* made = new (std::nothrow) ObjectFactory(create);
    if (!made)
        return E_OUTOFMEMORY;
    *factory = made;
    return S_OK;
}

} // namespace ut::sdk
