// CGWCOMObject: the reference-counted base of every COM-style class of the library.
//
// A class answers QueryInterface through its interface map: a table of (interface id, cast)
// entries returned by GetInterfaceMap. IUnknown is always answered, with the object's identity.
// A class that also derives from another interface resolves the IUnknown methods once:
//
//   class CThing : public CGWCOMObject, public IThing {
//   public:
//       UT_COM_OBJECT_IUNKNOWN()
//       std::span<const InterfaceEntry> GetInterfaceMap() const override {
//           static const InterfaceEntry map[] = {UT_INTERFACE_ENTRY(CThing, IThing, IID_IThing)};
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
} // namespace ut::sdk

#define UT_INTERFACE_ENTRY(Object, Interface, iid)                                                           \
    CGWCOMObject::InterfaceEntry {                                                                           \
        &(iid), &ut::sdk::CastTo<Object, Interface>                                                          \
    }

#define UT_COM_OBJECT_IUNKNOWN()                                                                             \
    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {                           \
        return CGWCOMObject::QueryInterface(iid, object);                                                    \
    }                                                                                                        \
    ULONG STDMETHODCALLTYPE AddRef() override {                                                              \
        return CGWCOMObject::AddRef();                                                                       \
    }                                                                                                        \
    ULONG STDMETHODCALLTYPE Release() override {                                                             \
        return CGWCOMObject::Release();                                                                      \
    }
