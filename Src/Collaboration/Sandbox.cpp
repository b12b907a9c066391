// The state of a sandbox and how it is found out: the session is refreshed, then its outgoing differences and
// the shared production are loaded side by side, and what they say is taken over at once.
#include "Frame/Station.h"
#include "ostcore/threads/Executor.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

InterfaceRef<IZOCEditingSession> FindSession(const InterfaceRef<IZOCDataServer>& inServer,
                                             const ImmutableString& inSessionURL) {
    if (!inServer || inSessionURL.empty()) {
        return nullptr;
    }
    return RFL::QueryInterface<IZOCEditingSession>(inServer->GetProductionFromURL(inSessionURL));
}

bool IsLoaded(const InterfaceRef<IZOCServerResource>& inResource) {
    return inResource && inResource->IsLoaded();
}

/// The current sandbox, under a lock of its own; lives as long as the process.
struct Current {
    ostcore::threads::RecursiveMutex mutex;
    shared_ptr<ZOSandbox> sandbox ZO_GUARDED_BY(mutex);
};
Current& GetCurrent() {
    static Current& current = *new Current;
    return current;
}

}  // namespace

ZOSandbox::ZOSandbox(const ImmutableString& inSessionURL)
    : mServer(IZOCDataServer::GetLoggedInServerRef()), mSession(FindSession(mServer, inSessionURL)) {}

ZOSandbox::~ZOSandbox() = default;

InterfaceRef<IZOCEditingSession> ZOSandbox::GetEditingSession() const {
    return mSession;
}

ImmutableString ZOSandbox::GetHTTPURL() const {
    const auto resource = RFL::QueryInterface<IZOCServerResource>(mSession);
    return resource ? resource->GetHTTPURL() : ImmutableString();
}

bool ZOSandbox::Get(Flag inFlag, const char* inLabel) const {
    if (!IsAlive()) {
        return false;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    return this->*inFlag;
}

bool ZOSandbox::Set(Flag inFlag, bool inValue, const char* inLabel) {
    if (!IsAlive()) {
        return false;
    }
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    return std::exchange(this->*inFlag, inValue) != inValue;
}

bool ZOSandbox::IsInSync() const {
    return Get(&ZOSandbox::mIsInSync, "ZOSandbox::IsInSync");
}
bool ZOSandbox::IsDirty() const {
    return Get(&ZOSandbox::mIsDirty, "ZOSandbox::IsDirty");
}
bool ZOSandbox::IsDirtyStateUncertain() const {
    return Get(&ZOSandbox::mDirtyStateUncertain, "ZOSandbox::IsDirtyStateUncertain");
}
bool ZOSandbox::IsSyncStateUncertain() const {
    return Get(&ZOSandbox::mSyncStateUncertain, "ZOSandbox::IsSyncStateUncertain");
}
bool ZOSandbox::IsResolveInProgress() const {
    return Get(&ZOSandbox::mResolveInProgress, "ZOSandbox::IsResolveInProgress");
}
bool ZOSandbox::HasConflicts() const {
    return Get(&ZOSandbox::mHasConflicts, "ZOSandbox::HasConflicts");
}

void ZOSandbox::SetDirtyStateUncertain(bool inIsUncertain) {
    if (Set(&ZOSandbox::mDirtyStateUncertain, inIsUncertain, "ZOSandbox::SetDirtyStateUncertain")) {
        PostStateChanged();
    }
}
void ZOSandbox::SetSyncStateUncertain(bool inIsUncertain) {
    if (Set(&ZOSandbox::mSyncStateUncertain, inIsUncertain, "ZOSandbox::SetSyncStateUncertain")) {
        PostStateChanged();
    }
}
void ZOSandbox::SetResolveIsInProgress(bool inIsInProgress) {
    Set(&ZOSandbox::mResolveInProgress, inIsInProgress, "ZOSandbox::SetResolveIsInProgress");
}
void ZOSandbox::SetHasConflicts(bool inHasConflicts) {
    Set(&ZOSandbox::mHasConflicts, inHasConflicts, "ZOSandbox::SetHasConflicts");
}

void ZOSandbox::PostStateChanged() const {
    ZOSandboxStateChangedMessage message;
    message.url = GetHTTPURL();
    PostLibraryMessage(message);
}

bool ZOSandbox::UpdateSandboxStateAsync() {
    const auto session = RFL::QueryInterface<IZOCServerResource>(mSession);
    if (!session) {
        return false;
    }
    // Weak from the first step on, so that a sandbox that is closed meanwhile never tells of itself.
    const weak_ptr<ZOSandbox> weak = shared_from_this();
    const auto onRefreshed = [weak](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                                    const shared_ptr<ostnet::Response>& inResponse) {
        if (const shared_ptr<ZOSandbox> self = weak.lock()) {
            self->OnSessionRefreshed(inResponse);
        }
    };
    return session->Refresh(Guid::CreateUnique(), onRefreshed);
}

void ZOSandbox::OnSessionRefreshed(const shared_ptr<ostnet::Response>& inResponse) {
    if (inResponse && !inResponse->IsSuccess() && inResponse->status != 304) {
        return;
    }
    const weak_ptr<ZOSandbox> weak = shared_from_this();
    ostcore::threads::GetIOBoundExecutor()->Post([weak] {
        if (const shared_ptr<ZOSandbox> self = weak.lock()) {
            self->StartStateUpdate();
        }
    });
}

InterfaceRef<IZOCProduction> ZOSandbox::GetParent() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOSandbox::GetParent");
    return mParentProduction;
}

