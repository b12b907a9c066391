// The host's part of the library's flows.
#include "GuidedFlow.h"

#include <algorithm>
#include <exception>
#include <set>

#include "Conflicts.h"
#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "Sharing.h"
#include "ZOClient/Publish.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ZOCL::ImmutableString;
using ZOCL::Publish::Continuation;

/// Of more conflicts than fit on a screen the sides are not told beforehand.
constexpr std::size_t kMostSides = 12;

// One run of a flow. The library calls the host's parts from within the call that runs it.
class GuidedFlow {
public:
    GuidedFlow(Context& ioContext, WorkSession& ioSession, const LatestState& inBefore)
        : mContext(ioContext),
          mSession(ioSession),
          mBefore(inBefore),
          mBase(inBefore.base),
          mConflicts(CountConflicts(inBefore.outgoing)),
          mHadConflicts(mConflicts != 0) {}

    void Share();
    void GetLatest();
    void Resolve();

private:
    using Production = ZOCL::InterfaceRef<ZOCL::IZOCProduction>;

    ZOCL::Publish::SyncCompletion SyncPart();
    ZOCL::Publish::ResolveCompletion ReplacedPart();
    ZOCL::Publish::ConflictsKeptFunction KeptPart();

    bool Do(const std::function<void()>& inPart);
    void OnSynced(const std::string& inCommit);
    void OnReplaced(const std::string& inCommit);
    void SaySides();
    void SayShared(const std::string& inCommit);
    void SayResolved() { mContext.Out().Say("no conflict remains; share with 'zo share'"); }
    bool LoadToEnd(const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource, bool inIsLoaded);
    void Settle();
    bool HasArrivedUntold() const;
    void ThrowIfStopped();
    void ThrowIfConflictsRemain();
    Failure WhySyncFailed(int inResult);

    ZOCL::UString ProductionName() const { return ToUTF16(mSession.productionName); }
    ImmutableString SessionURL() const { return ImmutableString(mSession.view.url); }
    ImmutableString ProductionURL() const {
        const auto production =
            RFL::QueryInterface<ZOCL::IZOCServerResource>(mSession.session->GetParentProduction());
        return production ? production->GetHTTPURL() : ImmutableString();
    }

    Context& mContext;
    WorkSession& mSession;
    const LatestState& mBefore;
    /// What the session is based on, and how much of it is in conflict, as far as it was told.
    std::string mBase;
    std::size_t mConflicts;
    bool mHadConflicts;
    /// The session has moved, and the library has not told where to.
    bool mIsHeadUnknown = false;
    bool mHasSyncFailed = false;
    bool mIsNothingLeft = false;
    bool mHasTriedToShare = false;
    /// What Settle has found.
    bool mIsSettled = false;
    std::string mSettledBase;
    bool mHasChanges = true;
    /// What went wrong in a part of the host.
    std::exception_ptr mFailure;
    /// No copies are kept on this road: nobody tells the host of which assets one is wanted.
    const std::set<ImmutableString> mCopyableTypes;
    const boost::shared_ptr<ZOCL::Publish::PublishWorkflowTracker> mTracker =
        boost::make_shared<ZOCL::Publish::PublishWorkflowTracker>();
};

// False: it failed, or the user wants to stop, and the flow is to end.
bool GuidedFlow::Do(const std::function<void()>& inPart) {
    try {
        inPart();
        return true;
    } catch (...) {
        mFailure = std::current_exception();
        return false;
    }
}

ZOCL::Publish::SyncCompletion GuidedFlow::SyncPart() {
    return [this](bool inSyncDone, bool, const ImmutableString& inCommitId, const Continuation& inContinue) {
        mHasSyncFailed = !inSyncDone;
        const bool goesOn = inSyncDone && Do([&] { OnSynced(inCommitId.str()); }) && !mIsNothingLeft;
        inContinue(goesOn ? ZOCL::kResultSuccess : ZOCL::kResultCancelled, inCommitId);
    };
}

