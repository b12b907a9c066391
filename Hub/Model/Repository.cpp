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

std::string const& ScopeOf(LineRecord const& inLine) {
    if (inLine.kind == kLineSession)
        return inLine.id;
    return inLine.kind == kLineTransaction ? inLine.parent : inLine.production;
}

bool Repository::MayRead(LineRecord const& inLine, Actor const& inActor) {
    if (inActor.isAdmin)
        return true;
    bool const isShared = inLine.id == inLine.production;
    if (!isShared) {
        if (inLine.owner != inActor.name)
            return false;
        // His own, but only as long as the production is open to him.
        auto const production = mTransaction.FindLine(inLine.production);
        return production && MayRead(*production, inActor);
    }
    return inLine.owner == inActor.name || inLine.kind == kLineTemplate ||
           mTransaction.HasGrant(inLine.production, inActor.name);
}

bool Repository::HasCommit(LineRecord const& inLine, CommitRecord const& inCommit) {
    if (inCommit.production != inLine.production)
        return false;
    bool const isShared = inCommit.line == inCommit.production;
    return isShared || inCommit.line == inLine.id ||
           (inLine.kind == kLineTransaction && inCommit.line == inLine.parent);
}

View Repository::LiveView(LineRecord inLine, Actor const& inActor) {
    auto commit = mTransaction.FindCommit(inLine.headCommit);
    if (!commit)
        throw std::runtime_error("the commit " + inLine.headCommit + " is missing; run zohub check");
    return ViewAt(std::move(inLine), std::move(*commit), inActor);
}

View Repository::ViewAt(LineRecord inLine, CommitRecord inCommit, Actor const& inActor) {
    View view;
    view.line = std::move(inLine);
    view.commit = std::move(inCommit);
    view.tree = LoadTree(view.commit.tree);
    bool const isOwner = view.line.owner == inActor.name;
    if (view.IsSession())
        view.mayManage = isOwner;
    else if (view.IsTransaction())
        view.mayWrite = isOwner && !view.line.isEnded;
    else
        view.mayWrite = view.line.kind != kLineTemplate || isOwner || inActor.isAdmin;
    return view;
}

View Repository::Open(std::string const& inLineId, std::string const& inCommit, Actor const& inActor) {
    auto line = mTransaction.FindLine(inLineId);
    if (!line || !MayRead(*line, inActor))
        FailNotFound("The production");
    if (IsHead(inCommit))
        return LiveView(std::move(*line), inActor);
    auto commit = mTransaction.FindCommit(inCommit);
    if (!commit || !HasCommit(*line, *commit))
        FailNotFound("The commit of the production");
    View view = ViewAt(std::move(*line), std::move(*commit), inActor);
    view.isPinned = true;
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

void Repository::AddContent(std::string const& inHash, std::string_view inBytes) {
    if (!mTransaction.HasContent(inHash))
        mTransaction.AddContent(inHash, inBytes);
}

void Repository::AddEnclosureReference(std::string const& inScope, EnclosureState const& inEnclosure) {
    mTransaction.AddReference({inScope, kReferenceEnclosure, inEnclosure.content, inEnclosure.id,
                               inEnclosure.name, inEnclosure.type});
}

void Repository::AddAssetReferences(std::string const& inScope, AssetState const& inState,
                                    std::string const& inHash) {
    mTransaction.AddReference({inScope, kReferenceAsset, inHash, inState.id, "", ""});
    for (auto const& enclosure : inState.enclosures)
        AddEnclosureReference(inScope, enclosure);
    for (auto const& rendition : inState.renditions)
        mTransaction.AddReference(
            {inScope, kReferenceRendition, rendition.content, rendition.id, "", rendition.type});
    if (!inState.locator.empty())
        mTransaction.AddReference({inScope, kReferenceLocator, inState.locator, inState.id, "", ""});
}

std::string Repository::AddAsset(std::string const& inScope, AssetState const& inState) {
    std::string const text = WriteAssetState(inState);
    std::string hash = Sha256Hex(text);
    mTransaction.AddObject(hash, text);
    AddAssetReferences(inScope, inState, hash);
    return hash;
}

std::optional<ReferenceRecord> Repository::FindReference(LineRecord const& inLine, std::string const& inKind,
                                                         std::string const& inKey) {
    std::string const& scope = ScopeOf(inLine);
    auto reference = mTransaction.FindReference(scope, inKind, inKey);
    if (!reference && scope != inLine.production)
        reference = mTransaction.FindReference(inLine.production, inKind, inKey);
    return reference;
}

// On top of the line's head.
CommitRecord Repository::WriteCommit(LineRecord const& inLine, TreeRoot const& inTree,
                                     std::string const& inTitle, Actor const& inCommitter, Micros inNow) {
    CommitRecord commit;
    std::string const treeText = WriteTreeRoot(inTree);
    commit.tree = Sha256Hex(treeText);
    mTransaction.AddObject(commit.tree, treeText);
    commit.production = inLine.production;
    commit.parent = inLine.headCommit;
    commit.title = inTitle;
    commit.committer = inCommitter.name;
    commit.time = inNow;
    commit.line = inLine.id;
    auto const parent = mTransaction.FindCommit(commit.parent);
    commit.number = parent ? parent->number + 1 : 1;
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
    line.headCommit = WriteCommit(line, inTree, inTitle, inOwner, inNow).id;
    mTransaction.PutLine(line);
    return line;
}

void Repository::CommitEdit(View& ioView, Edit const& inEdit, std::string const& inTitle,
                            Actor const& inCommitter, Micros inNow) {
    TreeRoot tree = ioView.tree;
    if (!inEdit.assets.empty()) {
        auto const written = AssetMap(mTransaction, tree.assets).Apply(inEdit.assets);
        tree.assets = written.root;
        tree.assetCount = written.count;
    }
    if (inEdit.properties)
        tree.properties = *inEdit.properties;
    if (inEdit.enclosures)
        tree.enclosures = *inEdit.enclosures;
    CommitTree(ioView, tree, inTitle, inCommitter, inNow);
}

void Repository::CommitTree(View& ioView, TreeRoot const& inTree, std::string const& inTitle,
                            Actor const& inCommitter, Micros inNow) {
    ioView.tree = inTree;
    ioView.commit = WriteCommit(ioView.line, inTree, inTitle, inCommitter, inNow);
    ioView.line.headCommit = ioView.commit.id;
    ioView.line.modified = inNow;
    mTransaction.PutLine(ioView.line);
}

}  // namespace zohub
