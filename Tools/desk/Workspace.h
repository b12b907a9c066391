// The production that is open: the user's session on it, its assets, its state, and the workflows on them.
#pragma once

#include <vector>

#include <QtCore/QObject>

#include "Requests.h"
#include "RFL/Messaging.h"
#include "ZOClient/Publish.h"
#include "ZOClient/ZOSandbox.h"

namespace Desk {

/// Needs a login. Main thread only; nothing here blocks.
class Workspace : public QObject {
    Q_OBJECT
public:
    struct Entry {
        QString id;
        QString name;
        QString description;
        QString owner;
    };
    using Listed = std::function<void(const QString& inError, const std::vector<Entry>&)>;

    explicit Workspace(QObject* inParent = nullptr);
    ~Workspace() override;

    /// The productions that the user may see, as they are now. A later call takes the place of this one.
    void ListProductions(const Listed& inListed);
    void CancelListing() { mListing.Cancel(); }

    /// By identifier or by name. Ends with Opened or Failed.
    void Open(const QString& inWhich);
    /// Gives up what is under way. Before the production is open, that is the opening.
    void Cancel();
    void Close();

    bool IsOpen() const { return static_cast<bool>(mSandbox) && static_cast<bool>(mAssets); }
    QString GetName() const { return mName; }
    const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& GetSession() const { return mSession; }
    ZOCL::InterfaceRef<ZOCL::IZOCProduction> GetSharedProduction() const { return mProduction; }
    const ZOCL::InterfaceRef<ZOCL::IZOCAssetList>& GetAssets() const { return mAssets; }
    /// Null when nothing is open.
    const ZOCL::shared_ptr<ZOCL::ZOSandbox>& GetSandbox() const { return mSandbox; }

    /// Asks for session, assets and state anew.
    void Refresh();
    /// To be called after a commit to the session.
    void OnSessionChanged();

    /// The three workflows, with their windows. They return when the user is done, and pump the queue of the
    /// main thread meanwhile.
    void Share();
    void GetLatest();
    void Resolve();
    bool IsInWorkflow() const { return mIsInWorkflow; }

Q_SIGNALS:
    void Opened();
    /// Opening did not work.
    void Failed(const QString& inReason);
    /// GetAssets has another content.
    void AssetsChanged();
    /// GetSandbox says something else.
    void StateChanged();
    /// What is loaded at this moment; empty when nothing is.
    void BusyChanged(const QString& inWhat);
    /// Something to tell that needs no answer.
    void Told(const QString& inText);
    /// The user has decided to close the production.
    void CloseWanted();

private:
    using Reloaded = std::function<void(int inResult)>;

    void Fail(const QString& inReason);
    void SetBusy(const QString& inWhat);
    void ListNextPage(const ZOCL::InterfaceRef<ZOCL::IZOCProductionList>& inPage,
                      std::vector<Entry> inEntries, const Listed& inListed);
    void LoadProduction(const Entry& inEntry);
    void JoinSession();
    void OnSessionJoined(const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& inSession,
                         const ZOCL::shared_ptr<ZOCL::ZOSandbox>& inSandbox);
    void Reload(const Reloaded& inReloaded);
    void EndReload(int inResult);
    void ReloadAndContinue(const ZOCL::ImmutableString& inCommit,
                           const ZOCL::Publish::Continuation& inContinue);
    void LoadAssets(const Reloaded& inReloaded);
    void WatchForChanges();
    void Watch(const ZOCL::InterfaceRef<ZOCL::IZOCProduction>& inProduction,
               void (ZOCL::ZOSandbox::*inMakeUncertain)(bool));
    void OnStateChanged();
    void ReloadIfMoved();
    ZOCL::ImmutableString GetSessionURL() const;
    ZOCL::ImmutableString GetSessionCommit() const;
    ZOCL::Publish::SyncCompletion MakeSyncCompletion();
    ZOCL::Publish::ResolveCompletion MakeResolveCompletion();
    void RunWorkflow(const std::function<void()>& inWorkflow);

    QString mName;
    ZOCL::InterfaceRef<ZOCL::IZOCProduction> mProduction;
    ZOCL::InterfaceRef<ZOCL::IZOCEditingSession> mSession;
    ZOCL::InterfaceRef<ZOCL::IZOCAssetList> mAssets;
    ZOCL::shared_ptr<ZOCL::ZOSandbox> mSandbox;
    /// The commit of the session whose assets are shown.
    ZOCL::ImmutableString mShownCommit;
    bool mIsInWorkflow = false;
    Requests mListing;
    Requests mRequests;
    Requests mReloads;
    /// Whoever waits for the reload that is under way.
    Reloaded mReloaded;
    std::vector<ZOCL::shared_ptr<ZOCL::ServerResourceChangeNotifier>> mWatched;
    RFL::Listener mListener;
};

}  // namespace Desk
