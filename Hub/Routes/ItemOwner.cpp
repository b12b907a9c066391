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
        mAsset = ioCall.repository.GetAsset(mView, ioCall.parameters[inKind.NextParameter() - 1]);
    else if (mView.IsSession() && !mView.isPinned)
        LoadNotes(ioCall.transaction);
}

ItemOwner ItemOwner::ForWriting(Call& ioCall, OwnerKind inKind) {
    View view = OpenView(ioCall, false);
    bool const isNote = !inKind.isAsset && view.IsSession();
    if (isNote)
        RequireManager(view);
    else
        RequireWritable(view);
    ItemOwner owner(ioCall, inKind, std::move(view));
    if (!inKind.isAsset)
        for (auto const& enclosure : owner.mView.tree.enclosures)
            owner.mContentsBefore.insert(enclosure.content);
    return owner;
}

void ItemOwner::LoadNotes(Transaction& inTransaction) {
    mNotes = inTransaction.ListNotes(mView.line.id);
    for (auto const& note : mNotes)
        Enclosures().push_back({note.id, note.name, note.type, note.content, note.size, true});
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

EnclosureState& ItemOwner::GetEnclosureToChange(std::string const& inId) {
    EnclosureState& enclosure = GetEnclosure(inId);
    if (TakesNotes() && !enclosure.isNote)
        RequireWritable(mView);
    return enclosure;
}

RenditionState& ItemOwner::GetRendition(std::string const& inId) {
    RenditionState* const rendition = FindItem(Renditions(), inId);
    if (!rendition)
        throw Failure(404, "not-found", "There is no such rendition here.");
    return *rendition;
}

void ItemOwner::Commit(Call& ioCall, std::string const& inTitle) {
    if (TakesNotes())
        return WriteNotes(ioCall);
    std::string const& scope = ScopeOf(mView.line);
    Repository::Edit edit;
    if (mIsAsset) {
        edit.assets[mAsset.id] = ioCall.repository.AddAsset(scope, mAsset);
    } else {
        for (auto const& enclosure : mView.tree.enclosures)
            if (!mContentsBefore.count(enclosure.content))
                ioCall.repository.AddEnclosureReference(scope, enclosure);
        edit.enclosures = mView.tree.enclosures;
    }
    ioCall.repository.CommitEdit(mView, edit, inTitle, ioCall.actor, ioCall.now);
}

void ItemOwner::WriteNotes(Call& ioCall) {
    std::string const& session = mView.line.id;
    for (auto const& before : mNotes)
        if (!FindItem(Enclosures(), before.id))
            ioCall.transaction.RemoveNote(session, before.id);
    for (auto const& note : Enclosures()) {
        if (!note.isNote)
            continue;
        ioCall.repository.AddEnclosureReference(session, note);
        ioCall.transaction.PutNote({session, note.id, note.name, note.type, note.content, note.size});
    }
}

}  // namespace zohub
