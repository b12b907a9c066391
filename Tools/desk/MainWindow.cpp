// What happens in the main window.
#include "MainWindow.h"

#include <set>

#include <QtGui/QCloseEvent>
#include <QtWidgets/QMessageBox>
#include <QtWidgets/QPushButton>

#include "HistoryWindow.h"
#include "Icons.h"
#include "ProductionChooser.h"
#include "SignInDialog.h"
#include "Text.h"

namespace Desk {

using ZOCL::ImmutableString;

MainWindow::MainWindow(const StartOptions& inOptions)
    : mOptions(inOptions),
      mPages(new QStackedWidget),
      mMessage(new MessagePage),
      mSearch(new QLineEdit),
      mTree(new QTreeView),
      mPane(new MetadataPane),
      mStatus(new StatusStrip) {
    setObjectName(QStringLiteral("mainWindow"));
    setWindowTitle(Text("$$$/ZODesk/Title=Meridane Desk"));
    MakeActions();
    MakeMenus();
    MakePages();
    ConnectSignals();
    UpdateActions();
    resize(1080, 680);
}

MainWindow::~MainWindow() {
    // The parts tell each other of their end; nobody listens any more.
    mWorkspace.disconnect(this);
    mConnection.disconnect(this);
    mPane->disconnect(this);
}

void MainWindow::ConnectSignals() {
    connect(&mConnection, &Connection::SignedIn, this, &MainWindow::OnSignedIn);
    connect(&mConnection, &Connection::Failed, this, &MainWindow::OnSignInFailed);
    connect(&mConnection, &Connection::SignedOut, this, &MainWindow::OnSignedOut);
    connect(&mConnection, &Connection::NetworkChanged, mStatus, &StatusStrip::ShowNetwork);
    connect(&mWorkspace, &Workspace::Opened, this, &MainWindow::OnOpened);
    connect(&mWorkspace, &Workspace::Failed, this, &MainWindow::ShowNoProduction);
    connect(&mWorkspace, &Workspace::AssetsChanged, this, &MainWindow::OnAssetsChanged);
    connect(&mWorkspace, &Workspace::StateChanged, this, &MainWindow::UpdateActions);
    connect(&mWorkspace, &Workspace::BusyChanged, this, &MainWindow::OnBusy);
    connect(&mWorkspace, &Workspace::Told, mStatus, &StatusStrip::Tell);
    connect(&mWorkspace, &Workspace::CloseWanted, this, [this] {
        CloseProduction();
        ShowNoProduction(QString());
    });
    connect(mStatus, &StatusStrip::CancelPressed, &mWorkspace, &Workspace::Cancel);
    connect(mSearch, &QLineEdit::textChanged, this, &MainWindow::Filter);
    connect(mTree->selectionModel(), &QItemSelectionModel::currentChanged, this,
            &MainWindow::OnCurrentChanged);
    connect(mPane, &MetadataPane::EditsChanged, this, &MainWindow::UpdateActions);
    connect(mPane, &MetadataPane::Saved, this, &MainWindow::OnSaved);
}

void MainWindow::UpdateActions() {
    const auto& sandbox = mWorkspace.GetSandbox();
    const bool isOpen = mWorkspace.IsOpen();
    const bool isFree = isOpen && !mWorkspace.IsInWorkflow() && !mPane->IsSaving();
    // An uncertain state is nothing to decide on.
    mShare->setEnabled(isFree && !sandbox->IsDirtyStateUncertain() && sandbox->IsDirty());
    mLatest->setEnabled(isFree && !sandbox->IsSyncStateUncertain() && !sandbox->IsInSync());
    mResolve->setEnabled(isFree && sandbox->HasConflicts());
    mHistory->setEnabled(isOpen);
    mRefresh->setEnabled(isFree);
    mOpen->setEnabled(mConnection.IsSignedIn());
    mSignOut->setEnabled(mConnection.IsSignedIn());
    mSave->setEnabled(mPane->HasEdits() && !mPane->IsSaving());
    mRevert->setEnabled(mSave->isEnabled());
    mStatus->ShowSandbox(isOpen ? sandbox : nullptr);
    setWindowModified(mPane->HasEdits());
    const QString title = Text("$$$/ZODesk/Title=Meridane Desk");
    // "[*]" is Qt's mark of an unsaved document.
    QString name = mWorkspace.GetName();
    setWindowTitle(
        (isOpen ? name.replace(QLatin1String("[*]"), QLatin1String("[*][*]")) + QStringLiteral("[*] \u2013 ")
                : QString()) +
        title);
}

// --- Pages

void MainWindow::ShowMessage(const char* inIcon, const QString& inTitle, const QString& inText,
                             const std::vector<MessagePage::Button>& inButtons) {
    mMessage->Show(inIcon, inTitle, inText, MessagePage::Bar::kNone, inButtons);
    mPages->setCurrentWidget(mMessage);
}

void MainWindow::ShowRunning(const QString& inTitle, const Action& inCancel) {
    std::vector<MessagePage::Button> buttons;
    if (inCancel) {
        buttons.push_back({Text("$$$/ZODesk/Cancel=Cancel"), inCancel});
    }
    mMessage->Show("SP_Production_Sm", inTitle, QString(), MessagePage::Bar::kRunning, buttons);
    mPages->setCurrentWidget(mMessage);
}

// --- Signing in and out

void MainWindow::Start() {
    Connection::Login login = mOptions.login;
    if (login.server.isEmpty()) {
        login = Connection::FindLastLogin();
    }
    if (login.server.isEmpty() || login.user.isEmpty()) {
        OnSignedOut();
        return;
    }
    ShowRunning(Text("$$$/ZODesk/SignIn/Running=Signing in to @0...", {login.server}), [this] {
        mConnection.Cancel();
        OnSignedOut();
    });
    mConnection.SignInWithStored(login);
}

void MainWindow::AskForLogin() {
    if (mSignIn) {
        return;
    }
    Connection::Login proposal = mConnection.GetLogin();
    if (proposal.server.isEmpty()) {
        proposal = mOptions.login.server.isEmpty() ? Connection::FindLastLogin() : mOptions.login;
    }
    mSignIn = new SignInDialog(mConnection, proposal, this);
    mSignIn->setAttribute(Qt::WA_DeleteOnClose);
    mSignIn->open();
}

void MainWindow::OnSignInFailed(const QString& inReason) {
    if (mSignIn) {
        return;
    }
    const MessagePage::Button signIn{Text("$$$/ZODesk/SignIn/Ask=Sign In..."), [this] { AskForLogin(); }};
    if (inReason.isEmpty()) {
        OnSignedOut();
    } else {
        ShowMessage("SP_ServerOffline_Sm", Text("$$$/ZODesk/SignIn/FailedTitle=You are not signed in"),
                    inReason, {{Text("$$$/ZODesk/Retry=Try &Again"), [this] { Start(); }}, signIn});
    }
}

void MainWindow::OnSignedOut() {
    CloseProduction();
    ShowMessage("SP_ShowUser_Sm", Text("$$$/ZODesk/SignIn/None=You are signed out"),
                Text("$$$/ZODesk/SignIn/NoneText=Sign in to work on the productions of your team."),
                {{Text("$$$/ZODesk/SignIn/Ask=Sign In..."), [this] { AskForLogin(); }}});
    AskForLogin();
}

void MainWindow::OnSignedIn() {
    mStatus->ShowNetwork(false);
    UpdateActions();
    const QString wanted = mWanted.isEmpty() ? mOptions.production : mWanted;
    if (!wanted.isEmpty()) {
        OpenProduction(wanted);
    } else {
        ShowNoProduction(QString());
        AskForProduction();
    }
}

// --- Opening and closing

void MainWindow::AskForProduction() {
    auto* const chooser = new ProductionChooser(mWorkspace, this);
    chooser->setAttribute(Qt::WA_DeleteOnClose);
    connect(chooser, &ProductionChooser::Chosen, this,
            [this](const QString& inID) { WhenNothingIsUnsaved([this, inID] { OpenProduction(inID); }); });
    chooser->open();
}

void MainWindow::OpenProduction(const QString& inWhich) {
    CloseProduction();
    mWanted = inWhich;
    mWorkspace.Open(inWhich);
    UpdateActions();
}

void MainWindow::ShowNoProduction(const QString& inReason) {
    UpdateActions();
    std::vector<MessagePage::Button> buttons{
        {Text("$$$/ZODesk/Action/OpenButton=Open Production..."), [this] { AskForProduction(); }}};
    if (inReason.isEmpty()) {
        ShowMessage("SP_Production_Sm", Text("$$$/ZODesk/Open/None=No production is open"), QString(),
                    buttons);
        return;
    }
    buttons.insert(buttons.begin(),
                   {Text("$$$/ZODesk/Retry=Try &Again"), [this] { OpenProduction(mWanted); }});
    ShowMessage("SP_IncompatibleAlert_Sm", Text("$$$/ZODesk/Open/Failed=The production could not be opened"),
                inReason, buttons);
}

void MainWindow::OnBusy(const QString& inWhat) {
    if (mWorkspace.IsOpen() || inWhat.isEmpty()) {
        mStatus->ShowBusy(inWhat);
        return;
    }
    ShowRunning(inWhat, [this] {
        CloseProduction();
        ShowNoProduction(QString());
    });
}

void MainWindow::OnOpened() {
    UpdateActions();
    mTree->setFocus();
}

void MainWindow::CloseProduction() {
    mAfterSave = {};
    mWorkspace.Close();
    if (mHistoryWindow) {
        mHistoryWindow->close();
    }
    mAssets.SetAssets(nullptr);
    mPane->ShowNothing();
    UpdateActions();
}

// --- Assets

void MainWindow::OnAssetsChanged() {
    std::set<ImmutableString> expanded;
    const std::function<void(const QModelIndex&)> remember = [&](const QModelIndex& inParent) {
        for (int row = 0; row < mFilter.rowCount(inParent); ++row) {
            const QModelIndex index = mFilter.index(row, 0, inParent);
            if (mTree->isExpanded(index)) {
                expanded.insert(mAssets.FindAsset(mFilter.mapToSource(index))->assetIdentifier);
                remember(index);
            }
        }
    };
    remember({});
    mAssets.SetAssets(mWorkspace.GetAssets());
    for (const ImmutableString& id : expanded) {
        mTree->expand(mFilter.mapFromSource(mAssets.FindIndex(id)));
    }
    if (mAssets.rowCount() == 0) {
        ShowMessage("SP_Folder_Sm", Text("$$$/ZODesk/Assets/Empty=This production has no assets yet"),
                    Text("$$$/ZODesk/Assets/EmptyText=What your team adds and shares will appear here."), {});
    } else {
        mPages->setCurrentWidget(mProductionPage);
    }
    SelectQuietly(mPane->GetAssetID());
    ShowInPane(mAssets.FindIndex(mPane->GetAssetID()));
}

/// An asset that is not there any more leaves the pane, unless it is being edited.
void MainWindow::ShowInPane(const QModelIndex& inIndex) {
    if (const AssetItem* const item = mAssets.FindAsset(inIndex)) {
        mPane->ShowAsset(mWorkspace.GetAssets()->GetAssetByIdentifier(item->assetIdentifier), *item,
                         mWorkspace.GetSession());
    } else if (!mPane->HasEdits() && !mPane->IsSaving()) {
        mPane->ShowNothing();
    }
}

/// What is edited stays in the pane, whether the tree shows it or not.
void MainWindow::Filter(const QString& inText) {
    mIsMoving = true;
    mFilter.setFilterFixedString(inText);
    if (!inText.isEmpty()) {
        mTree->expandAll();
    }
    SelectQuietly(mPane->GetAssetID());
}

/// In the tree alone; no row is chosen when the search hides the asset.
void MainWindow::SelectQuietly(const ImmutableString& inAssetID) {
    mIsMoving = true;
    mTree->setCurrentIndex(mFilter.mapFromSource(mAssets.FindIndex(inAssetID)));
    mIsMoving = false;
}

void MainWindow::OnCurrentChanged() {
    if (mIsMoving) {
        return;
    }
    const QModelIndex index = mFilter.mapToSource(mTree->currentIndex());
    const AssetItem* const item = mAssets.FindAsset(index);
    const ImmutableString id = item ? item->assetIdentifier : ImmutableString();
    if (id != mPane->GetAssetID() && (mPane->HasEdits() || mPane->IsSaving())) {
        SelectQuietly(mPane->GetAssetID());
        WhenNothingIsUnsaved([this, id] {
            SelectQuietly(id);
            ShowInPane(mAssets.FindIndex(id));
        });
    } else {
        ShowInPane(index);
    }
}

void MainWindow::ShowHistory() {
    if (!mHistoryWindow) {
        mHistoryWindow = new HistoryWindow(mWorkspace.GetSharedProduction(), mWorkspace.GetName(), this);
        mHistoryWindow->show();
    }
    mHistoryWindow->raise();
    mHistoryWindow->activateWindow();
}

// --- Edits

void MainWindow::WhenNothingIsUnsaved(const Action& inThen) {
    if (mPane->IsSaving()) {
        mAfterSave = inThen;
    } else if (mPane->HasEdits()) {
        AskAboutEdits(inThen);
    } else {
        inThen();
    }
}

void MainWindow::AskAboutEdits(const Action& inThen) {
    auto* const question = new QMessageBox(
        QMessageBox::Question, Text("$$$/ZODesk/Unsaved/Title=Unsaved Metadata"),
        Text("$$$/ZODesk/Unsaved/Text=The metadata of \"@0\" has been changed. Do you want to save it?",
             {mPane->GetAssetName()}),
        QMessageBox::NoButton, this);
    question->setObjectName(QStringLiteral("unsavedQuestion"));
    question->setTextFormat(Qt::PlainText);
    question->setIconPixmap(GetIcon("SP_IncompatibleAlert_Sm").pixmap(QSize(32, 32), devicePixelRatioF()));
    question->setAttribute(Qt::WA_DeleteOnClose);
    QPushButton* const save =
        question->addButton(Text("$$$/ZODesk/Metadata/Save=&Save"), QMessageBox::AcceptRole);
    const QPushButton* const discard =
        question->addButton(Text("$$$/ZODesk/Unsaved/Discard=&Discard"), QMessageBox::DestructiveRole);
    question->addButton(Text("$$$/ZODesk/Cancel=Cancel"), QMessageBox::RejectRole);
    question->setDefaultButton(save);
    connect(save, &QPushButton::clicked, this, [this, inThen] {
        mAfterSave = inThen;
        mPane->Save();
    });
    connect(discard, &QPushButton::clicked, this, [this, inThen] {
        mPane->Revert();
        inThen();
    });
    question->open();
}

void MainWindow::OnSaved(bool inSucceeded) {
    const Action then = std::exchange(mAfterSave, {});
    if (inSucceeded) {
        mWorkspace.OnSessionChanged();
        mStatus->Tell(Text("$$$/ZODesk/Told/Saved=Saved. Share it when you are ready."));
    }
    UpdateActions();
    if (inSucceeded && then) {
        then();
    }
}

void MainWindow::closeEvent(QCloseEvent* inEvent) {
    if (mMayClose || (!mPane->HasEdits() && !mPane->IsSaving())) {
        inEvent->accept();
        return;
    }
    inEvent->ignore();
    WhenNothingIsUnsaved([this] {
        mMayClose = true;
        close();
    });
}

}  // namespace Desk
