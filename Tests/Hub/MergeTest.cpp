// The laws of the merge over random trees, and what it costs.
#include <gtest/gtest.h>
#include <rapidcheck.h>

#include "Base/Digest.h"
#include "HubFixture.h"
#include "Model/Repository.h"
#include "Model/TreeMerge.h"

namespace zohub::test {

namespace {

// A tree in plain words. The second number of an item is the identifier that the hub keeps it under, which
// must not count.
using Item = std::pair<int, int>;
using Items = std::map<std::string, Item>;

struct PlainAsset {
    int properties = 0;
    Items enclosures;
    Items renditions;
};

struct PlainTree {
    int properties = 0;
    Items enclosures;
    std::map<std::string, PlainAsset> assets;
};

// One random change: what, which asset, which name, which value.
using Step = std::tuple<int, int, int, int>;
using Steps = std::vector<Step>;

PlainTree Applied(PlainTree inTree, Steps const& inSteps) {
    for (auto const& [what, which, name, value] : inSteps) {
        std::string const id = "asset" + std::to_string(which);
        Items* const items = what < 4   ? &inTree.enclosures
                             : what < 8 ? &inTree.assets[id].enclosures
                                        : &inTree.assets[id].renditions;
        if (what == 0)
            inTree.properties = value;
        else if (what == 12)
            inTree.assets.erase(id);
        else if (what == 13)
            inTree.assets[id].properties = value;
        else if (what % 4 == 1)
            items->erase("n" + std::to_string(name));
        else
            (*items)["n" + std::to_string(name)] = {value, value % 2 + name};
    }
    return inTree;
}

rc::Gen<Steps> AnySteps() {
    return rc::gen::container<Steps>(rc::gen::tuple(rc::gen::inRange(0, 14), rc::gen::inRange(0, 4),
                                                    rc::gen::inRange(0, 3), rc::gen::inRange(0, 3)));
}

std::string PropertiesText(int inValue) {
    // The same value in two orders of its keys.
    std::string const value = std::to_string(inValue);
    return inValue % 2 ? R"({"name":"a","v":)" + value + "}" : R"({"v":)" + value + R"(,"name":"a"})";
}

EnclosureState Enclosure(std::string const& inName, Item inItem) {
    return {"id" + std::to_string(inItem.second), inName, "text/plain",
            Sha256Hex(std::to_string(inItem.first)), 1};
}

}  // namespace

class MergeTest : public ::testing::Test {
protected:
    TreeRoot Stored(PlainTree const& inTree) {
        TreeRoot tree;
        tree.properties = PropertiesText(inTree.properties);
        for (auto const& [name, item] : inTree.enclosures)
            tree.enclosures.push_back(Enclosure(name, item));
        AssetMap::Changes assets;
        for (auto const& [id, plain] : inTree.assets) {
            AssetState asset;
            asset.id = id;
            asset.properties = PropertiesText(plain.properties);
            for (auto const& [name, item] : plain.enclosures)
                asset.enclosures.push_back(Enclosure(name, item));
            for (auto const& [name, item] : plain.renditions)
                asset.renditions.push_back({name, "image/png", Sha256Hex(std::to_string(item.first)), 1});
            assets[id] = Repository(*mTransaction).AddAsset("line", asset);
        }
        auto const written = AssetMap(*mTransaction, "").Apply(assets);
        tree.assets = written.root;
        tree.assetCount = written.count;
        return tree;
    }

    MergeResult Merge(TreeRoot const& inBase, TreeRoot const& inTheirs, TreeRoot const& inMine,
                      MergeStrategy inStrategy = MergeStrategy::Keep,
                      std::vector<ConflictRecord> const& inOpen = {}, std::string const& inCommit = "b") {
        return MergeTrees(*mTransaction, {inBase, inTheirs, inMine, inCommit, inOpen, inStrategy, "line"});
    }

    bool Same(TreeRoot const& inLeft, TreeRoot const& inRight) {
        auto const diff = CompareTrees(*mTransaction, inLeft, inRight);
        return !diff.properties && diff.assets.empty() && diff.enclosures.empty() &&
               inLeft.assetCount == inRight.assetCount;
    }

    static std::set<std::string> Keys(std::vector<ConflictRecord> const& inConflicts) {
        std::set<std::string> keys;
        for (auto const& conflict : inConflicts)
            keys.insert(conflict.item + " " + conflict.kind + " " + conflict.name);
        return keys;
    }

    // Runs the check over random B, T and M that come from B.
    void Check(std::function<void(TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine,
                                  PlainTree const& plainTheirs)> const& inCheck) {
        EXPECT_TRUE(rc::check([&] {
            PlainTree const base = Applied({}, *AnySteps());
            PlainTree const theirs = Applied(base, *AnySteps());
            PlainTree const mine = Applied(base, *AnySteps());
            inCheck(Stored(base), Stored(theirs), Stored(mine), theirs);
        }));
    }

