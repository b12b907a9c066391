// Sessions and transactions. What stands on what is checked here; how trees are merged is not.
#include "Model/Sessions.h"

#include <stdexcept>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Model/TreeMerge.h"

namespace zohub {

namespace {

constexpr char kPullTitle[] = "Got the latest changes";
/// The key of a transaction's metadata under which it says "true".
constexpr char kAnswersConflicts[] = "answersConflicts";

[[noreturn]] void FailMoved() {
    throw Failure(412, "session-changed",
                  "The session has changed since the commit that the request names; load it and look again.");
}

bool AnswersConflicts(LineRecord const& inTransaction) {
    Json const metadata = Json::parse(inTransaction.metadata, nullptr, false);
    return metadata.is_object() && StringUnder(metadata, kAnswersConflicts) == "true";
}

MergeStrategy MergeStrategyOf(PullStrategy inStrategy) {
    switch (inStrategy) {
        case PullStrategy::Yours:
            return MergeStrategy::Yours;
        case PullStrategy::Theirs:
            return MergeStrategy::Theirs;
        case PullStrategy::Interactive:
        case PullStrategy::Safe:
            break;
    }
    return MergeStrategy::Keep;
}

}  // namespace

Sessions::Sessions(Transaction& inTransaction, Actor inActor, Micros inNow)
    : mTransaction(inTransaction), mRepository(inTransaction), mActor(std::move(inActor)), mNow(inNow) {}

View Sessions::Parent(View const& inLine) {
    auto parent = mTransaction.FindLine(inLine.line.parent);
    if (!parent)
        throw std::runtime_error("the line " + inLine.line.id + " stands on nothing; run zohub check");
    return mRepository.LiveView(std::move(*parent), mActor);
}

CommitRecord Sessions::GetCommit(std::string const& inId) {
    auto commit = mTransaction.FindCommit(inId);
    if (!commit)
        throw std::runtime_error("the commit " + inId + " is missing; run zohub check");
    return std::move(*commit);
}

LineRecord Sessions::NewLine(char const* inKind, View const& inParent, std::string const& inMetadata) const {
    LineRecord line;
    line.id = NewKey(kShortKey);
    line.kind = inKind;
    line.parent = inParent.line.id;
    line.production = inParent.line.production;
    line.owner = mActor.name;
    line.metadata = inMetadata;
    line.created = line.modified = mNow;
    return line;
}

View Sessions::Create(View const& inProduction, std::string const& inMetadata, bool inIsTemporary) {
    LineRecord line = NewLine(kLineSession, inProduction, inMetadata);
    line.isTemporary = inIsTemporary;
    line.baseCommit = line.headCommit = inProduction.line.headCommit;
    mTransaction.PutLine(line);
    return mRepository.LiveView(line, mActor);
}

// Its own commits, and shared ones up to that on which it stands.
bool Sessions::IsOnSession(View const& inSession, CommitRecord const& inCommit) {
    if (!Repository::HasCommit(inSession.line, inCommit))
        return false;
    return inCommit.line == inSession.line.id ||
           inCommit.number <= GetCommit(inSession.line.baseCommit).number;
}

View Sessions::OpenTransaction(View const& inSession, Opening const& inOpening) {
    std::string const& head = inSession.line.headCommit;
    std::string const id = inOpening.commit.empty() ? head : inOpening.commit;
    auto const commit = mTransaction.FindCommit(id);
    if (!commit || !IsOnSession(inSession, *commit))
        throw Failure(400, "unknown-commit", "\":commitId\" is not a commit of this session.");
    if (inOpening.requireHead && id != head)
        FailMoved();
    LineRecord line = NewLine(kLineTransaction, inSession, inOpening.metadata);
    line.baseCommit = line.headCommit = id;
    mTransaction.PutLine(line);
    return mRepository.LiveView(line, mActor);
}

TreeRoot Sessions::Rebase(View const& inTransaction, CommitRecord const& inBase, View const& inSession) {
    MergeInput input;
    input.base = mRepository.LoadTree(inBase.tree);
    input.theirs = inSession.tree;
    input.mine = inTransaction.tree;
    input.baseCommit = inBase.id;
    input.referencesOf = ScopeOf(inSession.line);
    MergeResult result = MergeTrees(mTransaction, input);
    if (!result.conflicts.empty())
        FailMoved();
    return std::move(result.tree);
}

// What differs between the states before and after is what was changed.
void Sessions::AnswerConflicts(View const& inSession, TreeRoot const& inBefore) {
    auto const conflicts = mTransaction.ListConflicts(inSession.line.id);
    for (auto const& changed : OpenConflicts(mTransaction, inBefore, inSession.tree, conflicts))
        mTransaction.RemoveConflict(inSession.line.id, changed.kind, changed.item, changed.name);
}

void Sessions::CloseSettledConflicts(View const& inSession) {
    auto const conflicts = mTransaction.ListConflicts(inSession.line.id);
    if (conflicts.empty())
        return;
    TreeRoot const theirs = mRepository.LoadTree(GetCommit(inSession.line.baseCommit).tree);
    mTransaction.ReplaceConflicts(inSession.line.id,
                                  OpenConflicts(mTransaction, theirs, inSession.tree, conflicts));
}

View Sessions::CommitTransaction(View& ioTransaction, ResolveStrategy inStrategy,
                                 std::string const& inTitle) {
    View session = Parent(ioTransaction);
    CommitRecord const base = GetCommit(ioTransaction.line.baseCommit);
    if (ioTransaction.commit.tree != base.tree) {
        bool const hasMoved = session.line.headCommit != base.id;
        if (hasMoved && inStrategy == ResolveStrategy::None)
            FailMoved();
        TreeRoot const tree = hasMoved ? Rebase(ioTransaction, base, session) : ioTransaction.tree;
        if (WriteTreeRoot(tree) != WriteTreeRoot(session.tree)) {
            TreeRoot const before = session.tree;
            mRepository.CommitTree(session, tree, inTitle, mActor, mNow);
            if (AnswersConflicts(ioTransaction.line))
                AnswerConflicts(session, before);
            CloseSettledConflicts(session);
        }
    }
    // The steps between are of no more use to anybody; the transaction shows what became of it.
    ioTransaction.line.headCommit = session.line.headCommit;
    ioTransaction.line.isEnded = true;
    ioTransaction.line.modified = mNow;
    mTransaction.PutLine(ioTransaction.line);
    mTransaction.RemoveCommitsOf(ioTransaction.line.id);
    ioTransaction = mRepository.LiveView(ioTransaction.line, mActor);
    return session;
}

// What changed was listed under the session until now. The rest of the tree comes from the shared line.
void Sessions::ShareReferences(TreeRoot const& inBase, View const& inSession) {
    std::string const& production = inSession.line.production;
    AssetMap const base(mTransaction, inBase.assets);
    auto const changes = base.CompareTo(AssetMap(mTransaction, inSession.tree.assets));
    for (auto const& change : changes.differences)
        if (!change.right.empty())
            mRepository.AddAssetReferences(production, mRepository.LoadAsset(change.right), change.right);
    for (auto const& enclosure : inSession.tree.enclosures)
        mRepository.AddEnclosureReference(production, enclosure);
}

void Sessions::MoveTo(View& ioSession, CommitRecord const& inCommit) {
    ioSession.commit = inCommit;
    ioSession.tree = mRepository.LoadTree(inCommit.tree);
    ioSession.line.headCommit = ioSession.line.baseCommit = inCommit.id;
    ioSession.line.modified = mNow;
    mTransaction.PutLine(ioSession.line);
}

void Sessions::Push(View& ioSession, Sharing const& inSharing) {
    if (!inSharing.commit.empty() && inSharing.commit != ioSession.line.headCommit)
        FailMoved();
    if (!mTransaction.ListConflicts(ioSession.line.id).empty())
        throw Failure(409, "conflicts-remain",
                      "The session has conflicts; accept one side of each, then share again.");
    View production = Parent(ioSession);
    if (!production.mayWrite)
        throw Failure(403, "not-permitted", "You may read this production but not change it.");
    if (ioSession.line.baseCommit != production.line.headCommit) {
        if (inSharing.strategy == ResolveStrategy::None)
            throw Failure(409, "behind",
                          "The production has newer commits; get the latest changes, then share again.");
        Pull(ioSession, "", PullStrategy::Safe);
    }
    if (ioSession.commit.tree == production.commit.tree)
        return;
    ShareReferences(production.tree, ioSession);
    mRepository.CommitTree(production, ioSession.tree, inSharing.message, mActor, mNow);
    MoveTo(ioSession, production.commit);
}

CommitRecord Sessions::SharedCommit(View const& inProduction, std::string const& inCommit) {
    if (inCommit.empty())
        return inProduction.commit;
    auto commit = mTransaction.FindCommit(inCommit);
    if (!commit || commit->line != inProduction.line.id)
        throw Failure(400, "unknown-commit", "\":commitId\" is not a shared commit of this production.");
    return std::move(*commit);
}

void Sessions::Pull(View& ioSession, std::string const& inCommit, PullStrategy inStrategy) {
    CommitRecord const theirs = SharedCommit(Parent(ioSession), inCommit);
    CommitRecord const base = GetCommit(ioSession.line.baseCommit);
    if (theirs.number <= base.number)
        return;
    auto const open = mTransaction.ListConflicts(ioSession.line.id);
    if (open.empty() && ioSession.commit.tree == base.tree)
        MoveTo(ioSession, theirs);
    else
        Merge(ioSession, base, theirs, inStrategy, open);
}

void Sessions::Merge(View& ioSession, CommitRecord const& inBase, CommitRecord const& inTheirs,
                     PullStrategy inStrategy, std::vector<ConflictRecord> const& inOpen) {
    MergeInput input;
    input.base = mRepository.LoadTree(inBase.tree);
    input.theirs = mRepository.LoadTree(inTheirs.tree);
    input.mine = ioSession.tree;
    input.baseCommit = inBase.id;
    input.open = inOpen;
    input.strategy = MergeStrategyOf(inStrategy);
    input.referencesOf = ScopeOf(ioSession.line);
    MergeResult const merged = MergeTrees(mTransaction, input);
    if (inStrategy == PullStrategy::Safe && !merged.conflicts.empty())
        throw Failure(409, "would-conflict",
                      "Both sides changed the same items; get the latest changes and resolve the conflicts.");
    ioSession.line.baseCommit = inTheirs.id;
    mRepository.CommitTree(ioSession, merged.tree, kPullTitle, mActor, mNow);
    mTransaction.ReplaceConflicts(ioSession.line.id, merged.conflicts);
}

void Sessions::Discard(View const& inLine) {
    mTransaction.RemoveLine(inLine.line.id);
}

}  // namespace zohub
