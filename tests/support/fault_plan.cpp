// FaultPlan: fails the N-th host call through the SDK's fault hook.
#include "support/fault_plan.h"

#include <ut/sdk/objects.h>
#include <ut/sdk/testing.h>

namespace ut::test {

FaultPlan::FaultPlan(int failAt, HRESULT code) : failAt_(failAt), code_(code) {
    ut::sdk::SetHostFaultHook([this](std::string_view operation) { return OnCall(operation); });
}

FaultPlan::~FaultPlan() { ut::sdk::SetHostFaultHook(nullptr); }

HRESULT FaultPlan::OnCall(std::string_view operation) {
    seen_.emplace_back(operation);
    return ++calls_ == failAt_ ? code_ : S_OK;
}

} // namespace ut::test