    TemporaryDirectory mDirectory;
    std::unique_ptr<Storage> mStorage = OpenSqliteStorage(mDirectory.Path().string());
    std::unique_ptr<Transaction> mTransaction = mStorage->BeginWrite();
};

TEST_F(MergeTest, OneSidedChangesAreTakenAsTheyAre) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const&) {
        for (auto strategy : {MergeStrategy::Keep, MergeStrategy::Yours, MergeStrategy::Theirs}) {
            auto const fromTheirs = Merge(base, theirs, base, strategy);
            auto const fromMine = Merge(base, base, mine, strategy);
            RC_ASSERT(fromTheirs.tree.assets == theirs.assets);
            RC_ASSERT(fromMine.tree.assets == mine.assets);
            RC_ASSERT(Same(fromTheirs.tree, theirs));
            RC_ASSERT(Same(fromMine.tree, mine));
            RC_ASSERT(fromTheirs.conflicts.empty() && fromMine.conflicts.empty());
        }
    });
}

TEST_F(MergeTest, EqualSidesAreNoConflictWhateverIdentifiersTheHubGave) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const&, PlainTree const& plain) {
        PlainTree again = plain;
        for (auto& [name, item] : again.enclosures)
            item.second += 7;
        for (auto& [id, asset] : again.assets)
            for (auto& [name, item] : asset.enclosures)
                item.second += 7;
        auto const merged = Merge(base, theirs, Stored(again));
        RC_ASSERT(merged.conflicts.empty());
        RC_ASSERT(Same(merged.tree, theirs));
    });
}

TEST_F(MergeTest, SwappingTheSidesSwapsTheStrategies) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const&) {
        RC_ASSERT(Keys(Merge(base, theirs, mine).conflicts) == Keys(Merge(base, mine, theirs).conflicts));
        RC_ASSERT(Same(Merge(base, theirs, mine, MergeStrategy::Yours).tree,
                       Merge(base, mine, theirs, MergeStrategy::Theirs).tree));
        RC_ASSERT(Same(Merge(base, theirs, mine).tree, Merge(base, theirs, mine, MergeStrategy::Yours).tree));
    });
}

TEST_F(MergeTest, MergingTheSameCommitAgainChangesNothing) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const&) {
        auto const first = Merge(base, theirs, mine);
        auto const again = Merge(theirs, theirs, first.tree, MergeStrategy::Keep, first.conflicts, "c");
        RC_ASSERT(again.tree.assets == first.tree.assets);
        RC_ASSERT(Same(again.tree, first.tree));
        RC_ASSERT(Keys(again.conflicts) == Keys(first.conflicts));
        for (auto const& conflict : again.conflicts)
            RC_ASSERT(conflict.baseCommit == "b");
        RC_ASSERT(Same(Merge(base, theirs, first.tree).tree, first.tree));
    });
}

TEST_F(MergeTest, AcceptingTheirsEverywhereIsTheStrategyAcceptTheirs) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const&) {
        auto const kept = Merge(base, theirs, mine);
        TreeRoot const wanted = Merge(base, theirs, mine, MergeStrategy::Theirs).tree;
        RC_ASSERT(Same(TakeTheirs(*mTransaction, theirs, kept.tree, kept.conflicts, "line"), wanted));

        // One by one, in some order, comes to the same.
        auto open = kept.conflicts;
        TreeRoot tree = kept.tree;
        while (!open.empty()) {
            auto const at = *rc::gen::inRange<std::size_t>(0, open.size());
            tree = TakeTheirs(*mTransaction, theirs, tree, {open[at]}, "line");
            auto const left = OpenConflicts(*mTransaction, theirs, tree, open);
            RC_ASSERT(left.size() < open.size());
            open = left;
        }
        RC_ASSERT(Same(tree, wanted));
    });
}

TEST_F(MergeTest, OpenConflictsStayOverFurtherPullsUntilTheSidesAreEqual) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const& plain) {
        auto const first = Merge(base, theirs, mine);
        TreeRoot const later = Stored(Applied(plain, *AnySteps()));
        auto const second = Merge(theirs, later, first.tree, MergeStrategy::Keep, first.conflicts, "c");
        // All of the first that still differ are there, with the commit at which they began.
        auto const still = OpenConflicts(*mTransaction, later, second.tree, first.conflicts);
        auto const keys = Keys(second.conflicts);
        for (auto const& key : Keys(still))
            RC_ASSERT(keys.count(key));
        for (auto const& conflict : second.conflicts)
            if (Keys(first.conflicts).count(conflict.item + " " + conflict.kind + " " + conflict.name))
                RC_ASSERT(conflict.baseCommit == "b");
        RC_ASSERT(Keys(OpenConflicts(*mTransaction, later, second.tree, second.conflicts)) == keys);
        auto const taken = Merge(theirs, later, first.tree, MergeStrategy::Theirs, first.conflicts, "c");
        RC_ASSERT(Same(TakeTheirs(*mTransaction, later, second.tree, second.conflicts, "line"), taken.tree));
    });
}

