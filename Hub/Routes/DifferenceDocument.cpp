// The document of the differences between two states.
#include "Routes/DifferenceDocument.h"

#include "Base/Text.h"
#include "Model/TreeMerge.h"
#include "Routes/DifferenceLinks.h"

namespace zohub {

namespace {

constexpr std::size_t kBytesPerEntry = 700;

std::string_view NameOf(ChangeType inType) {
    switch (inType) {
        case ChangeType::Added:
            return "ADDED";
        case ChangeType::Removed:
            return "REMOVED";
        case ChangeType::Updated:
            break;
    }
    return "UPDATED";
}

class Writer {
public:
    Writer(Transaction& inTransaction, std::string const& inApi, Differences const& inDifferences)
        : mDifferences(inDifferences),
          mRight(inApi, inDifferences.right),
          mLeft(inApi, inDifferences.left ? *inDifferences.left : inDifferences.right),
          mLeftCommit(inDifferences.left ? inDifferences.left->commit.id : std::string()),
          mDiff(CompareTrees(inTransaction, inDifferences.left ? inDifferences.left->tree : TreeRoot(),
                             inDifferences.right.tree)),
          mChanges(FindLastChanges(inTransaction, mDiff, inDifferences.right.commit, mLeftCommit)) {
        for (auto const& conflict : inDifferences.conflicts)
            mConflicts.emplace(EntryOf(conflict), &conflict);
    }

    std::string Write() {
        mText.reserve((mDiff.assets.size() + mDiff.enclosures.size() + 2) * kBytesPerEntry);
        mText = "{\"info\":{";
        AppendMember(mText, "leftSideCommitId", mLeftCommit);
        AppendMember(mText, "rightSideCommitId", mDifferences.right.commit.id);
        mText += "},\"differences\":{\"assets\":[";
        for (auto const& asset : mDiff.assets)
            WriteAsset(asset);
        mText += "],\"enclosures\":[";
        for (auto const& enclosure : mDiff.enclosures)
            WriteEnclosure(enclosure);
        mText += ']';
        if (mDiff.properties)
            WriteProperties();
        mText += "},\"links\":";
        LinkWriter(mText).Plain("self", mDifferences.self);
        mText += '}';
        return std::move(mText);
    }

private:
    // A rendition's conflict is told with the asset. The first of an asset's conflicts speaks for it.
    static ChangedItem EntryOf(ConflictRecord const& inConflict) {
        if (inConflict.kind == kConflictEnclosure)
            return {ChangedItem::Kind::Enclosure, inConflict.item, inConflict.name};
        if (inConflict.item.empty())
            return {ChangedItem::Kind::Properties, "", ""};
        return {ChangedItem::Kind::Asset, inConflict.item, ""};
    }

    void BeginEntry() { mText += mText.back() == '[' ? "{" : ",{"; }

    void WriteAsset(AssetChange const& inAsset) {
        BeginEntry();
        AppendMember(mText, "zo:assetId", inAsset.id);
        AppendMember(mText, "zo:name", inAsset.name);
        FinishEntry({ChangedItem::Kind::Asset, inAsset.id, ""}, inAsset.type,
                    SideOf(inAsset.type).AssetHref(inAsset.id), "", &inAsset.leftHash);
    }

    void WriteEnclosure(EnclosureChange const& inEnclosure) {
        BeginEntry();
        DocumentWriter const& side = SideOf(inEnclosure.type);
        bool const isOfAsset = !inEnclosure.asset.empty();
        if (isOfAsset)
            AppendMember(mText, "zo:assetId", inEnclosure.asset);
        AppendMember(mText, "zo:name", inEnclosure.state.name);
        std::string const owner = isOfAsset ? side.AssetHref(inEnclosure.asset) : side.Prefix();
        FinishEntry({ChangedItem::Kind::Enclosure, inEnclosure.asset, inEnclosure.state.name},
                    inEnclosure.type, owner + "/e/" + PercentEncode(inEnclosure.state.id), owner);
    }

