// What differs between two trees, and who changed it.
#include "Model/TreeDiff.h"

#include <functional>
#include <optional>
#include <set>

#include "Model/Repository.h"

namespace zohub {

namespace {

constexpr int kMaxWalk = 5000;

std::string NameIn(AssetState const& inAsset) {
    return StringUnder(Json::parse(inAsset.properties), "name");
}

// Calls inFound with each enclosure that differs. A missing asset has none.
void CompareEnclosures(std::vector<EnclosureState> const& inLeft, std::vector<EnclosureState> const& inRight,
                       std::function<void(ChangeType, EnclosureState const&)> const& inFound) {
    for (auto const& right : inRight) {
        EnclosureState const* const left = FindByKey(inLeft, right.name);
        if (!left)
            inFound(ChangeType::Added, right);
        else if (!SameItem(*left, right))
            inFound(ChangeType::Updated, right);
    }
    for (auto const& left : inLeft)
        if (!FindByKey(inRight, left.name))
            inFound(ChangeType::Removed, left);
}

// Both states of an asset that differs between two trees.
class Sides {
public:
    Sides(Repository& inRepository, AssetMap::Difference const& inDifference) {
        if (!inDifference.left.empty())
            mLeft = inRepository.LoadAsset(inDifference.left);
        if (!inDifference.right.empty())
            mRight = inRepository.LoadAsset(inDifference.right);
    }

    ChangeType Type() const {
        return !mLeft ? ChangeType::Added : !mRight ? ChangeType::Removed : ChangeType::Updated;
    }
    bool CoreDiffers() const { return !mLeft || !mRight || !SameCore(*mLeft, *mRight); }
    AssetState const& Shown() const { return mRight ? *mRight : *mLeft; }

    void VisitEnclosures(std::function<void(ChangeType, EnclosureState const&)> const& inFound) const {
        static std::vector<EnclosureState> const kNone;
        CompareEnclosures(mLeft ? mLeft->enclosures : kNone, mRight ? mRight->enclosures : kNone, inFound);
    }

private:
    std::optional<AssetState> mLeft;
    std::optional<AssetState> mRight;
};

// Looks for the last change of each wanted item, commit by commit.
class LastChanges {
public:
    LastChanges(Transaction& inTransaction, TreeDiff const& inDiff)
        : mTransaction(inTransaction), mRepository(inTransaction) {
        if (inDiff.properties)
            Want({ChangedItem::Kind::Properties, "", ""});
        for (auto const& asset : inDiff.assets)
            Want({ChangedItem::Kind::Asset, asset.id, ""});
        for (auto const& enclosure : inDiff.enclosures)
            Want({ChangedItem::Kind::Enclosure, enclosure.asset, enclosure.state.name});
    }

    std::map<ChangedItem, Change> Walk(CommitRecord inFrom, std::string const& inEnd) {
        TreeRoot after = mRepository.LoadTree(inFrom.tree);
        for (int steps = 0; steps < kMaxWalk && mWanted != 0 && inFrom.id != inEnd; ++steps) {
            auto parent = inFrom.parent.empty() ? std::nullopt : mTransaction.FindCommit(inFrom.parent);
            if (!parent || parent->tree != inFrom.tree) {
                TreeRoot before = parent ? mRepository.LoadTree(parent->tree) : TreeRoot();
                Attribute(inFrom, before, after);
                after = std::move(before);
            }
            if (!parent)
                break;
            inFrom = std::move(*parent);
        }
        return std::move(mFound);
    }

private:
    void Want(ChangedItem const& inItem) {
        mWantedByAsset[inItem.asset].insert(inItem);
        ++mWanted;
    }

