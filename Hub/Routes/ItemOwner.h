// What has enclosures and renditions: an asset, or the production itself. Finds it for a request, and writes
// the changed list back as one commit.
#pragma once

#include "Routes/Documents.h"
#include "Routes/RouteTable.h"

namespace zohub {

/// Which owner the pattern of a route speaks of, and whether it names a commit.
struct OwnerKind {
    bool isAsset = false;
    bool isPinned = false;

    /// The pattern of the owner below the API path.
    std::string Pattern() const;
    /// Where the parameters behind the owner's begin.
    std::size_t NextParameter() const { return 1u + (isPinned ? 1u : 0u) + (isAsset ? 1u : 0u); }
};

class ItemOwner {
public:
    /// For reading. Throws Failure 404.
    ItemOwner(Call& ioCall, OwnerKind inKind);
    /// For writing: live, and the actor may write. Throws Failure 403, 404.
    static ItemOwner ForWriting(Call& ioCall, OwnerKind inKind);

    View const& GetView() const { return mView; }
    std::string Href() const;
    /// What decides on the owner's lists: the hash of the asset's state, or of the tree.
    std::string const& StateHash() const { return mHash; }

    std::vector<EnclosureState>& Enclosures() { return mIsAsset ? mAsset.enclosures : mView.tree.enclosures; }
    std::vector<RenditionState>& Renditions() { return mAsset.renditions; }

    /// Throw Failure 404.
    EnclosureState& GetEnclosure(std::string const& inId);
    RenditionState& GetRendition(std::string const& inId);

    void Commit(Call& ioCall, std::string const& inTitle);

private:
    ItemOwner(Call& ioCall, OwnerKind inKind, View inView);

    bool const mIsAsset;
    View mView;
    AssetState mAsset;
    std::string mHash;
    std::string mApi;
};

}  // namespace zohub
