// Editing sessions: the private lines on which users work before they share.
#pragma once

#include <map>
#include <vector>

#include "ZOClient/IZOCDifferences.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/IZOCTransaction.h"

namespace ZOCL {

/// How Pull treats what both sides changed.
enum MergeStrategy : int {
    kMergeStrategy_None = 0,
    kMergeStrategy_Yours = 1,
    kMergeStrategy_Theirs = 2,
    kMergeStrategy_Interactive = 3,
    kMergeStrategy_Safe = 4
};

/// How Push treats a session that is behind its production.
enum ResolveStrategy : int { kResolveStrategy_None = 0, kResolveStrategy_Auto = 1 };

/// Further texts for the metadata of a transaction. A name that the library itself writes is left out.
using ExtraTransactionMetadata = std::map<ImmutableString, ImmutableString>;

/// A user's editing session on a production. It holds the work that is not shared yet. Writes go through
/// transactions; Push makes the work a commit of the production, Pull brings the production's commits in.
///
/// The object is an IZOCProduction as well (IsEditingSession tells the role), and answers IZOCServerResource
/// and, when it is writable, IZOCWritableServerResource, whose Delete discards the session with everything
/// that is not shared and with its transactions. Every object of the class answers this interface; on one
/// that is no session the operations find no link and return false or null.
///
/// Threads: any; completions on workers with no lock held. A true result means exactly one completion, false
/// none.
class ZOCL_EXPORT IZOCEditingSession : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634564697453ull, 0x657373696f6e0001ull};

    /// Tells how something that is no single request ended.
    using ResultCompletion = function<void(int inResult)>;

    /// Opens a transaction at the commit at which this object was loaded. The completion's resource answers
    /// IZOCTransaction and is loaded. kResultHTTPPreconditionFailed: the session has moved on since then;
    /// refresh it and try again. An ingest may be based on any commit.
    virtual bool CreateTransaction(
        const Guid& inRequestID, const RequestCompletion& inCompletion,
        const ImmutableString& inTransactionType,
        const optional<ExtraTransactionMetadata>& inExtraMetadata = boost::none) = 0;
    /// As CreateTransaction, then StoreProductionChangesInTransaction of the given production. The
    /// completion's resource is the transaction, to be committed or rolled back by the caller; when storing
    /// failed it is rolled back already.
    virtual bool CreateTransactionAndStoreChanges(const Guid& inRequestID,
                                                  const RequestCompletion& inCompletion,
                                                  const InterfaceRef<IZOCProduction>& inProduction,
                                                  const UString& inTransactionType) = 0;
    /// The session's open transactions, not loaded by this call; the same object each time. Null without the
    /// link.
    virtual InterfaceRef<IZOCTransactionList> GetOrCreateTransactionList() = 0;
    /// Waits until no other client has a transaction open on this session, and then completes with 0.
    /// Transactions that this application left on this machine are rolled back first, whatever run they are
    /// of. For the rest a window tells the user who is in the way; closing it, or a list that cannot be
    /// loaded, gives a failure. A load that the user cancels completes with that cancel result.
    /// Main thread: it blocks while the list loads under a progress window, and may complete on its stack.
    virtual void WaitForPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                            const ResultCompletion& inCompletion) = 0;
    /// The same from any thread: the list is loaded without a window.
    virtual bool GetPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                        const ResultCompletion& inCompletion) = 0;
    /// The production that this session belongs to, not loaded by this call; null when it is not known.
    virtual InterfaceRef<IZOCProduction> GetParentProduction() = 0;
    virtual ImmutableString GetParentProductionIdentifier() = 0;
    /// Shares the session. An empty message or commit is not sent. kResultHTTPConflict: the production has a
    /// newer commit, or conflicts remain. kResultHTTPPreconditionFailed: the session is no longer at
    /// inCommitId. The strategy is one of ResolveStrategy. The session object stays as it was loaded; the
    /// response holds the new state.
    virtual bool Push(const Guid& inRequestID, const RequestCompletion& inCompletion,
                      const UString& inCommitMessage, int inResolveStrategy, const UString& inCommitId) = 0;
    /// Merges the production's commit (the newest for an empty inCommitId) into the session. The strategy is
    /// one of MergeStrategy. Results as Push.
    virtual bool Pull(const Guid& inRequestID, const RequestCompletion& inCompletion, int inMergeStrategy,
                      const UString& inCommitId) = 0;
    /// Asks for the latest state of the session.
    virtual bool Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// New, unloaded; null without the link.
    virtual InterfaceRef<IZOCDifferences> GetOutgoingChanges() = 0;
    virtual InterfaceRef<IZOCDifferences> GetIncomingChanges() = 0;
    /// Keeps the XMP packet of an item, in UTF-8, until it is stored with the session's other changes. The
    /// key is the identifier of the item's media locator. A dirty packet is a change of this client, another
    /// one a copy of what the server holds; a copy never takes the place of a change, else the newer packet
    /// counts. Nothing happens on an object that is no session, and for an empty key.
    virtual void CacheXMP(const ImmutableString& inKey, const std::string& inPacket, bool inDirty) = 0;
    /// True when there is something to store: cached packets, or a name or description that was set.
    virtual bool HasCachedXMPChanges() = 0;
    /// Hands all cached packets to the bulk transaction as enclosures of the production: changes over what
    /// is there, copies only where nothing is. They stay cached: clear the cache when they have arrived.
    virtual void StoreCachedXMPChangesInBulkTransaction(const InterfaceRef<IZOCBulkTransaction>& inBulk) = 0;
    /// Forgets all cached packets. A name or description that was set stays to be stored.
    virtual void ClearXMPCache() = 0;
    /// Writes the cached packets, and the name and description that were set on this object, into the
    /// transaction: changed packets over the XMP enclosures that are there, copies only where nothing is. The
    /// cache is empty from here on. Completes with 0 when there was nothing to write; after a failure all is
    /// kept for another try, but for packets that were cached anew meanwhile.
    virtual bool StoreProductionChangesInTransaction(const InterfaceRef<IZOCTransaction>& inTransaction,
                                                     const ResultCompletion& inCompletion) = 0;
    /// The same operation as that of IZOCTransaction: null on a session that is no transaction.
    virtual InterfaceRef<IZOCBulkTransaction> CreateBulkTransaction(
        const shared_ptr<CompoundAsyncOperation>& inParentOperation) = 0;
};

/// Gets all sessions of a production that this user may see, each loaded: the list first, then every session.
/// The completion gets them in the order of the list and the first failure or 0; after a failure the list
/// holds what could be loaded. False: nothing was started. Threads: any.
ZOCL_EXPORT bool GetEditingSessionList(
    const InterfaceRef<IZOCProduction>& inProduction,
    const function<void(int inResult, const std::vector<InterfaceRef<IZOCProduction>>& inSessions)>&
        inCompletion);

}  // namespace ZOCL
