// CGWCOMObject: reference counting and interface maps, and the live-object count.
#include <ut/sdk/comobject.h>
#include <ut/sdk/testing.h>

namespace {
std::atomic<long> g_liveObjects{0};
}

CGWCOMObject::CGWCOMObject() {
    g_liveObjects.fetch_add(1, std::memory_order_relaxed);
}

CGWCOMObject::~CGWCOMObject() {
    g_liveObjects.fetch_sub(1, std::memory_order_relaxed);
}

namespace ut::sdk {
long LiveCount() { return g_liveObjects.load(std::memory_order_relaxed); }
} // namespace ut::sdk

HRESULT CGWCOMObject::QueryInterface(REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (IsEqualGUID(iid, IID_IUnknown)) {
        *object = static_cast<IUnknown*>(this);
    } else {
        for (const InterfaceEntry& entry : GetInterfaceMap()) {
            if (IsEqualGUID(*entry.iid, iid)) {
                *object = entry.cast(this);
                break;
            }
        }
    }
    if (!*object)
        return E_NOINTERFACE;
    AddRef();
    return S_OK;
}

ULONG CGWCOMObject::AddRef() {
    return references_.fetch_add(1, std::memory_order_relaxed) + 1;
}

ULONG CGWCOMObject::Release() {
    ULONG left = references_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (left == 0)
        OnFinalRelease();
    return left;
}

HRESULT CGWCOMObject::GetWeakRefContainerWithReference(IUnknown** container) {
    if (container)
        *container = nullptr;
    return E_NOTIMPL;
}

void CGWCOMObject::OnFinalRelease() {
    delete this;
}

std::span<const CGWCOMObject::InterfaceEntry> CGWCOMObject::GetInterfaceMap() const {
    return {};
}

HRESULT CGWCOMObject::Construct() {
    return S_OK;
}
