// Generic objects and class factories (install, query, create, revoke); CGWCOMObject's interface maps
// and reference counts.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/sdk/comobject.h>
#include <ut/sdk/objects.h>

#include "support/com_mock.h"
#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

constexpr CLSID kServiceClass = {0x5E1D1000, 0, 0x4000, {0x80, 0, 0, 0, 0, 0, 0x10, 0}};
constexpr IID IID_IService = {0x5E1D1001, 0, 0x4000, {0x80, 0, 0, 0, 0, 0, 0x10, 1}};
constexpr CLSID kWidgetClass = {0x5E1D1002, 0, 0x4000, {0x80, 0, 0, 0, 0, 0, 0x10, 2}};
constexpr IID IID_IWidget = {0x5E1D1003, 0, 0x4000, {0x80, 0, 0, 0, 0, 0, 0x10, 3}};

struct IService : IUnknown {
    virtual HRESULT STDMETHODCALLTYPE Answer(int* value) = 0;
};

class MockService : public ut::test::ComMock<IService> {
public:
    MockService() : ComMock(IID_IService) {}
    MOCK_METHOD(HRESULT, Answer, (int*), (override, Calltype(STDMETHODCALLTYPE)));
};

struct IWidget : IUnknown {
    virtual int STDMETHODCALLTYPE Size() = 0;
};

class Widget final : public ut::sdk::ComObject<IWidget> {
public:
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {ut::sdk::Entry<Widget, IWidget>(IID_IWidget)};
        return map;
    }
    HRESULT Construct() override { return failConstruct ? E_OUTOFMEMORY : S_OK; }
    int STDMETHODCALLTYPE Size() override { return 7; }
    static inline bool failConstruct = false;
};

TEST(GenericObjects, InstalledServicesAreFoundByClassWithCOMsCodes) {
    MockService service;
    ut::test::RefTracker refs;
    refs.Track(&service, 1, "service");
    ut::test::ScopedGenericObject installed(kServiceClass, &service);
    EXPECT_CALL(service, Answer(testing::_))
        .WillOnce(testing::DoAll(testing::SetArgPointee<0>(42), testing::Return(S_OK)));

    ut::ComPtr<IService> found;
    ASSERT_EQ(GWQueryGenericObject(kServiceClass, IID_IService, found.PutVoid()), S_OK);
    int value = 0;
    EXPECT_EQ(found->Answer(&value), S_OK);
    EXPECT_EQ(value, 42);

    ut::ComPtr<IUnknown> identity;
    EXPECT_EQ(GWQueryGenericObject(kServiceClass, identity.PutVoid()), S_OK);
    EXPECT_EQ(identity.Get(), static_cast<IUnknown*>(&service));
    // Failures use the codes of COM.
    void* out = &out;
    EXPECT_EQ(GWQueryGenericObject(kWidgetClass, IID_IService, &out), REGDB_E_CLASSNOTREG);
    EXPECT_EQ(out, nullptr);
    out = &out;
    EXPECT_EQ(GWQueryGenericObject(kServiceClass, IID_IWidget, &out), E_NOINTERFACE);
    EXPECT_EQ(out, nullptr);
    EXPECT_EQ(GWQueryGenericObject(kServiceClass, IID_IService, nullptr), E_POINTER);
}

TEST(GenericObjects, ReplacingAndRevokingReleaseTheOldObject) {
    MockService first, second;
    ASSERT_EQ(GWRegisterGenericObject(kServiceClass, &first), S_OK);
    EXPECT_EQ(first.Extra(), 1u);
    EXPECT_EQ(GWRegisterGenericObject(kServiceClass, &second), S_FALSE);
    EXPECT_EQ(first.Extra(), 0u);
    EXPECT_EQ(GWRevokeGenericObject(kServiceClass), S_OK);
    EXPECT_EQ(second.Extra(), 0u);
    EXPECT_EQ(GWRevokeGenericObject(kServiceClass), S_FALSE);
}

TEST(ClassFactories, CreateInstalledClassesWithConstruct) {
    ut::test::LiveObjectCheck live;
    ASSERT_EQ(ut::sdk::RegisterClass<Widget>(kWidgetClass), S_OK);
    ut::ComPtr<IWidget> widget;
    ASSERT_EQ(KXCreateInstance(kWidgetClass, IID_IWidget, widget.PutVoid()), S_OK);
    EXPECT_EQ(widget->Size(), 7);
    EXPECT_EQ(ut::test::RefTracker::References(widget.Get()), 1u);
    widget.Reset();

    Widget::failConstruct = true;
    void* out = &out;
    EXPECT_EQ(KXCreateInstance(kWidgetClass, IID_IWidget, &out), E_OUTOFMEMORY);
    EXPECT_EQ(out, nullptr);
    Widget::failConstruct = false;

    EXPECT_EQ(KXCreateInstance(kWidgetClass, IID_IService, &out), E_NOINTERFACE);
    EXPECT_EQ(GWRevokeClassFactory(kWidgetClass), S_OK);
    EXPECT_EQ(KXCreateInstance(kWidgetClass, IID_IWidget, &out), REGDB_E_CLASSNOTREG);
}

