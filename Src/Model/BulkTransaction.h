// Gathers changes to a transaction and sends them in bulk: the work behind IZOCBulkTransaction.
#pragma once

#include <set>

#include "Model/BulkSender.h"
#include "Model/BulkState.h"
#include "Model/OperationHold.h"

namespace ZOCL {

/// Three phases, create, delete and edit, whose requests are nested in seven operations, each a sub-operation
/// of the one before:
///
///     completely finished > editing finished > ready to edit > deletion finished > ready to delete
///                         > creation finished > ready to create
///
/// An operation ends after what is nested in it, so that the innermost ends first and the order on the wire
/// is fixed. The gathering of a kind holds its ready operation. When that ends, the phase's requests are
/// started on the operation around it, which is held until then. A failure goes outwards through all of them,
/// and holds let go of what has failed, so that nobody waits for a host that has nothing more to finish.
///
/// Concurrency: everything is guarded by the lock of the connection layer, which is held for short changes of
/// state alone. The chain is built in one breath under it, which starts no request and calls no function of a
/// host; holds are let go, requests started and completions called outside. The functions in the chain hold a
/// reference to this object until everything has ended.
class BulkTransaction : public enable_shared_from_this<BulkTransaction> {
public:
    using ResultCompletion = IZOCBulkTransaction::ResultCompletion;
    using AssetCompletion = IZOCBulkTransaction::AssetCompletion;

    /// What a transaction gives.
    struct Setup {
        InterfaceRef<IZOCDataServer> server;
        ImmutableString createLink;
        /// May be null: nothing is deleted then.
        ImmutableString deleteLink;
        ImmutableString editLink;
        /// The template of an asset's URL.
        ImmutableString assetTemplate;
        InterfaceRef<IZOCAssetList> assets;
        InterfaceRef<IZOCEnclosures> enclosures;
    };

    explicit BulkTransaction(const Setup& inSetup) : mSetup(inSetup) {}

    /// Builds the chain; false when the setup is not complete or the parent operation has failed. Until then
    /// the object does not count as finished.
    bool Init(const shared_ptr<CompoundAsyncOperation>& inParent);
    /// The host has let go. Cancels everything unless all three kinds were finished.
    void Abandon();

    bool CreateNewAsset(const AssetCompletion& inCompletion, const BulkNewAsset& inAsset);
    void AddEnclosureToNewAsset(std::size_t inIndex, const ImmutableString& inName,
                                const BulkPayload& inData);
    shared_ptr<CompoundAsyncOperation> GetCreateOperation();
    void FinishedCreatingNewAssets();
    void NotifyOfRestoredAsset(const InterfaceRef<IZOCAsset>& inAsset);
    bool DeleteAsset(const ResultCompletion& inCompletion, const ImmutableString& inAssetID);
    void FinishedDeletingAssets();
    bool SetAssetProperties(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                            const optional<AssetBaseProperties>& inProperties,
                            const optional<SubClip>& inSubClip,
                            const optional<ImmutableString>& inMediaLocator);
    bool SetAssetEnclosure(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                           const ImmutableString& inName, const BulkPayload& inData);
    void SetAssetRendition(const ImmutableString& inAssetID, const ImmutableString& inContentType,
                           const BulkPayload& inData);
    void SetProductionEnclosure(const ImmutableString& inName, const BulkPayload& inData, bool inCreateOnly);
    shared_ptr<CompoundAsyncOperation> GetEditOperation();
    void FinishedEditing();
    bool IsCompletelyFinished();

    /// One that the source asset has; one that the host gave under this name stays.
    void AddSourceEnclosure(std::size_t inIndex, const ImmutableString& inName, const BulkPayload& inData);
    const InterfaceRef<IZOCDataServer>& GetServer() const { return mSetup.server; }

private:
    using OperationRef = shared_ptr<CompoundAsyncOperation>;
    struct Phase {
        OperationRef operation;
        shared_ptr<OperationHold> hold;
    };
    /// The lists of an asset that was edited, as they were asked for.
    struct AssetLists {
        InterfaceRef<IZOCAsset> asset;
        InterfaceRef<IZOCEnclosures> enclosures;
        InterfaceRef<IZOCRenditions> renditions;
    };
    struct Edits {
        BulkAssetEdits assets;
        BulkEnclosureEdits production;
        ByText<AssetLists> lists;
    };

