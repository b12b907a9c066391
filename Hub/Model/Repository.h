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
    bool isPinned = false;  ///< the commit was named, so nothing can be written through this view
    bool mayWrite = false;  ///< the actor may write to the line
};

class Repository {
public:
    explicit Repository(Transaction& inTransaction) : mTransaction(inTransaction) {}

    /// The view of a production or template. inCommit is empty or "HEAD" for the live state.
    /// Throws Failure 404 for an unknown line or commit, and for one that the actor may not read.
    View Open(std::string const& inLineId, std::string const& inCommit, Actor const& inActor);

    bool MayRead(LineRecord const& inLine, Actor const& inActor);

    /// A new line with a first commit. Properties have been checked.
    LineRecord CreateLine(std::string const& inKind, TreeRoot const& inTree, std::string const& inTitle,
                          Actor const& inOwner, bool inIsTemporary, Micros inNow);

    std::optional<AssetState> FindAsset(View const& inView, std::string const& inAssetId,
                                        std::string* outHash = nullptr);
    /// Throws Failure 404 when it is not there.
    AssetState GetAsset(View const& inView, std::string const& inAssetId, std::string* outHash = nullptr);
    AssetState LoadAsset(std::string const& inHash);
    TreeRoot LoadTree(std::string const& inHash);

    /// Stores payload bytes and returns their content identifier.
    std::string AddContent(std::string_view inBytes);
    /// Stores the state with all references that make it readable through the production.
    std::string AddAsset(std::string const& inProduction, AssetState const& inState);
    void AddEnclosureReference(std::string const& inProduction, EnclosureState const& inEnclosure);

    /// What a commit changes; states are hashes from AddAsset.
    struct Edit {
        AssetMap::Changes assets;
        std::optional<std::string> properties;
        std::optional<std::vector<EnclosureState>> enclosures;
    };

    /// Writes one new commit on the line and moves its head; ioView shows the new state afterwards.
    void CommitEdit(View& ioView, Edit const& inEdit, std::string const& inTitle, Actor const& inCommitter,
                    Micros inNow);

private:
    CommitRecord WriteCommit(std::string const& inProduction, std::string const& inParent,
                             TreeRoot const& inTree, std::string const& inTitle, Actor const& inCommitter,
                             Micros inNow);

    Transaction& mTransaction;
};

}  // namespace zohub