void GuidedFlow::OnSynced(const std::string& inCommit) {
    // At once, since it is so also when what follows fails.
    ChangeOpen(mContext, [&](OpenRecord& ioRecord) {
        ioRecord.session = mSession.view.url;
        ioRecord.seenCommit = inCommit;
    });
    RefreshSession(mContext, mSession);
    const auto outgoing = mSession.session->GetOutgoingChanges();
    const std::vector<Change> changes =
        LoadChanges(mContext, outgoing, "loading what the session has to share");
    mBase = outgoing->GetBaseCommitID().str();
    RememberMoved(mContext, mSession, inCommit, mBase);
    SayGot(mContext.Out(), mBefore, mBase, CountMerged(mBefore, changes));
    mIsNothingLeft = changes.empty();
    mConflicts = CountConflicts(changes);
    mHadConflicts = mConflicts != 0;
    if (mHadConflicts) {
        SaySides();
    }
}

// What the window's table does not tell: who did what on each side.
void GuidedFlow::SaySides() {
    std::vector<Conflict> conflicts = LoadOpenConflicts(mContext, mSession);
    // In the order of the table.
    std::stable_sort(conflicts.begin(), conflicts.end(), [](const Conflict& inLeft, const Conflict& inRight) {
        return inLeft.asset < inRight.asset;
    });
    const std::size_t count = conflicts.size();
    conflicts.resize(std::min(count, kMostSides));
    mContext.Out().Line("");
    PrintConflicts(mContext, conflicts);
    if (count > conflicts.size()) {
        mContext.Out().Line("... and " + std::to_string(count - conflicts.size()) +
                            " more; 'zo conflicts' tells of all");
    }
    mContext.Out().Line("");
}

void GuidedFlow::OnReplaced(const std::string& inCommit) {
    ChangeOpen(mContext, [&](OpenRecord& ioRecord) { ioRecord.seenCommit = inCommit; });
    mIsHeadUnknown = false;
    const std::vector<Change> changes = LoadOutgoing(mContext, mSession);
    mIsNothingLeft = changes.empty();
    mConflicts = CountConflicts(changes);
}

ZOCL::Publish::ResolveCompletion GuidedFlow::ReplacedPart() {
    return
        [this](bool, const Production&, const ImmutableString& inCommitId, const Continuation& inContinue) {
            const bool goesOn = Do([&] { OnReplaced(inCommitId.str()); }) && !mIsNothingLeft;
            inContinue(goesOn ? ZOCL::kResultSuccess : ZOCL::kResultCancelled, inCommitId);
        };
}

ZOCL::Publish::ConflictsKeptFunction GuidedFlow::KeptPart() {
    return [this](const std::vector<ImmutableString>&, const Continuation& inContinue) {
        mIsHeadUnknown = true;
        inContinue(ZOCL::kResultSuccess, ImmutableString());
    };
}

bool GuidedFlow::LoadToEnd(const ZOCL::InterfaceRef<ZOCL::IZOCServerResource>& inResource, bool inIsLoaded) {
    const Outcome outcome = mContext.Loop().RunToEnd(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inResource && (inIsLoaded ? inResource->Refresh(inRequest, inCompletion)
                                             : inResource->Load(inRequest, inCompletion, true));
        });
    return inResource && inResource->IsLoaded() &&
           (outcome.Succeeded() || outcome.result == ZOCL::kResultHTTPNotModified);
}

// What the flow has left behind counts as seen, also after an interrupt.
void GuidedFlow::Settle() {
    const auto outgoing = mSession.session->GetOutgoingChanges();
    mIsSettled = LoadToEnd(RFL::QueryInterface<ZOCL::IZOCServerResource>(outgoing), false);
    if (!mIsSettled) {
        return;
    }
    const std::vector<Change> changes = ChangesOf(outgoing);
    const std::size_t conflicts = CountConflicts(changes);
    mHasChanges = !changes.empty();
    mSettledBase = outgoing->GetBaseCommitID().str();
    // Of a decision about the production's properties alone the host is not told.
    mIsHeadUnknown = mIsHeadUnknown || conflicts != mConflicts || HasArrivedUntold();
    mConflicts = conflicts;
    if (mIsHeadUnknown &&
        LoadToEnd(RFL::QueryInterface<ZOCL::IZOCServerResource>(mSession.view.production), true)) {
        mSession.view = DescribeProduction(mSession.view.production);
        RememberMoved(mContext, mSession, mSession.view.commit, mSettledBase);
    }
}