    void WriteProperties() {
        mText += ",\"properties\":{";
        FinishEntry({ChangedItem::Kind::Properties, "", ""},
                    mDifferences.left ? ChangeType::Updated : ChangeType::Added, mRight.Prefix(), "");
    }

    DocumentWriter const& SideOf(ChangeType inType) const {
        return inType == ChangeType::Removed ? mLeft : mRight;
    }

    // inTheirs is the asset's state on their side, which also stands for a conflict of one of its renditions.
    void FinishEntry(ChangedItem const& inItem, ChangeType inType, std::string const& inSelf,
                     std::string const& inUp, std::string const* inTheirs = nullptr) {
        auto const found = mConflicts.find(inItem);
        ConflictRecord const* const conflict = found == mConflicts.end() ? nullptr : found->second;
        AppendMember(mText, "zo:differenceType", NameOf(inType));
        if (conflict)
            AppendMember(mText, "zo:conflictsWithContentId",
                         !inTheirs           ? conflict->theirsContent
                         : inTheirs->empty() ? kConflictRemoved
                                             : *inTheirs);
        std::string const& base = conflict ? conflict->baseCommit : mLeftCommit;
        if (!base.empty())
            AppendMember(mText, "zo:baseCommitId", base);
        if (auto const change = mChanges.find(inItem); change != mChanges.end()) {
            AppendMember(mText, "zo:committer", change->second.committer);
            AppendMember(mText, "zo:committed", FormatTime(change->second.time));
        }
        mText += ",\"links\":";
        {
            LinkWriter links(mText);
            links.Plain("self", inSelf);
            if (!inUp.empty())
                links.Plain("up", inUp);
            if (conflict && !mDifferences.accept.empty())
                WriteAcceptLinks(links, inItem);
        }
        mText += '}';
    }

    void WriteAcceptLinks(LinkWriter& ioLinks, ChangedItem const& inItem) const {
        std::string query = "?kind=";
        if (inItem.kind == ChangedItem::Kind::Properties)
            query += kConflictProperties;
        else if (inItem.kind == ChangedItem::Kind::Asset)
            query += kConflictAsset;
        else
            query += kConflictEnclosure;
        if (!inItem.asset.empty())
            query += "&asset=" + PercentEncode(inItem.asset);
        if (!inItem.enclosure.empty())
            query += "&name=" + PercentEncode(inItem.enclosure);
        ioLinks.Plain("accept-theirs", mDifferences.accept + kAcceptTheirsTail + query);
        ioLinks.Plain("accept-yours", mDifferences.accept + kAcceptYoursTail + query);
    }

    Differences const& mDifferences;
    DocumentWriter const mRight;
    DocumentWriter const mLeft;
    std::string const mLeftCommit;
    TreeDiff const mDiff;
    std::map<ChangedItem, Change> const mChanges;
    std::map<ChangedItem, ConflictRecord const*> mConflicts;
    std::string mText;
};

}  // namespace

std::string WhatDecides(Differences const& inDifferences) {
    auto const view = [](View const& inView) {
        return inView.line.id + (inView.isPinned ? "@" : "~") + inView.commit.id + "\n";
    };
    std::string text = "differences\n" + inDifferences.self + "\n" + inDifferences.accept + "\n";
    text += inDifferences.left ? view(*inDifferences.left) : "nothing\n";
    text += view(inDifferences.right);
    for (auto const& c : inDifferences.conflicts)
        text += c.kind + "\t" + c.item + "\t" + c.name + "\t" + c.theirsContent + "\t" + c.baseCommit + "\n";
    return text;
}

std::string WriteDifferences(Transaction& inTransaction, std::string const& inApi,
                             Differences const& inDifferences) {
    return Writer(inTransaction, inApi, inDifferences).Write();
}

}  // namespace zohub
