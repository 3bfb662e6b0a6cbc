// The reference notification service: advise, unadvise and re-entrant broadcasts.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>

#include "support/com_mock.h"
#include "support/ref_tracker.h"

namespace {

using testing::Return;
using testing::StrEq;

class MockSink : public ut::test::ComMock<IGwNotifySink> {
public:
    MockSink() : ComMock(IID_IGwNotifySink) {}
    MOCK_METHOD(HRESULT, PropertyChanged, (const wchar_t*, ULONG, const VARIANT*, int),
                (override, Calltype(STDMETHODCALLTYPE)));
};

// Owned only by the service: it withdraws inside its own call and then still uses a member.
class SelfWithdrawingSink final : public ut::sdk::ComObject<IGwNotifySink> {
public:
    explicit SelfWithdrawingSink(IGWNotificationService* service) : service_(service) {}
    std::span<const InterfaceEntry> GetInterfaceMap() const override {
        static const InterfaceEntry map[] = {
            ut::sdk::Entry<SelfWithdrawingSink, IGwNotifySink>(IID_IGwNotifySink)};
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

class NotificationService : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service_.PutVoid()),
            S_OK);
    }
    void AdviseAll(std::initializer_list<MockSink*> sinks) {
        for (MockSink* sink : sinks)
            ASSERT_EQ(service_->Advise(L"Alpha", sink), S_OK);
    }
    void UnadviseAll(std::initializer_list<MockSink*> sinks) {
        for (MockSink* sink : sinks)
            service_->Unadvise(L"Alpha", sink);
    }

    ut::host::ReferenceHost host_;
    ut::ComPtr<IGWNotificationService> service_;
};

TEST_F(NotificationService, TellsEverySinkOfTheNameInOrderAndAnswersTheFirstFailure) {
    MockSink first, second, third, other;
    AdviseAll({&first, &second, &third});
    service_->Advise(L"Beta", &other);
    VARIANT value{};
    {
        testing::InSequence order;
        EXPECT_CALL(first, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(S_OK));
        EXPECT_CALL(second, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(E_INVALIDARG));
        EXPECT_CALL(third, PropertyChanged(StrEq(L"Alpha"), 7u, &value, 0)).WillOnce(Return(E_FAIL));
    }
    EXPECT_EQ(service_->Broadcast(L"Alpha", 7, &value), E_INVALIDARG);
    EXPECT_EQ(service_->Broadcast(L"alpha", 7, &value), S_FALSE) << "names are case-sensitive";
    UnadviseAll({&first, &second, &third});
    service_->Unadvise(L"Beta", &other);
}

TEST_F(NotificationService, HoldsOneReferencePerNameUntilUnadvised) {
    MockSink sink;
    ut::test::RefTracker refs;
    refs.Track(&sink, 1, "sink");
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Advise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Advise(L"Beta", &sink), S_OK);
    EXPECT_EQ(sink.Extra(), 2u);
    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_OK);
    EXPECT_EQ(service_->Unadvise(L"Alpha", &sink), S_FALSE);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
    EXPECT_EQ(service_->Unadvise(L"Beta", &sink), S_OK);
    EXPECT_EQ(service_->Advise(L"", &sink), E_INVALIDARG);
    EXPECT_EQ(service_->Advise(nullptr, &sink), E_POINTER);
}

TEST_F(NotificationService, SinksMayChangeTheRegistrationsDuringABroadcast) {
    MockSink leaving, editor, removed, added;
    AdviseAll({&leaving, &editor, &removed});
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
    EXPECT_CALL(added, PropertyChanged).WillOnce(Return(S_OK)); // from the second broadcast on

    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    UnadviseAll({&editor, &added});
}

TEST_F(NotificationService, ASinkOwnedOnlyByTheServiceOutlivesItsOwnWithdrawal) {
    ut::test::LiveObjectCheck live;
    auto* sink = new SelfWithdrawingSink(service_.Get());
    ASSERT_EQ(service_->Advise(L"Alpha", sink), S_OK);
    sink->Release();
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_OK);
    EXPECT_EQ(service_->Broadcast(L"Alpha", 1, nullptr), S_FALSE);
}

} // namespace
