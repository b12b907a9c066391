// Settles the metadata conflicts of a session: loads the three packets of each, merges them, and commits what
// came out.
#pragma once

#include <map>
#include <utility>
#include <vector>

#include "Collaboration/RecentCommitMetadataBase.h"
#include "ZOClient/CompoundAsyncOperation.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/ZOOperationBase.h"

namespace ZOCL {

/// What a failure to load one side is traced as, in front of the URL.
struct AutoMergeTexts {
    const char* production;
    const char* enclosures;
    const char* payload;
};

/// One enclosure in conflict.
struct AutoMergeItem {
    struct Side {
        InterfaceRef<IZOCEnclosures> enclosures;
        /// Null until it is loaded.
        shared_ptr<RecycledMemory const> payload;
    };

    /// The base of the enclosure's name.
    ImmutableString assetName;
    ImmutableString enclosureName;
    /// The asset that the enclosure belongs to; empty for an enclosure of the production.
    ImmutableString assetID;
    Side base;
    Side head;
    Side session;
    /// Null unless the merge settled everything and it was written.
    shared_ptr<RecycledMemory const> merged;
};
using AutoMergeItems = std::vector<shared_ptr<AutoMergeItem>>;

/// A commit that is the common ancestor of some items, so that it is loaded once for all of them.
struct BaseCommitItem {
    InterfaceRef<IZOCProduction> production;
    AutoMergeItems items;
};

/// A failure to load or merge one item leaves that item in conflict and the others on their way.
///
/// Each side of an item is written by the completions of its own loads alone, and read when all loads have
/// ended. Everything else that changes is guarded by the data server's lock. Each end of a phase either
/// starts the next phase or finishes, so the operation ends once. A cancel stops the loads and the writes and
/// rolls the transaction back; a commit that is under way is not stopped.
class ZOAutoResolveOperation final : public ZOOperationBase, public RecentCommitMetadataBase {
public:
    /// inCommitID is the session's commit as the caller knows it.
    ZOAutoResolveOperation(const InterfaceRef<IZOCEditingSession>& inSession,
                           const ImmutableString& inCommitID);

    UString GetDescription() override;
    bool Start() override;
    void Abort() override;

    /// Whether anything is left in conflict; true until something else is known.
    bool ConflictsRemain() const;

private:
    /// Asset and enclosure, which together name an item.
    using ItemKey = std::pair<ImmutableString, ImmutableString>;
    /// One state of the production and what is wanted of it.
    struct Source {
        InterfaceRef<IZOCProduction> production;
        AutoMergeItems items;
        AutoMergeItem::Side AutoMergeItem::*side;
        const AutoMergeTexts* texts;
    };
    using Operation = shared_ptr<CompoundAsyncOperation>;

    ~ZOAutoResolveOperation() override = default;

    // --- Loading (ZOAutoResolveOperation.cpp).

    int OnSessionRefreshed(const Operation& inOperation, int inResult);
    int OnOneOfTwoLoaded(const Operation& inOperation, int inResult);
    int OnDifferencesAndEnclosuresLoaded(const Operation& inOperation);
    void MakeItems();
    void LoadProduction(const Operation& inOperation, const shared_ptr<const Source>& inSource);
    void LoadLists(const Operation& inOperation, const shared_ptr<const Source>& inSource);
    void LoadPayloads(const Operation& inOperation, const shared_ptr<const Source>& inSource,
                      bool inOfAssets);
    void LoadPayload(const Operation& inOperation, const shared_ptr<const Source>& inSource,
                     const shared_ptr<AutoMergeItem>& inItem);
    void OnLoadsEnded(int inResult);

    // --- Merging and writing (AutoResolveWriteBack.cpp).

    bool MergeItems();
    void MergeItem(AutoMergeItem& ioItem);
    void StartWriting();
    int OnTransactionCreated(const Operation& inOperation, int inResult,
                             const InterfaceRef<IZOCServerResource>& inTransaction);
    void LoadListAndWrite(const Operation& inOperation, bool inOfAssets);
    void WriteItem(const Operation& inOperation, const shared_ptr<AutoMergeItem>& inItem);
    void OnWritesEnded(int inResult);
    void Commit();
    void OnCommitted(int inResult, const shared_ptr<ostnet::Response>& inResponse);
    void ReloadDifferences(bool inMayAcceptOwn);
    /// True when it goes on.
    bool AcceptOwnSides();
    void GiveUp(int inResult);
    void EndAfterFailure(int inResult);

    void End(int inResult);
    Operation MakeOperation(const CompoundAsyncOperation::FinalCompletion& inFinal);
    void TraceFailure(const char* inText, const ImmutableString& inURL) const;
    void SetConflictsRemain(bool inRemain);
    void CountSteps(std::size_t inCount);

    const InterfaceRef<IZOCEditingSession> mSession;
    const InterfaceRef<IZOCDataServer> mServer;
    ImmutableString mCommitID ZO_GUARDED_BY(IZOCDataServer::GetLock());
    ImmutableString mHeadCommitId;
    InterfaceRef<IZOCDifferences> mOutgoingChanges;
    InterfaceRef<IZOCEnclosures> mEnclosures;
    std::map<ImmutableString, BaseCommitItem> mBaseCommitItems;
    std::map<ItemKey, shared_ptr<AutoMergeItem>> mItems;
    InterfaceRef<IZOCTransaction> mTransaction;

    Operation mOperation ZO_GUARDED_BY(IZOCDataServer::GetLock());
    int mLoadsInFlight ZO_GUARDED_BY(IZOCDataServer::GetLock()) = 0;
    bool mConflictsRemain ZO_GUARDED_BY(IZOCDataServer::GetLock()) = true;
    std::size_t mStepsDone ZO_GUARDED_BY(IZOCDataServer::GetLock()) = 0;
    std::size_t mStepsAll ZO_GUARDED_BY(IZOCDataServer::GetLock()) = 0;
    std::size_t mStepsTold ZO_GUARDED_BY(IZOCDataServer::GetLock()) = 0;
    bool mIsTellingSteps ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
};

}  // namespace ZOCL
