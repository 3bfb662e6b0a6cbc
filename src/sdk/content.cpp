// The current content container: one slot that the application sets when a scene opens.
#include <mutex>

#include <ut/sdk/content.h>
#include <ut/sdk/testing.h>

namespace {

struct CurrentContainer {
    std::mutex mutex;
    ut::ComPtr<IUnknown> container;
};

// Never destroyed: modules still ask for the container while the process exits.
CurrentContainer& Current() {
    static CurrentContainer* current = new CurrentContainer;
    return *current;
}

} // namespace

HRESULT GWContentGetCurrentContainer(REFIID iid, void** container) {
    if (!container)
        return E_POINTER;
    *container = nullptr;
    if (HRESULT hr = ut::sdk::CheckHostFault("GWContentGetCurrentContainer"); FAILED(hr))
        return hr;
    ut::ComPtr<IUnknown> found;
    {
        std::lock_guard lock(Current().mutex);
        found = Current().container;
    }
    // Asked outside the lock, so that the container may call back in.
    return found ? found->QueryInterface(iid, container) : E_FAIL;
}

HRESULT GWContentSetCurrentContainer(IUnknown* container) {
    ut::ComPtr<IUnknown> previous(container);
    {
        std::lock_guard lock(Current().mutex);
        Current().container.Swap(previous);
    }
    return S_OK;
}
