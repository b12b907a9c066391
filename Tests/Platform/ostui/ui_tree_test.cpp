// The order, the selection and the columns of a tree.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostui/Tree.h"

namespace ostui {
namespace {

using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;
using Texts = std::vector<std::string>;

TreeRow Row(const std::string& inID, const std::string& inName, int inParent = TreeRow::kTopLevel) {
    TreeRow row;
    row.id = inID;
    row.cells = {inName};
    row.parent = inParent;
    return row;
}

class TreeTest : public testing::Test {
protected:
    TreeTest() {
        tree.SetColumns({{"name", "Name", 0}, {"date", "Date", 0}});
        tree.SetOnSelectionChanged([this] { ++selectionChanges; });
        tree.SetOnChanged([this] { ++changes; });
    }

    void SetNames(const Texts& inNames) {
        std::vector<TreeRow> rows;
        for (const std::string& name : inNames) {
            rows.push_back(Row(std::to_string(rows.size()), name));
        }
        tree.SetRows(rows);
    }

    Texts IDs() const {
        Texts ids;
        for (const int row : tree.GetRowsInOrder()) {
            ids.push_back(tree.GetRows()[static_cast<std::size_t>(row)].id);
        }
        return ids;
    }

    Texts Names() const {
        Texts names;
        for (const int row : tree.GetRowsInOrder()) {
            const TreeRow& shown = tree.GetRows()[static_cast<std::size_t>(row)];
            names.push_back(shown.cells.empty() ? std::string() : shown.cells.front());
        }
        return names;
    }

