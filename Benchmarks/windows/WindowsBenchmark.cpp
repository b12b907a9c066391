// How long a window takes to open, and a tree of 50,000 rows to open, to sort and to scroll, until it is
// drawn.
#include <algorithm>
#include <array>
#include <chrono>
#include <cstdio>
#include <functional>
#include <memory>
#include <vector>

#include <QtTest/QtTest>
#include <QtWidgets/QApplication>
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QScrollBar>
#include <QtWidgets/QTreeView>

#include "BareWindows.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "ZOClientQt/QtBackEnd.h"

namespace {

using ostui::Dialog;
using ostui::View;

constexpr int kRounds = 9;
constexpr int kManyRows = 50000;
constexpr int kFewRows = 20;
constexpr int kScrollSteps = 100;

/// In milliseconds, of one round.
struct Times {
    double open = 0;
    double sort = 0;
    double frame = 0;
};

class Clock {
public:
    double Milliseconds() const {
        return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - mBegin).count();
    }

private:
    const std::chrono::steady_clock::time_point mBegin = std::chrono::steady_clock::now();
};

std::vector<std::string> MakeRow(int inNumber) {
    // No order that a sort could have an easy time with.
    const int mixed = static_cast<int>((static_cast<long long>(inNumber) * 7919) % kManyRows);
    return {"Shot " + std::to_string(mixed) + " take " + std::to_string(inNumber % 7),
            inNumber % 3 == 0 ? "Add" : "Edit", "/Rushes/Day " + std::to_string(mixed % 40) + "/Card A"};
}

Rows MakeBareRows(int inCount) {
    Rows rows;
    for (int i = 0; i < inCount; ++i) {
        QStringList cells;
        for (const std::string& cell : MakeRow(i)) {
            cells << QString::fromStdString(cell);
        }
        rows.push_back(cells);
    }
    return rows;
}

std::vector<ostui::TreeRow> MakeOurRows(int inCount) {
    std::vector<ostui::TreeRow> rows;
    for (int i = 0; i < inCount; ++i) {
        rows.push_back({std::to_string(i), MakeRow(i), "", "", ostui::TreeRow::kTopLevel});
    }
    return rows;
}

void WaitUntilDrawn(QWidget& ioWindow) {
    if (!QTest::qWaitForWindowExposed(&ioWindow)) {
        std::fprintf(stderr, "bench: the window does not appear\n");
        std::exit(1);
    }
    ioWindow.repaint();
}

/// A user's click on the head of the first column, and some scrolling.
void UseTree(QWidget& ioWindow, Times& outTimes) {
    auto* const view = ioWindow.findChild<QTreeView*>();
    QHeaderView* const header = view->header();
    const QPoint place(header->sectionViewportPosition(0) + 20, header->height() / 2);
    const Clock sorting;
    QTest::mouseClick(header->viewport(), Qt::LeftButton, {}, place);
    view->viewport()->repaint();
    outTimes.sort = sorting.Milliseconds();
    QScrollBar* const bar = view->verticalScrollBar();
    const Clock scrolling;
    for (int step = 0; step < kScrollSteps; ++step) {
        bar->setValue(bar->value() + bar->maximum() / (2 * kScrollSteps));
        view->viewport()->repaint();
    }
    outTimes.frame = scrolling.Milliseconds() / kScrollSteps;
}

template <class Window>
Times RunBare(const Rows& inRows) {
    Times times;
    const Clock clock;
    Window window(inRows);
    window.setModal(true);
    window.resize(640, 420);
    window.show();
    WaitUntilDrawn(window);
    times.open = clock.Milliseconds();
    UseTree(window, times);
    return times;
}

View Make(const std::string& inTag, std::vector<ostui::ViewParameter> inParameters,
          std::vector<View> inChildren = {}) {
    View view;
    view.tag = inTag;
    view.parameters = std::move(inParameters);
    view.children = std::move(inChildren);
    return view;
}

