// Brings the newest commit of a production into an editing session.
#pragma once

#include "Collaboration/WorkflowOperation.h"

namespace ZOCL {

/// One request after the other: the production's head is read, noted as an enclosure of the session, and
/// merged into it; then the differences are loaded, and the new base is noted. The notes are records for
/// whoever reads the session: that one cannot be written stops nothing. Neither does a failure to load the
/// differences, since the session has been merged by then.
///
/// A cancel is seen between two requests. kResultHTTPPreconditionFailed: the session was changed elsewhere;
/// GetRecentCommitMetadata has by whom, when that is known.
class ZOSyncOperation final : public WorkflowOperation {
public:
    ZOSyncOperation(const ImmutableString& inSessionURL, const ImmutableString& inProductionURL);

    UString GetDescription() override { return u"ZOSyncOperation"; }
    void Run() override;

    /// The session's commit after the merge, else the head that was to be merged; null when not even that is
    /// known.
    ImmutableString GetCommitId() const;
    /// Whether the server has merged, whatever came after that.
    bool PullSucceeded() const;
    // What the differences say after the merge; false when they could not be loaded.
    bool HasChanges() const;
    bool HasConflicts() const;
    bool HasEnclosureConflicts() const;

private:
    struct State {
        ImmutableString commitId;
        bool pullSucceeded = false;
        bool hasChanges = false;
        bool hasConflicts = false;
        bool hasEnclosureConflicts = false;
    };
    using AfterWrite = function<void()>;

    ~ZOSyncOperation() override = default;
    State GetState() const;
    bool FindSession(const InterfaceRef<IZOCDataServer>& inServer);
    bool FindHead(const InterfaceRef<IZOCDataServer>& inServer);
    void WritePreSyncEnclosure();
    void OnPreSyncEnclosureWritten();
    void OnPullCompleted(int inResult, const shared_ptr<ostnet::Response>& inResponse);
    void OnDifferencesLoaded(int inResult, const InterfaceRef<IZOCDifferences>& inDifferences);
    void OnPostSyncEnclosureWritten();
    void WriteNote(const ImmutableString& inName, const ImmutableString& inCommitId,
                   const AfterWrite& inNext);

    const ImmutableString mSessionURL;
    const ImmutableString mProductionURL;
    // Set by Run before the first request that it does not wait for, and not changed after that.
    InterfaceRef<IZOCEditingSession> mSession;
    InterfaceRef<IZOCEnclosures> mEnclosures;
    ImmutableString mProductionID;
    State mState ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
