#include <vector>

#include <gtest/gtest.h>

#include <ut/persist.h>
#include <ut/sdk/objects.h>

#include "support/fault_plan.h"
#include "support/ref_tracker.h"

namespace {

// Types of the blocks destroyed, in order.
std::vector<eUserDataBlockType> g_destroyed;

template <eUserDataBlockType Type>
class TestBlock final : public CUserDataBlock {
public:
    ~TestBlock() override { g_destroyed.push_back(Type); }
    HRESULT GetType(eUserDataBlockType& type) override {
        type = Type;
        return S_OK;
    }
};

// Exposes the protected Clear.
class Blocks : public CUserDataBlocks {
public:
    using CUserDataBlocks::Clear;
};

// Installs the test block classes for the test's duration.
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
};

eUserDataBlockType Type(LONG value) {
    return static_cast<eUserDataBlockType>(value);
}

TEST(UserDataBlock, BaseAnswersOnlyItsOwnInterfaceAndPersistsNothing) {
    ut::test::LiveObjectCheck live;
    auto block = ut::ComPtr<CUserDataBlock>::Adopt(new CUserDataBlock);

    EXPECT_EQ(block->QueryInterface(IID_CUserDataBlock, nullptr), E_POINTER);
    void* out = nullptr;
    ASSERT_EQ(block->QueryInterface(IID_CUserDataBlock, &out), S_OK);
    EXPECT_EQ(out, static_cast<void*>(block.Get()));
    EXPECT_EQ(ut::test::RefTracker::References(block.Get()), 2u);
    block->Release();
    ut::ComPtr<IUnknown> identity;
    EXPECT_EQ(block->QueryInterface(IID_IUnknown, identity.PutVoid()), S_OK);
    identity.Reset();
    out = &out;
    EXPECT_EQ(block->QueryInterface(IID_IStream, &out), E_NOINTERFACE);
    EXPECT_EQ(out, nullptr);

    EXPECT_TRUE(block->IsPersistable());
    std::map<CKXString, CKXString> text;
    EXPECT_EQ(block->Save(nullptr), E_NOTIMPL);
    EXPECT_EQ(block->Load(nullptr), E_NOTIMPL);
    EXPECT_EQ(block->GetAsTextVersion(text), E_NOTIMPL);
    EXPECT_EQ(block->SetFromTextVersion(text), E_NOTIMPL);
    EXPECT_EQ(block->OnEndLoad(), E_NOTIMPL);

    // The base is of a type without a class, so that it is never mistaken for a real block.
    eUserDataBlockType type = eUserDataBlockType0;
    EXPECT_EQ(block->GetType(type), S_OK);
    EXPECT_EQ(type, eUserDataBlockTypeBase);
    CLSID clsid = GUID_NULL;
    EXPECT_EQ(CUserDataBlock::GetCLSIDFromType(type, clsid), E_UNEXPECTED);
}

TEST(UserDataBlock, ClassIdsOfTheTypes) {
    const CLSID untouched = {0x12345678, 0, 0, {0, 0, 0, 0, 0, 0, 0, 1}};
    struct Case {
        LONG type;
        HRESULT result;
        CLSID clsid;
    };
    for (const Case& c : {Case{0, S_OK, CLSID_UserDataBlockType0}, Case{1, S_OK, CLSID_UserDataBlockType1},
                          Case{2, E_UNEXPECTED, untouched}, Case{5, E_UNEXPECTED, untouched},
                          Case{-1, E_UNEXPECTED, untouched}}) {
        CLSID clsid = untouched;
        EXPECT_EQ(CUserDataBlock::GetCLSIDFromType(Type(c.type), clsid), c.result) << "type " << c.type;
        EXPECT_TRUE(IsEqualGUID(clsid, c.clsid)) << "type " << c.type;
    }
}