// The user stopped while the hub was away, and the share had arrived before.
bool GuidedFlow::HasArrivedUntold() const {
    return mHasTriedToShare && mIsSettled && !mHasChanges && mSettledBase != mBase;
}

void GuidedFlow::ThrowIfStopped() {
    mContext.Loop().ThrowIfInterrupted();
    if (mFailure) {
        std::rethrow_exception(mFailure);
    }
}

void GuidedFlow::ThrowIfConflictsRemain() {
    if (!mIsSettled) {
        // Fails as that did, and tells why.
        mConflicts = CountConflicts(LoadOutgoing(mContext, mSession));
    }
    if (mConflicts != 0) {
        throw Failure(ExitCode::ConflictsRemain, Counted(mConflicts, "item") + " still in conflict",
                      kConflictsHint);
    }
}

// A window has told the user of it; what is wanted here is the exit code.
Failure GuidedFlow::WhySyncFailed(int inResult) {
    const std::string what = "getting the latest of " + mSession.productionName;
    const std::string seen = SeenCommit(mContext, mSession);
    RefreshSession(mContext, mSession);
    const bool mayHaveMoved =
        inResult == ZOCL::kResultFailure || inResult == ZOCL::kResultHTTPPreconditionFailed;
    if (mayHaveMoved && mSession.view.commit != seen) {
        return SessionMoved(mContext, mSession, what, seen);
    }
    return Failure::OfRequest(what, inResult, nullptr, "try again with 'zo latest'");
}

void GuidedFlow::Share() {
    const bool isBehind = mBefore.base != mBefore.head;
    if (!isBehind && mConflicts != 0) {
        SaySides();
    }
    const auto onShared = [this](bool inSucceeded, const ImmutableString& inCommitId) {
        mHasTriedToShare = true;
        if (inSucceeded) {
            // Head and base of the session are the new commit then.
            mIsHeadUnknown =
                !Do([&] { RememberMoved(mContext, mSession, inCommitId.str(), inCommitId.str()); });
        }
    };
    ZOCL::Publish::Publish(ProductionName(), SessionURL(), ImmutableString(mSession.view.commit), isBehind,
                           mConflicts != 0, onShared, SyncPart(), ReplacedPart(), KeptPart(), mCopyableTypes,
                           mTracker, false, {});
    const auto outcome = mTracker->GetOutcome();
    if (outcome.wasShared) {
        SayShared(outcome.commitId.str());
        return Settle();
    }
    if (outcome.result == ZOCL::kResultHTTPPreconditionFailed) {
        // Where others have moved it to has not been seen.
        mIsHeadUnknown = false;
    }
    Settle();
    if (HasArrivedUntold()) {
        return SayShared(mSettledBase);
    }
    if (mHasTriedToShare && !mIsSettled) {
        mContext.Out().Note(
            "the share may have arrived all the same: look with 'zo history' once the hub is back");
    }
    ThrowIfStopped();
    if (mIsNothingLeft) {
        return mContext.Out().Say("nothing is left to share: the session is as what is shared");
    }
    if (outcome.wasShown && outcome.result != ZOCL::kResultDialogCancelled) {
        Outcome refused;
        refused.started = true;
        refused.result = outcome.result;
        throw RefusedShare(mContext, mSession, refused, SeenCommit(mContext, mSession));
    }
    if (mHasSyncFailed) {
        throw WhySyncFailed(ZOCL::kResultFailure);
    }
    ThrowIfConflictsRemain();
    throw Failure(ExitCode::Cancelled, "nothing was shared", "'zo share' goes on from here");
}