    void BuildChain(const OperationRef& inParent);
    void ReleaseHold(Phase BulkTransaction::*inPhase, const char* inLabel);

    // --- The phases (BulkPhases.cpp).

    int ReadyToCreate(int inResult);
    int ReadyToDelete(int inResult);
    int ReadyToEdit(int inResult);
    int CompletelyFinished(int inResult);
    void SendCreations(const OperationRef& inOperation, std::vector<BulkAssetCreation> inCreations);
    void SendDeletions(const OperationRef& inOperation, std::vector<BulkAssetDeletion> inDeletions);
    void SendEdits(const OperationRef& inOperation, Edits& ioEdits);
    void SendNewItems(const OperationRef& inOperation, std::vector<BulkAssetItem> inAssetItems,
                      std::vector<BulkEnclosureItem> inEnclosures);
    void SendChanges(const OperationRef& inOperation, std::vector<BulkAssetItem> inAssetEdits,
                     std::vector<BulkEnclosureItem> inEnclosures);
    void Send(const OperationRef& inOperation, const ImmutableString& inURL, BulkSender::Verb inVerb,
              const shared_ptr<BulkPending>& inFirst, const shared_ptr<BulkPending>& inSecond);
    BulkWritten WriteEdit(BulkForm& ioForm, const BulkAssetItem& inItem);

    // --- The image of the server (BulkWaits.cpp).

    void WaitForAssetList();
    void OnAssetListLoaded();
    void WaitForEnclosures(const ImmutableString& inAssetID);
    void WaitForRenditions(const ImmutableString& inAssetID);
    InterfaceRef<IZOCAsset> FindAsset(const ImmutableString& inAssetID);
    void TakeStates(const Edits& inEdits);
    void UpdateAssetStateForRestoredAsset(const AssetLists& inRestored);

    // --- The ends of requests (BulkCompletions.cpp). Each calls the completions of its items.

    void OnAssetsCreated(int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetCreation>& ioItems);
    void OnItemsCreated(int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetItem>& ioItems);
    void OnAssetsEdited(int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetItem>& ioItems);
    void OnProductionEnclosuresCreated(int inResult, const BulkAnswer& inAnswer,
                                       std::vector<BulkEnclosureItem>& ioItems);
    void OnProductionEnclosuresEdited(int inResult, const BulkAnswer& inAnswer,
                                      std::vector<BulkEnclosureItem>& ioItems);
    InterfaceRef<IZOCAsset> MakeCreatedAsset(const ImmutableString& inAssetID,
                                             const dto::AssetProperties& inProperties);
    void KeepPayloads(const BulkKnownPayloads& inPayloads);

    const Setup mSetup;

    bool mHasEnded ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    Phase mCompletelyFinished ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mEditingFinished ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mReadyToEdit ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mDeletionFinished ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mReadyToDelete ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mCreationFinished ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Phase mReadyToCreate ZO_GUARDED_BY(IZOCDataServer::GetLock());

    std::vector<BulkAssetCreation> mAssetCreations ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::vector<BulkAssetDeletion> mAssetDeletions ZO_GUARDED_BY(IZOCDataServer::GetLock());
    Edits mEdits ZO_GUARDED_BY(IZOCDataServer::GetLock());
    BulkState mState ZO_GUARDED_BY(IZOCDataServer::GetLock());

    bool mAssetListIsLoaded ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
    /// Assets whose lists are asked for as soon as they can be found.
    std::set<ImmutableString> mEnclosuresWanted ZO_GUARDED_BY(IZOCDataServer::GetLock());
    std::set<ImmutableString> mRenditionsWanted ZO_GUARDED_BY(IZOCDataServer::GetLock());
    bool mWaitsForProductionEnclosures ZO_GUARDED_BY(IZOCDataServer::GetLock()) = false;
};

/// Waits for a resource on an operation. What is null or loaded needs no wait; a load whose body is not
/// accepted fails the operation.
void WaitForLoad(const shared_ptr<CompoundAsyncOperation>& inOperation,
                 const InterfaceRef<IZOCServerResource>& inResource);
/// Copies the enclosures of an asset of some production into a new one, on the create operation. Ends
/// silently where something cannot be had (BulkSourceAsset.cpp).
void CopySourceEnclosures(const shared_ptr<BulkTransaction>& inBulk,
                          const shared_ptr<CompoundAsyncOperation>& inOperation, std::size_t inIndex,
                          const SourceAssetReference& inSource);

}  // namespace ZOCL
