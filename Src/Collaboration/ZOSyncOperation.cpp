// Getting the latest: each step starts from the completion of the one before, so no two requests overlap.
#include "Collaboration/ZOSyncOperation.h"

#include "Collaboration/FreshLoad.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"
#include "Resources/JoinText.h"

namespace ZOCL {

using ostcore::threads::MutexLock;

namespace {

void TraceUnwritten(const ImmutableString& inName) {
    ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Error,
                          JoinText("ZOSyncOperation failed to write enclosure: \"", inName, "\""));
}

}  // namespace

ZOSyncOperation::ZOSyncOperation(const ImmutableString& inSessionURL, const ImmutableString& inProductionURL)
    : WorkflowOperation("sync operation"), mSessionURL(inSessionURL), mProductionURL(inProductionURL) {}

ZOSyncOperation::State ZOSyncOperation::GetState() const {
    MutexLock lock(mMutex);
    return mState;
}

ImmutableString ZOSyncOperation::GetCommitId() const {
    return GetState().commitId;
}
bool ZOSyncOperation::PullSucceeded() const {
    return GetState().pullSucceeded;
}
bool ZOSyncOperation::HasChanges() const {
    return GetState().hasChanges;
}
bool ZOSyncOperation::HasConflicts() const {
    return GetState().hasConflicts;
}
bool ZOSyncOperation::HasEnclosureConflicts() const {
    return GetState().hasEnclosureConflicts;
}

void ZOSyncOperation::Run() {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    if (IsCanceled() || !server || !FindSession(server)) {
        return Finish(kResultFailure);
    }
    const bool isHeadKnown = FindHead(server);
    if (IsCanceled() || !isHeadKnown) {
        return Finish(IsCanceled() ? kResultCancelled : kResultFailure);
    }
    WritePreSyncEnclosure();
}

bool ZOSyncOperation::FindSession(const InterfaceRef<IZOCDataServer>& inServer) {
    const InterfaceRef<IZOCProduction> production =
        mSessionURL.empty() ? nullptr : inServer->GetProductionFromURL(mSessionURL);
    mSession = RFL::QueryInterface<IZOCEditingSession>(production);
    mEnclosures = production ? production->GetEnclosures() : nullptr;
    return bool(mSession);
}

bool ZOSyncOperation::FindHead(const InterfaceRef<IZOCDataServer>& inServer) {
    const InterfaceRef<IZOCProduction> production =
        mProductionURL.empty() ? nullptr : inServer->GetProductionFromURL(mProductionURL);
    if (!production) {
        return false;
    }
    mProductionID = production->GetIdentifier();
    // Asks the server for the present state: what the object holds may be any number of commits old.
    const ImmutableString head = production->GetMostRecentRevision();
    MutexLock lock(mMutex);
    mState.commitId = head;
    return !head.empty();
}

void ZOSyncOperation::WritePreSyncEnclosure() {
    const InterfaceRef<ZOSyncOperation> self(this);
    // Another host of the user may have written the note since the list was loaded.
    const RequestCompletion onListed = [self](const Guid&, int inResult,
                                              const InterfaceRef<IZOCServerResource>&,
                                              const shared_ptr<ostnet::Response>&) {
        if (inResult < 0 || self->IsCanceled()) {
            return self->OnPreSyncEnclosureWritten();
        }
        self->WriteNote(GetPreSyncHeadCommitIdEnclosureName(self->mProductionID), self->GetCommitId(),
                        [self] { self->OnPreSyncEnclosureWritten(); });
    };
    if (!LoadFresh(RFL::QueryInterface<IZOCServerResource>(mEnclosures), Guid::CreateUnique(), onListed)) {
        OnPreSyncEnclosureWritten();
    }
}

