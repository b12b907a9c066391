// The making of the main window: actions, menus, tool bar and pages.
#include <QtWidgets/QHeaderView>
#include <QtWidgets/QMenuBar>
#include <QtWidgets/QSplitter>
#include <QtWidgets/QToolBar>
#include <QtWidgets/QVBoxLayout>

#include "Icons.h"
#include "MainWindow.h"
#include "Text.h"

namespace Desk {

QAction* MainWindow::MakeAction(const char* inName, const char* inIcon, const char* inText,
                                const QKeySequence& inKeys, const Action& inAction) {
    auto* const action = new QAction(GetIcon(inIcon), Text(inText), this);
    action->setObjectName(QLatin1String(inName));
    action->setShortcut(inKeys);
    // The tip tells the keys, too.
    QString tip = action->text().remove(QLatin1Char('&'));
    if (!inKeys.isEmpty()) {
        tip += QStringLiteral(" (%1)").arg(inKeys.toString(QKeySequence::NativeText));
    }
    action->setToolTip(tip);
    connect(action, &QAction::triggered, this, inAction);
    return action;
}

void MainWindow::MakeActions() {
    const auto whenSaved = [this](void (Workspace::*inWorkflow)()) {
        return
            [this, inWorkflow] { WhenNothingIsUnsaved([this, inWorkflow] { (mWorkspace.*inWorkflow)(); }); };
    };
    mShare = MakeAction("share", "Share", "$$$/ZODesk/Action/Share=S&hare",
                        QKeySequence(Qt::CTRL | Qt::Key_Return), whenSaved(&Workspace::Share));
    mLatest = MakeAction("latest", "Latest", "$$$/ZODesk/Action/Latest=Get &Latest",
                         QKeySequence(Qt::CTRL | Qt::Key_L), whenSaved(&Workspace::GetLatest));
    mResolve = MakeAction("resolve", "Resolve", "$$$/ZODesk/Action/Resolve=&Resolve",
                          QKeySequence(Qt::CTRL | Qt::Key_R), whenSaved(&Workspace::Resolve));
    mHistory = MakeAction("history", "History", "$$$/ZODesk/Action/History=Histor&y",
                          QKeySequence(Qt::CTRL | Qt::Key_H), [this] { ShowHistory(); });
    mRefresh = MakeAction("refresh", "Refresh", "$$$/ZODesk/Action/Refresh=Re&fresh",
                          QKeySequence(Qt::Key_F5), [this] { mWorkspace.Refresh(); });
    mOpen = MakeAction("open", "SP_Production_Sm", "$$$/ZODesk/Action/Open=&Open Production...",
                       QKeySequence::Open, [this] { AskForProduction(); });
    mSave = MakeAction("save", "Save", "$$$/ZODesk/Action/Save=&Save Metadata", QKeySequence::Save,
                       [this] { mPane->Save(); });
    mRevert = MakeAction("revert", "", "$$$/ZODesk/Action/Revert=Re&vert Metadata", {},
                         [this] { mPane->Revert(); });
    mSignOut = MakeAction("signOut", "SP_ShowUser_Sm", "$$$/ZODesk/Action/SignOut=Sign O&ut", {}, [this] {
        WhenNothingIsUnsaved([this] {
            CloseProduction();
            ShowRunning(Text("$$$/ZODesk/SignOut/Running=Signing out..."), {});
            mConnection.SignOut();
        });
    });
}

void MainWindow::MakeMenus() {
    QMenu* const file = menuBar()->addMenu(Text("$$$/ZODesk/Menu/File=&File"));
    file->addActions({mOpen, mSave, mRevert});
    file->addSeparator();
    file->addAction(mSignOut);
    file->addAction(
        MakeAction("quit", "", "$$$/ZODesk/Action/Quit=&Quit", QKeySequence::Quit, [this] { close(); }));
    QMenu* const production = menuBar()->addMenu(Text("$$$/ZODesk/Menu/Production=&Production"));
    production->addActions({mShare, mLatest, mResolve});
    production->addSeparator();
    production->addActions({mHistory, mRefresh});
    auto* const find = MakeAction("find", "", "$$$/ZODesk/Action/Find=&Find", QKeySequence::Find, [this] {
        mSearch->setFocus();
        mSearch->selectAll();
    });
    production->addAction(find);

    QToolBar* const bar = addToolBar(Text("$$$/ZODesk/Menu/Tools=Tools"));
    bar->setObjectName(QStringLiteral("tools"));
    bar->setMovable(false);
    bar->setIconSize(QSize(20, 20));
    bar->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
    bar->setContextMenuPolicy(Qt::PreventContextMenu);
    for (QAction* const action : {mShare, mLatest, mResolve, mHistory}) {
        bar->addAction(action);
        auto* const button = bar->widgetForAction(action);
        button->setObjectName(action->objectName() + QStringLiteral("Button"));
        button->setAccessibleName(action->text().remove(QLatin1Char('&')));
        button->setFocusPolicy(Qt::TabFocus);
    }
}

void MainWindow::MakePages() {
    mFilter.setSourceModel(&mAssets);
    mFilter.setRecursiveFilteringEnabled(true);
    mFilter.setAutoAcceptChildRows(true);
    mFilter.setFilterCaseSensitivity(Qt::CaseInsensitive);
    mFilter.setSortRole(AssetTreeModel::kSortRole);
    mFilter.setSortLocaleAware(true);
    mTree->setModel(&mFilter);
    mTree->setSortingEnabled(true);
    mTree->sortByColumn(AssetTreeModel::kName, Qt::AscendingOrder);
    mTree->setUniformRowHeights(true);
    mTree->setAccessibleName(Text("$$$/ZODesk/Assets/List=Assets"));
    mTree->setObjectName(QStringLiteral("assets"));
    mTree->header()->setStretchLastSection(false);
    mTree->header()->setSectionResizeMode(AssetTreeModel::kName, QHeaderView::Stretch);
    mTree->header()->setSectionResizeMode(AssetTreeModel::kType, QHeaderView::Interactive);
    mTree->header()->resizeSection(AssetTreeModel::kType, 150);
    mSearch->setObjectName(QStringLiteral("search"));
    mSearch->setPlaceholderText(Text("$$$/ZODesk/Assets/Search=Search assets"));
    mSearch->setAccessibleName(mSearch->placeholderText());
    mSearch->setClearButtonEnabled(true);

    auto* const left = new QWidget;
    auto* const leftLayout = new QVBoxLayout(left);
    leftLayout->setContentsMargins(14, 12, 6, 12);
    leftLayout->setSpacing(10);
    leftLayout->addWidget(mSearch);
    leftLayout->addWidget(mTree, 1);
    auto* const splitter = new QSplitter;
    splitter->addWidget(left);
    splitter->addWidget(mPane);
    splitter->setStretchFactor(0, 3);
    splitter->setStretchFactor(1, 2);
    splitter->setChildrenCollapsible(false);
    splitter->setSizes({640, 440});
    mProductionPage = splitter;
    mPages->addWidget(mMessage);
    mPages->addWidget(mProductionPage);

    auto* const whole = new QWidget;
    auto* const layout = new QVBoxLayout(whole);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);
    layout->addWidget(mPages, 1);
    layout->addWidget(mStatus);
    setCentralWidget(whole);
}

}  // namespace Desk
