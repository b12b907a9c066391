// A production, an editing session or a transaction: one class, whose role its links tell.
#pragma once

#include <map>

#include "dto/Production.h"
#include "JSONServerResource.h"
#include "Model/XMPCache.h"
#include "Resources/Implements.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/IZOCProduction.h"
#include "ZOClient/IZOCTransaction.h"

namespace ZOCL {

class AssetList;
class BulkTransaction;
class Enclosures;
class TransactionList;

class Production final : public Implements<JSONServerResource<dto::Production>,
                                           Readable<IZOCProduction, IZOCEditingSession, IZOCTransaction>> {
public:
    /// Answers with the object itself, for code of this floor.
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f6350726f6475ull, 0x6374696f6e000002ull};

    Production();
    ~Production() override;

    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    UString GetName() override;
    void SetName(const UString& inName) override;
    ImmutableString GetIdentifier() override;
    UString GetDescription() override;
    void SetDescription(const UString& inDescription) override;
    InterfaceRef<IZOCAssetList> GetAssets() override;
    InterfaceRef<IZOCAssetList> GetAssetsWithParent(const ImmutableString& inParentID) override;
    bool GetAssetByIdentifier(const Guid& inRequestID, const ImmutableString& inIdentifier,
                              const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCAsset> GetAssetByIdentifier(const ImmutableString& inIdentifier) override;
    ImmutableString GetAssetURL(const ImmutableString& inAssetID, const ImmutableString& inCommit) override;
    bool GetMostRecentRevision(const HistoryWalkCompletion& inCompletion) override;
    bool LoadHistoryWith(const HistoryVisitor& inVisitor, const HistoryWalkCompletion& inCompletion) override;
    bool CreateEditingSession(InterfaceRef<IZOCEditingSession>& outSession, const UString& inName,
                              const UString& inDescription, bool inIsTemporary) override;
    InterfaceRef<IZOCProductionList> GetEditingSessions() override;
    ImmutableString GetSessionsLink() override;
    InterfaceRef<IZOCProductionHistory> GetProductionHistory() override;
    ImmutableString GetMostRecentRevision() override;
    ImmutableString GetLoadedRevision() override;
    std::string ReadXMP(const ImmutableString& inKey) override;
    std::string ReadXMP(const InterfaceRef<IZOCAsset>& inItem) override;
    InterfaceRef<IZOCEnclosures> GetEnclosures() override;
    bool Copy(const Guid& inRequestID, const RequestCompletion& inCompletion, const UString& inName,
              const UString& inDescription, bool inIsTemporary) override;
    bool GetEditingSessionFactoryURL(ImmutableString& outURL) override;
    ptime GetCreationTime() override;
    ptime GetModificationTime() override;
    ImmutableString GetOwner() override;
    std::vector<ImmutableString> GetTags() override;
    InterfaceRef<IZOCProduction> GetLatestVersion() override;
    bool IsEditingSession() override;
    bool IsTransaction() override;
    bool IsTemplate() override;

    // --- IZOCEditingSession (EditingSession.cpp, TransactionCreation.cpp, PendingTransactions.cpp,
    // XMPCache.cpp, UnstoredChanges.cpp).

    bool CreateTransaction(const Guid& inRequestID, const RequestCompletion& inCompletion,
                           const ImmutableString& inTransactionType,
                           const optional<ExtraTransactionMetadata>& inExtraMetadata) override;
    bool CreateTransactionAndStoreChanges(const Guid& inRequestID, const RequestCompletion& inCompletion,
                                          const InterfaceRef<IZOCProduction>& inProduction,
                                          const UString& inTransactionType) override;
    InterfaceRef<IZOCTransactionList> GetOrCreateTransactionList() override;
    void WaitForPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                    const ResultCompletion& inCompletion) override;
    bool GetPendingTransactions(const std::vector<ImmutableString>& inIgnoredTypes,
                                const ResultCompletion& inCompletion) override;
    InterfaceRef<IZOCProduction> GetParentProduction() override;
    ImmutableString GetParentProductionIdentifier() override;
    bool Push(const Guid& inRequestID, const RequestCompletion& inCompletion, const UString& inCommitMessage,
              int inResolveStrategy, const UString& inCommitId) override;
    bool Pull(const Guid& inRequestID, const RequestCompletion& inCompletion, int inMergeStrategy,
              const UString& inCommitId) override;
    /// Of a transaction, its asset list with it.
    bool Refresh(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    using ServerResource::Refresh;
    InterfaceRef<IZOCDifferences> GetOutgoingChanges() override;
    InterfaceRef<IZOCDifferences> GetIncomingChanges() override;
    void CacheXMP(const ImmutableString& inKey, const std::string& inPacket, bool inDirty) override;
    bool HasCachedXMPChanges() override;
    void StoreCachedXMPChangesInBulkTransaction(const InterfaceRef<IZOCBulkTransaction>& inBulk) override;
    void ClearXMPCache() override;
    bool StoreProductionChangesInTransaction(const InterfaceRef<IZOCTransaction>& inTransaction,
                                             const ResultCompletion& inCompletion) override;

    // --- IZOCTransaction (Transaction.cpp).

    bool CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                        const AssetBaseProperties& inProperties) override;
    bool CreateNewAsset(const Guid& inRequestID, const RequestCompletion& inCompletion,
                        const AssetBaseProperties& inProperties, const SubClip& inSubClip) override;
    ImmutableString GetAssetFactoryURL() override;
    bool WriteEnclosure(const ImmutableString& inPath, const std::string& inText, const Guid& inRequestID,
                        const RequestCompletion& inCompletion, const ImmutableString& inContentType) override;
    bool Commit(const Guid& inRequestID, const RequestCompletion& inCompletion,
                const UString& inMessage) override;
    bool Rollback(const Guid& inRequestID, const RequestCompletion& inCompletion) override;
    InterfaceRef<IZOCBulkTransaction> CreateBulkTransaction(
        const shared_ptr<CompoundAsyncOperation>& inParentOperation) override;

