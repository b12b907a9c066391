// The window of the desk: the open production as a tree, the metadata of the chosen asset, and how the user's
// work stands to what the team shares.
#pragma once

#include <functional>

#include <QtCore/QPointer>
#include <QtCore/QSortFilterProxyModel>
#include <QtGui/QAction>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QMainWindow>
#include <QtWidgets/QStackedWidget>
#include <QtWidgets/QTreeView>

#include "AssetTreeModel.h"
#include "Connection.h"
#include "MessagePage.h"
#include "MetadataPane.h"
#include "StatusStrip.h"
#include "Workspace.h"

namespace Desk {

/// What the command line says; empty where it is silent.
struct StartOptions {
    Connection::Login login;
    /// By identifier or name.
    QString production;
};

class MainWindow : public QMainWindow {
    Q_OBJECT
public:
    explicit MainWindow(const StartOptions& inOptions);
    ~MainWindow() override;

    /// Signs in with what is stored, or asks.
    void Start();

protected:
    void closeEvent(QCloseEvent* inEvent) override;

private:
    using Action = std::function<void()>;

    void MakeActions();
    QAction* MakeAction(const char* inName, const char* inIcon, const char* inText,
                        const QKeySequence& inKeys, const Action& inAction);
    void MakeMenus();
    void MakePages();
    void ConnectSignals();
    void UpdateActions();
    void ShowMessage(const char* inIcon, const QString& inTitle, const QString& inText,
                     const std::vector<MessagePage::Button>& inButtons);
    void ShowRunning(const QString& inTitle, const Action& inCancel);

    void AskForLogin();
    void OnSignInFailed(const QString& inReason);
    void OnSignedIn();
    void OnSignedOut();
    void AskForProduction();
    void OpenProduction(const QString& inWhich);
    void ShowNoProduction(const QString& inReason);
    void OnOpened();
    void OnBusy(const QString& inWhat);
    void CloseProduction();

    void OnAssetsChanged();
    void OnCurrentChanged();
    void ShowInPane(const QModelIndex& inIndex);
    void Filter(const QString& inText);
    void SelectQuietly(const ZOCL::ImmutableString& inAssetID);
    void ShowHistory();
    /// Asks what shall become of edits that are not saved, and goes on unless the user would rather stay.
    void WhenNothingIsUnsaved(const Action& inThen);
    void AskAboutEdits(const Action& inThen);
    void OnSaved(bool inSucceeded);

    const StartOptions mOptions;
    Connection mConnection;
    Workspace mWorkspace;
    AssetTreeModel mAssets;
    QSortFilterProxyModel mFilter;

    QStackedWidget* mPages;
    MessagePage* mMessage;
    QWidget* mProductionPage = nullptr;
    QLineEdit* mSearch;
    QTreeView* mTree;
    MetadataPane* mPane;
    StatusStrip* mStatus;
    QAction *mShare, *mLatest, *mResolve, *mHistory, *mRefresh, *mOpen, *mSave, *mRevert, *mSignOut;
    QPointer<QDialog> mSignIn;
    QPointer<QDialog> mHistoryWindow;
    Action mAfterSave;
    QString mWanted;
    /// The current row moves by itself, and not by the user.
    bool mIsMoving = false;
    bool mMayClose = false;
};

}  // namespace Desk