void GuidedFlow::SayShared(const std::string& inCommit) {
    const auto shared =
        ZOCL::GetDifferencesByCommit(mContext.Server(), ImmutableString(mSession.productionID),
                                     ImmutableString(mBase), ImmutableString(inCommit));
    const bool isCounted = LoadToEnd(RFL::QueryInterface<ZOCL::IZOCServerResource>(shared), false);
    const std::string what = isCounted ? Counted(ChangesOf(shared).size(), "change") : "your changes";
    mContext.Out().Say(inCommit == mBase ? "there was nothing to share"
                                         : "shared " + what + " of " + mSession.productionName + " (commit " +
                                               inCommit + ")");
}

void GuidedFlow::GetLatest() {
    const int result = ZOCL::Publish::Sync(ProductionName(), SessionURL(), ProductionURL(), SyncPart(),
                                           ReplacedPart(), KeptPart(), mCopyableTypes, mTracker, {}, false);
    Settle();
    ThrowIfStopped();
    if (mHasSyncFailed) {
        throw WhySyncFailed(result);
    }
    ThrowIfConflictsRemain();
    if (mHadConflicts) {
        SayResolved();
    }
}

void GuidedFlow::Resolve() {
    SaySides();
    ZOCL::Publish::Resolve(ProductionName(), SessionURL(), ProductionURL(), ReplacedPart(), KeptPart(),
                           mCopyableTypes, mTracker, {});
    Settle();
    ThrowIfStopped();
    ThrowIfConflictsRemain();
    SayResolved();
}

// A share would be refused at its end; better before the user has written anything.
void RefuseWhenMoved(Context& ioContext, const WorkSession& inSession) {
    const std::string seen = SeenCommit(ioContext, inSession);
    if (seen != inSession.view.commit) {
        throw SessionMoved(ioContext, inSession, "sharing the session on " + inSession.productionName, seen);
    }
}

}  // namespace

bool AsksOnTheWay(Context& ioContext, Asks inWhen, const std::vector<std::string>& inDeciding) {
    const Arguments& args = ioContext.Args();
    const bool isTold = args.Has("interactive");
    std::vector<std::string> against = inDeciding;
    against.insert(against.end(), {"dry-run", "json", "quiet", "no-input"});
    for (const std::string& option : against) {
        if (args.Has(option) && isTold) {
            throw Failure(ExitCode::Usage, "--interactive and --" + option + " exclude each other",
                          "leave one of them out");
        }
        if (args.Has(option)) {
            return false;
        }
    }
    if (isTold && !ioContext.Out().HasPerson()) {
        throw Failure(ExitCode::Usage,
                      "--interactive needs a terminal, on standard input and on standard error");
    }
    return isTold || (inWhen == Asks::Usually && ioContext.Out().HasPerson());
}

void ShareWithUser(Context& ioContext, WorkSession& ioSession) {
    const LatestState before = LoadLatestState(ioContext, ioSession);
    if (before.outgoing.empty()) {
        return ioContext.Out().Say(std::string("there is nothing to share") +
                                   (before.base == before.head ? "" : ", but something newer: zo latest"));
    }
    RefuseWhenMoved(ioContext, ioSession);
    GuidedFlow(ioContext, ioSession, before).Share();
}

void GetLatestWithUser(Context& ioContext, WorkSession& ioSession) {
    const LatestState before = LoadLatestState(ioContext, ioSession);
    if (before.base == before.head && CountConflicts(before.outgoing) == 0) {
        return ioContext.Out().Say("there is nothing newer than what the session is based on");
    }
    GuidedFlow(ioContext, ioSession, before).GetLatest();
}

void ResolveWithUser(Context& ioContext, WorkSession& ioSession) {
    const LatestState before = LoadLatestState(ioContext, ioSession);
    if (CountConflicts(before.outgoing) == 0) {
        return ioContext.Out().Note("nothing is in conflict");
    }
    GuidedFlow(ioContext, ioSession, before).Resolve();
}

}  // namespace zo
