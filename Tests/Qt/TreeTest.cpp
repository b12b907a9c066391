// Trees: order, selection, columns.
#include "WindowTest.h"

namespace {

using ostui::Dialog;
using ostui::Tree;
using ostui::TreeRow;
using testing::ElementsAre;
using testing::IsEmpty;

class TreeTest : public WindowTest {
protected:
    TreeTest()
        : mDialog("Trees",
                  MakeView("ost_dialog", {{"canResize", "true"}},
                           {MakeView("ost_multi_column_tree",
                                     {{"identifier", "tree"}, {"vertical", "fill"}, {"minHeight", "240"}}),
                            MakeView("ost_cancel_row", {})})),
          mTree(mDialog.GetTree("tree")) {
        mTree->SetColumns({{"name", "Name", 0}, {"size", "Size", 0}, {"path", "Path", 0}});
        mTree->SetRows({Row("b", {"beta", "10"}), Row("a", {"Alpha", "9"}), Row("c", {"gamma", "100"}),
                        Row("c2", {"inner 10", ""}, 2), Row("c1", {"inner 9", ""}, 2)});
    }

    static TreeRow Row(std::string inID, std::vector<std::string> inCells,
                       int inParent = TreeRow::kTopLevel) {
        return {inID, std::move(inCells), "", "tip of " + inID, inParent};
    }
    /// The texts of a column from the top down, as the view has them.
    static std::vector<std::string> Read(const QTreeView& inView, int inCell = 0) {
        std::vector<std::string> texts;
        for (QModelIndex at = inView.model()->index(0, 0); at.isValid(); at = inView.indexBelow(at)) {
            texts.push_back(at.siblingAtColumn(inCell).data().toString().toStdString());
        }
        return texts;
    }
    static void ClickHeader(QTreeView& ioView, int inCell) {
        QHeaderView* const header = ioView.header();
        const int x = header->sectionViewportPosition(inCell) + 20;
        QTest::mouseClick(header->viewport(), Qt::LeftButton, {}, QPoint(x, header->height() / 2));
    }
    static void ClickRow(QTreeView& ioView, const char* inText, Qt::KeyboardModifiers inModifiers = {}) {
        const QModelIndexList found =
            ioView.model()->match(ioView.model()->index(0, 0), Qt::DisplayRole, QString::fromUtf8(inText), 1,
                                  Qt::MatchExactly | Qt::MatchRecursive);
        ASSERT_EQ(found.size(), 1) << inText;
        QTest::mouseClick(ioView.viewport(), Qt::LeftButton, inModifiers,
                          ioView.visualRect(found[0]).center());
    }
    void RunTree(const std::function<void(QTreeView&)>& inUser) {
        Run(mDialog, [&](QDialog& ioWindow) {
            auto* const view = FindOnly<QTreeView>(ioWindow);
            // Finds what a model tells its views amiss, at each change.
            const QAbstractItemModelTester tester(view->model(),
                                                  QAbstractItemModelTester::FailureReportingMode::Fatal);
            inUser(*view);
            mDialog.Close(ostui::kResponseOK);
        });
    }

