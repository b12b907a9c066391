// The wait runs on a thread of its own: it can take hours, and nothing else may queue behind it.
#include "Connection/WaitForNetworkRecoveryOperation.h"

#include "ostcore/threads/Executor.h"

namespace ZOCL {

using ostcore::threads::Gate;
using ostcore::threads::MutexLock;

bool WaitForNetworkRecoveryOperation::Start() {
    const auto executor =
        ostcore::threads::CreateAsyncEventLoopExecutor("ZOCL::DataServer::ZONetworkUnavailableDialog");
    return executor->Post([self = InterfaceRef<WaitForNetworkRecoveryOperation>(this)] {
        Gate::PassThrough(self->mEnded, Gate::kWaitForever);
        int result = kResultFailure;
        {
            MutexLock lock(self->mMutex);
            result = self->mEnd.value_or(kResultFailure);
        }
        self->Finish(result);
    });
}

void WaitForNetworkRecoveryOperation::End(int inResult) {
    {
        MutexLock lock(mMutex);
        if (mEnd) {
            return;
        }
        mEnd = inResult;
    }
    mEnded.Open();
}

}  // namespace ZOCL
