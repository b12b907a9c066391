// Copies enclosures from one list to another, and tells once that all copies have ended.
#include "Resources/ServerResource.h"
#include "ZOClient/IZOCEnclosure.h"

namespace ZOCL {

using ostcore::threads::RecursiveMutex;
using ostcore::threads::ScopedLock;

namespace {

/// Counts copies, which end on several threads while the scan still starts others. The end is reached when
/// the scan is through and as many copies have ended as were started; whoever brings that about, and only
/// that one, finds the done flag unset.
class EnclosureCopyTracker {
public:
    EnclosureCopyTracker(const Guid& inRequestID, const RequestCompletion& inCompletion,
                         const InterfaceRef<IZOCServerResource>& inTarget)
        : mRequestID(inRequestID), mCompletion(inCompletion), mTarget(inTarget) {}

    void CopyStarted() {
        ScopedLock lock(mMutex, "EnclosureCopyTracker::CopyStarted");
        ++mStarted;
    }
    void CopyEnded(int inResult) {
        {
            ScopedLock lock(mMutex, "EnclosureCopyTracker::CopyEnded");
            ++mEnded;
            if (mResult >= 0 && inResult < 0) {
                mResult = inResult;
            }
        }
        CompleteWhenDone();
    }
    void ScanEnded() {
        {
            ScopedLock lock(mMutex, "EnclosureCopyTracker::ScanEnded");
            mScanEnded = true;
        }
        CompleteWhenDone();
    }

private:
    void CompleteWhenDone() {
        int result = kResultSuccess;
        {
            ScopedLock lock(mMutex, "EnclosureCopyTracker::CompleteWhenDone");
            if (mDone || !mScanEnded || mStarted != mEnded) {
                return;
            }
            mDone = true;
            result = mResult;
        }
        if (mCompletion) {
            mCompletion(mRequestID, result, mTarget, nullptr);
        }
    }

    const Guid mRequestID;
    const RequestCompletion mCompletion;
    const InterfaceRef<IZOCServerResource> mTarget;
    RecursiveMutex mMutex;
    std::size_t mStarted ZO_GUARDED_BY(mMutex) = 0;
    std::size_t mEnded ZO_GUARDED_BY(mMutex) = 0;
    int mResult ZO_GUARDED_BY(mMutex) = kResultSuccess;
    bool mScanEnded ZO_GUARDED_BY(mMutex) = false;
    bool mDone ZO_GUARDED_BY(mMutex) = false;
};

struct CopyTarget {
    ImmutableString factoryURL;
    InterfaceRef<IZOCDataServer> server;
};

void CopyEnclosure(const shared_ptr<EnclosureCopyTracker>& inTracker, const ImmutableString& inName,
                   const InterfaceRef<IZOCEnclosure>& inEnclosure, const CopyTarget& inTarget) {
    inTracker->CopyStarted();
    const RequestCompletion onCreated =
        [inTracker](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                    const shared_ptr<ostnet::Response>&) { inTracker->CopyEnded(inResult); };
    const RequestCompletion onPayload = [=](const Guid&, int inResult,
                                            const InterfaceRef<IZOCServerResource>&,
                                            const shared_ptr<ostnet::Response>&) {
        if (inResult < 0) {
            inTracker->CopyEnded(inResult);
        } else if (!CreateEnclosure(Guid::CreateUnique(), inTarget.factoryURL, inTarget.server, inName,
                                    inEnclosure->GetEnclosurePayload(), onCreated)) {
            inTracker->CopyEnded(kResultNotStarted);
        }
    };
    if (!inEnclosure->LoadEnclosureData(Guid::CreateUnique(), onPayload)) {
        inTracker->CopyEnded(kResultNotStarted);
    }
}

}  // namespace

bool CopyEnclosuresIf(const Guid& inRequestID, const InterfaceRef<IZOCEnclosures>& inFrom,
                      const InterfaceRef<IZOCEnclosures>& inTo, const EnclosureCopyPredicate& inPredicate,
                      const RequestCompletion& inCompletion) {
    const auto target = RFL::QueryInterface<ServerResource>(inTo);
    const auto writable = RFL::QueryInterface<IZOCWritableEnclosures>(inTo);
    if (!inFrom || !target || !writable) {
        return false;
    }
    const CopyTarget copyTarget{writable->GetEnclosureFactoryURL(), target->GetServer()};
    const auto tracker = make_shared<EnclosureCopyTracker>(inRequestID, inCompletion, target);
    for (const ImmutableString& name : inFrom->GetEnclosureNames()) {
        if (inPredicate && !inPredicate(name, inFrom, inTo)) {
            continue;
        }
        if (const InterfaceRef<IZOCEnclosure> enclosure = inFrom->GetEnclosure(name)) {
            CopyEnclosure(tracker, name, enclosure, copyTarget);
        }
    }
    tracker->ScanEnded();
    return true;
}

}  // namespace ZOCL
