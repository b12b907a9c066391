// Lists, opens, watches and reloads; runs the workflows.
#include "Workspace.h"

#include "ostcore/threads/MainThread.h"
#include "Text.h"
#include "ZOClient/Library.h"

namespace Desk {
namespace {

using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;
using ZOCL::IZOCDataServer;
using ZOCL::IZOCServerResource;

constexpr std::uint32_t kMillisecondsBetweenLooks = 4000;
// A list that names itself as its next page must not keep us for ever.
constexpr std::size_t kMaximumEntries = 100000;

template <class T>
InterfaceRef<IZOCServerResource> AsResource(const InterfaceRef<T>& inObject) {
    return RFL::QueryInterface<IZOCServerResource>(inObject);
}

const Workspace::Entry* FindEntry(const std::vector<Workspace::Entry>& inEntries, const QString& inWhich) {
    for (const auto member : {&Workspace::Entry::id, &Workspace::Entry::name}) {
        for (const Workspace::Entry& entry : inEntries) {
            if (entry.*member == inWhich) {
                return &entry;
            }
        }
    }
    return nullptr;
}

}  // namespace

Workspace::Workspace(QObject* inParent) : QObject(inParent), mListener(ZOCL::GetStationID()) {
    mListener.AddHandler<ZOCL::ZOSandboxStateChangedMessage>(
        [this](const ZOCL::ZOSandboxStateChangedMessage& inMessage) {
            if (mSandbox && inMessage.url == mSandbox->GetHTTPURL()) {
                OnStateChanged();
            }
        });
    mListener.AddHandler<ZOCL::ZOCloseProductionMessage>(
        [this](const ZOCL::ZOCloseProductionMessage&) { Q_EMIT CloseWanted(); });
}

Workspace::~Workspace() {
    Close();
}

// --- Listing

void Workspace::ListProductions(const Listed& inListed) {
    mListing.Cancel();
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    ListNextPage(server ? server->GetProductionList(false) : nullptr, {}, inListed);
}

void Workspace::ListNextPage(const InterfaceRef<ZOCL::IZOCProductionList>& inPage,
                             std::vector<Entry> inEntries, const Listed& inListed) {
    mListing.Refresh(AsResource(inPage), [=, this](const Outcome& inOutcome) {
        if (!inOutcome.Succeeded()) {
            inListed(DescribeResult(inOutcome.result), {});
            return;
        }
        std::vector<Entry> entries = inEntries;
        for (const auto& item : inPage->GetAllItems()) {
            entries.push_back(
                {ToQt(item.identifier), ToQt(item.name), ToQt(item.description), ToQt(item.owner)});
        }
        const auto next = entries.size() < kMaximumEntries ? inPage->GetNextPage() : nullptr;
        if (next) {
            ListNextPage(next, entries, inListed);
        } else {
            inListed(QString(), entries);
        }
    });
}

// --- Opening and closing

void Workspace::Open(const QString& inWhich) {
    Close();
    SetBusy(Text("$$$/ZODesk/Busy/Opening=Opening \"@0\"...", {inWhich}));
    ListProductions([this, inWhich](const QString& inError, const std::vector<Entry>& inEntries) {
        const Entry* const entry = FindEntry(inEntries, inWhich);
        if (entry) {
            LoadProduction(*entry);
        } else if (!inError.isEmpty()) {
            Fail(inError);
        } else {
            Fail(Text("$$$/ZODesk/Open/NoSuch=There is no production \"@0\" that you may see.", {inWhich}));
        }
    });
}

void Workspace::LoadProduction(const Entry& inEntry) {
    mName = inEntry.name;
    SetBusy(Text("$$$/ZODesk/Busy/Opening=Opening \"@0\"...", {mName}));
    mProduction = IZOCDataServer::GetLoggedInServerRef()->GetProductionByIdAndCommitId(ToID(inEntry.id),
                                                                                       ImmutableString());
    mRequests.Refresh(AsResource(mProduction), [this](const Outcome& inOutcome) {
        if (inOutcome.Succeeded()) {
            JoinSession();
        } else {
            Fail(DescribeResult(inOutcome.result));
        }
    });
}

/// Finding or making the session blocks, and so may the making of a sandbox.
void Workspace::JoinSession() {
    struct Joined {
        InterfaceRef<ZOCL::IZOCEditingSession> session;
        ZOCL::shared_ptr<ZOCL::ZOSandbox> sandbox;
    };
    const auto joined = std::make_shared<Joined>();
    const auto server = IZOCDataServer::GetLoggedInServerRef();
    const QString user = ToQt(server->GetCredentials().username);
    const QString name = Text("$$$/ZODesk/Open/SessionName=@0 on @1", {user, mName});
    mRequests.RunBlocking(
        [joined, production = mProduction, name = FromQt(name)] {
            production->CreateEditingSession(joined->session, name, ZOCL::UString(), false);
            if (const auto resource = AsResource(joined->session)) {
                joined->sandbox = ZOCL::make_shared<ZOCL::ZOSandbox>(resource->GetHTTPURL());
            }
        },
        [this, joined] { OnSessionJoined(joined->session, joined->sandbox); });
}

void Workspace::OnSessionJoined(const InterfaceRef<ZOCL::IZOCEditingSession>& inSession,
                                const ZOCL::shared_ptr<ZOCL::ZOSandbox>& inSandbox) {
    if (!inSession) {
        Fail(
            Text("$$$/ZODesk/Open/NoSession=The server gave you no session on \"@0\" to work in. Ask its "
                 "owner for "
                 "the right to change it.",
                 {mName}));
        return;
    }
    mSession = inSession;
    mSandbox = inSandbox;
    ZOCL::SetCurrentZOSandbox(mSandbox);
    LoadAssets([this](int inResult) {
        if (inResult < 0) {
            Fail(DescribeResult(inResult));
            return;
        }
        SetBusy(QString());
        Q_EMIT Opened();
        WatchForChanges();
        ZOCL::UpdateCurrentZOSandboxAsync();
    });
}

void Workspace::Fail(const QString& inReason) {
    Close();
    Q_EMIT Failed(inReason);
}

void Workspace::Cancel() {
    mListing.Cancel();
    mRequests.Cancel();
    mReloads.Cancel();
    EndReload(ZOCL::kResultCancelled);
    SetBusy(QString());
}

void Workspace::Close() {
    Cancel();
    for (const auto& watched : mWatched) {
        watched->StopNotifications();
    }
    mWatched.clear();
    if (mSandbox) {
        ZOCL::SetCurrentZOSandbox(nullptr);
    }
    mSandbox.reset();
    mAssets.Reset();
    mSession.Reset();
    mProduction.Reset();
    mShownCommit = ImmutableString();
    mName.clear();
}

void Workspace::SetBusy(const QString& inWhat) {
    Q_EMIT BusyChanged(inWhat);
}

// --- What is shown, and what has become of it

void Workspace::LoadAssets(const Reloaded& inReloaded) {
    const auto view = RFL::QueryInterface<ZOCL::IZOCProduction>(mSession);
    const ImmutableString commit = GetSessionCommit();
    const auto assets = view->GetAssets();
    mReloads.Refresh(AsResource(assets), [=, this](const Outcome& inOutcome) {
        const bool isLoaded = inOutcome.Succeeded() && AsResource(assets)->IsLoaded();
        if (isLoaded) {
            mAssets = assets;
            mShownCommit = commit;
            Q_EMIT AssetsChanged();
        }
        inReloaded(isLoaded ? 0 : inOutcome.Succeeded() ? ZOCL::kResultFailure : inOutcome.result);
    });
}

void Workspace::Reload(const Reloaded& inReloaded) {
    mReloads.Cancel();
    EndReload(ZOCL::kResultCancelled);
    mReloaded = inReloaded;
    SetBusy(Text("$$$/ZODesk/Busy/Loading=Loading..."));
    mReloads.Refresh(AsResource(mSession), [this](const Outcome& inOutcome) {
        if (inOutcome.Succeeded()) {
            LoadAssets([this](int inResult) { EndReload(inResult); });
        } else {
            EndReload(inOutcome.result);
        }
    });
}

/// A workflow waits for this: whoever asked is told in any case.
void Workspace::EndReload(int inResult) {
    if (const Reloaded reloaded = std::exchange(mReloaded, {})) {
        SetBusy(QString());
        reloaded(inResult);
    }
    if (inResult >= 0) {
        ReloadIfMoved();
    }
}

void Workspace::Refresh() {
    if (!IsOpen()) {
        return;
    }
    mSandbox->SetDirtyStateUncertain(true);
    mSandbox->SetSyncStateUncertain(true);
    Reload([this](int inResult) {
        if (inResult < 0) {
            Q_EMIT Told(DescribeResult(inResult));
        }
        ZOCL::UpdateCurrentZOSandboxAsync();
    });
}

void Workspace::OnSessionChanged() {
    if (IsOpen()) {
        mSandbox->SetDirtyStateUncertain(true);
        ZOCL::UpdateCurrentZOSandboxAsync();
    }
}

/// Others share, and this user may work elsewhere, too.
void Workspace::WatchForChanges() {
    Watch(mProduction, &ZOCL::ZOSandbox::SetSyncStateUncertain);
    Watch(RFL::QueryInterface<ZOCL::IZOCProduction>(mSession), &ZOCL::ZOSandbox::SetDirtyStateUncertain);
}

void Workspace::Watch(const InterfaceRef<ZOCL::IZOCProduction>& inProduction,
                      void (ZOCL::ZOSandbox::*inMakeUncertain)(bool)) {
    // Called on a worker: the sandbox may be used there, windows may not.
    const ZOCL::weak_ptr<ZOCL::ZOSandbox> weak = mSandbox;
    const auto onChanged = [weak, inMakeUncertain](const InterfaceRef<IZOCServerResource>&) {
        if (const auto sandbox = weak.lock()) {
            (sandbox.get()->*inMakeUncertain)(true);
            sandbox->UpdateSandboxStateAsync();
        }
    };
    if (const auto watched =
            AsResource(inProduction)->SubscribeToChanges(onChanged, false, kMillisecondsBetweenLooks)) {
        mWatched.push_back(watched);
    }
}

void Workspace::OnStateChanged() {
    Q_EMIT StateChanged();
    ReloadIfMoved();
}

/// The session may have moved by a commit from elsewhere.
void Workspace::ReloadIfMoved() {
    if (!mIsInWorkflow && IsOpen() && mReloads.IsIdle() && GetSessionCommit() != mShownCommit) {
        Reload([](int) {});
    }
}

// --- Workflows

ImmutableString Workspace::GetSessionURL() const {
    return AsResource(mSession)->GetHTTPURL();
}

ImmutableString Workspace::GetSessionCommit() const {
    return RFL::QueryInterface<ZOCL::IZOCProduction>(mSession)->GetLoadedRevision();
}

/// The library has changed the session and waits until the host has reloaded what it shows.
void Workspace::ReloadAndContinue(const ImmutableString& inCommit,
                                  const ZOCL::Publish::Continuation& inContinue) {
    Reload([inCommit, inContinue](int inResult) { inContinue(inResult, inCommit); });
}

ZOCL::Publish::SyncCompletion Workspace::MakeSyncCompletion() {
    return [this](bool inSyncDone, bool inHasConflicts, const ImmutableString& inCommit,
                  const ZOCL::Publish::Continuation& inContinue) {
        if (!inSyncDone || !IsOpen()) {
            inContinue(ZOCL::kResultFailure, inCommit);
            return;
        }
        if (!inHasConflicts) {
            Q_EMIT Told(Text("$$$/ZODesk/Told/Latest=You have the latest changes."));
        }
        ReloadAndContinue(inCommit, inContinue);
    };
}

ZOCL::Publish::ResolveCompletion Workspace::MakeResolveCompletion() {
    return [this](bool, const InterfaceRef<ZOCL::IZOCProduction>&, const ImmutableString& inCommit,
                  const ZOCL::Publish::Continuation& inContinue) {
        if (IsOpen()) {
            ReloadAndContinue(inCommit, inContinue);
        } else {
            inContinue(ZOCL::kResultFailure, inCommit);
        }
    };
}

void Workspace::RunWorkflow(const std::function<void()>& inWorkflow) {
    if (!IsOpen() || mIsInWorkflow) {
        return;
    }
    mIsInWorkflow = true;
    Q_EMIT StateChanged();
    inWorkflow();
    mIsInWorkflow = false;
    // A forced end of the session closes the production from within a workflow.
    if (IsOpen()) {
        ZOCL::UpdateCurrentZOSandboxAsync();
        OnStateChanged();
    }
}

void Workspace::Share() {
    RunWorkflow([this] {
        const auto onShared = [this](bool inSucceeded, const ImmutableString&) {
            if (inSucceeded) {
                Q_EMIT Told(Text("$$$/ZODesk/Told/Shared=Shared. Everybody on the team has it now."));
            }
        };
        ZOCL::Publish::Publish(FromQt(mName), GetSessionURL(), GetSessionCommit(), !mSandbox->IsInSync(),
                               mSandbox->HasConflicts(), onShared, MakeSyncCompletion(),
                               MakeResolveCompletion(), {}, {}, nullptr, false, ZOCL::UString());
    });
}

void Workspace::GetLatest() {
    RunWorkflow([this] {
        ZOCL::Publish::Sync(FromQt(mName), GetSessionURL(), AsResource(mProduction)->GetHTTPURL(),
                            MakeSyncCompletion(), MakeResolveCompletion(), {}, {}, nullptr, {}, false);
    });
}

void Workspace::Resolve() {
    RunWorkflow([this] {
        ZOCL::Publish::Resolve(FromQt(mName), GetSessionURL(), AsResource(mProduction)->GetHTTPURL(),
                               MakeResolveCompletion(), {}, {}, nullptr, {});
    });
}

}  // namespace Desk