    // --- For code of this floor.

    /// The shared commit on which a session stands; null when the server gave none.
    ImmutableString GetBaseCommit();
    /// Tells a session of the production that made it, and a transaction of its session and the list in which
    /// it stands; the list is null for a session.
    void SetCreationContext(const InterfaceRef<Production>& inParent,
                            const InterfaceRef<TransactionList>& inTransactions);
    /// Puts the whole object of base properties to the "edit" link, with the held tag.
    bool UpdateProductionBaseProperties(const Guid& inRequestID, const RequestCompletion& inCompletion);

protected:
    void PostLoadDTO() override;
    std::string GetTraceName() override;

private:
    /// What was set here and is not stored yet, by key.
    using PropertyChanges = std::map<std::string, std::string, std::less<>>;

    bool HasLink(const ImmutableString& inRelation);
    ImmutableString GetAssetsLink();
    void SetProperty(std::string_view inKey, const UString& inValue, const char* inLabel);
    void ReportMissingLists();
    void ReportMissingAsset(const ImmutableString& inIdentifier);

    bool PostStrategyForm(const ImmutableString& inRelation, const ostnet::http::Form& inForm,
                          const Guid& inRequestID, const RequestCompletion& inCompletion);

    /// A refusal goes to the host, unless it meets a share that went through before.
    RequestCompletion MakePushCompletion(const UString& inMessage, const UString& inCommitID,
                                         const RequestCompletion& inCompletion);

    struct TransactionRequest;
    bool GetOrCreateTransactionFactory(const shared_ptr<TransactionRequest>& inRequest);
    bool CreateTransactionFactory(const shared_ptr<TransactionRequest>& inRequest);
    void OnReadyToCreateTransaction(const shared_ptr<TransactionRequest>& inRequest, int inResult,
                                    const InterfaceRef<TransactionList>& inFactory,
                                    const shared_ptr<ostnet::Response>& inResponse);
    ostcore::serialization::JSONValue MakeTransactionBody(const TransactionRequest& inRequest);
    void OnTransactionCreated(const shared_ptr<TransactionRequest>& inRequest, int inResult,
                              const InterfaceRef<TransactionList>& inFactory,
                              const shared_ptr<ostnet::Response>& inResponse);

    RequestCompletion MakeNewAssetCompletion(const RequestCompletion& inCompletion);
    void OnCommitted(const Guid& inRequestID, int inResult, const shared_ptr<ostnet::Response>& inResponse,
                     const RequestCompletion& inCompletion);
    void OnRepeatedCommitRefused(const Guid& inRequestID, int inResult,
                                 const shared_ptr<ostnet::Response>& inResponse,
                                 const RequestCompletion& inCompletion);
    void ClearCachedState();
    void LeaveListOfParent();
    struct UnstoredChanges;
    UnstoredChanges TakeUnstoredChanges();
    /// What was set anew meanwhile stays as it is.
    void PutBackUnstoredChanges(const UnstoredChanges& inChanges);
    /// Starts on the transaction what this object's changes ask for.
    bool PutPropertiesInTransaction(const InterfaceRef<Production>& inTransaction, const Guid& inRequestID,
                                    const RequestCompletion& inCompletion);
    void ApplyPropertyChanges();
    shared_ptr<RecycledMemory const> FindChangedXMP(const ImmutableString& inKey);

    InterfaceRef<AssetList> mAssets ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<Enclosures> mEnclosures ZO_GUARDED_BY(IZOCDataServer::GetLock());
    PropertyChanges mPropertyChanges ZO_GUARDED_BY(IZOCDataServer::GetLock());
    XMPCache mXMPCache ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<TransactionList> mTransactionFactory ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<TransactionList> mTransactions ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<Production> mParent ZO_GUARDED_BY(IZOCDataServer::GetLock());
    InterfaceRef<TransactionList> mListOfParent ZO_GUARDED_BY(IZOCDataServer::GetLock());
    /// The last one, as long as it lives.
    weak_ptr<BulkTransaction> mBulkTransaction ZO_GUARDED_BY(IZOCDataServer::GetLock());
};

/// The body of a creation.
ostcore::serialization::JSONValue MakeProductionCreationBody(const UString& inName,
                                                             const UString& inDescription,
                                                             bool inIsTemporary);

}  // namespace ZOCL
