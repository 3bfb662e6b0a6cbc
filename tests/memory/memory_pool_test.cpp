#include <limits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/memory.h>
#include <ut/sdk/objects.h>

#include "support/com_mock.h"
#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

using testing::_;
using testing::Return;
using testing::StrEq;

class MockNotificationService : public ut::test::ComMock<IGWNotificationService> {
public:
    MockNotificationService() : ComMock(IID_IGWNotificationService) {}
    MOCK_METHOD(HRESULT, Advise, (const wchar_t*, IGwNotifySink*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, Unadvise, (const wchar_t*, IGwNotifySink*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, Broadcast, (const wchar_t*, ULONG, const VARIANT*),
                (override, Calltype(STDMETHODCALLTYPE)));
};

constexpr const wchar_t* kStateChange = ut::sdk::kAppStateChange;

IGwNotifySink* AsSink(CMemoryPool& pool) {
    return &pool;
}

VARIANT IntegerVariant(VARTYPE type, ULONG payload) {
    VARIANT value;
    VariantInit(&value);
    value.vt = type;
    value.ulVal = payload;
    return value;
}

struct ReleaseCase {
    const char* what;
    LONG size;
    LONG resizedTo;  // 0: not resized
    int keptInClass; // -1: freed at once
    std::size_t capacity;
};

// Rows print as their description (gtest would otherwise dump their padding bytes).
void PrintTo(const ReleaseCase& row, std::ostream* out) {
    *out << row.what;
}

class ReleaseRules : public testing::TestWithParam<ReleaseCase> {};

TEST_P(ReleaseRules, KeepBlocksByTheirLastSizeAndFreeLargeOnes) {
    const ReleaseCase& row = GetParam();
    CMemoryPool pool;
    void* block = pool.Allocate(row.size);
    ASSERT_NE(block, nullptr);
    if (row.resizedTo)
        block = pool.Reallocate(block, row.resizedTo);
    pool.Deallocate(block);

    pool.Diagnostics();
    EXPECT_EQ(pool.InUseCount, 0u);
    if (row.keptInClass < 0) {
        EXPECT_EQ(pool.TotalFreeCount, 0u);
        return;
    }
    EXPECT_EQ(pool.TotalFreeCount, 1u);
    EXPECT_EQ(pool.FreeCounts[row.keptInClass], 1u);
    EXPECT_EQ(pool.FreeBytes[row.keptInClass], row.capacity);

    // The largest size of the class gets the kept block back; the next class a new one.
    LONG classTop = 16 * (row.keptInClass + 1);
    if (classTop < CMemoryPool::kLargestPooled) {
        EXPECT_NE(pool.Allocate(classTop + 1), block);
    }
    EXPECT_EQ(pool.Allocate(classTop), block);
}

INSTANTIATE_TEST_SUITE_P(MemoryPool, ReleaseRules,
                         testing::Values(ReleaseCase{"a class covers 17 to 32", 20, 0, 1, 32},
                                         ReleaseCase{"the largest pooled size", 4096, 0, 255, 4096},
                                         ReleaseCase{"one more is freed", 4097, 0, -1, 0},
                                         ReleaseCase{"zero is served as 16", 0, 0, 0, 16},
                                         ReleaseCase{"grown in place waits by its new size", 10, 100, 6, 112},
                                         ReleaseCase{"grown past 4096 is freed", 10, 5000, -1, 0},
                                         ReleaseCase{"shrinking keeps the capacity", 100, 10, 0, 112},
                                         ReleaseCase{"large capacity with a small size is freed", 5000, 20,
                                                     -1, 0}),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(MemoryPool, ReallocateEdges) {
    CMemoryPool pool;
    EXPECT_EQ(pool.Allocate(-1), nullptr);

    void* block = pool.Reallocate(nullptr, 0);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(pool.Reallocate(block, -1), nullptr);
    EXPECT_EQ(pool.Reallocate(block, 16), block) << "a failed call leaves the block usable";
    EXPECT_EQ(pool.Reallocate(block, 0), nullptr);
    pool.Diagnostics();
    EXPECT_EQ(pool.InUseCount, 0u);
    EXPECT_EQ(pool.FreeCounts[0], 1u);
    pool.Deallocate(nullptr);
}

TEST(MemoryPool, PointersKeepTheAlignmentOfTheirHeader) {
    CMemoryPool pool;
    void* blocks[] = {pool.Allocate(1), pool.Allocate(24), pool.Allocate(4096), pool.Allocate(10000)};
    blocks[1] = pool.Reallocate(blocks[1], 3000);
    for (void* block : blocks)
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(block) % (2 * sizeof(void*)), 0u);
}

TEST(MemoryPool, DiagnosticsCountsBlocksInUseAndKeptPerClass) {
    CMemoryPool pool;
    void* kept[] = {pool.Allocate(1), pool.Allocate(16), pool.Allocate(40)};
    pool.Allocate(100);
    pool.Allocate(5000);
    for (void* block : kept)
        pool.Deallocate(block);
    pool.Diagnostics();
    EXPECT_EQ(pool.InUseCount, 2u);
    EXPECT_EQ(pool.InUseBytes, 112u + 5008u);
    EXPECT_EQ(pool.FreeCounts[0], 2u);
    EXPECT_EQ(pool.FreeBytes[0], 32u);
    EXPECT_EQ(pool.FreeCounts[2], 1u);
    EXPECT_EQ(pool.TotalFreeCount, 3u);
    EXPECT_EQ(pool.TotalFreeBytes, 80u);

    pool.Purge();
    pool.Diagnostics();
    EXPECT_EQ(pool.TotalFreeCount, 0u);
    EXPECT_EQ(pool.TotalFreeBytes, 0u);
    EXPECT_EQ(pool.FreeCounts[0], 0u);
    EXPECT_EQ(pool.InUseCount, 2u);
}

TEST(MemoryPool, AnswersQueryInterfaceWithoutHandingOutAnything) {
    CMemoryPool pool;
    void* untouched = &pool;
    EXPECT_EQ(pool.QueryInterface(IID_IUnknown, &untouched), S_OK);
    EXPECT_EQ(pool.QueryInterface(IID_IGwNotifySink, &untouched), S_OK);
    EXPECT_EQ(pool.QueryInterface(IID_IGWNotificationService, &untouched), E_NOINTERFACE);
    EXPECT_EQ(untouched, &pool);
    EXPECT_EQ(pool.AddRef(), 1u);
    EXPECT_EQ(pool.Release(), 1u);
}

class PoolWithMockService : public testing::Test {
protected:
    void ExpectAdvise(CMemoryPool& pool, HRESULT answer = S_OK) {
        EXPECT_CALL(service_, Advise(StrEq(kStateChange), AsSink(pool))).WillOnce(Return(answer));
    }
    void ExpectUnadvise(CMemoryPool& pool) {
        EXPECT_CALL(service_, Unadvise(StrEq(kStateChange), AsSink(pool))).WillOnce(Return(S_OK));
    }

    testing::StrictMock<MockNotificationService> service_;
    ut::test::RefTracker refs_;
    ut::test::ScopedGenericObject installed_{CLSID_GWNotificationService, &service_};
};

TEST_F(PoolWithMockService, RegistersOnceAtTheFirstAllocationAndWithdrawsAtDestruction) {
    refs_.Track(&service_, 1, "service");
    {
        CMemoryPool pool; // a strict mock: constructing asks nothing
        ExpectAdvise(pool);
        ut::test::FaultPlan hostCalls(std::numeric_limits<int>::max());
        for (int i = 0; i < 1000; ++i)
            pool.Deallocate(pool.Allocate(i));
        EXPECT_EQ(hostCalls.Calls(), 1) << "once registered, allocations do not ask the host";
        ExpectUnadvise(pool);
    }
}

TEST_F(PoolWithMockService, ARefusedRegistrationIsTriedAgain) {
    CMemoryPool pool;
    ExpectAdvise(pool, E_FAIL);
    void* first = pool.Allocate(8);
    EXPECT_NE(first, nullptr);
    testing::Mock::VerifyAndClearExpectations(&service_);
    ExpectAdvise(pool);
    pool.Deallocate(pool.Allocate(8));
    ExpectUnadvise(pool);
}

struct StateChangeCase {
    const char* what;
    const wchar_t* name;
    ULONG kind;
    bool hasValue;
    VARTYPE type;
    ULONG payload;
    bool purges;
    bool unregisters;
};

void PrintTo(const StateChangeCase& row, std::ostream* out) {
    *out << row.what;
}

class StateChanges : public PoolWithMockService, public testing::WithParamInterface<StateChangeCase> {};

TEST_P(StateChanges, PurgeAndOnTerminationUnregister) {
    const StateChangeCase& row = GetParam();
    CMemoryPool pool;
    ExpectAdvise(pool);
    void* kept = pool.Allocate(50);
    void* inUse = pool.Allocate(50);
    pool.Deallocate(kept);
    testing::Mock::VerifyAndClearExpectations(&service_);

    if (row.unregisters)
        ExpectUnadvise(pool);
    VARIANT value = IntegerVariant(row.type, row.payload);
    EXPECT_EQ(pool.PropertyChanged(row.name, row.kind, row.hasValue ? &value : nullptr, 0), S_OK);
    pool.Diagnostics();
    EXPECT_EQ(pool.TotalFreeCount, row.purges ? 0u : 1u);
    EXPECT_EQ(pool.InUseCount, 1u);
    testing::Mock::VerifyAndClearExpectations(&service_);

    if (row.unregisters) {
        // An allocation after termination listens again.
        ExpectAdvise(pool);
        pool.Deallocate(pool.Allocate(1));
    }
    pool.Deallocate(inUse);
    ExpectUnadvise(pool);
}

INSTANTIATE_TEST_SUITE_P(
    MemoryPool, StateChanges,
    testing::Values(
        StateChangeCase{"state 3 purges", kStateChange, 1, true, VT_I4, 3, true, false},
        StateChangeCase{"state 8 also unregisters", kStateChange, 1, true, VT_I4, 8, true, true},
        StateChangeCase{"16-bit payload", kStateChange, 1, true, VT_I2, 8, true, true},
        StateChangeCase{"low 16 bits count", kStateChange, 1, true, VT_UI4, 0x10008, true, true},
        StateChangeCase{"no integer payload", kStateChange, 1, true, VT_R8, 8, true, false},
        StateChangeCase{"no value", kStateChange, 1, false, VT_EMPTY, 0, true, false},
        StateChangeCase{"other kinds are ignored", kStateChange, 2, true, VT_I4, 8, false, false},
        StateChangeCase{"names are case-sensitive", L"gwapp_state_change", 1, true, VT_I4, 8, false, false},
        StateChangeCase{"other notifications", L"KX3D_SELECTION_LIST", 1, true, VT_I4, 8, false, false},
        StateChangeCase{"no name", nullptr, 1, true, VT_I4, 8, false, false}),
    [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(MemoryPool, WorksWithoutAHost) {
    CMemoryPool pool;
    void* block = pool.Allocate(64);
    ASSERT_NE(block, nullptr);
    pool.Deallocate(block);
    pool.Unregister();
    EXPECT_EQ(pool.PropertyChanged(kStateChange, 1, nullptr, 0), S_OK);
    pool.Diagnostics();
    EXPECT_EQ(pool.TotalFreeCount, 0u);
}

TEST(MemoryPool, PoolsFollowTheReferenceHostsStateChanges) {
    ut::host::ReferenceHost host;
    ut::ComPtr<IGWNotificationService> service;
    ASSERT_EQ(
        GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid()),
        S_OK);
    CMemoryPool first, second;
    for (CMemoryPool* pool : {&first, &second})
        pool->Deallocate(pool->Allocate(200));

    VARIANT state = IntegerVariant(VT_I4, 3);
    EXPECT_EQ(service->Broadcast(kStateChange, 1, &state), S_OK);
    for (CMemoryPool* pool : {&first, &second}) {
        pool->Diagnostics();
        EXPECT_EQ(pool->TotalFreeCount, 0u);
        pool->Deallocate(pool->Allocate(200));
    }

    // Both withdraw from inside the broadcast.
    state.ulVal = ut::sdk::kAppStateTerminate;
    EXPECT_EQ(service->Broadcast(kStateChange, 1, &state), S_OK);
    EXPECT_EQ(service->Broadcast(kStateChange, 1, &state), S_FALSE);
    first.Diagnostics();
    EXPECT_EQ(first.TotalFreeCount, 0u);
}

} // namespace