TEST_F(UserDataBlocks, AreCreatedOnRequestAndThenFound) {
    Blocks blocks;
    CUserDataBlock* sentinel = reinterpret_cast<CUserDataBlock*>(&blocks);
    CUserDataBlock* block = sentinel;
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, false), S_FALSE);
    EXPECT_EQ(block, sentinel);

    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, true), S_FALSE);
    ASSERT_NE(block, sentinel);
    ASSERT_NE(block, nullptr);
    eUserDataBlockType type = eUserDataBlockTypeBase;
    EXPECT_EQ(block->GetType(type), S_OK);
    EXPECT_EQ(type, eUserDataBlockType0);
    // Borrowed: the collection holds the only reference.
    EXPECT_EQ(ut::test::RefTracker::References(block), 1u);

    CUserDataBlock* again = nullptr;
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &again, false), S_OK);
    EXPECT_EQ(again, block);
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &again, true), S_OK);
    EXPECT_EQ(again, block);
    EXPECT_EQ(ut::test::RefTracker::References(block), 1u);
}

TEST_F(UserDataBlocks, RejectBadArgumentsWithoutCreating) {
    Blocks blocks;
    CUserDataBlock* block = nullptr;
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, nullptr, true), E_POINTER);
    for (LONG type : {2, 5, -1}) {
        ut::test::FaultPlan plan(1); // would fail a creation, were one tried
        EXPECT_EQ(blocks.GetBlock(Type(type), &block, true), E_UNEXPECTED) << "type " << type;
        EXPECT_EQ(plan.Calls(), 0) << "type " << type;
    }
    EXPECT_EQ(block, nullptr);
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, false), S_FALSE);
}

TEST_F(UserDataBlocks, AFailedCreationStoresNothing) {
    Blocks blocks;
    CUserDataBlock* block = nullptr;
    {
        ut::test::FaultPlan plan(1, E_OUTOFMEMORY);
        EXPECT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, true), E_OUTOFMEMORY);
        EXPECT_TRUE(plan.Fired());
    }
    EXPECT_EQ(block, nullptr);
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, false), S_FALSE);

    // A type whose class nobody installed: the creation's own error.
    GWRevokeClassFactory(CLSID_UserDataBlockType1);
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, true), REGDB_E_CLASSNOTREG);
    EXPECT_EQ(block, nullptr);
    EXPECT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, false), S_FALSE);
}

TEST_F(UserDataBlocks, AreReleasedInTypeOrder) {
    CUserDataBlock* block = nullptr;
    {
        Blocks blocks;
        ASSERT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, true), S_FALSE);
        ASSERT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, true), S_FALSE);
        blocks.Clear();
        EXPECT_EQ(g_destroyed, (std::vector{eUserDataBlockType0, eUserDataBlockType1}));
        EXPECT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, false), S_FALSE);

        g_destroyed.clear();
        ASSERT_EQ(blocks.GetBlock(eUserDataBlockType1, &block, true), S_FALSE);
        ASSERT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, true), S_FALSE);
    }
    EXPECT_EQ(g_destroyed, (std::vector{eUserDataBlockType0, eUserDataBlockType1}));
}

TEST_F(UserDataBlocks, PersistNothingOfTheirOwn) {
    Blocks blocks;
    CUserDataBlock* block = nullptr;
    ASSERT_EQ(blocks.GetBlock(eUserDataBlockType0, &block, true), S_FALSE);
    ut::ComPtr<IStream> stream;
    ASSERT_EQ(ut::platform::CreateMemoryStream(stream.Put()), S_OK);
    EXPECT_EQ(blocks.Save(stream.Get()), S_FALSE);
    EXPECT_EQ(blocks.Load(stream.Get()), S_FALSE);
    STATSTG stat{};
    ASSERT_EQ(stream->Stat(&stat, STATFLAG_NONAME), S_OK);
    EXPECT_EQ(stat.cbSize.QuadPart, 0u);
}

} // namespace
