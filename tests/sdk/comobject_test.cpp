// CGWCOMObject's interface maps and reference counts.
#include <gtest/gtest.h>

#include <ut/sdk/comobject.h>

#include "support/ref_tracker.h"

namespace {

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
