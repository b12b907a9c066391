// Settling conflicts: one step after the other, with the host's part between them.
#pragma once

#include "Collaboration/ProductionItemData.h"
#include "Collaboration/ZOResolveOperation.h"
#include "Workflows/WorkflowTools.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

struct ResolveFlowSettings {
    UString productionName;
    ImmutableString sessionURL;
    ImmutableString productionURL;
    Publish::ResolveCompletion resolveCompletion;
    Publish::ConflictsKeptFunction conflictsKept;
    std::set<ImmutableString> copyableTypes;
    shared_ptr<Publish::PublishWorkflowTracker> tracker;
    /// What comes when no conflict is left and the host has done its part.
    Publish::WorkflowContinuation next;
};

/// Outlives its window for as long as a host holds a continuation. Main thread.
class ResolveFlow : public enable_shared_from_this<ResolveFlow> {
public:
    explicit ResolveFlow(const ResolveFlowSettings& inSettings) : mSettings(inSettings) {}

    const ResolveFlowSettings& Settings() const noexcept { return mSettings; }
    /// The session's commit that the next step names.
    void SetCommitId(const ImmutableString& inCommitId) { mCommitId = inCommitId; }
    /// Told when the host's part has ended; an empty function ends that.
    void SetOnHostDone(function<void()> inFunction) { mOnHostDone.swap(inFunction); }

    struct Step {
        int result = kResultFailure;
        /// How many of the items, from the first on.
        std::size_t settled = 0;
    };
    /// Settles the items under a progress window, tells the user of a failure, and the host of what has
    /// changed.
    Step Run(const std::vector<ConflictItemData>& inItems, Publish::ResolveType inType);
    bool WaitsForHost() const noexcept { return mHostParts > 0; }
    bool HasLoginEnded() const { return mLogin.HasEnded(); }
    /// No conflict is left: goes on, as soon as the host has done its part.
    void Finish();

private:
    void TellHost(const InterfaceRef<ZOResolveOperation>& inOperation);
    Publish::Continuation BeginHostPart();
    void OnHostDone(int inResult, const ImmutableString& inCommitId);
    void GoOnWhenReady();

    const ResolveFlowSettings mSettings;
    const LoginWatch mLogin;
    ImmutableString mCommitId;
    function<void()> mOnHostDone;
    int mHostParts = 0;
    bool mIsFinished = false;
    bool mHasHostRefused = false;
};

}  // namespace ZOCL
