// The part of an operation that remembers that it was torn down.
#pragma once

#include <atomic>

#include "IForceAbortEnabledOperation.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

/// To be mixed in; a class whose work must be stopped overrides ForceAbort and calls this one first.
class ForceAbortEnabledOperation : public IForceAbortEnabledOperation {
public:
    void ForceAbort(int inResult) override {
        mForceAbortResult.store(inResult, std::memory_order_release);
        mForceAborted.store(1, std::memory_order_release);
    }
    bool WasForceAborted() const override { return mForceAborted.load(std::memory_order_acquire) == 1; }
    int GetForceAbortResult() const override { return mForceAbortResult.load(std::memory_order_acquire); }

private:
    std::atomic<int> mForceAborted{0};
    std::atomic<int> mForceAbortResult{kResultFailure};
};

}  // namespace ZOCL
