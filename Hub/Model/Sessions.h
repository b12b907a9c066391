// A user's work on a production: his session, the transactions that change it, sharing it and getting the
// latest.
#pragma once

#include <string>

#include "Model/Repository.h"

namespace zohub {

/// What a pull does with an item that both sides changed.
enum class PullStrategy { Interactive, Yours, Theirs, Safe };

/// What a commit, or a push, does when what it stands on has moved.
enum class ResolveStrategy { None, Auto };

/// All steps happen inside the caller's database transaction, as one user at one time. Views that are handed
/// in for reading and writing are live, and show the new state afterwards.
class Sessions {
public:
    Sessions(Transaction& inTransaction, Actor inActor, Micros inNow);

    /// A session that stands on the production's head. inMetadata is a JSON object.
    View Create(View const& inProduction, std::string const& inMetadata, bool inIsTemporary);

    struct Opening {
        std::string commit;  ///< empty for the session's head
        bool requireHead = false;
        std::string metadata;  ///< JSON object
    };
    /// Throws Failure 400 for a commit that is not the session's, 412 for one that is not its head but has
    /// to be.
    View OpenTransaction(View const& inSession, Opening const& inOpening);

    /// Makes what the transaction changed one commit of the session, ends the transaction, and gives the
    /// session. A transaction whose metadata says so answers the conflicts of the items that it changed.
    /// Throws Failure 412 when the session has moved and the strategy does not help.
    View CommitTransaction(View& ioTransaction, ResolveStrategy inStrategy, std::string const& inTitle);

    struct Sharing {
        std::string commit;  ///< what the user believes to be the session's head; empty when he does not say
        std::string message;
        ResolveStrategy strategy = ResolveStrategy::None;
    };
    /// Throws Failure 412 when the session has moved, 409 when it is behind or has conflicts.
    void Push(View& ioSession, Sharing const& inSharing);

    /// inCommit is shared; empty for the production's head. Throws Failure 400 for an unknown commit, 409
    /// when a safe pull would conflict.
    void Pull(View& ioSession, std::string const& inCommit, PullStrategy inStrategy);

    /// Removes a session with its transactions, or a transaction.
    void Discard(View const& inLine);

private:
    View Parent(View const& inLine);
    CommitRecord GetCommit(std::string const& inId);
    LineRecord NewLine(char const* inKind, View const& inParent, std::string const& inMetadata) const;
    bool IsOnSession(View const& inSession, CommitRecord const& inCommit);
    CommitRecord SharedCommit(View const& inProduction, std::string const& inCommit);
    TreeRoot Rebase(View const& inTransaction, CommitRecord const& inBase, View const& inSession);
    void AnswerConflicts(View const& inSession, TreeRoot const& inBefore);
    void CloseSettledConflicts(View const& inSession);
    void Merge(View& ioSession, CommitRecord const& inBase, CommitRecord const& inTheirs,
               PullStrategy inStrategy, std::vector<ConflictRecord> const& inOpen);
    void ShareReferences(TreeRoot const& inBase, View const& inSession);
    void MoveTo(View& ioSession, CommitRecord const& inCommit);

    Transaction& mTransaction;
    Repository mRepository;
    Actor const mActor;
    Micros const mNow;
};

}  // namespace zohub
