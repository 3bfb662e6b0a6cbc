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
#include <utility>
#include <vector>

#include <ut/platform/com.h>

#include "support/ref_tracker.h"

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

// Walks every failure path of `run`: runs it with host call n failing (with `code`) for
// n = 1, 2, ... and hands `check` the row n and what `run` returned, until a run makes fewer than
// n host calls; that clean run is handed over as row 0 and ends the walk. `check` runs after the
// fault is lifted. No run may leave a COM object alive.
template <class Run, class Check>
void WalkHostFaults(Run run, Check check, HRESULT code = E_FAIL) {
    for (int n = 1;; ++n) {
        bool fired = false;
        auto result = [&] {
            LiveObjectCheck live;
            FaultPlan plan(n, code);
            auto answer = run();
            fired = plan.Fired();
            return answer;
        }();
        check(fired ? n : 0, result);
        if (!fired)
            return;
    }
}

// What an operation that hands out an object answered, and whether it handed one out; the object
// is released here, so that the walk's check for live objects sees nothing left.
inline std::pair<HRESULT, bool> Released(std::pair<HRESULT, IUnknown*> outcome) {
    if (outcome.second)
        outcome.second->Release();
    return {outcome.first, outcome.second != nullptr};
}

// The name of a result the library's functions give, or its number, for tables of outcomes.
inline std::string Result(HRESULT hr) {
    const std::pair<HRESULT, const char*> names[] = {{S_OK, "S_OK"},
                                                     {S_FALSE, "S_FALSE"},
                                                     {E_FAIL, "E_FAIL"},
                                                     {E_POINTER, "E_POINTER"},
                                                     {E_NOINTERFACE, "E_NOINTERFACE"},
                                                     {E_UNEXPECTED, "E_UNEXPECTED"},
                                                     {E_INVALIDARG, "E_INVALIDARG"},
                                                     {E_ACCESSDENIED, "DENIED"},
                                                     {DISP_E_MEMBERNOTFOUND, "NOTFOUND"}};
    for (auto [value, name] : names)
        if (hr == value)
            return name;
    return std::to_string(hr);
}

} // namespace ut::test
