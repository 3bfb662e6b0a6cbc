// Notification sinks: the application sink's dispatch and all-or-nothing advice, the active
// database's object events, the load guard, the property forwarders and the curve cache, on the
// reference host.
#include <string>
#include <tuple>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/notify.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>

#include "support/ref_tracker.h"
#include "support/scene_mocks.h"
#include "test_scene.h"

namespace {

using ::testing::_;
using ::testing::Return;
using ut::test::Find;
using ut::test::Result;

// Records which handler ran and answers S_FALSE from each, so that the answer is seen to come back.
class Recording final : public CKXAppNotifySink {
public:
    std::string seen;
    HRESULT Note(std::string what) {
        seen += (seen.empty() ? "" : " ") + what;
        return S_FALSE;
    }
    HRESULT OnTerminate() override { return Note("Terminate"); }
    HRESULT OnPreCloseProject() override { return Note("PreClose"); }
    HRESULT OnStartup() override { return Note("Startup"); }
    HRESULT OnNewProject() override { return Note("New"); }
    HRESULT OnPostCloseProject() override { return Note("PostClose"); }
    HRESULT OnSelectionChange(ULONG kind, const VARIANT*) override {
        return Note("Selection" + std::to_string(kind));
    }
    HRESULT OnActiveListChange(ULONG kind, const VARIANT*) override {
        return Note("Active" + std::to_string(kind));
    }
    HRESULT OnChangedProject() override { return Note("Changed"); }
    HRESULT OnActivate(bool active) override { return Note(active ? "Activate" : "Deactivate"); }
    HRESULT OnMinimize() override { return Note("Minimize"); }
    HRESULT OnMaximize() override { return Note("Maximize"); }
};

VARIANT Integer(LONG value) {
    VARIANT variant;
    VariantInit(&variant);
    variant.vt = VT_I4;
    variant.lVal = value;
    return variant;
}

// The notifications in the order of the sink's bits.
const wchar_t* const kNames[] = {L"GWAPP_STATE_CHANGE",   L"KX3D_SELECTION_LIST", L"KX3D_ACTIVE_LIST",
                                 L"DesktopAppActivation", L"DesktopAppMinimized", L"DesktopAppRestore"};

TEST(AppNotifySink, DispatchesEachNotificationByItsExactName) {
    // The notification, its kind and value (-1: none); the result and the handlers that ran.
    const std::tuple<const wchar_t*, ULONG, LONG, std::string> cases[] = {
        {L"GWAPP_STATE_CHANGE", 1, 8, "S_FALSE Terminate"},
        {L"GWAPP_STATE_CHANGE", 1, 2, "S_FALSE PreClose"},
        {L"GWAPP_STATE_CHANGE", 1, 1, "S_FALSE Startup"},
        {L"GWAPP_STATE_CHANGE", 1, 4, "S_FALSE New"},
        {L"GWAPP_STATE_CHANGE", 1, 16, "S_FALSE PostClose"},
        {L"GWAPP_STATE_CHANGE", 1, 0x10100, "S_FALSE Changed"}, // the low 16 bits
        {L"GWAPP_STATE_CHANGE", 1, 3, "S_OK "},
        {L"GWAPP_STATE_CHANGE", 2, 8, "E_INVALIDARG "},
        {L"GWAPP_STATE_CHANGE", 1, -1, "E_INVALIDARG "},
        {L"gwapp_state_change", 1, 8, "S_OK "},
        {L"KX3D_SELECTION_LIST", 5, -1, "S_FALSE Selection5"},
        {L"KX3D_ACTIVE_LIST", 6, 0, "S_FALSE Active6"},
        {L"DesktopAppActivation", 1, 1, "S_FALSE Activate"},
        {L"DesktopAppActivation", 1, 0, "S_FALSE Deactivate"},
        {L"DesktopAppActivation", 0, 1, "E_INVALIDARG "},
        {L"DesktopAppMinimized", 0, -1, "S_FALSE Minimize"},
        {L"DesktopAppRestore", 0, -1, "S_FALSE Maximize"}};
    for (const auto& [name, kind, number, expected] : cases) {
        auto* sink = new Recording;
        VARIANT value = Integer(number);
        HRESULT hr = sink->PropertyChanged(name, kind, number < 0 ? nullptr : &value, 0);
        EXPECT_EQ(Result(hr) + " " + sink->seen, expected) << ut::test::Narrow(name) << " " << number;
        sink->Release();
    }
}

TEST(AppNotifySink, AdvisesAllOrNothingInItsBitOrderAndHearsTheService) {
    ut::test::MockNotificationService service;
    {
        ut::test::ScopedGenericObject installed(CLSID_GWNotificationService, &service);
        auto* sink = new Recording;
        ::testing::InSequence order;
        for (const wchar_t* name : kNames)
            EXPECT_CALL(service, Advise(::testing::StrEq(name), _)).WillOnce(Return(S_OK));
        EXPECT_CALL(service, Unadvise(::testing::StrEq(L"KX3D_SELECTION_LIST"), _)).WillOnce(Return(E_FAIL));
        EXPECT_EQ(sink->Advise(63), S_OK);
        EXPECT_EQ(sink->Advise(3), S_FALSE);
        EXPECT_EQ(sink->Unadvise(2), E_FAIL);
        EXPECT_EQ(sink->Unadvise(2), S_FALSE);
        EXPECT_EQ(sink->Flags(), 61u);
        sink->Release();
    }
    EXPECT_EQ(service.Extra(), 0u);

    // On the reference service, each notification reaches the handler it names.
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWNotificationService> real;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, real.PutVoid()),
              S_OK);
    auto* sink = new Recording;
    ASSERT_EQ(sink->Advise(1), S_OK);
    EXPECT_EQ(sink->Advise(3), S_FALSE);
    ASSERT_EQ(sink->Advise(62), S_OK);
    VARIANT closing = Integer(2), active = Integer(1);
    const std::pair<ULONG, VARIANT*> payloads[] = {{1, &closing}, {3, nullptr}, {4, nullptr},
                                                   {1, &active},  {0, nullptr}, {0, nullptr}};
    for (int i = 0; i < 6; ++i)
        real->Broadcast(kNames[i], payloads[i].first, payloads[i].second);
    EXPECT_EQ(sink->seen, "PreClose Selection3 Active4 Activate Minimize Maximize");
    EXPECT_EQ(sink->Unadvise(63), S_OK);
    real->Broadcast(L"DesktopAppRestore", 0, nullptr);
    EXPECT_EQ(sink->seen.find("Maximize Maximize"), std::string::npos);
    sink->Release();
}

