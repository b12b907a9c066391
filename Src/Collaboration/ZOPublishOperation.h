// Shares an editing session as one commit of its production.
#pragma once

#include "Collaboration/WorkflowOperation.h"

namespace ZOCL {

/// One request that is never cancelled, since a commit cannot be half cancelled: Abort does nothing, and the
/// result tells what the server did. kResultHTTPConflict: the production has a newer commit, or conflicts
/// remain. kResultHTTPPreconditionFailed: the session was changed elsewhere; GetRecentCommitMetadata has by
/// whom, when that is known.
class ZOPublishOperation final : public WorkflowOperation {
public:
    /// inCommitId is the session's commit that the user has seen.
    ZOPublishOperation(const InterfaceRef<IZOCEditingSession>& inSession, const UString& inCommitMessage,
                       const ImmutableString& inCommitId);

    UString GetDescription() override { return u"ZOPublishOperation"; }
    void Abort() override {}
    void Run() override;

    /// Null before the end and when there was none.
    shared_ptr<ostnet::Response> GetResponse() const;
    /// The new commit, as the response names it; null for a refusal.
    ImmutableString GetCommitId() const { return GetCommitIdFromResponse(GetResponse()); }

private:
    ~ZOPublishOperation() override = default;
    void OnPushCompleted(int inResult, const shared_ptr<ostnet::Response>& inResponse);

    const InterfaceRef<IZOCEditingSession> mSession;
    const UString mCommitMessage;
    const ImmutableString mCommitId;
    shared_ptr<ostnet::Response> mResponse ZO_GUARDED_BY(mMutex);
};

}  // namespace ZOCL