void ZOSandbox::StartStateUpdate() {
    const InterfaceRef<IZOCDifferences> differences = mSession->GetOutgoingChanges();
    const InterfaceRef<IZOCProduction> parent = mSession->GetParentProduction();
    std::uint64_t update = 0;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOSandbox::StartStateUpdate()");
        if (!mParentProduction) {
            mParentProduction = parent;
        }
        update = ++mLastStartedUpdate;
    }
    const auto differencesResource = RFL::QueryInterface<IZOCServerResource>(differences);
    const auto parentResource = RFL::QueryInterface<IZOCServerResource>(GetParent());
    if (!differencesResource || !parentResource) {
        return;
    }
    const weak_ptr<ZOSandbox> weak = shared_from_this();
    const auto operation = CompoundAsyncOperation::Create(
        [weak, differences, update](int inResult) {
            if (const shared_ptr<ZOSandbox> self = weak.lock()) {
                self->OnResourcesRefreshed(inResult, differences, update);
            }
        },
        mServer, false);
    // The first load starts from within the second request, so that the operation cannot end between the two.
    const CompoundAsyncOperation::WorkFunction loadDifferences =
        [differencesResource](const Guid& inID, const RequestCompletion& inCompletion) {
            return differencesResource->Load(inID, inCompletion, true);
        };
    const CompoundAsyncOperation::WorkFunction loadBoth = [=](const Guid& inID,
                                                              const RequestCompletion& inCompletion) {
        operation->Initiate(loadDifferences, nullptr);
        return parentResource->Refresh(inID, inCompletion);
    };
    constexpr bool kForgiveNotModified = true;
    operation->Initiate(loadBoth, nullptr, CompoundAsyncOperation::TryToCancelFunction(),
                        kForgiveNotModified);
}

void ZOSandbox::OnResourcesRefreshed(int inResult, const InterfaceRef<IZOCDifferences>& inDifferences,
                                     std::uint64_t inUpdate) {
    const InterfaceRef<IZOCProduction> parent = GetParent();
    if (inResult < 0 || !IsLoaded(RFL::QueryInterface<IZOCServerResource>(inDifferences)) ||
        !IsLoaded(RFL::QueryInterface<IZOCServerResource>(parent))) {
        return;
    }
    State state;
    state.hasConflicts = inDifferences->HasConflicts();
    state.isDirty = inDifferences->HasDifferences();
    state.isInSync = inDifferences->GetBaseCommitID() == parent->GetLoadedRevision();
    if (TakeState(state, inUpdate)) {
        PostStateChanged();
    }
}

bool ZOSandbox::TakeState(const State& inState, std::uint64_t inUpdate) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::ZOSandbox::OnResourcesRefreshed");
    if (inUpdate < mLastTakenUpdate) {
        return false;
    }
    mLastTakenUpdate = inUpdate;
    SetHasConflicts(inState.hasConflicts);
    bool hasDirtyChanged = std::exchange(mIsDirty, inState.isDirty) != inState.isDirty;
    hasDirtyChanged = std::exchange(mFirstUpdatePending, false) || hasDirtyChanged;
    hasDirtyChanged = std::exchange(mDirtyStateUncertain, false) || hasDirtyChanged;
    bool hasSyncChanged = std::exchange(mIsInSync, inState.isInSync) != inState.isInSync;
    hasSyncChanged = std::exchange(mSyncStateUncertain, false) || hasSyncChanged;
    return hasDirtyChanged || hasSyncChanged;
}

shared_ptr<ZOSandbox> GetCurrentZOSandbox() {
    Current& current = GetCurrent();
    ScopedLock lock(current.mutex, "ZOCL::GetCurrentZOSandbox");
    return current.sandbox;
}

void SetCurrentZOSandbox(const shared_ptr<ZOSandbox>& inSandbox) {
    Current& current = GetCurrent();
    shared_ptr<ZOSandbox> former = inSandbox;
    ScopedLock lock(current.mutex, "ZOCL::SetCurrentZOSandbox");
    former.swap(current.sandbox);
    lock.Unlock();
}

bool UpdateCurrentZOSandboxAsync() {
    const shared_ptr<ZOSandbox> sandbox = GetCurrentZOSandbox();
    return sandbox && sandbox->UpdateSandboxStateAsync();
}

}  // namespace ZOCL