    Tree tree;
    int selectionChanges = 0;
    int changes = 0;
};

TEST_F(TreeTest, TextsAreOrderedWithoutCaseAndDigitsAsNumbers) {
    const std::vector<Texts> ordered = {
        {"clip 2", "Clip 9", "clip 10", "CLIP 100"},
        {"v1.9", "v1.10", "v2"},
        {"a99999999999999999999", "a100000000000000000000"},
        {"", "1", "a"},
        {"a", "a 1", "ab"},
        {"\u00C4pfel", "\u00E4pfelbaum", "\u00C4pfelwein"},
        {"stra\u00DFe 1", "STRASSE 2"},
        {"\u041A\u0438\u043D\u043E 2", "\u043A\u0438\u043D\u043E 12"},
        {"\u6D77\u8FBA 2", "\u6D77\u8FBA 10"},
        {"file\xFF", "file\xFF 2"},
    };
    tree.SetSort("name", true);
    for (const Texts& texts : ordered) {
        SetNames({texts.rbegin(), texts.rend()});
        EXPECT_THAT(Names(), ElementsAreArray(texts));
        tree.ClickColumn("name");
        EXPECT_THAT(Names(), ElementsAreArray(Texts(texts.rbegin(), texts.rend())));
        tree.ClickColumn("name");
    }
}

TEST_F(TreeTest, EqualRowsKeepTheOrderOfTheListInBothDirections) {
    // Equal: without case, by leading zeros, composed and decomposed.
    SetNames({"b", "A", "a", "file 7", "file 007", "\u00E9", "e\u0301", "B"});
    tree.ClickColumn("name");
    EXPECT_TRUE(tree.IsSortAscending());
    EXPECT_THAT(IDs(), ElementsAre("1", "2", "0", "7", "3", "4", "5", "6"));
    tree.ClickColumn("name");
    EXPECT_FALSE(tree.IsSortAscending());
    EXPECT_THAT(IDs(), ElementsAre("5", "6", "3", "4", "0", "7", "1", "2"));
    tree.ClickColumn("date");
    EXPECT_TRUE(tree.IsSortAscending());
    EXPECT_THAT(IDs(), ElementsAre("0", "1", "2", "3", "4", "5", "6", "7")) << "no row has a date";
    const std::uint64_t revision = tree.GetRevision();
    tree.ClickColumn("unknown");
    EXPECT_EQ(tree.GetSortColumn(), "date");
    EXPECT_EQ(tree.GetRevision(), revision);
    tree.SetSort("", true);
    EXPECT_NE(tree.GetRevision(), revision);
}

TEST_F(TreeTest, RowsAreSortedBelowTheirParents) {
    tree.SetRows({Row("z", "z"), Row("z2", "2", 0), Row("z1", "1", 0), Row("a", "a"), Row("z1b", "b", 2),
                  Row("z1a", "a", 2), Row("astray", "m", 77), Row("itself", "n", 7)});
    EXPECT_THAT(IDs(), ElementsAre("z", "z2", "z1", "z1b", "z1a", "a", "astray", "itself"));
    tree.SetSort("name", true);
    EXPECT_THAT(IDs(), ElementsAre("a", "astray", "itself", "z", "z1", "z1a", "z1b", "z2"));
    EXPECT_THAT(tree.GetChildren(0), ElementsAre(2, 1));
    EXPECT_EQ(tree.GetPlace(1), 1);
    EXPECT_THAT(tree.GetChildren(99), IsEmpty());
    EXPECT_EQ(tree.GetPlace(99), -1);

    // As deep as a server likes.
    std::vector<TreeRow> chain;
    for (int i = 0; i < 200000; ++i) {
        chain.push_back(Row(std::to_string(i), "x", i - 1));
    }
    tree.SetRows(chain);
    EXPECT_EQ(tree.GetRowsInOrder().back(), 199999);
}

TEST_F(TreeTest, RemovedRowsTakeWhatIsBelowThemAlong) {
    tree.SetSelectionMode(Tree::SelectionMode::kMultiple);
    tree.SetRows({Row("a", "a"), Row("a1", "a1", 0), Row("b", "b"), Row("a11", "a11", 1), Row("b1", "b1", 2),
                  Row("c", "c"), Row("c1", "c1", 5)});
    ASSERT_TRUE(tree.Select({4, 6}));
    selectionChanges = 0;
    tree.RemoveRows({"a1", "nobody"});
    EXPECT_THAT(IDs(), ElementsAre("a", "b", "b1", "c", "c1"));
    EXPECT_THAT(tree.GetSelectedIDs(), ElementsAre("b1", "c1"));
    EXPECT_EQ(selectionChanges, 0) << "the same rows are selected";
    tree.RemoveRows({"b"});
    EXPECT_THAT(IDs(), ElementsAre("a", "c", "c1"));
    EXPECT_THAT(tree.GetSelection(), ElementsAre(2));
    EXPECT_EQ(tree.GetRows()[2].parent, 1);
    EXPECT_EQ(selectionChanges, 1);
    changes = 0;
    tree.RemoveRows({"b"});
    EXPECT_EQ(changes, 0);
}

TEST_F(TreeTest, TheSelectionFollowsItsRowsAndItsMode) {
    SetNames({"a", "b", "c"});
    EXPECT_FALSE(tree.Select({0, 1})) << "one row at first";
    EXPECT_FALSE(tree.Select({3}));
    EXPECT_FALSE(tree.Select({-1}));
    EXPECT_EQ(selectionChanges, 0);
    tree.SetSelectionMode(Tree::SelectionMode::kMultiple);
    EXPECT_TRUE(tree.Select({2, 0, 2}));
    EXPECT_TRUE(tree.Select({0, 2}));
    EXPECT_THAT(tree.GetSelection(), ElementsAre(0, 2));
    EXPECT_EQ(selectionChanges, 1) << "selected again is no change";
    tree.SetRows({Row("new", "new"), Row("2", "c")});
    EXPECT_THAT(tree.GetSelection(), ElementsAre(1));
    EXPECT_EQ(selectionChanges, 2);
    tree.SetSelectionMode(Tree::SelectionMode::kNone);
    EXPECT_THAT(tree.GetSelection(), IsEmpty());
    EXPECT_EQ(selectionChanges, 3);
    EXPECT_FALSE(tree.Select({0}));
    EXPECT_TRUE(tree.Select({}));
}

TEST_F(TreeTest, AHandlerMayReplaceWhatItIsToldOf) {
    SetNames({"a", "b"});
    Texts seen;
    tree.SetOnSelectionChanged([&] {
        const Texts selected = tree.GetSelectedIDs();
        seen.insert(seen.end(), selected.begin(), selected.end());
        seen.push_back("|");
        if (!selected.empty() && selected.front() == "1") {
            tree.SetOnSelectionChanged([&] { seen.push_back("second"); });
            tree.SetRows({Row("only", "only")});
        }
    });
    EXPECT_TRUE(tree.Select({1}));
    EXPECT_THAT(seen, ElementsAre("1", "|", "second"));
    EXPECT_THAT(tree.GetSelection(), IsEmpty());
    EXPECT_TRUE(tree.Select(tree.GetSelection()));

    int activated = -1;
    tree.SetOnActivated([&](int inRow) {
        tree.SetOnActivated({});
        tree.SetRows({});
        activated = inRow;
    });
    tree.Activate(1);
    EXPECT_EQ(activated, -1) << "there is no such row";
    tree.Activate(0);
    EXPECT_EQ(activated, 0);
    tree.Activate(0);
}

TEST_F(TreeTest, ColumnsMoveAndTheirCellsStayWithThem) {
    tree.SetColumns({{"a", "A", 0}, {"b", "B", 50}, {"c", "C", 0}});
    const std::uint64_t revision = tree.GetRevision();
    changes = 0;
    const auto order = [&] {
        std::string ids;
        for (const TreeColumn& column : tree.GetColumns()) {
            ids += column.id + std::to_string(tree.GetCell(column.id));
        }
        return ids;
    };
    tree.MoveColumn("a", 2);
    EXPECT_EQ(order(), "b1c2a0");
    tree.MoveColumn("c", -5);
    EXPECT_EQ(order(), "c2b1a0");
    tree.MoveColumn("c", 99);
    EXPECT_EQ(order(), "b1a0c2");
    tree.MoveColumn("unknown", 0);
    tree.SetColumnWidth("b", -3);
    EXPECT_EQ(tree.GetColumns()[0].width, 0);
    tree.SetColumnWidth("b", 120);
    EXPECT_EQ(tree.GetColumns()[0].width, 120);
    EXPECT_EQ(tree.GetCell("unknown"), -1);
    EXPECT_EQ(tree.GetRevision(), revision);
    EXPECT_EQ(changes, 0) << "what the back end does itself is not told to it";
}

}  // namespace
}  // namespace ostui
