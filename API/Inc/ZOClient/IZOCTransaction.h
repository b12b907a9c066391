// Transactions: the short-lived copies of a session through which everything is written.
#pragma once

#include <string>
#include <vector>

#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCAsset.h"
#include "ZOClient/IZOCProduction.h"

namespace ZOCL {

class CompoundAsyncOperation;
class IZOCBulkTransaction;

/// "edit": changes by hand, for which others wait.
ZOCL_EXPORT extern const ImmutableString kTransactionType_Edit;
/// "ingest": only adds, and never blocks others.
ZOCL_EXPORT extern const ImmutableString kTransactionType_Ingest;
/// The types that nobody has to wait for: kTransactionType_Ingest.
ZOCL_EXPORT extern const std::vector<ImmutableString> kNoConflictTransactionTypes;

/// A transaction on an editing session: what is added and changed in it becomes part of the session with
/// Commit, or is dropped with Rollback. Until one of them it counts as pending, and others wait for it.
///
/// The object is an IZOCProduction as well (IsTransaction tells that it can be committed): its assets and
/// enclosures are read, created, changed and deleted as those of any production, and answer
/// IZOCWritableAsset, IZOCWritableEnclosure and IZOCWritableServerResource. Every object of the class answers
/// this interface; on one that is no transaction the operations find no link and return false.
///
/// Threads: any; completions on workers. A true result means exactly one completion, false none.
class ZOCL_EXPORT IZOCTransaction : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635472616e73ull, 0x616374696f6e0001ull};

    /// Posts a new asset; the completion's resource answers IZOCAsset and IZOCWritableAsset. The asset is
    /// found in this transaction's list from then on, also before the list is loaded anew.
    virtual bool CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const AssetBaseProperties& inProperties) = 0;
    /// The same for a sub-clip.
    virtual bool CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const AssetBaseProperties& inProperties, const SubClip& inSubClip) = 0;
    virtual ImmutableString GetAssetFactoryURL() = 0;
    /// Asks for the latest state of the transaction and of its asset list; the completion's resource is the
    /// transaction. The result is the first failure; "not modified" is none.
    virtual bool Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// Writes an enclosure of the transaction itself: over the one of this name, or as a new one. The bytes
    /// go out as they are (text is UTF-8), with the content type. The completion's resource answers
    /// IZOCEnclosure.
    virtual bool WriteEnclosure(const ImmutableString& inPath, const std::string& inText,
                                const Guid& inRequestID, const RequestCompletion& inCompletion,
                                const ImmutableString& inContentType) = 0;
    /// Makes the changes part of the session. The message and who made the transaction become the title of
    /// the session's commit. The completion comes after the session object has been refreshed; its resource
    /// is the session, and the result that of the commit alone: kResultHTTPPreconditionFailed when the
    /// session has moved on since the transaction was opened. After a failure the transaction stays pending.
    virtual bool Commit(const Guid& inRequestID, const RequestCompletion& inCompletion,
                        const UString& inMessage) = 0;
    /// Drops the changes; the transaction is gone then.
    virtual bool Rollback(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    /// Gathers many changes of this transaction and sends them as a few requests, which together count as one
    /// request of the parent operation (IZOCBulkTransaction.h). Null: make the changes one by one. It is null
    /// on an object that is no transaction, when the server does not take changes in bulk, when the switch
    /// "ZOClient.EnableBulkAPI" is off, when the parent operation is null or has failed, and as long as an
    /// earlier one of this object has not ended.
    virtual InterfaceRef<IZOCBulkTransaction> CreateBulkTransaction(
        const shared_ptr<CompoundAsyncOperation>& inParentOperation) = 0;
};

/// The open transactions of a session. Loaded as any resource: the object answers IZOCServerResource.
class ZOCL_EXPORT IZOCTransactionList : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f635472616e73ull, 0x61634c6973740001ull};

    struct Entry {
        ImmutableString identifier;
        ImmutableString sessionIdentifier;
        ImmutableString owner;
        ImmutableString baseCommit;
        /// Not-a-date-time when the server gave none. In UTC.
        ptime created;
        ptime modified;
        ClientMetadata metadata;
        ImmutableString url;
    };

    /// Of the loaded body; empty before.
    virtual std::vector<Entry> GetAllItems() = 0;
    /// Those of this session whose type is not among the given ones.
    virtual std::vector<Entry> GetPendingItems(const std::vector<ImmutableString>& inIgnoredTypes) = 0;
    /// Null when the server gave none.
    virtual ImmutableString GetTransactionURL(const Entry& inEntry) = 0;
};

}  // namespace ZOCL
