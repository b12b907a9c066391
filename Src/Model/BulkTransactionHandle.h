// The object that a host holds of a bulk transaction.
#pragma once

#include "Model/BulkTransaction.h"

namespace ZOCL {

/// Passes everything on. The work itself is held by its requests; that the host's last reference goes is what
/// tells an unfinished one that nobody will finish it.
class BulkTransactionHandle final : public IZOCBulkTransaction {
public:
    explicit BulkTransactionHandle(shared_ptr<BulkTransaction> inBulk) : mBulk(std::move(inBulk)) {}

    std::uint32_t AddRef() noexcept override { return mReferences.Add(); }
    std::uint32_t Release() noexcept override;
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override;
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override;

    bool CreateNewAsset(const AssetCompletion& inCompletion, const AssetBaseProperties& inProperties,
                        const ImmutableString& inMediaLocator, const optional<SubClip>& inSubClip,
                        const ImmutableString& inEnclosureName,
                        const shared_ptr<RecycledMemory const>& inEnclosureData,
                        const ImmutableString& inRenditionType,
                        const shared_ptr<RecycledMemory const>& inRenditionData,
                        const SourceAssetReference& inSource) override;
    shared_ptr<CompoundAsyncOperation> GetCreateOperation() override { return mBulk->GetCreateOperation(); }
    void FinishedCreatingNewAssets() override { mBulk->FinishedCreatingNewAssets(); }
    void NotifyOfRestoredAsset(const InterfaceRef<IZOCAsset>& inAsset) override {
        mBulk->NotifyOfRestoredAsset(inAsset);
    }
    bool DeleteAsset(const ResultCompletion& inCompletion, const ImmutableString& inAssetID) override {
        return mBulk->DeleteAsset(inCompletion, inAssetID);
    }
    void FinishedDeletingAssets() override { mBulk->FinishedDeletingAssets(); }
    bool SetAssetProperties(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                            const optional<AssetBaseProperties>& inProperties,
                            const optional<SubClip>& inSubClip,
                            const optional<ImmutableString>& inMediaLocator) override {
        return mBulk->SetAssetProperties(inCompletion, inAssetID, inProperties, inSubClip, inMediaLocator);
    }
    bool SetAssetEnclosure(const ResultCompletion& inCompletion, const ImmutableString& inAssetID,
                           const ImmutableString& inName,
                           const shared_ptr<RecycledMemory const>& inData) override {
        return mBulk->SetAssetEnclosure(inCompletion, inAssetID, inName, inData);
    }
    void SetAssetRendition(const ImmutableString& inAssetID, const ImmutableString& inContentType,
                           const shared_ptr<RecycledMemory const>& inData) override {
        mBulk->SetAssetRendition(inAssetID, inContentType, inData);
    }
    void SetProductionEnclosure(const ImmutableString& inName, const shared_ptr<RecycledMemory const>& inData,
                                bool inCreateOnly) override {
        mBulk->SetProductionEnclosure(inName, inData, inCreateOnly);
    }
    shared_ptr<CompoundAsyncOperation> GetEditOperation() override { return mBulk->GetEditOperation(); }
    void FinishedEditing() override { mBulk->FinishedEditing(); }
    InterfaceRef<IZOCBulkTransaction> AddRefSelf() override {
        return InterfaceRef<IZOCBulkTransaction>(this);
    }
    void AddEnclosureToNewAsset(std::size_t inIndex, const ImmutableString& inName,
                                const shared_ptr<RecycledMemory const>& inData) override {
        mBulk->AddEnclosureToNewAsset(inIndex, inName, inData);
    }
    bool CreateNewAsset(const AssetCompletion& inCompletion, const BulkNewAsset& inAsset) override {
        return mBulk->CreateNewAsset(inCompletion, inAsset);
    }
    bool IsCompletelyFinished() override { return mBulk->IsCompletelyFinished(); }

private:
    ~BulkTransactionHandle() override = default;

    const shared_ptr<BulkTransaction> mBulk;
    RFL::RefCount mReferences;
};

}  // namespace ZOCL
