// Waiting for the network as an operation, so that a window can show it.
#pragma once

#include "Frame/BatchOperationBase.h"
#include "ostcore/threads/Gate.h"
#include "ostcore/threads/Mutex.h"

namespace ZOCL {

/// Ends when the network is back (kResultSuccess) or when it is aborted (kResultCancelled), whichever
/// comes first; either may come before the start.
class WaitForNetworkRecoveryOperation final : public BatchOperationBase {
public:
    UString GetDescription() override { return u"WaitForNetworkRecoveryOperation"; }
    bool Start() override;
    void Abort() override { End(kResultCancelled); }
    /// Any thread.
    void NetworkIsBack() { End(kResultSuccess); }

private:
    void End(int inResult);

    ostcore::threads::Gate mEnded;
    ostcore::threads::Mutex mMutex;
    /// Of the end that came first.
    optional<int> mEnd ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
