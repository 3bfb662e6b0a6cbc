// CMemoryPool's reuse, growth, purge and registration rules.
#include <limits>
#include <new>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ut/memory.h>
#include <ut/sdk/objects.h>

#include "support/com_mock.h"
#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

using testing::Return;
using testing::StrEq;

constexpr const wchar_t* kStateChange = ut::sdk::kAppStateChange;

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
    if (row.resizedTo)
        block = pool.Reallocate(block, row.resizedTo);
    pool.Diagnostics();
    ASSERT_EQ(pool.InUseCount, 1u);
    pool.Deallocate(block);

    pool.Diagnostics();
    EXPECT_EQ(pool.InUseCount, 0u);
    EXPECT_EQ(pool.TotalFreeCount, row.keptInClass < 0 ? 0u : 1u);
    if (row.keptInClass < 0)
        return;
    EXPECT_EQ(pool.FreeBytes[row.keptInClass], row.capacity);
    // The largest size of the class gets the kept block back; the next class a new one.
    LONG classTop = 16 * (row.keptInClass + 1);
    EXPECT_NE(pool.Allocate(classTop + 1), block);
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
                                         ReleaseCase{"large capacity, small size is freed", 5000, 20, -1,
                                                     0}));

TEST(MemoryPool, ReallocateEdgesAndQueryInterface) {
    CMemoryPool pool;
    EXPECT_EQ(pool.Allocate(-1), nullptr);
    void* block = pool.Reallocate(nullptr, 0);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(pool.Reallocate(block, -1), nullptr);
    EXPECT_EQ(pool.Reallocate(block, 16), block) << "a failed call leaves the block usable";
    EXPECT_EQ(pool.Reallocate(block, 0), nullptr);
    pool.Diagnostics();
    EXPECT_EQ(pool.FreeCounts[0], 1u);

    void* untouched = &pool;
    EXPECT_EQ(pool.QueryInterface(IID_IGwNotifySink, &untouched), S_OK);
    EXPECT_EQ(pool.QueryInterface(IID_IGWNotificationService, &untouched), E_NOINTERFACE);
    EXPECT_EQ(untouched, &pool);
}

TEST(MemoryPool, WorksWithoutAHost) {
    CMemoryPool pool;
    pool.Deallocate(pool.Allocate(64));
    EXPECT_EQ(pool.PropertyChanged(kStateChange, 1, nullptr, 0), S_OK);
    pool.Diagnostics();
    EXPECT_EQ(pool.TotalFreeCount, 0u);
}

class MockNotificationService : public ut::test::ComMock<IGWNotificationService> {
public:
    MockNotificationService() : ComMock(IID_IGWNotificationService) {}
    MOCK_METHOD(HRESULT, Advise, (const wchar_t*, IGwNotifySink*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, Unadvise, (const wchar_t*, IGwNotifySink*), (override, Calltype(STDMETHODCALLTYPE)));
    MOCK_METHOD(HRESULT, Broadcast, (const wchar_t*, ULONG, const VARIANT*),
                (override, Calltype(STDMETHODCALLTYPE)));
};

class PoolWithMockService : public testing::Test {
protected:
    void ExpectAdvise(HRESULT answer = S_OK) {
        EXPECT_CALL(service_, Advise(StrEq(kStateChange), Sink())).WillOnce(Return(answer));
    }
    void ExpectUnadvise() {
        EXPECT_CALL(service_, Unadvise(StrEq(kStateChange), Sink())).WillOnce(Return(S_OK));
    }
    IGwNotifySink* Sink() { return &pool_; }

    testing::StrictMock<MockNotificationService> service_; // constructing the pool asks nothing
    ut::test::RefTracker refs_;
    ut::test::ScopedGenericObject installed_{CLSID_GWNotificationService, &service_};
    CMemoryPool pool_;
};

TEST_F(PoolWithMockService, RegistersAtTheFirstAllocationOnceItIsAccepted) {
    refs_.Track(&service_, 1, "service");
    ExpectAdvise(E_FAIL);
    pool_.Deallocate(pool_.Allocate(8));
    testing::Mock::VerifyAndClearExpectations(&service_);

    ExpectAdvise();
    ut::test::FaultPlan hostCalls(std::numeric_limits<int>::max());
    for (int i = 0; i < 1000; ++i)
        pool_.Deallocate(pool_.Allocate(i));
    EXPECT_EQ(hostCalls.Calls(), 1) << "once registered, allocations do not ask the host";
    ExpectUnadvise(); // at destruction
}

// The copy takes the service pointer without a reference: once the original is destroyed and the
// copy dropped, the service's count is where it started.
TEST_F(PoolWithMockService, ACopySharesTheServiceWithoutAReferenceOfItsOwn) {
    refs_.Track(&service_, 1, "service");
    ExpectAdvise();
    void* block = pool_.Allocate(40);
    alignas(CMemoryPool) unsigned char storage[sizeof(CMemoryPool)];
    const ULONG before = ut::test::RefTracker::References(&service_);
    new (storage) CMemoryPool(pool_); // dropped without its destructor: the blocks are pool_'s
    EXPECT_EQ(ut::test::RefTracker::References(&service_), before);
    pool_.Deallocate(block);
    ExpectUnadvise();
}

struct StateChangeCase {
    const char* what;
    const wchar_t* name;
    ULONG kind;
    VARTYPE type; // VT_EMPTY: no value at all
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
    ExpectAdvise();
    void* inUse = pool_.Allocate(50);
    pool_.Deallocate(pool_.Allocate(50));
    if (row.unregisters)
        ExpectUnadvise();
    VARIANT value;
    VariantInit(&value);
    value.vt = row.type;
    value.ulVal = row.payload;
    EXPECT_EQ(pool_.PropertyChanged(row.name, row.kind, row.type == VT_EMPTY ? nullptr : &value, 0), S_OK);
    pool_.Diagnostics();
    EXPECT_EQ(pool_.TotalFreeCount, row.purges ? 0u : 1u);
    EXPECT_EQ(pool_.InUseCount, 1u);
    testing::Mock::VerifyAndClearExpectations(&service_);

    if (row.unregisters)
        ExpectAdvise(); // an allocation after termination listens again
    pool_.Deallocate(pool_.Allocate(1));
    pool_.Deallocate(inUse);
    ExpectUnadvise();
}

INSTANTIATE_TEST_SUITE_P(
    MemoryPool, StateChanges,
    testing::Values(StateChangeCase{"state 3 purges", kStateChange, 1, VT_I4, 3, true, false},
                    StateChangeCase{"state 8 also unregisters", kStateChange, 1, VT_I4, 8, true, true},
                    StateChangeCase{"16-bit payload", kStateChange, 1, VT_I2, 8, true, true},
                    StateChangeCase{"low 16 bits count", kStateChange, 1, VT_UI4, 0x10008, true, true},
                    StateChangeCase{"no integer payload", kStateChange, 1, VT_R8, 8, true, false},
                    StateChangeCase{"no value", kStateChange, 1, VT_EMPTY, 0, true, false},
                    StateChangeCase{"other kinds are ignored", kStateChange, 2, VT_I4, 8, false, false},
                    StateChangeCase{"names are case-sensitive", L"gwapp_state_change", 1, VT_I4, 8, false,
                                    false},
                    StateChangeCase{"no name", nullptr, 1, VT_I4, 8, false, false}));

} // namespace
