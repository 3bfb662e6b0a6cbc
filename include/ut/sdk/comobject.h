// CGWCOMObject: the reference-counted base of every COM-style class of the library.
//
// A class answers QueryInterface through its interface map: a table of (interface id, cast)
// entries returned by GetInterfaceMap. IUnknown is always answered, with the object's identity.
// A class that implements further interfaces derives from ComObject, which resolves the IUnknown
// methods of all its bases to CGWCOMObject's once:
//
//   class CThing : public ut::sdk::ComObject<IThing> {
//   public:
//       std::span<const InterfaceEntry> GetInterfaceMap() const override {
//           static const InterfaceEntry map[] = {ut::sdk::Entry<CThing, IThing>(IID_IThing)};
//           return map;
//       }
//   };
#pragma once

#include <atomic>
#include <span>

#include <ut/platform/com.h>
#include <ut/sdk/export.h>

class UT_SDK_API CGWCOMObject : public IUnknown {
public:
    struct InterfaceEntry {
        const IID* iid;
        void* (*cast)(CGWCOMObject* self);
    };

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    ULONG STDMETHODCALLTYPE AddRef() override;
    ULONG STDMETHODCALLTYPE Release() override;
    // This object keeps no weak references: E_NOTIMPL with *container cleared.
    virtual HRESULT GetWeakRefContainerWithReference(IUnknown** container);
    virtual ~CGWCOMObject();
    // Called when the last reference goes; deletes the object.
    virtual void OnFinalRelease();
    virtual std::span<const InterfaceEntry> GetInterfaceMap() const;
    // Second-phase construction, run by factories after `new`; a failure destroys the object.
    virtual HRESULT Construct();

    CGWCOMObject(const CGWCOMObject&) = delete;
    CGWCOMObject& operator=(const CGWCOMObject&) = delete;

protected:
    CGWCOMObject();
    ULONG References() const { return references_.load(std::memory_order_relaxed); }

private:
    std::atomic<ULONG> references_{1};
};

namespace ut::sdk {
template <class Object, class Interface>
void* CastTo(CGWCOMObject* self) {
    return static_cast<Interface*>(static_cast<Object*>(self));
}

// The interface-map entry that answers `iid` with the object's `Interface` part.
template <class Object, class Interface>
constexpr CGWCOMObject::InterfaceEntry Entry(const IID& iid) {
    return {&iid, &CastTo<Object, Interface>};
}

// CGWCOMObject together with the interfaces a class implements.
template <class... Interfaces>
class ComObject : public CGWCOMObject, public Interfaces... {
public:
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        return CGWCOMObject::QueryInterface(iid, object);
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return CGWCOMObject::AddRef(); }
    ULONG STDMETHODCALLTYPE Release() override { return CGWCOMObject::Release(); }

protected:
    ComObject() = default;
    ~ComObject() override = default;
};
} // namespace ut::sdk
