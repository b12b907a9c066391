// A new asset takes over the enclosures of an asset that is there already, in whatever production and commit.
#include "Model/Asset.h"
#include "Model/BulkTransaction.h"
#include "Model/ResourceCreation.h"
#include "ZOClient/IZOCProduction.h"

namespace ZOCL {

namespace {

/// One chain: production, asset, list of enclosures, payloads. Each step starts in the end of the one before,
/// and none of them hands on its failure: the asset is sent with what arrived.
class SourceCopy : public enable_shared_from_this<SourceCopy> {
public:
    SourceCopy(shared_ptr<BulkTransaction> inBulk, shared_ptr<CompoundAsyncOperation> inOperation,
               std::size_t inIndex, const SourceAssetReference& inSource)
        : mBulk(std::move(inBulk)), mOperation(std::move(inOperation)), mIndex(inIndex), mSource(inSource) {}

    void Start() {
        mProduction =
            mBulk->GetServer()->GetProductionByIdAndCommitId(mSource.productionID, mSource.commitID);
        const auto self = shared_from_this();
        Load(RFL::QueryInterface<IZOCServerResource>(mProduction), [self] { self->FindAsset(); });
    }

private:
    /// Goes on when the resource is loaded; a null one ends the chain.
    void Load(const InterfaceRef<IZOCServerResource>& inResource, const function<void()>& inNext) {
        if (!inResource) {
            return;
        }
        mOperation->Initiate(
            [inResource](const Guid& inRequestID, const RequestCompletion& inCompletion) {
                return inResource->Load(inRequestID, inCompletion, true);
            },
            [inResource, inNext](int inResult) {
                if (inResult >= 0 && inResource->IsLoaded()) {
                    inNext();
                }
                return kResultSuccess;
            });
    }

    void FindAsset() {
        const auto self = shared_from_this();
        mOperation->Initiate(
            [self](const Guid& inRequestID, const RequestCompletion& inCompletion) {
                return self->mProduction->GetAssetByIdentifier(inRequestID, self->mSource.assetID,
                                                               inCompletion);
            },
            [self](int inResult, const InterfaceRef<IZOCAsset>& inAsset,
                   const shared_ptr<ostnet::Response>&) {
                if (inResult >= 0 && inAsset) {
                    self->LoadList(inAsset);
                } else {
                    self->RetryAlone();
                }
                return kResultSuccess;
            });
    }

    /// The list may be out of reach, or not hold it any more.
    void RetryAlone() {
        const ImmutableString url = mProduction->GetAssetURL(mSource.assetID, mSource.commitID);
        const InterfaceRef<Asset> asset =
            MakeAtURL<Asset>(url, mBulk->GetServer(), ResourceWritability::kReadOnly);
        const auto self = shared_from_this();
        Load(RFL::QueryInterface<IZOCServerResource>(asset), [self, asset] { self->LoadList(asset); });
    }

    void LoadList(const InterfaceRef<IZOCAsset>& inAsset) {
        const InterfaceRef<IZOCEnclosures> list = inAsset->GetEnclosures();
        const auto self = shared_from_this();
        Load(RFL::QueryInterface<IZOCServerResource>(list), [self, list] { self->LoadPayloads(list); });
    }

    void LoadPayloads(const InterfaceRef<IZOCEnclosures>& inList) {
        for (const ImmutableString& name : inList->GetEnclosureNames()) {
            if (const InterfaceRef<IZOCEnclosure> enclosure = inList->GetEnclosure(name)) {
                LoadPayload(name, enclosure);
            }
        }
    }

    void LoadPayload(const ImmutableString& inName, const InterfaceRef<IZOCEnclosure>& inEnclosure) {
        const auto self = shared_from_this();
        mOperation->Initiate(
            [inEnclosure](const Guid& inRequestID, const RequestCompletion& inCompletion) {
                return inEnclosure->LoadEnclosureData(inRequestID, inCompletion);
            },
            [self, inName, inEnclosure](int inResult) {
                // What is held is given at once; anything else would be asked for again, and block.
                if (inResult >= 0 && inEnclosure->EnclosureDataIsLoaded()) {
                    self->mBulk->AddSourceEnclosure(self->mIndex, inName, inEnclosure->GetEnclosurePayload());
                }
                return kResultSuccess;
            });
    }

    const shared_ptr<BulkTransaction> mBulk;
    const shared_ptr<CompoundAsyncOperation> mOperation;
    const std::size_t mIndex;
    const SourceAssetReference mSource;
    InterfaceRef<IZOCProduction> mProduction;
};

}  // namespace

void CopySourceEnclosures(const shared_ptr<BulkTransaction>& inBulk,
                          const shared_ptr<CompoundAsyncOperation>& inOperation, std::size_t inIndex,
                          const SourceAssetReference& inSource) {
    make_shared<SourceCopy>(inBulk, inOperation, inIndex, inSource)->Start();
}

}  // namespace ZOCL
