// Lines, commits and trees.
#include "Model/Repository.h"

#include <stdexcept>

#include "Base/Digest.h"
#include "Base/Error.h"

namespace zohub {

namespace {

[[noreturn]] void FailNotFound(std::string const& inWhat) {
    throw Failure(404, "not-found", inWhat + " does not exist, or you have no access to it.");
}

bool IsHead(std::string const& inCommit) {
    return inCommit.empty() || inCommit == "HEAD";
}

}  // namespace

bool Repository::MayRead(LineRecord const& inLine, Actor const& inActor) {
    return inActor.isAdmin || inLine.owner == inActor.name || inLine.kind == kLineTemplate ||
           mTransaction.HasGrant(inLine.production, inActor.name);
}

View Repository::Open(std::string const& inLineId, std::string const& inCommit, Actor const& inActor) {
    View view;
    auto line = mTransaction.FindLine(inLineId);
    if (!line || !MayRead(*line, inActor))
        FailNotFound("The production");
    view.line = std::move(*line);
    view.isPinned = !IsHead(inCommit);
    bool const isSharedTemplate = view.line.kind == kLineTemplate && view.line.owner != inActor.name;
    view.mayWrite = !isSharedTemplate || inActor.isAdmin;
    auto commit = mTransaction.FindCommit(view.isPinned ? inCommit : view.line.headCommit);
    if (!commit || commit->production != view.line.production)
        FailNotFound("The commit of the production");
    view.commit = std::move(*commit);
    view.tree = LoadTree(view.commit.tree);
    return view;
}

TreeRoot Repository::LoadTree(std::string const& inHash) {
    auto const text = mTransaction.FindObject(inHash);
    if (!text)
        throw std::runtime_error("the tree " + inHash + " is missing; run zohub check");
    return ReadTreeRoot(*text);
}

AssetState Repository::LoadAsset(std::string const& inHash) {
    auto const text = mTransaction.FindObject(inHash);
    if (!text)
        throw std::runtime_error("the asset state " + inHash + " is missing; run zohub check");
    return ReadAssetState(*text);
}

std::optional<AssetState> Repository::FindAsset(View const& inView, std::string const& inAssetId,
                                                std::string* outHash) {
    auto const hash = AssetMap(mTransaction, inView.tree.assets).Find(inAssetId);
    if (!hash)
        return std::nullopt;
    if (outHash)
        *outHash = *hash;
    return LoadAsset(*hash);
}

AssetState Repository::GetAsset(View const& inView, std::string const& inAssetId, std::string* outHash) {
    auto asset = FindAsset(inView, inAssetId, outHash);
    if (!asset)
        FailNotFound("The asset in this production");
    return std::move(*asset);
}

std::string Repository::AddContent(std::string_view inBytes) {
    std::string hash = Sha256Hex(inBytes);
    if (!mTransaction.HasContent(hash))
        mTransaction.AddContent(hash, inBytes);
    return hash;
}

void Repository::AddEnclosureReference(std::string const& inProduction, EnclosureState const& inEnclosure) {
    mTransaction.AddReference({inProduction, kReferenceEnclosure, inEnclosure.content, inEnclosure.id,
                               inEnclosure.name, inEnclosure.type});
}

std::string Repository::AddAsset(std::string const& inProduction, AssetState const& inState) {
    std::string const text = WriteAssetState(inState);
    std::string hash = Sha256Hex(text);
    mTransaction.AddObject(hash, text);
    mTransaction.AddReference({inProduction, kReferenceAsset, hash, inState.id, "", ""});
    for (auto const& enclosure : inState.enclosures)
        AddEnclosureReference(inProduction, enclosure);
    for (auto const& rendition : inState.renditions)
        mTransaction.AddReference(
            {inProduction, kReferenceRendition, rendition.content, rendition.id, "", rendition.type});
    if (!inState.locator.empty())
        mTransaction.AddReference({inProduction, kReferenceLocator, inState.locator, inState.id, "", ""});
    return hash;
}

CommitRecord Repository::WriteCommit(std::string const& inProduction, std::string const& inParent,
                                     TreeRoot const& inTree, std::string const& inTitle,
                                     Actor const& inCommitter, Micros inNow) {
    CommitRecord commit;
    std::string const treeText = WriteTreeRoot(inTree);
    commit.tree = Sha256Hex(treeText);
    mTransaction.AddObject(commit.tree, treeText);
    commit.production = inProduction;
    commit.parent = inParent;
    commit.title = inTitle;
    commit.committer = inCommitter.name;
    commit.time = inNow;
    commit.id = CommitIdentifier(commit);
    // The same change made twice within one tick of the clock must still be two commits.
    while (mTransaction.FindCommit(commit.id)) {
        ++commit.time;
        commit.id = CommitIdentifier(commit);
    }
    mTransaction.AddCommit(commit);
    return commit;
}

LineRecord Repository::CreateLine(std::string const& inKind, TreeRoot const& inTree,
                                  std::string const& inTitle, Actor const& inOwner, bool inIsTemporary,
                                  Micros inNow) {
    LineRecord line;
    line.id = NewKey(kShortKey);
    line.kind = inKind;
    line.production = line.id;
    line.owner = inOwner.name;
    line.isTemporary = inIsTemporary;
    line.created = inNow;
    line.modified = inNow;
    line.headCommit = WriteCommit(line.id, "", inTree, inTitle, inOwner, inNow).id;
    mTransaction.PutLine(line);
    return line;
}

void Repository::CommitEdit(View& ioView, Edit const& inEdit, std::string const& inTitle,
                            Actor const& inCommitter, Micros inNow) {
    if (!inEdit.assets.empty()) {
        auto const written = AssetMap(mTransaction, ioView.tree.assets).Apply(inEdit.assets);
        ioView.tree.assets = written.root;
        ioView.tree.assetCount = written.count;
    }
    if (inEdit.properties)
        ioView.tree.properties = *inEdit.properties;
    if (inEdit.enclosures)
        ioView.tree.enclosures = *inEdit.enclosures;
    ioView.commit =
        WriteCommit(ioView.line.production, ioView.line.headCommit, ioView.tree, inTitle, inCommitter, inNow);
    ioView.line.headCommit = ioView.commit.id;
    ioView.line.modified = inNow;
    mTransaction.PutLine(ioView.line);
}

}  // namespace zohub
