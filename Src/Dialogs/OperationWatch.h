// Runs an operation in the background of an open window.
#pragma once

#include "RFL/BatchOperation.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Tells once when the operation has ended, and aborts it when the window goes first. Main thread.
class OperationWatch {
public:
    OperationWatch(const InterfaceRef<RFL::IBatchOperation>& inOperation, function<void()> inOnEnded)
        : mOperation(inOperation), mListener(inOperation->GetStationID()) {
        mListener.AddHandler<RFL::OperationCompleteMessage>(
            [this, inOnEnded](const RFL::OperationCompleteMessage&) {
                if (!mHasEnded) {
                    mHasEnded = true;
                    inOnEnded();
                }
            });
    }
    ~OperationWatch() {
        if (mIsRunning && !mHasEnded) {
            mOperation->Abort();
        }
    }
    OperationWatch(const OperationWatch&) = delete;
    OperationWatch& operator=(const OperationWatch&) = delete;

    /// False: it did not start, and there will be no end.
    bool Start() { return mIsRunning = mOperation->Start(); }

private:
    const InterfaceRef<RFL::IBatchOperation> mOperation;
    bool mIsRunning = false;
    bool mHasEnded = false;
    RFL::Listener mListener;
};

}  // namespace ZOCL