// Every conflict can be seen: its item is among the differences between their tree and the merged one.
TEST_F(MergeTest, EveryConflictIsADifference) {
    Check([&](TreeRoot const& base, TreeRoot const& theirs, TreeRoot const& mine, PlainTree const&) {
        auto const merged = Merge(base, theirs, mine);
        auto const diff = CompareTrees(*mTransaction, theirs, merged.tree);
        std::set<std::string> seen;
        if (diff.properties)
            seen.insert(" properties ");
        for (auto const& asset : diff.assets)
            seen.insert(asset.id + " asset ");
        for (auto const& enclosure : diff.enclosures)
            seen.insert(enclosure.asset + " enclosure " + enclosure.state.name);
        for (auto const& conflict : merged.conflicts) {
            bool const isRendition = conflict.kind == kConflictRendition;
            RC_ASSERT(seen.count(conflict.item + (isRendition ? " asset " : " " + conflict.kind + " ") +
                                 (isRendition ? "" : conflict.name)));
        }
    });
}

// The rows of the table that are easy to get wrong, spelled out.
TEST_F(MergeTest, DecidesEachCaseOfTheTable) {
    PlainTree base;
    base.assets["a"] = {0, {{"xmp", {0, 0}}}, {{"r", {0, 0}}}};
    auto const with = [&](auto const& inChange) {
        PlainTree tree = base;
        inChange(tree);
        return tree;
    };
    auto const gone = with([](PlainTree& t) { t.assets.erase("a"); });
    auto const newXmp = with([](PlainTree& t) { t.assets["a"].enclosures["xmp"] = {1, 0}; });
    auto const otherXmp = with([](PlainTree& t) { t.assets["a"].enclosures["xmp"] = {2, 0}; });
    auto const noXmp = with([](PlainTree& t) { t.assets["a"].enclosures.clear(); });
    auto const newName = with([](PlainTree& t) { t.assets["a"].properties = 1; });
    auto const newPicture = with([](PlainTree& t) { t.assets["a"].renditions["r"] = {1, 0}; });
    auto const otherPicture = with([](PlainTree& t) { t.assets["a"].renditions["r"] = {2, 0}; });
    auto const notes = with([](PlainTree& t) { t.enclosures["notes"] = {1, 1}; });
    auto const otherNotes = with([](PlainTree& t) { t.enclosures["notes"] = {2, 2}; });

    struct Row {
        PlainTree theirs, mine;
        std::set<std::string> conflicts;
        PlainTree result;
    };
    auto both = newName;
    both.assets["a"].enclosures["xmp"] = {1, 0};
    std::vector<Row> const rows = {
        {gone, base, {}, gone},
        {base, gone, {}, gone},
        {gone, newXmp, {"a asset "}, newXmp},
        {gone, noXmp, {"a asset "}, noXmp},
        {newXmp, gone, {"a asset "}, gone},
        {newName, newXmp, {}, both},
        {newXmp, otherXmp, {"a enclosure xmp"}, otherXmp},
        {newXmp, noXmp, {"a enclosure xmp"}, noXmp},
        {newPicture, otherPicture, {"a rendition r"}, otherPicture},
        {notes, otherNotes, {" enclosure notes"}, otherNotes},
    };
    for (std::size_t i = 0; i < rows.size(); ++i) {
        SCOPED_TRACE(i);
        auto const merged = Merge(Stored(base), Stored(rows[i].theirs), Stored(rows[i].mine));
        EXPECT_EQ(Keys(merged.conflicts), rows[i].conflicts);
        EXPECT_TRUE(Same(merged.tree, Stored(rows[i].result)));
        for (auto const& conflict : merged.conflicts)
            EXPECT_EQ(conflict.theirsContent == "removed", rows[i].theirs.assets.empty());
    }
}

TEST_F(MergeTest, TouchesLittleOfALargeTree) {
    AssetMap::Changes many;
    for (int i = 0; i < 20000; ++i)
        many["asset" + std::to_string(i)] = Sha256Hex(std::to_string(i));
    AssetState changed;
    changed.properties = "{}";
    auto const with = [&](std::string const& inRoot, std::initializer_list<int> inAssets, int inMark) {
        AssetMap::Changes changes;
        for (int i : inAssets) {
            changed.id = "asset" + std::to_string(i);
            changed.renditions = {{"r", "image/png", Sha256Hex(std::to_string(inMark)), 1}};
            changes[changed.id] = Repository(*mTransaction).AddAsset("line", changed);
        }
        return TreeRoot{AssetMap(*mTransaction, inRoot).Apply(changes).root, 20000, "{}", {}};
    };
    // The other states do not exist at all: a merge that looked at one would fail.
    TreeRoot const base = with(AssetMap(*mTransaction, "").Apply(many).root, {1, 5000, 19999}, 0);
    TreeRoot const theirs = with(base.assets, {1, 5000}, 1);
    TreeRoot const mine = with(base.assets, {5000, 19999}, 2);
    auto const merged = Merge(base, theirs, mine);
    EXPECT_EQ(Keys(merged.conflicts), std::set<std::string>{"asset5000 rendition r"});
    auto const compared =
        AssetMap(*mTransaction, base.assets).CompareTo(AssetMap(*mTransaction, merged.tree.assets));
    EXPECT_EQ(compared.differences.size(), 3u);
    EXPECT_LE(compared.nodesRead, 2u + 3u * 2u * 3u);
}

}  // namespace zohub::test
