// The three-way merge of trees, item by item, and the conflicts that it leaves open. Its laws are in
// Docs/decisions/0007-merge-laws.md.
//
// Equal parts are never looked at: the cost goes with what was changed, not with what there is.
#pragma once

#include <string>
#include <vector>

#include "Model/TreeDiff.h"

namespace zohub {

/// A rendition that both sides changed is kept as a conflict of its own, with its identifier as the name; to
/// clients it is told as part of the asset's conflict.
inline constexpr char kConflictRendition[] = "rendition";
inline constexpr char kConflictRemoved[] = "removed";

/// What happens to an item that both sides changed in different ways.
enum class MergeStrategy {
    Keep,    ///< mine stays and the item is in conflict
    Yours,   ///< mine
    Theirs,  ///< theirs
};

struct MergeInput {
    TreeRoot base;                     ///< what both sides come from
    TreeRoot theirs;                   ///< the commit that is pulled
    TreeRoot mine;                     ///< the session
    std::string baseCommit;            ///< the commit of the base tree; conflicts that are new name it
    std::vector<ConflictRecord> open;  ///< the session's conflicts before the merge
    MergeStrategy strategy = MergeStrategy::Keep;
    std::string referencesOf;  ///< the line under which states that neither side has are listed
};

struct MergeResult {
    TreeRoot tree;
    /// All that are open afterwards, old and new, without the session's identifier. Always empty with Yours
    /// and Theirs.
    std::vector<ConflictRecord> conflicts;
};

/// Stores the asset states that are new; the tree itself is the caller's to store, with its commit.
MergeResult MergeTrees(Transaction& inTransaction, MergeInput const& inInput);

/// The conflicts that are left when a session with these conflicts has the tree inMine: those whose sides
/// have become equal are closed, and those of an asset that one side no longer has become one. To be called
/// whenever the tree of a session with conflicts changes. inTheirs is the tree of the session's base commit.
std::vector<ConflictRecord> OpenConflicts(Transaction& inTransaction, TreeRoot const& inTheirs,
                                          TreeRoot const& inMine,
                                          std::vector<ConflictRecord> const& inConflicts);

/// inMine with the items of these conflicts as they are in inTheirs.
TreeRoot TakeTheirs(Transaction& inTransaction, TreeRoot const& inTheirs, TreeRoot const& inMine,
                    std::vector<ConflictRecord> const& inConflicts, std::string const& inReferencesOf);

}  // namespace zohub
