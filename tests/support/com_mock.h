// The pattern for host mocks. A mock derives from ComMock<Interface>, which counts references
// the way a real object does (but never deletes: the test owns the mock on its stack), and adds
// GoogleMock methods for the interface's own operations:
//
//   class MockThing : public ut::test::ComMock<IThing> {
//   public:
//       MockThing() : ComMock(IID_IThing) {}
//       MOCK_METHOD(HRESULT, DoIt, (int), (override, Calltype(STDMETHODCALLTYPE)));
//   };
//
// An interface with a ut::InterfaceId needs no constructor. An object with several interfaces is
// made of one mock each, joined with Also.
//
// ScopedGenericObject installs a mock (or any object) as an application service for one scope,
// putting back whatever was installed before.
#pragma once

#include <utility>
#include <vector>

#include <ut/platform/com.h>
#include <ut/sdk/objects.h>

namespace ut::test {

template <class Interface>
class ComMock : public Interface {
public:
    explicit ComMock(const IID& iid, std::vector<IID> more = {}) : iids_(std::move(more)) {
        iids_.push_back(iid);
    }
    ComMock() requires HasInterfaceId<Interface> : ComMock(InterfaceId<Interface>::Get()) {}
    virtual ~ComMock() = default;

    // Answers `iid` with `other`, another mock of the same test object.
    void Also(const IID& iid, IUnknown* other) { others_.push_back({iid, other}); }

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override {
        if (!object)
            return E_POINTER;
        *object = nullptr;
        for (const auto& [own, other] : others_) {
            if (IsEqualGUID(iid, own)) {
                other->AddRef();
                *object = other;
                return S_OK;
            }
        }
        bool known = IsEqualGUID(iid, IID_IUnknown);
        for (const IID& own : iids_)
            known = known || IsEqualGUID(iid, own);
        if (!known)
            return E_NOINTERFACE;
        *object = static_cast<Interface*>(this);
        AddRef();
        return S_OK;
    }
    ULONG STDMETHODCALLTYPE AddRef() override { return ++references_; }
    ULONG STDMETHODCALLTYPE Release() override { return --references_; }

    // References beyond the test's own one.
    ULONG Extra() const { return references_ - 1; }

private:
    std::vector<IID> iids_;
    std::vector<std::pair<IID, IUnknown*>> others_;
    ULONG references_ = 1;
};

class ScopedGenericObject {
public:
    ScopedGenericObject(REFCLSID clsid, IUnknown* object) : clsid_(clsid) {
        GWQueryGenericObject(clsid, previous_.PutVoid());
        GWRegisterGenericObject(clsid, object);
    }
    ~ScopedGenericObject() {
        if (previous_)
            GWRegisterGenericObject(clsid_, previous_.Get());
        else
            GWRevokeGenericObject(clsid_);
    }
    ScopedGenericObject(const ScopedGenericObject&) = delete;
    ScopedGenericObject& operator=(const ScopedGenericObject&) = delete;

private:
    CLSID clsid_;
    ComPtr<IUnknown> previous_;
};

} // namespace ut::test