    void Attribute(CommitRecord const& inCommit, TreeRoot const& inBefore, TreeRoot const& inAfter) {
        mCommit = &inCommit;
        if (!SameProperties(inBefore.properties, inAfter.properties))
            Found({ChangedItem::Kind::Properties, "", ""});
        CompareEnclosures(inBefore.enclosures, inAfter.enclosures, [&](ChangeType, EnclosureState const& e) {
            Found({ChangedItem::Kind::Enclosure, "", e.name});
        });
        auto const compared =
            AssetMap(mTransaction, inBefore.assets).CompareTo(AssetMap(mTransaction, inAfter.assets));
        for (auto const& difference : compared.differences)
            if (mWantedByAsset.count(difference.id))
                AttributeAsset(difference);
    }

    void AttributeAsset(AssetMap::Difference const& inDifference) {
        Sides const sides(mRepository, inDifference);
        if (sides.CoreDiffers())
            Found({ChangedItem::Kind::Asset, inDifference.id, ""});
        sides.VisitEnclosures([&](ChangeType, EnclosureState const& e) {
            Found({ChangedItem::Kind::Enclosure, inDifference.id, e.name});
        });
    }

    void Found(ChangedItem const& inItem) {
        auto const wanted = mWantedByAsset.find(inItem.asset);
        if (wanted == mWantedByAsset.end() || wanted->second.erase(inItem) == 0)
            return;
        mFound[inItem] = {mCommit->committer, mCommit->time};
        --mWanted;
        if (wanted->second.empty())
            mWantedByAsset.erase(wanted);
    }

    Transaction& mTransaction;
    Repository mRepository;
    CommitRecord const* mCommit = nullptr;
    std::map<std::string, std::set<ChangedItem>> mWantedByAsset;
    std::size_t mWanted = 0;
    std::map<ChangedItem, Change> mFound;
};

}  // namespace

bool SameProperties(std::string const& inLeft, std::string const& inRight) {
    if (inLeft == inRight)
        return true;
    if (inLeft.empty() || inRight.empty())
        return false;
    // A value type that does not keep the order of keys.
    return nlohmann::json::parse(inLeft) == nlohmann::json::parse(inRight);
}

bool SameItem(EnclosureState const& inLeft, EnclosureState const& inRight) {
    return inLeft.content == inRight.content && inLeft.type == inRight.type;
}

bool SameItem(RenditionState const& inLeft, RenditionState const& inRight) {
    return inLeft.content == inRight.content && inLeft.type == inRight.type;
}

bool SameCore(AssetState const& inLeft, AssetState const& inRight) {
    return SameProperties(inLeft.properties, inRight.properties) &&
           SameItems(inLeft.renditions, inRight.renditions);
}

bool SameAsset(AssetState const& inLeft, AssetState const& inRight) {
    return SameCore(inLeft, inRight) && SameItems(inLeft.enclosures, inRight.enclosures);
}

TreeDiff CompareTrees(Transaction& inTransaction, TreeRoot const& inLeft, TreeRoot const& inRight) {
    Repository repository(inTransaction);
    TreeDiff diff;
    diff.properties = !SameProperties(inLeft.properties, inRight.properties);
    CompareEnclosures(inLeft.enclosures, inRight.enclosures, [&](ChangeType inType, EnclosureState const& e) {
        diff.enclosures.push_back({inType, "", e});
    });
    auto const compared =
        AssetMap(inTransaction, inLeft.assets).CompareTo(AssetMap(inTransaction, inRight.assets));
    for (auto const& difference : compared.differences) {
        Sides const sides(repository, difference);
        if (sides.CoreDiffers())
            diff.assets.push_back({sides.Type(), difference.id, NameIn(sides.Shown()), difference.left});
        sides.VisitEnclosures([&](ChangeType inType, EnclosureState const& e) {
            diff.enclosures.push_back({inType, difference.id, e});
        });
    }
    return diff;
}

std::map<ChangedItem, Change> FindLastChanges(Transaction& inTransaction, TreeDiff const& inDiff,
                                              CommitRecord const& inRight, std::string const& inLeftCommit) {
    return LastChanges(inTransaction, inDiff).Walk(inRight, inLeftCommit);
}

}  // namespace zohub