Times RunOurs(std::vector<ostui::TreeRow> inRows) {
    Times times;
    const Clock clock;
    Dialog dialog("Bench",
                  Make("ost_dialog", {{"canResize", "true"}, {"minWidth", "640"}, {"minHeight", "420"}},
                       {Make("ost_multi_column_tree", {{"identifier", "tree"}, {"vertical", "fill"}}),
                        Make("ost_static_text", {{"identifier", "label"}, {"name", "Comment:"}}),
                        Make("ost_text_edit", {{"identifier", "comment"}, {"multiLine", "true"}}),
                        Make("ost_ok_cancel_row", {{"okText", "Share"}})}));
    const auto tree = dialog.GetTree("tree");
    tree->SetColumns({{"name", "Name", 0}, {"action", "Action", 0}, {"path", "Path", 0}});
    tree->SetRows(std::move(inRows));
    dialog.SetOnOpened([&] {
        QWidget& window = *QApplication::activeModalWidget();
        WaitUntilDrawn(window);
        times.open = clock.Milliseconds();
        UseTree(window, times);
        dialog.Close(ostui::kResponseOK);
    });
    dialog.RunModal();
    return times;
}

double Median(std::vector<Times> inTimes, double Times::*inWhich) {
    std::vector<double> values;
    for (const Times& times : inTimes) {
        values.push_back(times.*inWhich);
    }
    std::sort(values.begin(), values.end());
    return values[values.size() / 2];
}

void Report(const char* inName, double inOurs, double inBaseline, const char* inWhat, double inTarget) {
    std::printf("bench %s: ours %.2f ms, baseline %.2f ms (%s), ratio %.2f, target %.0f ms: %s\n", inName,
                inOurs, inBaseline, inWhat, inBaseline / inOurs, inTarget,
                inOurs < inTarget ? "holds" : "falls short");
}

}  // namespace

int main(int inCount, char** inArguments) {
    qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(inCount, inArguments);
    ZOClientQt::UseModernStyle(ZOClientQt::ColorScheme::kLight);
    ostcore::threads::SetMainThread();
    const auto former = ostui::SetBackEnd(ZOClientQt::CreateQtBackEnd(nullptr));

    const Rows fewBare = MakeBareRows(kFewRows);
    const Rows manyBare = MakeBareRows(kManyRows);
    std::vector<Times> few, bareFew, many, bareMany, bareWidget;
    // The first of each loads fonts and fills caches.
    for (int round = -1; round < kRounds; ++round) {
        const std::array<std::function<void()>, 5> bodies{
            [&] { few.push_back(RunOurs(MakeOurRows(kFewRows))); },
            [&] { bareFew.push_back(RunBare<BareShareWindow>(fewBare)); },
            [&] { many.push_back(RunOurs(MakeOurRows(kManyRows))); },
            [&] { bareMany.push_back(RunBare<BareModelWindow>(manyBare)); },
            [&] { bareWidget.push_back(RunBare<BareTreeWidgetWindow>(manyBare)); },
        };
        for (const auto& body : bodies) {
            body();
        }
        if (round < 0) {
            for (std::vector<Times>* const times : {&few, &bareFew, &many, &bareMany, &bareWidget}) {
                times->clear();
            }
        }
    }
    const auto open = &Times::open;
    const auto sort = &Times::sort;
    const auto frame = &Times::frame;
    Report("windows-open", Median(few, open), Median(bareFew, open), "the same widgets made by hand", 50);
    Report("windows-tree-open", Median(many, open), Median(bareMany, open),
           "QTreeView, bare model, 50,000 rows", 300);
    Report("windows-tree-open", Median(many, open), Median(bareWidget, open), "QTreeWidget, 50,000 rows",
           300);
    Report("windows-tree-sort", Median(many, sort), Median(bareMany, sort),
           "QTreeView, bare model, texts compared as they are, 50,000 rows", 200);
    Report("windows-tree-sort", Median(many, sort), Median(bareWidget, sort), "QTreeWidget, 50,000 rows",
           200);
    Report("windows-tree-frame", Median(many, frame), Median(bareMany, frame),
           "QTreeView, bare model, 50,000 rows", 16);
    ostui::SetBackEnd(former);
    return 0;
}