    Dialog mDialog;
    const ostcore::shared_ptr<Tree> mTree;
};

TEST_F(TreeTest, AClickOnAHeadSortsAndASecondOneFlips) {
    RunTree([&](QTreeView& ioView) {
        EXPECT_THAT(Read(ioView), ElementsAre("beta", "Alpha", "gamma", "inner 10", "inner 9"));
        ClickHeader(ioView, 0);
        EXPECT_THAT(Read(ioView), ElementsAre("Alpha", "beta", "gamma", "inner 9", "inner 10"));
        EXPECT_EQ(ioView.header()->sortIndicatorOrder(), Qt::AscendingOrder);
        ClickHeader(ioView, 0);
        EXPECT_THAT(Read(ioView), ElementsAre("gamma", "inner 10", "inner 9", "beta", "Alpha"));
        ClickHeader(ioView, 1);
        EXPECT_THAT(Read(ioView, 1), ElementsAre("9", "10", "100", "", ""));
        EXPECT_EQ(ioView.header()->sortIndicatorSection(), 1);
        mTree->SetSort("", true);
        EXPECT_THAT(Read(ioView), ElementsAre("beta", "Alpha", "gamma", "inner 10", "inner 9"));
    });
}

TEST_F(TreeTest, SelectionFollowsTheUserTheLogicAndTheOrder) {
    mTree->SetSelectionMode(Tree::SelectionMode::kMultiple);
    int changes = 0;
    mTree->SetOnSelectionChanged([&] { ++changes; });
    RunTree([&](QTreeView& ioView) {
        const auto shown = [&] {
            std::vector<std::string> texts;
            for (const QModelIndex& index : ioView.selectionModel()->selectedRows()) {
                texts.push_back(index.data().toString().toStdString());
            }
            std::sort(texts.begin(), texts.end());
            return texts;
        };
        ClickRow(ioView, "beta");
        ClickRow(ioView, "inner 9", Qt::ControlModifier);
        EXPECT_THAT(mTree->GetSelectedIDs(), ElementsAre("b", "c1"));
        EXPECT_EQ(changes, 2);
        for (int click = 0; click < 2; ++click) {
            ClickHeader(ioView, 0);
            EXPECT_THAT(shown(), ElementsAre("beta", "inner 9"));
        }
        mDialog.SelectRows("tree", {1, 2});
        EXPECT_THAT(shown(), ElementsAre("Alpha", "gamma"));
        QTest::keyClick(&ioView, Qt::Key_A, Qt::ControlModifier);
        EXPECT_EQ(mTree->GetSelection().size(), 5u);
        ClickHeader(ioView, 0);
        EXPECT_EQ(shown().size(), 5u);
        mTree->RemoveRows({"c"});
        EXPECT_THAT(shown(), ElementsAre("Alpha", "beta"));
        mTree->SetSelectionMode(Tree::SelectionMode::kNone);
        EXPECT_THAT(shown(), IsEmpty());
    });
}

TEST_F(TreeTest, RowsMayBeReplacedFromWithinTheSelection) {
    mTree->SetOnSelectionChanged([&] { mTree->SetRows({Row("x", {"only"}), Row("y", {"two"})}); });
    RunTree([&](QTreeView& ioView) {
        ClickRow(ioView, "inner 10");
        EXPECT_THAT(Read(ioView), ElementsAre("only", "two"));
        mTree->SetOnSelectionChanged([&] { mTree->RemoveRows({"x", "y"}); });
        QTest::keyClick(&ioView, Qt::Key_Down);
        EXPECT_THAT(Read(ioView), IsEmpty());
    });
}

TEST_F(TreeTest, ColumnsThatAreMovedOrWidenedAreToldAndCellsStayUnderTheirHeads) {
    RunTree([&](QTreeView& ioView) {
        QHeaderView* const header = ioView.header();
        header->resizeSection(0, 211);
        EXPECT_EQ(mTree->GetColumns()[0].width, 211);
        header->moveSection(0, 1);
        EXPECT_EQ(mTree->GetColumns()[0].id, "size");
        EXPECT_EQ(mTree->GetColumns()[1].id, "name");
        ClickHeader(ioView, 0);
        EXPECT_EQ(mTree->GetSortColumn(), "name");
        EXPECT_THAT(Read(ioView, 1), ElementsAre("9", "10", "100", "", ""));
    });
    // The next window is as this one was left.
    RunTree([&](QTreeView& ioView) {
        EXPECT_EQ(ioView.header()->visualIndex(0), 1);
        EXPECT_EQ(ioView.header()->sectionSize(0), 211);
        EXPECT_THAT(Read(ioView), ElementsAre("Alpha", "beta", "gamma", "inner 9", "inner 10"));
    });
}

TEST_F(TreeTest, EnterAndDoubleClickOpenARowAndShutRowsStayShut) {
    std::vector<int> opened;
    mTree->SetOnActivated([&](int inRow) { opened.push_back(inRow); });
    RunTree([&](QTreeView& ioView) {
        ClickRow(ioView, "Alpha");
        QTest::keyClick(&ioView, Qt::Key_Return);
        QTest::mouseDClick(ioView.viewport(), Qt::LeftButton, {},
                           ioView.visualRect(ioView.currentIndex()).center());
        EXPECT_THAT(opened, ElementsAre(1, 1));
        ioView.collapse(ioView.model()->index(2, 0));
        EXPECT_THAT(Read(ioView), ElementsAre("beta", "Alpha", "gamma"));
        auto rows = mTree->GetRows();
        rows.insert(rows.begin(), Row("new", {"new"}));
        rows[4].parent = rows[5].parent = 3;
        mTree->SetRows(rows);
        EXPECT_THAT(Read(ioView), ElementsAre("new", "beta", "Alpha", "gamma"));
        EXPECT_TRUE(ioView.model()
                        ->index(0, 0)
                        .data(Qt::ToolTipRole)
                        .toString()
                        .contains(QStringLiteral("tip of new")));
    });
}

}  // namespace
