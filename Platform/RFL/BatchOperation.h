// The contract between a long operation and whoever shows its progress: how it is started, watched and
// stopped, and the messages by which it tells of itself.
#pragma once

#include "RFL/Messaging.h"
#include "RFL/RFLUnknown.h"

namespace RFL {

/// An operation that works in the background and reports its end with OperationCompleteMessage at its own
/// station. It is started once.
class ZOPLATFORM_EXPORT IBatchOperation : public RFLUnknown {
public:
    static constexpr InterfaceID kInterfaceID{0x52464c4261746368ull, 0x4f70000000000001ull};

    /// The station of this operation and no other, the same from construction to end. Threads: any.
    virtual ImmutableString GetStationID() = 0;
    /// A fixed text for logs, the name of the class. Threads: any.
    virtual UString GetDescription() = 0;
    /// True: the operation runs and will post OperationCompleteMessage, perhaps before this call returns.
    /// False: it does not run and will post nothing. Main thread only.
    virtual bool Start() = 0;
    /// Asks the operation to stop and never blocks; the end still comes by its message. Threads: any.
    virtual void Abort() = 0;
};

/// Work for a queue that runs on another thread.
class ZOPLATFORM_EXPORT IThreadedQueueRequest : public RFLUnknown {
public:
    static constexpr InterfaceID kInterfaceID{0x52464c5468726551ull, 0x5265710000000001ull};

    /// Called once, on a thread of the queue.
    virtual void Run() = 0;
};

/// The operation has ended; its result is there to be read.
struct ZOPLATFORM_EXPORT OperationCompleteMessage : MessageImpl<OperationCompleteMessage> {};

/// How far a long operation has come: value of range.
struct ZOPLATFORM_EXPORT UpdateOperationProgressMessage : MessageImpl<UpdateOperationProgressMessage> {
    UpdateOperationProgressMessage() = default;
    UpdateOperationProgressMessage(double inValue, double inRange) : value(inValue), range(inRange) {}
    double value = 0;
    double range = 0;
};

/// What the window that shows the operation should say from now on.
struct ZOPLATFORM_EXPORT UpdateOperationDescriptionMessage : MessageImpl<UpdateOperationDescriptionMessage> {
    UpdateOperationDescriptionMessage() = default;
    explicit UpdateOperationDescriptionMessage(UString inText) : text(std::move(inText)) {}
    UString text;
};

}  // namespace RFL
