// What has enclosures and renditions.
#include "Routes/ItemOwner.h"

#include "Base/Error.h"

namespace zohub {

std::string OwnerKind::Pattern() const {
    std::string pattern = std::string(kApiPath) + "/p/{}";
    if (isPinned)
        pattern += "/at/{}";
    if (isAsset)
        pattern += "/a/{}";
    return pattern;
}

ItemOwner::ItemOwner(Call& ioCall, OwnerKind inKind)
    : ItemOwner(ioCall, inKind, OpenView(ioCall, inKind.isPinned)) {}

ItemOwner::ItemOwner(Call& ioCall, OwnerKind inKind, View inView)
    : mIsAsset(inKind.isAsset), mView(std::move(inView)), mApi(ioCall.api) {
    if (mIsAsset)
        mAsset = ioCall.repository.GetAsset(mView, ioCall.parameters[inKind.NextParameter() - 1], &mHash);
    else
        mHash = mView.commit.tree;
}

ItemOwner ItemOwner::ForWriting(Call& ioCall, OwnerKind inKind) {
    return ItemOwner(ioCall, inKind, OpenForWriting(ioCall));
}

std::string ItemOwner::Href() const {
    DocumentWriter const writer(mApi, mView);
    return mIsAsset ? writer.AssetHref(mAsset.id) : writer.Prefix();
}

EnclosureState& ItemOwner::GetEnclosure(std::string const& inId) {
    EnclosureState* const enclosure = FindItem(Enclosures(), inId);
    if (!enclosure)
        throw Failure(404, "not-found", "There is no such enclosure here.");
    return *enclosure;
}

RenditionState& ItemOwner::GetRendition(std::string const& inId) {
    RenditionState* const rendition = FindItem(Renditions(), inId);
    if (!rendition)
        throw Failure(404, "not-found", "There is no such rendition here.");
    return *rendition;
}

void ItemOwner::Commit(Call& ioCall, std::string const& inTitle) {
    Repository::Edit edit;
    if (mIsAsset) {
        mHash = ioCall.repository.AddAsset(ScopeOf(mView.line), mAsset);
        edit.assets[mAsset.id] = mHash;
    } else {
        for (auto const& enclosure : mView.tree.enclosures)
            ioCall.repository.AddEnclosureReference(ScopeOf(mView.line), enclosure);
        edit.enclosures = mView.tree.enclosures;
    }
    ioCall.repository.CommitEdit(mView, edit, inTitle, ioCall.actor, ioCall.now);
    if (!mIsAsset)
        mHash = mView.commit.tree;
}

}  // namespace zohub
