// What has enclosures and renditions: an asset, or the production itself. Finds it for a request, and writes
// the changed list back as one commit. The enclosures of a session are those of its tree and its notes; only
// the notes can be written there, and no commit is made of them.
#pragma once

#include <unordered_set>

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
    /// For writing: live, and the actor may write. Throws Failure 403, 404, 409.
    static ItemOwner ForWriting(Call& ioCall, OwnerKind inKind);

    View const& GetView() const { return mView; }
    std::string Href() const;
    /// Whether what is added here becomes a note of a session.
    bool TakesNotes() const { return !mIsAsset && mView.IsSession(); }
    std::vector<EnclosureState>& Enclosures() { return mIsAsset ? mAsset.enclosures : mView.tree.enclosures; }
    std::vector<RenditionState>& Renditions() { return mAsset.renditions; }

    /// Throw Failure 404.
    EnclosureState& GetEnclosure(std::string const& inId);
    RenditionState& GetRendition(std::string const& inId);
    /// The enclosure to change. Throws Failure 403 as well, for one of a session's tree.
    EnclosureState& GetEnclosureToChange(std::string const& inId);

    void Commit(Call& ioCall, std::string const& inTitle);

private:
    ItemOwner(Call& ioCall, OwnerKind inKind, View inView);
    void LoadNotes(Transaction& inTransaction);
    void WriteNotes(Call& ioCall);

    bool const mIsAsset;
    View mView;
    AssetState mAsset;
    std::vector<NoteRecord> mNotes;                   // as they were loaded
    std::unordered_set<std::string> mContentsBefore;  // of the production, which lists them already
    std::string mApi;
};

}  // namespace zohub
