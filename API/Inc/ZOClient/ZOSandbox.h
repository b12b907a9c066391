// A host's view of the one production that it has open: its user's session, compared with what is shared.
#pragma once

#include <vector>

#include "RFL/Messaging.h"
#include "ZOClient/Export.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCEditingSession.h"

namespace ZOCL {

/// Posted to the library's station when the state of a sandbox has changed. Who gets it asks the getters of
/// the current sandbox.
struct ZOCL_EXPORT ZOSandboxStateChangedMessage : RFL::MessageImpl<ZOSandboxStateChangedMessage> {
    /// The session of the sandbox.
    ImmutableString url;
};

/// Posted to the library's station: the host shall close the production, as its user has decided.
struct ZOCL_EXPORT ZOCloseProductionMessage : RFL::MessageImpl<ZOCloseProductionMessage> {};

/// Whether there is something to share, whether something new is shared, whether both are in conflict, and
/// whether all this is certain.
///
///     in sync, not dirty: nothing to do         not in sync, not dirty: Get Latest is offered
///     in sync, dirty: Share at once             not in sync, dirty: Get Latest first, with conflicts Resolve
///
/// While a flag is uncertain, the row is not final and the host must not decide on it. It holds no timer: the
/// host says when the state is to be looked at anew, and only such an update makes it certain. A failed
/// update leaves everything as it was.
///
/// It belongs to the data server that is logged in when it is made; without one, or without a session, every
/// getter is false and every setter does nothing. It must be owned by a shared pointer. Threads: any.
class ZOCL_EXPORT ZOSandbox : public enable_shared_from_this<ZOSandbox> {
public:
    /// Blocks when the session is not loaded yet.
    explicit ZOSandbox(const ImmutableString& inSessionURL);
    virtual ~ZOSandbox();
    ZOSandbox(const ZOSandbox&) = delete;
    ZOSandbox& operator=(const ZOSandbox&) = delete;

    InterfaceRef<IZOCEditingSession> GetEditingSession() const;
    /// Of the session; empty when there is none.
    ImmutableString GetHTTPURL() const;

    /// The session is based on the newest shared commit.
    bool IsInSync() const;
    /// The session differs from what is shared.
    bool IsDirty() const;
    bool IsDirtyStateUncertain() const;
    bool IsSyncStateUncertain() const;
    /// A conflict resolution has begun and not ended.
    bool IsResolveInProgress() const;
    bool HasConflicts() const;

    /// For whoever has just changed the session or the production. A change is posted.
    void SetDirtyStateUncertain(bool inIsUncertain);
    void SetSyncStateUncertain(bool inIsUncertain);
    /// Nothing is posted.
    void SetResolveIsInProgress(bool inIsInProgress);
    void SetHasConflicts(bool inHasConflicts);

    /// Looks at session and production anew and posts ZOSandboxStateChangedMessage when the outcome is
    /// another, or was uncertain. Of several updates under way, none replaces the outcome of a later one.
    /// False: nothing was started.
    bool UpdateSandboxStateAsync();

    /// Looks whether another client has a transaction open on the session, of a type that counts. If so, a
    /// window tells the user; ZOCloseProductionMessage is posted when the user would rather close the
    /// production. One check at a time in the process: a second one is ignored while the first goes on.
    void CheckForPendingTransactionConflicts(const std::vector<ImmutableString>& inTypesToIgnore) const;

private:
    using Flag = bool ZOSandbox::*;

    bool IsAlive() const noexcept { return mServer && mSession; }
    bool Get(Flag inFlag, const char* inLabel) const;
    /// Whether the flag was another.
    bool Set(Flag inFlag, bool inValue, const char* inLabel);
    void PostStateChanged() const;
    void OnSessionRefreshed(const shared_ptr<ostnet::Response>& inResponse);
    void StartStateUpdate();
    void OnResourcesRefreshed(int inResult, const InterfaceRef<IZOCDifferences>& inDifferences,
                              std::uint64_t inUpdate);
    struct State {
        bool isDirty, isInSync, hasConflicts;
    };
    /// Whether the host is to be told.
    bool TakeState(const State& inState, std::uint64_t inUpdate);
    InterfaceRef<IZOCProduction> GetParent() const;

    const InterfaceRef<IZOCDataServer> mServer;
    const InterfaceRef<IZOCEditingSession> mSession;
    // Guarded by IZOCDataServer::GetLock().
    InterfaceRef<IZOCProduction> mParentProduction;
    bool mIsInSync = false;
    bool mSyncStateUncertain = true;
    bool mResolveInProgress = false;
    bool mIsDirty = true;
    bool mDirtyStateUncertain = true;
    bool mFirstUpdatePending = true;
    bool mHasConflicts = false;
    /// Updates are numbered in the order in which they begin to look.
    std::uint64_t mLastStartedUpdate = 0;
    std::uint64_t mLastTakenUpdate = 0;
};

/// The sandbox of the production that the host has open, null when there is none. Threads: any.
ZOCL_EXPORT shared_ptr<ZOSandbox> GetCurrentZOSandbox();
ZOCL_EXPORT void SetCurrentZOSandbox(const shared_ptr<ZOSandbox>& inSandbox);
/// UpdateSandboxStateAsync of the current sandbox; false when there is none.
ZOCL_EXPORT bool UpdateCurrentZOSandboxAsync();

}  // namespace ZOCL
