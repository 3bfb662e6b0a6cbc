#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>

#include "support/com_mock.h"
#include "support/ref_tracker.h"

namespace {

using testing::_;
using testing::Return;
using testing::StrEq;

class MockSink : public ut::test::ComMock<IGwNotifySink> {
public:
    MockSink() : ComMock(IID_IGwNotifySink) {}
    MOCK_METHOD(HRESULT, PropertyChanged, (const wchar_t*, ULONG, const VARIANT*, int),
                (override, Calltype(STDMETHODCALLTYPE)));
};

// A reference-counted sink whose only owner is the service: it withdraws from inside its own
// call and then still uses its members, which must be alive until the call returns.
class SelfWithdrawingSink final : public CGWCOMObject, public IGwNotifySink {
public:
    explicit SelfWithdrawingSink(IGWNotificationService* service) : service_(service) {}
    UT_COM_OBJECT_IUNKNOWN()
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            UT_INTERFACE_ENTRY(SelfWithdrawingSink, IGwNotifySink, IID_IGwNotifySink)};
        return map;
    }
    HRESULT STDMETHODCALLTYPE PropertyChanged(const wchar_t* name, ULONG, const VARIANT*, int) override {
        service_->Unadvise(name, this);
        ++calls_;
        return S_OK;
    }

private:
    IGWNotificationService* service_;
    int calls_ = 0;
};

class NotificationServiceTest : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(host_.Status(), S_OK);
        ASSERT_EQ(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service_.PutVoid()),
            S_OK);
    }

    ut::host::ReferenceHost host_;
    ut::ComPtr<IGWNotificationService> service_;
};

TEST_F(NotificationServiceTest, BroadcastReachesTheSinksOfThatNameInAdviseOrder) {
    MockSink first, second, other;
    ASSERT_EQ(service_->Advise(L"Alpha", &first), S_OK);
    ASSERT_EQ(service_->Advise(L"Alpha", &second), S_OK);
    ASSERT_EQ(service_->Advise(L"Beta", &other), S_OK);
    VARIANT value{};
    {
        testing::InSequence order;
        EXPECT_CALL(first, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(S_OK));
        EXPECT_CALL(second, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(S_FALSE));
    }
    EXPECT_CALL(other, PropertyChanged).Times(0);

    EXPECT_EQ(service_->Broadcast(L"Alpha", 7, &value), S_OK);
    EXPECT_EQ(service_->Broadcast(L"alpha", 7, &value), S_FALSE) << "names are case-sensitive";
    EXPECT_EQ(service_->Broadcast(L"Gamma", 7, &value), S_FALSE);

    service_->Unadvise(L"Alpha", &first);
    service_->Unadvise(L"Alpha", &second);
    service_->Unadvise(L"Beta", &other);
}

TEST_F(NotificationServiceTest, AdviseHoldsOneReferenceUntilUnadvised) {
    MockSink sink;
    ut::test::RefTracker refs;
    refs.Track(&sink, 1, "sink");
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Advise(L"Beta", &sink), S_OK);
    EXPECT_EQ(sink.Extra(), 2u);

    EXPECT_CALL(sink, PropertyChanged(StrEq(L"Alpha"), _, _, _)).WillOnce(Return(S_OK));
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);

    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
    EXPECT_EQ(service_->Unadvise(L"Beta", &sink), S_OK);
}

TEST_F(NotificationServiceTest, ChecksItsArguments) {
    MockSink sink;
    EXPECT_EQ(service_->Advise(nullptr, &sink), E_POINTER);
    EXPECT_EQ(service_->Advise(L"Alpha", nullptr), E_POINTER);
    EXPECT_EQ(service_->Advise(L"", &sink), E_INVALIDARG);
    EXPECT_EQ(service_->Unadvise(nullptr, &sink), E_POINTER);
    EXPECT_EQ(service_->Unadvise(L"Alpha", nullptr), E_POINTER);
    EXPECT_EQ(service_->Broadcast(nullptr, 1, nullptr), E_POINTER);
    EXPECT_EQ(sink.Extra(), 0u);
}

TEST_F(NotificationServiceTest, EverySinkIsToldAndTheFirstFailureAnswered) {
    MockSink first, second, third;
    for (MockSink* sink : {&first, &second, &third})
        service_->Advise(L"Alpha", sink);
    EXPECT_CALL(first, PropertyChanged).WillOnce(Return(S_OK));
    EXPECT_CALL(second, PropertyChanged).WillOnce(Return(E_INVALIDARG));
    EXPECT_CALL(third, PropertyChanged).WillOnce(Return(E_FAIL));

    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), E_INVALIDARG);

    for (MockSink* sink : {&first, &second, &third})
        service_->Unadvise(L"Alpha", sink);
}

TEST_F(NotificationServiceTest, SinksMayChangeTheRegistrationsDuringABroadcast) {
    MockSink leaving, editor, removed, added;
    for (MockSink* sink : {&leaving, &editor, &removed})
        service_->Advise(L"Alpha", sink);
    EXPECT_CALL(leaving, PropertyChanged).WillOnce([&](const wchar_t* name, ULONG, const VARIANT*, int) {
        return service_->Unadvise(name, &leaving);
    });
    EXPECT_CALL(editor, PropertyChanged)
        .WillOnce([&](const wchar_t* name, ULONG, const VARIANT*, int) {
            service_->Unadvise(name, &removed);
            return service_->Advise(name, &added);
        })
        .WillOnce(Return(S_OK));
    EXPECT_CALL(removed, PropertyChanged).Times(0);
    EXPECT_CALL(added, PropertyChanged).WillOnce(Return(S_OK));

    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(leaving.Extra() + removed.Extra(), 0u);

    service_->Unadvise(L"Alpha", &editor);
    service_->Unadvise(L"Alpha", &added);
}

TEST_F(NotificationServiceTest, ASinkOwnedOnlyByTheServiceOutlivesItsOwnWithdrawal) {
    ut::test::LiveObjectCheck live;
    auto* sink = new SelfWithdrawingSink(service_.Get());
    ASSERT_EQ(service_->Advise(L"Alpha", sink), S_OK);
    sink->Release();

    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
}

TEST(ReferenceHost, InstallsTheNotificationServiceForItsLifetime) {
    ut::ComPtr<IGWNotificationService> service;
    {
        ut::host::ReferenceHost host;
        EXPECT_EQ(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid()),
            S_OK);
    }
    EXPECT_TRUE(service) << "a caller's reference keeps the service";
    ut::ComPtr<IUnknown> gone;
    EXPECT_EQ(GWQueryGenericObject(CLSID_GWNotificationService, gone.PutVoid()), REGDB_E_CLASSNOTREG);
}

} // namespace