void ZOSyncOperation::WriteNote(const ImmutableString& inName, const ImmutableString& inCommitId,
                                const AfterWrite& inNext) {
    const auto writer = RFL::QueryInterface<IZOCTransaction>(mSession);
    const RequestCompletion onWritten = [inName, inNext](const Guid&, int inResult,
                                                         const InterfaceRef<IZOCServerResource>&,
                                                         const shared_ptr<ostnet::Response>&) {
        if (inResult < 0) {
            TraceUnwritten(inName);
        }
        inNext();
    };
    if (!writer || !writer->WriteEnclosure(inName, inCommitId.str(), Guid::CreateUnique(), onWritten,
                                           ostnet::kHEADER_CONTENT_TYPE_TEXT_PLAIN)) {
        TraceUnwritten(inName);
        inNext();
    }
}

void ZOSyncOperation::OnPreSyncEnclosureWritten() {
    if (IsCanceled()) {
        return Finish(kResultCancelled);
    }
    const InterfaceRef<ZOSyncOperation> self(this);
    const RequestCompletion onPulled = [self](const Guid&, int inResult,
                                              const InterfaceRef<IZOCServerResource>&,
                                              const shared_ptr<ostnet::Response>& inResponse) {
        self->OnPullCompleted(inResult, inResponse);
    };
    if (!mSession->Pull(Guid::CreateUnique(), onPulled, kMergeStrategy_Interactive,
                        ostcore::utility::ToUTF16(GetCommitId().view()))) {
        Finish(kResultFailure);
    }
}

void ZOSyncOperation::OnPullCompleted(int inResult, const shared_ptr<ostnet::Response>& inResponse) {
    if (inResult == kResultHTTPPreconditionFailed) {
        return FinishAfterForeignCommit(RFL::QueryInterface<IZOCProduction>(mSession), GetCommitId());
    }
    if (inResult < 0) {
        return Finish(IsCanceled() ? kResultCancelled : inResult);
    }
    {
        const ImmutableString commit = GetCommitIdFromResponse(inResponse);
        MutexLock lock(mMutex);
        mState.pullSucceeded = true;
        mState.commitId = commit;
    }
    const InterfaceRef<IZOCDifferences> differences = mSession->GetOutgoingChanges();
    if (IsCanceled()) {
        return Finish(kResultCancelled);
    }
    const InterfaceRef<ZOSyncOperation> self(this);
    const RequestCompletion onLoaded = [self, differences](const Guid&, int inLoadResult,
                                                           const InterfaceRef<IZOCServerResource>&,
                                                           const shared_ptr<ostnet::Response>&) {
        self->OnDifferencesLoaded(inLoadResult, differences);
    };
    if (!LoadFresh(RFL::QueryInterface<IZOCServerResource>(differences), Guid::CreateUnique(), onLoaded)) {
        Finish(kResultSuccess);
    }
}

void ZOSyncOperation::OnDifferencesLoaded(int inResult, const InterfaceRef<IZOCDifferences>& inDifferences) {
    if (inResult < 0) {
        return OnPostSyncEnclosureWritten();
    }
    {
        const bool hasChanges = inDifferences->HasDifferences();
        const bool hasConflicts = inDifferences->HasConflicts();
        const bool hasEnclosureConflicts = inDifferences->HasEnclosureConflicts();
        MutexLock lock(mMutex);
        mState.hasChanges = hasChanges;
        mState.hasConflicts = hasConflicts;
        mState.hasEnclosureConflicts = hasEnclosureConflicts;
    }
    const ImmutableString base = inDifferences->GetBaseCommitID();
    if (!mEnclosures || base.empty()) {
        return OnPostSyncEnclosureWritten();
    }
    const InterfaceRef<ZOSyncOperation> self(this);
    WriteNote(GetPostSyncBaseCommitIdEnclosureName(mProductionID), base,
              [self] { self->OnPostSyncEnclosureWritten(); });
}

void ZOSyncOperation::OnPostSyncEnclosureWritten() {
    Finish(IsCanceled() ? kResultCancelled : kResultSuccess);
}

}  // namespace ZOCL
