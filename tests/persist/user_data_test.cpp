// User data blocks: add, find, remove and persist.
#include <vector>

#include <gtest/gtest.h>

#include <ut/persist.h>
#include <ut/sdk/objects.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

std::vector<eUserDataBlockType> g_destroyed; // types of the blocks destroyed, in order

template <eUserDataBlockType Type>
class TestBlock final : public CUserDataBlock {
public:
    ~TestBlock() override { g_destroyed.push_back(Type); }
    HRESULT GetType(eUserDataBlockType& type) override {
        type = Type;
        return S_OK;
    }
};

class Blocks : public CUserDataBlocks {
public:
    using CUserDataBlocks::Clear;
};

class UserDataBlocks : public testing::Test {
protected:
    void SetUp() override {
        g_destroyed.clear();
        ASSERT_EQ(ut::sdk::RegisterClass<TestBlock<eUserDataBlockType0>>(CLSID_UserDataBlockType0), S_OK);
        ASSERT_EQ(ut::sdk::RegisterClass<TestBlock<eUserDataBlockType1>>(CLSID_UserDataBlockType1), S_OK);
    }
    void TearDown() override {
        GWRevokeClassFactory(CLSID_UserDataBlockType0);
        GWRevokeClassFactory(CLSID_UserDataBlockType1);
    }

    ut::test::LiveObjectCheck live_;
    Blocks blocks_;
    CUserDataBlock* block_ = nullptr;
};

eUserDataBlockType Type(LONG value) {
    return static_cast<eUserDataBlockType>(value);
}

TEST(UserDataBlock, BaseAnswersItsOwnInterfaceAndHasNoClass) {
    ut::test::LiveObjectCheck live;
    auto block = ut::ComPtr<CUserDataBlock>::Adopt(new CUserDataBlock);
    ut::ComPtr<CUserDataBlock> same;
    ASSERT_EQ(block.As(same), S_OK);
    EXPECT_EQ(same.Get(), block.Get());
    void* out = &out;
    EXPECT_EQ(block->QueryInterface(IID_IStream, &out), E_NOINTERFACE);
    EXPECT_EQ(out, nullptr);
    // The base is of a type without a class, so that it is never taken for a real block.
    eUserDataBlockType type = eUserDataBlockType0;
    CLSID clsid = GUID_NULL;
    EXPECT_EQ(block->GetType(type), S_OK);
    EXPECT_EQ(CUserDataBlock::GetCLSIDFromType(type, clsid), E_UNEXPECTED);
    EXPECT_TRUE(IsEqualGUID(clsid, GUID_NULL));
}

TEST_F(UserDataBlocks, AreCreatedOnRequestAndThenLent) {
    CUserDataBlock* untouched = reinterpret_cast<CUserDataBlock*>(&block_);
    block_ = untouched;
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, &block_, false), S_FALSE);
    EXPECT_EQ(block_, untouched);
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, &block_, true), S_FALSE);
    ASSERT_NE(block_, untouched);
    eUserDataBlockType type = eUserDataBlockTypeBase;
    EXPECT_EQ(block_->GetType(type), S_OK);
    EXPECT_EQ(type, eUserDataBlockType0);
    EXPECT_EQ(ut::test::RefTracker::References(block_), 1u); // the collection's only

    for (bool create : {false, true}) {
        CUserDataBlock* again = nullptr;
        EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, &again, create), S_OK);
        EXPECT_EQ(again, block_);
    }
    EXPECT_EQ(blocks_.Save(nullptr), S_FALSE);
    EXPECT_EQ(blocks_.Load(nullptr), S_FALSE);
}

TEST_F(UserDataBlocks, BadRequestsAndFailedCreationsStoreNothing) {
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, nullptr, true), E_POINTER);
    for (LONG type : {2, 5, -1}) {
        ut::test::FaultPlan plan(1); // would fail a creation, were one tried
        EXPECT_EQ(blocks_.GetBlock(Type(type), &block_, true), E_UNEXPECTED) << "type " << type;
        EXPECT_EQ(plan.Calls(), 0) << "type " << type;
    }
    {
        ut::test::FaultPlan plan(1, E_OUTOFMEMORY);
        EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType1, &block_, true), E_OUTOFMEMORY);
    }
    GWRevokeClassFactory(CLSID_UserDataBlockType0);
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, &block_, true), REGDB_E_CLASSNOTREG);
    EXPECT_EQ(block_, nullptr);
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType0, &block_, false), S_FALSE);
    EXPECT_EQ(blocks_.GetBlock(eUserDataBlockType1, &block_, false), S_FALSE);
}

TEST_F(UserDataBlocks, AreReleasedInTypeOrder) {
    const std::vector<eUserDataBlockType> typeOrder = {eUserDataBlockType0, eUserDataBlockType1};
    {
        Blocks blocks;
        for (int round = 0; round < 2; ++round) {
            ASSERT_EQ(blocks.GetBlock(eUserDataBlockType1, &block_, true), S_FALSE);
            ASSERT_EQ(blocks.GetBlock(eUserDataBlockType0, &block_, true), S_FALSE);
            if (round == 0) {
                blocks.Clear();
                EXPECT_EQ(g_destroyed, typeOrder);
                g_destroyed.clear();
            }
        }
    }
    EXPECT_EQ(g_destroyed, typeOrder); // by the destructor
}

} // namespace
