// Random allocate, reallocate and free steps against a plain model of the live blocks: blocks
// keep their alignment, never overlap, keep their contents across reallocation, a request is
// served by the block freed last into its class while one is kept, and all are released when the
// pool goes (the sanitizers' and valgrind's leak checks see to that part).
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
    LONG capacity;

    unsigned char Expected(LONG i) const { return static_cast<unsigned char>(seed + i * 31); }
    void Fill(LONG from) const {
        for (LONG i = from; i < size; ++i)
            data[i] = Expected(i);
    }
    bool Intact(LONG length) const {
        for (LONG i = 0; i < length; ++i)
            if (data[i] != Expected(i))
                return false;
        return true;
    }
};

class Model {
public:
    explicit Model(unsigned seed) : random_(seed) {}

    int Percent() { return std::uniform_int_distribution<int>(0, 99)(random_); }

    void Allocate() {
        LiveBlock block{nullptr, RandomSize(), static_cast<unsigned char>(random_()), 0};
        LONG request = Request(block.size);
        std::vector<LiveBlock>& kept = kept_[ClassOf(request)];
        block.data = static_cast<unsigned char*>(pool_.Allocate(block.size));
        ASSERT_NE(block.data, nullptr);
        block.capacity = RoundUp(request);
        if (request <= CMemoryPool::kLargestPooled && !kept.empty()) {
            EXPECT_EQ(block.data, kept.back().data) << "not the block freed last into its class";
            block.capacity = kept.back().capacity;
            kept.pop_back();
        }
        Add(block);
    }

    // Grows, keeps or frees (a zero size) a random live block.
    void Reallocate() {
        LiveBlock block = TakeRandom();
        if (!block.data)
            return;
        LONG newSize = Percent() < 10 ? 0 : RandomSize();
        void* moved = pool_.Reallocate(block.data, newSize);
        if (newSize == 0) {
            EXPECT_EQ(moved, nullptr);
            Keep(block);
            return;
        }
        block.capacity = std::max(block.capacity, RoundUp(newSize));
        LONG kept = std::min(block.size, newSize);
        block.data = static_cast<unsigned char*>(moved);
        ASSERT_TRUE(block.Intact(kept)) << "contents lost resizing " << block.size << " to " << newSize;
        block.size = newSize;
        Add(block, kept);
    }

    void Free() {
        LiveBlock block = TakeRandom();
        pool_.Deallocate(block.data);
        if (block.data)
            Keep(block);
    }

    // A state change empties the free lists.
    void ForgetKept() { kept_.clear(); }

    void CheckCount() {
        pool_.Diagnostics();
        EXPECT_EQ(pool_.InUseCount, live_.size());
    }

private:
    // A zero request is served as 16 bytes.
    static LONG Request(LONG size) { return std::max<LONG>(size, 16); }
    static LONG RoundUp(LONG size) { return (size + 15) / 16 * 16; }
    static std::size_t ClassOf(LONG size) {
        return static_cast<std::size_t>(std::max<LONG>(size, 1) - 1) / 16;
    }

    // A freed block waits on the list of the size last asked for, unless it grew past the pooled sizes.
    void Keep(const LiveBlock& block) {
        if (block.capacity <= CMemoryPool::kLargestPooled)
            kept_[ClassOf(Request(block.size))].push_back(block);
    }

    // Mostly pooled sizes, some class edges and some large sizes.
    LONG RandomSize() {
        int pick = Percent();
        if (pick < 5)
            return 16 * std::uniform_int_distribution<LONG>(0, 256)(random_);
        if (pick < 10)
            return std::uniform_int_distribution<LONG>(4097, 20000)(random_);
        return std::uniform_int_distribution<LONG>(0, 4096)(random_);
    }

    void Add(const LiveBlock& block, LONG filled = 0) {
        auto start = reinterpret_cast<std::uintptr_t>(block.data);
        auto end = start + static_cast<std::uintptr_t>(std::max<LONG>(block.size, 1));
        EXPECT_EQ(start % (2 * sizeof(void*)), 0u);
        auto next = byAddress_.lower_bound(start);
        EXPECT_TRUE(next == byAddress_.end() || end <= next->first) << "overlaps the block after it";
        EXPECT_TRUE(next == byAddress_.begin() || std::prev(next)->second <= start)
            << "overlaps the block before";
        byAddress_[start] = end;
        live_.push_back(block);
        block.Fill(filled);
    }

    // Removes a random live block from the model after checking its contents; none when empty.
    LiveBlock TakeRandom() {
        if (live_.empty())
            return {};
        std::size_t index = std::uniform_int_distribution<std::size_t>(0, live_.size() - 1)(random_);
        LiveBlock block = live_[index];
        EXPECT_TRUE(block.Intact(block.size)) << "a block was overwritten";
        byAddress_.erase(reinterpret_cast<std::uintptr_t>(block.data));
        live_[index] = live_.back();
        live_.pop_back();
        return block;
    }

    std::mt19937 random_;
    CMemoryPool pool_;
    std::vector<LiveBlock> live_;
    std::map<std::uintptr_t, std::uintptr_t> byAddress_; // start -> end
    std::map<std::size_t, std::vector<LiveBlock>> kept_; // class -> blocks freed into it, last at the back
};

// State changes go through the host as the application sends them; after a termination the
// pool listens again from its next allocation.
void BroadcastStateChange(LONG state) {
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

TEST(MemoryPoolModel, RandomStepsKeepBlocksApartAndIntact) {
    ut::host::ReferenceHost host;
    for (unsigned seed : {1u, 2u, 3u}) {
        SCOPED_TRACE(seed);
        Model model(seed);
        for (int step = 1; step <= 6000 && !testing::Test::HasFailure(); ++step) {
            int roll = model.Percent();
            if (roll < 45)
                model.Allocate();
            else if (roll < 70)
                model.Reallocate();
            else
                model.Free();
            if (step % 500 == 0) {
                BroadcastStateChange(model.Percent() < 25 ? ut::sdk::kAppStateTerminate : 3);
                model.ForgetKept();
            }
            if (step % 250 == 0)
                model.CheckCount();
        }
    }
}

} // namespace