TEST(FaultPlan, FailsExactlyTheChosenHostCall) {
    MockService service;
    ut::test::ScopedGenericObject installed(kServiceClass, &service);
    ut::test::FaultPlan plan(2, E_ACCESSDENIED);
    void* out = nullptr;
    EXPECT_EQ(GWQueryGenericObject(kServiceClass, IID_IService, &out), S_OK);
    static_cast<IUnknown*>(out)->Release();
    EXPECT_EQ(GWQueryGenericObject(kServiceClass, IID_IService, &out), E_ACCESSDENIED);
    EXPECT_EQ(KXCreateInstance(kWidgetClass, IID_IWidget, &out), REGDB_E_CLASSNOTREG);
    EXPECT_THAT(plan.Seen(),
                testing::ElementsAre("GWQueryGenericObject", "GWQueryGenericObject", "KXCreateInstance"));
    EXPECT_EQ(service.Extra(), 1u); // the installation's own reference
}

constexpr IID IID_IPing = {0x5E1D0001, 0x0000, 0x4000, {0x80, 0, 0, 0, 0, 0, 0, 1}};
constexpr IID IID_IPong = {0x5E1D0002, 0x0000, 0x4000, {0x80, 0, 0, 0, 0, 0, 0, 2}};

struct IPing : IUnknown {
    virtual int STDMETHODCALLTYPE Ping() = 0;
};
struct IPong : IUnknown {
    virtual int STDMETHODCALLTYPE Pong() = 0;
};

class PingPong final : public ut::sdk::ComObject<IPing, IPong> {
public:
    explicit PingPong(bool* destroyed = nullptr) : destroyed_(destroyed) {}
    ~PingPong() override {
        if (destroyed_)
            *destroyed_ = true;
    }
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {ut::sdk::Entry<PingPong, IPing>(IID_IPing),
                                             ut::sdk::Entry<PingPong, IPong>(IID_IPong)};
        return map;
    }
    int STDMETHODCALLTYPE Ping() override { return 1; }
    int STDMETHODCALLTYPE Pong() override { return 2; }

private:
    bool* destroyed_;
};

TEST(CGWCOMObject, AnswersItsMapKeepsOneIdentityAndRefusesTheRest) {
    ut::test::LiveObjectCheck live;
    auto object = ut::ComPtr<IPing>::Adopt(new PingPong);
    ut::test::RefTracker refs;
    refs.Track(object.Get(), 1);

    ut::ComPtr<IPong> pong;
    ASSERT_EQ(object.As(IID_IPong, pong), S_OK);
    EXPECT_EQ(pong->Pong(), 2);
    ut::ComPtr<IUnknown> a, b;
    ASSERT_EQ(object.As(IID_IUnknown, a), S_OK);
    ASSERT_EQ(pong.As(IID_IUnknown, b), S_OK);
    EXPECT_EQ(a.Get(), b.Get());

    constexpr IID other = {0x5E1D0003, 0, 0, {0, 0, 0, 0, 0, 0, 0, 3}};
    void* out = &out;
    EXPECT_EQ(object->QueryInterface(other, &out), E_NOINTERFACE);
    EXPECT_EQ(out, nullptr);
    EXPECT_EQ(object->QueryInterface(IID_IPong, nullptr), E_POINTER);
}

// The last release, here through ComPtr's reset, destroys the object.
TEST(ComPtr, CopiesMovesAndDetachesWithBalancedReferences) {
    bool destroyed = false;
    {
        auto first = ut::ComPtr<IPing>::Adopt(new PingPong(&destroyed));
        ut::ComPtr<IPing> copy = first;
        EXPECT_EQ(ut::test::RefTracker::References(first.Get()), 2u);
        ut::ComPtr<IPing> moved = std::move(copy);
        EXPECT_FALSE(copy);
        EXPECT_EQ(ut::test::RefTracker::References(first.Get()), 2u);
        IPing* detached = moved.Detach();
        EXPECT_EQ(ut::test::RefTracker::References(first.Get()), 2u);
        detached->Release();
        IPing* out = nullptr;
        ASSERT_EQ(first.CopyTo(&out), S_OK);
        EXPECT_EQ(out->Release(), 1u);
        EXPECT_FALSE(destroyed);
        first = nullptr;
        EXPECT_TRUE(destroyed);
    }
}

} // namespace
