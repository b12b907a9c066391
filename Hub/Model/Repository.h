// Lines, commits and trees: finding the state that a URL speaks of, and writing the next one.
#pragma once

#include <map>
#include <optional>
#include <string>

#include "Model/AssetMap.h"
#include "Model/Objects.h"
#include "Store/Storage.h"

namespace zohub {

/// A user as the request's rights see him.
struct Actor {
    std::string name;
    bool isAdmin = false;
};

/// A line at one of its commits.
struct View {
    LineRecord line;
    CommitRecord commit;
    TreeRoot tree;
    bool isPinned = false;   ///< the commit was named, so nothing can be written through this view
    bool mayWrite = false;   ///< the actor may write to the line
    bool mayManage = false;  ///< the line is the actor's own session: he shares it and opens transactions

    bool IsSession() const { return line.kind == kLineSession; }
    bool IsTransaction() const { return line.kind == kLineTransaction; }
};

/// Under what references are listed that the line makes: what a session has not shared yet is its own.
std::string const& ScopeOf(LineRecord const& inLine);

class Repository {
public:
    explicit Repository(Transaction& inTransaction) : mTransaction(inTransaction) {}

    /// The view of a line. inCommit is empty or "HEAD" for the live state.
    /// Throws Failure 404 for an unknown line or commit, and for one that the actor may not read.
    View Open(std::string const& inLineId, std::string const& inCommit, Actor const& inActor);

    bool MayRead(LineRecord const& inLine, Actor const& inActor);

    /// Whether the line may show the commit: its own, or one of a line below it.
    static bool HasCommit(LineRecord const& inLine, CommitRecord const& inCommit);
    /// The present state of the line, which the caller may see. Throws std::runtime_error for a damaged one.
    View LiveView(LineRecord inLine, Actor const& inActor);

    /// A new production or template with a first commit. Properties have been checked.
    LineRecord CreateLine(std::string const& inKind, TreeRoot const& inTree, std::string const& inTitle,
                          Actor const& inOwner, bool inIsTemporary, Micros inNow);

    std::optional<AssetState> FindAsset(View const& inView, std::string const& inAssetId,
                                        std::string* outHash = nullptr);
    /// Throws Failure 404 when it is not there.
    AssetState GetAsset(View const& inView, std::string const& inAssetId, std::string* outHash = nullptr);
    AssetState LoadAsset(std::string const& inHash);
    TreeRoot LoadTree(std::string const& inHash);

    /// Stores payload bytes under their hash, which is their content identifier.
    void AddContent(std::string const& inHash, std::string_view inBytes);
    /// Stores the state with all references that make it readable through lines of that scope.
    std::string AddAsset(std::string const& inScope, AssetState const& inState);
    /// Makes a stored state readable through lines of that scope.
    void AddAssetReferences(std::string const& inScope, AssetState const& inState, std::string const& inHash);
    void AddEnclosureReference(std::string const& inScope, EnclosureState const& inEnclosure);
    /// What the line, or the production below it, refers to or once did.
    std::optional<ReferenceRecord> FindReference(LineRecord const& inLine, std::string const& inKind,
                                                 std::string const& inKey);

    /// What a commit changes; states are hashes from AddAsset.
    struct Edit {
        AssetMap::Changes assets;
        std::optional<std::string> properties;
        std::optional<std::vector<EnclosureState>> enclosures;
    };

    /// Writes one new commit on the line and moves its head; ioView shows the new state afterwards.
    void CommitEdit(View& ioView, Edit const& inEdit, std::string const& inTitle, Actor const& inCommitter,
                    Micros inNow);
    /// As CommitEdit, with a tree whose parts are stored already.
    void CommitTree(View& ioView, TreeRoot const& inTree, std::string const& inTitle,
                    Actor const& inCommitter, Micros inNow);

private:
    View ViewAt(LineRecord inLine, CommitRecord inCommit, Actor const& inActor);
    CommitRecord WriteCommit(LineRecord const& inLine, TreeRoot const& inTree, std::string const& inTitle,
                             Actor const& inCommitter, Micros inNow);

    Transaction& mTransaction;
};

}  // namespace zohub
