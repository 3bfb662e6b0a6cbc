// Makes the N-th host call fail, so that a test can walk every failure path of an operation:
//
//   for (int n = 1;; ++n) {
//       ut::test::FaultPlan plan(n);
//       HRESULT hr = Operation();
//       if (!plan.Fired()) break;          // the operation makes fewer than n host calls
//       EXPECT_TRUE(FAILED(hr));           // and nothing is left behind
//   }
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include <ut/platform/com.h>

namespace ut::test {

class FaultPlan {
public:
    explicit FaultPlan(int failAt, HRESULT code = E_FAIL);
    ~FaultPlan();
    FaultPlan(const FaultPlan&) = delete;
    FaultPlan& operator=(const FaultPlan&) = delete;

    bool Fired() const { return calls_ >= failAt_; }
    int Calls() const { return calls_; }
    // The host operations seen, in order.
    const std::vector<std::string>& Seen() const { return seen_; }

private:
    HRESULT OnCall(std::string_view operation);

    int failAt_;
    HRESULT code_;
    int calls_ = 0;
    std::vector<std::string> seen_;
};

} // namespace ut::test
