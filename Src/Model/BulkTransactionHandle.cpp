// The host's end of bulk transactions, and how a production makes one.
#include "Model/BulkTransactionHandle.h"

#include "Model/Production.h"
#include "ostcore/debug/DebugDatabase.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

std::uint32_t BulkTransactionHandle::Release() noexcept {
    const std::uint32_t left = mReferences.Drop();
    if (left == 0) {
        mBulk->Abandon();
        delete this;
    }
    return left;
}

int BulkTransactionHandle::QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept {
    const int result = QueryInterfaceNoAddRef(inID, outInterface);
    if (result >= 0) {
        AddRef();
    }
    return result;
}

int BulkTransactionHandle::QueryInterfaceNoAddRef(const RFL::InterfaceID& inID,
                                                  void** outInterface) noexcept {
    if (inID == IZOCBulkTransaction::kInterfaceID) {
        *outInterface = static_cast<IZOCBulkTransaction*>(this);
    } else if (inID == RFL::RFLUnknown::kInterfaceID) {
        *outInterface = static_cast<RFL::RFLUnknown*>(this);
    } else {
        *outInterface = nullptr;
        return kResultInterfaceNotSupported;
    }
    return kResultSuccess;
}

bool BulkTransactionHandle::CreateNewAsset(
    const AssetCompletion& inCompletion, const AssetBaseProperties& inProperties,
    const ImmutableString& inMediaLocator, const optional<SubClip>& inSubClip,
    const ImmutableString& inEnclosureName, const shared_ptr<RecycledMemory const>& inEnclosureData,
    const ImmutableString& inRenditionType, const shared_ptr<RecycledMemory const>& inRenditionData,
    const SourceAssetReference& inSource) {
    BulkNewAsset asset;
    asset.properties = inProperties;
    asset.mediaLocator = inMediaLocator;
    asset.subClip = inSubClip;
    asset.enclosures.emplace(inEnclosureName, inEnclosureData);
    asset.renditions.emplace(inRenditionType, inRenditionData);
    asset.source = inSource;
    return mBulk->CreateNewAsset(inCompletion, asset);
}

InterfaceRef<IZOCBulkTransaction> Production::CreateBulkTransaction(
    const shared_ptr<CompoundAsyncOperation>& inParentOperation) {
    if (!inParentOperation || !IsTransaction() ||
        !ostcore::debug::DebugDatabase::GetBool("ZOClient.EnableBulkAPI", true)) {
        return nullptr;
    }
    BulkTransaction::Setup setup;
    setup.server = GetServer();
    setup.createLink = GetLinkHref(kRelation_Bulk_Create);
    setup.deleteLink = GetLinkHref(kRelation_Bulk_Delete);
    setup.editLink = GetLinkHref(kRelation_Bulk_Edit);
    setup.assetTemplate = GetLinkHref(kRelation_Assets_Asset_ById);
    setup.assets = GetAssets();
    setup.enclosures = GetEnclosures();
    const auto bulk = make_shared<BulkTransaction>(setup);
    shared_ptr<BulkTransaction> previous;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::Production::CreateBulkTransaction");
        previous = mBulkTransaction.lock();
        if (previous && !previous->IsCompletelyFinished()) {
            return nullptr;
        }
        mBulkTransaction = bulk;
    }
    if (!bulk->Init(inParentOperation)) {
        return nullptr;
    }
    return InterfaceRef<IZOCBulkTransaction>(new BulkTransactionHandle(bulk));
}

}  // namespace ZOCL
