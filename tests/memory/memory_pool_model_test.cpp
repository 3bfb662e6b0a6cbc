// Random allocate, reallocate and free steps against a plain model of the live blocks: blocks
// never overlap, keep their contents across reallocation, and are all released when the pool
// goes (the leak checkers of the sanitized and valgrind runs see to the last part).
#include <algorithm>
#include <cstdint>
#include <map>
#include <random>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/memory.h>
#include <ut/sdk/objects.h>

namespace {

struct LiveBlock {
    unsigned char* data;
    LONG size;
    unsigned char seed;
};

unsigned char PatternByte(unsigned char seed, LONG index) {
    return static_cast<unsigned char>(seed + index * 31);
}

void Fill(const LiveBlock& block, LONG from) {
    for (LONG i = from; i < block.size; ++i)
        block.data[i] = PatternByte(block.seed, i);
}

bool Intact(const LiveBlock& block, LONG length) {
    for (LONG i = 0; i < length; ++i)
        if (block.data[i] != PatternByte(block.seed, i))
            return false;
    return true;
}

class Model {
public:
    explicit Model(unsigned seed) : random_(seed) {}

    void Allocate() {
        LiveBlock block{nullptr, RandomSize(), NextSeed()};
        block.data = static_cast<unsigned char*>(pool_.Allocate(block.size));
        ASSERT_NE(block.data, nullptr);
        Add(block);
        Fill(block, 0);
    }

    void Reallocate() {
        if (live_.empty())
            return;
        std::size_t index = RandomIndex();
        LiveBlock block = live_[index];
        ASSERT_TRUE(Intact(block, block.size));
        Remove(index);
        LONG newSize = Percent() < 10 ? 0 : RandomSize();
        void* moved = pool_.Reallocate(block.data, newSize);
        if (newSize == 0) {
            EXPECT_EQ(moved, nullptr);
            return;
        }
        ASSERT_NE(moved, nullptr);
        LONG kept = std::min(block.size, newSize);
        block.data = static_cast<unsigned char*>(moved);
        ASSERT_TRUE(Intact(block, kept)) << "contents lost growing " << block.size << " to " << newSize;
        block.size = newSize;
        Add(block);
        Fill(block, kept);
    }

    void Free() {
        if (live_.empty())
            return;
        std::size_t index = RandomIndex();
        LiveBlock block = live_[index];
        ASSERT_TRUE(Intact(block, block.size));
        Remove(index);
        pool_.Deallocate(block.data);
    }

    // Through the host, as the application sends it; after a termination the pool listens
    // again from its next allocation.
    void StateChange(USHORT state) {
        ut::ComPtr<IGWNotificationService> service;
        ASSERT_EQ(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid()),
            S_OK);
        VARIANT value;
        VariantInit(&value);
        value.vt = VT_I4;
        value.lVal = state;
        EXPECT_EQ(service->Broadcast(ut::sdk::kAppStateChange, ut::sdk::kStateChangeKind, &value), S_OK);
    }

    void CheckCounts() {
        pool_.Diagnostics();
        EXPECT_EQ(pool_.InUseCount, live_.size());
    }

    int Percent() { return std::uniform_int_distribution<int>(0, 99)(random_); }

private:
    // Mostly pooled sizes, a few large ones, and the class edges.
    LONG RandomSize() {
        int pick = Percent();
        if (pick < 5)
            return 16 * std::uniform_int_distribution<LONG>(0, 256)(random_);
        if (pick < 10)
            return std::uniform_int_distribution<LONG>(4097, 20000)(random_);
        return std::uniform_int_distribution<LONG>(0, 4096)(random_);
    }
    std::size_t RandomIndex() {
        return std::uniform_int_distribution<std::size_t>(0, live_.size() - 1)(random_);
    }
    unsigned char NextSeed() { return static_cast<unsigned char>(random_()); }

    // Records a block after checking it against its neighbours in address order.
    void Add(const LiveBlock& block) {
        auto start = reinterpret_cast<std::uintptr_t>(block.data);
        auto end = start + static_cast<std::uintptr_t>(std::max<LONG>(block.size, 1));
        EXPECT_EQ(start % (2 * sizeof(void*)), 0u);
        auto next = byAddress_.lower_bound(start);
        if (next != byAddress_.end()) {
            EXPECT_LE(end, next->first) << "overlaps the block after it";
        }
        if (next != byAddress_.begin()) {
            EXPECT_LE(std::prev(next)->second, start) << "overlaps the block before it";
        }
        byAddress_[start] = end;
        live_.push_back(block);
    }

    void Remove(std::size_t index) {
        byAddress_.erase(reinterpret_cast<std::uintptr_t>(live_[index].data));
        live_[index] = live_.back();
        live_.pop_back();
    }

    std::mt19937 random_;
    CMemoryPool pool_;
    std::vector<LiveBlock> live_;
    std::map<std::uintptr_t, std::uintptr_t> byAddress_; // start -> end
};

TEST(MemoryPoolModel, RandomStepsKeepBlocksApartAndIntact) {
    ut::host::ReferenceHost host; // the pool registers and hears the state changes
    for (unsigned seed : {1u, 2u, 3u}) {
        SCOPED_TRACE(seed);
        Model model(seed);
        for (int step = 0; step < 6000 && !testing::Test::HasFatalFailure(); ++step) {
            int roll = model.Percent();
            if (roll < 45)
                model.Allocate();
            else if (roll < 70)
                model.Reallocate();
            else
                model.Free();
            if (step % 500 == 499)
                model.StateChange(model.Percent() < 25 ? ut::sdk::kAppStateTerminate : 3);
            if (step % 250 == 0)
                model.CheckCounts();
        }
        model.CheckCounts();
    }
}

} // namespace