class ActiveDatabase : public ::testing::Test {
protected:
    ut::test::MockEventSink events;
    ut::host::ReferenceHost host{ut::test::TestScene()};
    ut::ComPtr<IGWActiveDatabaseNotifier> notifier;
    void SetUp() override {
        ASSERT_EQ(
            GWQueryGenericObject(CLSID_GWActiveDatabase, IID_IGWActiveDatabaseNotifier, notifier.PutVoid()),
            S_OK);
    }
};

TEST_F(ActiveDatabase, TellsAdvisedSinksOfRemovedObjectsAndTheFinalEndOfLoad) {
    ut::ComPtr<I3DObject> light = Find(L"Light"), camera = Find(L"Camera1");
    EXPECT_EQ(KXAdviseOnActiveDBEx(nullptr, 1, 2), E_POINTER);
    EXPECT_CALL(events, OnObjectRemoved(static_cast<IUnknown*>(light.Get()))).WillOnce(Return(S_OK));
    EXPECT_CALL(events, OnFinalEndLoad(77)).WillOnce(Return(S_OK));
    EXPECT_CALL(events, OnEndLoad()).Times(0);
    ASSERT_EQ(KXAdviseOnActiveDBEx(&events, 1, GWDB_EVENT_REMOVED), S_OK);
    EXPECT_EQ(F3DRemove3DObjectFromScene(light.Get()), S_OK);
    // Registering for the final end of load withdraws the masked advice first.
    ASSERT_EQ(KXAdviseOnActiveDBForFinalEndLoad(&events, 77), S_OK);
    EXPECT_EQ(F3DRemove3DObjectFromScene(camera.Get()), S_OK);
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_LOAD_SAVE, nullptr), S_OK);
    EXPECT_EQ(KXAdviseOnActiveDB(&events, 0), S_OK);
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_LOAD_SAVE, nullptr), S_FALSE);
    EXPECT_EQ(events.Extra(), 0u);
}

TEST_F(ActiveDatabase, TheLoadGuardSwitchesResolvingOnForItsLifetime) {
    ut::ComPtr<IGWActiveDatabase> database;
    ASSERT_EQ(GWQueryGenericObject(CLSID_GWActiveDatabase, IID_IGWActiveDatabase, database.PutVoid()), S_OK);
    const ULONG resolving = GWDB_STATE_RESOLVE_ALL | GWDB_STATE_RESOLVE_DURING_LOAD;
    {
        CKXResolveAllDuringLoadHelper guard;
        EXPECT_EQ(database->TestStateFlags(resolving), S_OK);
    }
    EXPECT_EQ(database->TestStateFlags(GWDB_STATE_RESOLVE_ALL), S_FALSE);
    EXPECT_EQ(F3DWasLoadCancelled(), 0);
    database->SetStateFlags(GWDB_STATE_LOAD_CANCELLED, TRUE);
    EXPECT_EQ(F3DWasLoadCancelled(), 1);
}

