// Where things stand.
#include <fstream>
#include <sstream>

#include "ostlyra/Layout.h"
#include "WindowTest.h"

namespace {

using ostui::Dialog;
using ostui::View;

class LayoutTest : public WindowTest {
protected:
    static QRect PlaceOf(const QWidget* inWidget) {
        return {inWidget->mapTo(inWidget->window(), QPoint()), inWidget->size()};
    }
    static ostcore::optional<std::string> ReadLayout(const std::string& inName) {
        std::ifstream file(std::string(ZO_LAYOUTS "/") + inName + ".lyra");
        std::stringstream text;
        text << file.rdbuf();
        return file ? ostcore::optional<std::string>(text.str()) : boost::none;
    }
    /// What a change of one widget asks of the next takes several rounds of the loop.
    static void Settle() {
        for (int round = 0; round < 8; ++round) {
            QCoreApplication::processEvents();
        }
    }
    /// Nothing that can be seen is cut by its window, stands on its neighbour or is smaller than its text.
    static void CheckPlaces(const QDialog& inWindow) {
        for (const QWidget* const one : inWindow.findChildren<QWidget*>()) {
            const bool isLeaf = qobject_cast<const QLabel*>(one) ||
                                qobject_cast<const QAbstractButton*>(one) ||
                                qobject_cast<const QLineEdit*>(one) || qobject_cast<const QTreeView*>(one) ||
                                qobject_cast<const QProgressBar*>(one);
            if (!isLeaf || !one->isVisible()) {
                continue;
            }
            EXPECT_TRUE(inWindow.rect().contains(PlaceOf(one))) << one->metaObject()->className();
            const auto* const label = qobject_cast<const QLabel*>(one);
            if (label && label->wordWrap()) {
                EXPECT_GE(label->height(), label->heightForWidth(label->width()))
                    << label->text().toStdString();
            }
            for (const QWidget* const other :
                 one->parentWidget()->findChildren<QWidget*>(Qt::FindDirectChildrenOnly)) {
                if (other != one && other->isVisible() &&
                    !qobject_cast<const QAbstractScrollArea*>(one->parentWidget())) {
                    EXPECT_FALSE(PlaceOf(one).intersects(PlaceOf(other)))
                        << one->metaObject()->className() << " on " << other->metaObject()->className();
                }
            }
        }
    }
};

TEST_F(LayoutTest, ShippedLayoutsStandWellAtEverySizeAndInBothDirections) {
    int count = 0;
    for (const auto& entry : std::filesystem::directory_iterator(ZO_LAYOUTS)) {
        const std::string name = entry.path().stem();
        ostlyra::LayoutError error;
        const auto layout = ostlyra::ParseLayout(*ReadLayout(name), error, &LayoutTest::ReadLayout);
        ASSERT_TRUE(layout) << error.AsText();
        if (layout->view.tag != "ost_dialog") {
            continue;
        }
        ++count;
        for (const Qt::LayoutDirection direction : {Qt::LeftToRight, Qt::RightToLeft}) {
            QApplication::setLayoutDirection(direction);
            Dialog dialog(name, layout->view);
            const testing::ScopedTrace trace(__FILE__, __LINE__, name);
            Run(dialog, [&](QDialog& ioWindow) {
                EXPECT_GE(ioWindow.width(), layout->view.GetNumber("minWidth", 0));
                CheckPlaces(ioWindow);
                for (const std::string& text :
                     {"A path without end: /" + std::string(600, 'w'), std::string(20, '\n') + "end"}) {
                    for (const auto& control : dialog.GetControls()) {
                        if (control.type == ostui::ControlType::kStaticText && control.isMultiLine) {
                            dialog.SetText(control.id, text);
                        }
                    }
                    Settle();
                    CheckPlaces(ioWindow);
                    EXPECT_LT(ioWindow.width(), 1000);
                }
                ioWindow.resize(ioWindow.minimumSize());
                Settle();
                CheckPlaces(ioWindow);
                dialog.Close(1);
            });
        }
        QApplication::setLayoutDirection(Qt::LeftToRight);
    }
    EXPECT_GE(count, 6);
}

TEST_F(LayoutTest, WhatFillsGrowsWithTheWindowAndTheRestStays) {
    const auto button = [](const char* inID) {
        return MakeView("ost_button", {{"identifier", inID}, {"name", inID}});
    };
    Dialog dialog(
        "Grow",
        MakeView("ost_dialog", {{"canResize", "true"}, {"minWidth", "500"}},
                 {MakeView("row", {{"horizontal", "fill"}, {"vertical", "fill"}},
                           {MakeView("ost_multi_column_tree", {{"identifier", "tree"}, {"vertical", "fill"}}),
                            MakeView("column", {{"vertical", "top"}}, {button("Add"), button("Remove")})}),
                  MakeView("row", {{"horizontal", "fill"}},
                           {button("Left"),
                            MakeView("ost_button",
                                     {{"identifier", "Right"}, {"name", "Right"}, {"horizontal", "right"}})}),
                  MakeView("ost_text_edit", {{"identifier", "a"}, {"label", "A:"}, {"gap", "20"}}),
                  MakeView("ost_text_edit", {{"identifier", "b"}, {"label", "Much longer:"}, {"gap", "20"}}),
                  MakeView("row", {{"horizontal", "right"}, {"topSpace", "4"}}, {button("End")}),
                  MakeView("ost_ok_cancel_row", {})}));
    Run(dialog, [&](QDialog& ioWindow) {
        const auto* const tree = FindOnly<QTreeView>(ioWindow);
        const QSize before = tree->size();
        ioWindow.resize(ioWindow.size() + QSize(200, 150));
        Settle();
        EXPECT_EQ(tree->size(), before + QSize(200, 150));
        const int right = PlaceOf(tree->parentWidget()).right();
        EXPECT_LT(PlaceOf(FindButton(ioWindow, QStringLiteral("Left"))).left(), 40);
        EXPECT_GT(PlaceOf(FindButton(ioWindow, QStringLiteral("Right"))).right(), right - 40);
        EXPECT_GT(PlaceOf(FindButton(ioWindow, QStringLiteral("End"))).right(), right - 40);
        EXPECT_EQ(PlaceOf(FindButton(ioWindow, QStringLiteral("Add"))).top(), PlaceOf(tree).top());
        const auto edits = ioWindow.findChildren<QLineEdit*>();
        ASSERT_EQ(edits.size(), 2);
        EXPECT_EQ(PlaceOf(edits[0]).left(), PlaceOf(edits[1]).left());
        CheckPlaces(ioWindow);
        dialog.Close(1);
    });
}

TEST_F(LayoutTest, OneViewInThePlaceOfAnotherKeepsTheWindowsSize) {
    const auto page = [](const char* inID, const char* inText) {
        return MakeView(
            "ost_subview", {{"identifier", inID}, {"horizontal", "fill"}},
            {MakeView("ost_static_text", {{"identifier", std::string(inID) + "Text"}, {"name", inText}})});
    };
    Dialog dialog("Overlay", MakeView("ost_dialog", {{"placement", "overlay"}},
                                      {page("one", "1\n2\n3\n4"), page("two", "A line that is longer")}));
    dialog.SetVisible("two", false);
    Run(dialog, [&](QDialog& ioWindow) {
        const QSize before = ioWindow.size();
        dialog.SetVisible("one", false);
        dialog.SetVisible("two", true);
        Settle();
        EXPECT_EQ(ioWindow.size(), before);
        dialog.Close(1);
    });
}

}  // namespace