TEST_F(ActiveDatabase, PropertyNotificationsGoOutWithTheirKindQuietlyWhenSeveralListen) {
    ut::test::MockPropertySink first, second;
    std::map<IGwPropertyNotifySink*, unsigned long> one = {{&first, 0}},
                                                    both = {{&first, 0}, {&second, 1u << 2}};
    std::string seen;
    auto note = [&](ULONG kind, REFGUID, const VARIANT*, IUnknown*, const GWPARAMS*, USHORT, USHORT) {
        seen += std::to_string(kind) + (host.SceneNotificationMode() == GW3DNOTIFY_QUIET ? "q " : "n ");
        return S_OK;
    };
    EXPECT_CALL(first, OnPropertyNotify).WillRepeatedly(note);
    EXPECT_CALL(second, OnPropertyNotify).WillRepeatedly(note);
    EXPECT_EQ(FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, one), S_OK);
    EXPECT_EQ(FPropertyAddedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    EXPECT_EQ(FPropertyChangedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    EXPECT_EQ(FPropertyRemovedNotify(ut::test::kX, nullptr, nullptr, nullptr, 0, 0, both), S_OK);
    // The second sink takes only changes.
    EXPECT_EQ(seen, "2n 1q 2q 2q 3q ");
    EXPECT_EQ(host.SceneNotificationMode(), GW3DNOTIFY_NORMAL);
}

TEST_F(ActiveDatabase, TheCurveCacheHoldsEachCurveOnceListensWhileItHoldsAndIsPruned) {
    C3DFCurveKeySelectionCache* cache = KXGetFCurveKeySelectionCache();
    ASSERT_TRUE(cache != nullptr);
    EXPECT_EQ(cache, KXGetFCurveKeySelectionCache());
    cache->Clear(); // empty and never listening: nothing to withdraw
    EXPECT_FALSE(cache->Listening());
    ut::ComPtr<I3DObject> arm = Find(L"Arm"), light = Find(L"Light");
    ut::test::MockFCurve onArm, onLight, orphan;
    EXPECT_CALL(onArm, GetParentObject)
        .WillRepeatedly(ut::test::GiveOut<0>(static_cast<IUnknown*>(arm.Get())));
    EXPECT_CALL(onLight, GetParentObject)
        .WillRepeatedly(ut::test::GiveOut<0>(static_cast<IUnknown*>(light.Get())));
    EXPECT_CALL(orphan, GetParentObject).WillRepeatedly(Return(S_FALSE));
    for (IFCurve* curve : {&onArm, &onLight, &onArm, &orphan})
        cache->AddCurve(curve);
    cache->AddCurve(nullptr);
    EXPECT_TRUE(cache->Listening());
    EXPECT_EQ(onArm.Extra(), 1u);
    int listed = 0;
    cache->Reset();
    while (IFCurve* curve = cache->Next()) {
        ++listed;
        curve->Release();
    }
    EXPECT_EQ(listed, 3);
    // A curve without an object, and one whose object left the scene, are dropped on validation.
    EXPECT_EQ(F3DRemove3DObjectFromScene(light.Get()), S_OK);
    for (IFCurve* curve : {&onArm, &onLight, &orphan})
        cache->ValidateCurve(curve);
    EXPECT_TRUE(cache->IsCurveInCache(&onArm) && !cache->IsCurveInCache(&onLight) &&
                !cache->IsCurveInCache(&orphan));
    // A removed curve is pruned through the database; closing the project empties the cache.
    EXPECT_EQ(notifier->Fire(GWDB_EVENT_REMOVED, &onArm), S_OK);
    EXPECT_TRUE(cache->IsEmpty());
    cache->AddCurve(&onArm);
    ut::ComPtr<IGWNotificationService> service;
    ASSERT_EQ(
        GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid()),
        S_OK);
    VARIANT closing = Integer(2);
    EXPECT_EQ(service->Broadcast(L"GWAPP_STATE_CHANGE", 1, &closing), S_OK);
    EXPECT_TRUE(cache->IsEmpty());
    EXPECT_FALSE(cache->Listening());
    EXPECT_FALSE(cache->RemoveCurve(&onArm));
    EXPECT_EQ(onArm.Extra() + onLight.Extra() + orphan.Extra(), 0u);
}

} // namespace
