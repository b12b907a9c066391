// What a bulk transaction has to know of the server before it can edit, and how it waits for that.
#include "Model/BulkTransaction.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

void WaitForLoad(const shared_ptr<CompoundAsyncOperation>& inOperation,
                 const InterfaceRef<IZOCServerResource>& inResource) {
    if (!inResource || inResource->IsLoaded()) {
        return;
    }
    inOperation->Initiate(
        [inResource](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            return inResource->Load(inRequestID, inCompletion, true);
        },
        [inResource](int inResult) {
            return inResult >= 0 && !inResource->IsLoaded() ? kResultFailure : inResult;
        });
}

void BulkTransaction::WaitForAssetList() {
    const auto self = shared_from_this();
    const OperationRef operation = GetCreateOperation();
    const auto list = RFL::QueryInterface<IZOCServerResource>(mSetup.assets);
    if (!operation) {
        return;
    }
    operation->Initiate(
        [list](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            return list && list->Load(inRequestID, inCompletion, true);
        },
        [self, list](int inResult) {
            if (inResult < 0 || !list->IsLoaded()) {
                return inResult < 0 ? inResult : kResultFailure;
            }
            self->OnAssetListLoaded();
            return inResult;
        });
}

void BulkTransaction::OnAssetListLoaded() {
    std::set<ImmutableString> enclosures;
    std::set<ImmutableString> renditions;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::OnAssetListLoaded");
        mAssetListIsLoaded = true;
        enclosures.swap(mEnclosuresWanted);
        renditions.swap(mRenditionsWanted);
    }
    for (const ImmutableString& assetID : enclosures) {
        WaitForEnclosures(assetID);
    }
    for (const ImmutableString& assetID : renditions) {
        WaitForRenditions(assetID);
    }
}

InterfaceRef<IZOCAsset> BulkTransaction::FindAsset(const ImmutableString& inAssetID) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::FindAsset");
        const auto held = mEdits.lists.find(inAssetID);
        if (held != mEdits.lists.end()) {
            return held->second.asset;
        }
    }
    return mSetup.assets->GetAssetByIdentifier(inAssetID);
}

void BulkTransaction::WaitForEnclosures(const ImmutableString& inAssetID) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::WaitForEnclosures");
        if (!mAssetListIsLoaded) {
            mEnclosuresWanted.insert(inAssetID);
            return;
        }
    }
    const InterfaceRef<IZOCAsset> asset = FindAsset(inAssetID);
    const auto list = asset ? asset->GetEnclosures() : nullptr;
    OperationRef operation;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::WaitForEnclosures");
        AssetLists* const lists = list && mReadyToEdit.operation ? &mEdits.lists[inAssetID] : nullptr;
        if (!lists || lists->enclosures) {
            return;
        }
        lists->asset = asset;
        lists->enclosures = list;
        operation = mReadyToEdit.operation;
    }
    WaitForLoad(operation, RFL::QueryInterface<IZOCServerResource>(list));
}

void BulkTransaction::WaitForRenditions(const ImmutableString& inAssetID) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::WaitForRenditions");
        if (!mAssetListIsLoaded) {
            mRenditionsWanted.insert(inAssetID);
            return;
        }
    }
    const InterfaceRef<IZOCAsset> asset = FindAsset(inAssetID);
    const auto list = asset ? asset->GetRenditions() : nullptr;
    OperationRef operation;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::WaitForRenditions");
        AssetLists* const lists = list && mReadyToEdit.operation ? &mEdits.lists[inAssetID] : nullptr;
        if (!lists || lists->renditions) {
            return;
        }
        lists->asset = asset;
        lists->renditions = list;
        operation = mReadyToEdit.operation;
    }
    WaitForLoad(operation, RFL::QueryInterface<IZOCServerResource>(list));
}

void BulkTransaction::TakeStates(const Edits& inEdits) {
    std::vector<std::pair<ImmutableString, BulkAssetState>> states;
    for (const auto& [assetID, edit] : inEdits.assets) {
        const auto waited = inEdits.lists.find(assetID);
        AssetLists lists = waited == inEdits.lists.end() ? AssetLists() : waited->second;
        if (!lists.asset) {
            lists.asset = mSetup.assets->GetAssetByIdentifier(assetID);
        }
        if (lists.asset) {
            states.emplace_back(assetID, ReadBulkAssetState(lists.asset, lists.enclosures, lists.renditions));
        }
    }
    const BulkIdentifiers enclosures = ReadBulkIdentifiers(mSetup.enclosures);
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::TakeStates");
    for (const auto& [assetID, state] : states) {
        AddToBulkState(state, mState.assets[assetID]);
    }
    AddBulkIdentifiers(enclosures, mState.productionEnclosures);
}

void BulkTransaction::NotifyOfRestoredAsset(const InterfaceRef<IZOCAsset>& inAsset) {
    const auto resource = RFL::QueryInterface<IZOCServerResource>(inAsset);
    const OperationRef edit = GetEditOperation();
    if (!edit || !resource) {
        return;
    }
    const auto self = shared_from_this();
    const auto lists = make_shared<AssetLists>();
    lists->asset = inAsset;
    OperationRef waits;
    edit->CreateSubOperation(
        waits,
        [self, lists](int inResult) {
            if (inResult >= 0) {
                self->UpdateAssetStateForRestoredAsset(*lists);
            }
            return inResult;
        },
        false);
    if (!waits) {
        return;
    }
    waits->Initiate(
        [resource](const Guid& inRequestID, const RequestCompletion& inCompletion) {
            return resource->Load(inRequestID, inCompletion, true);
        },
        [waits, lists, resource](int inResult) {
            if (inResult < 0 || !resource->IsLoaded()) {
                return inResult < 0 ? inResult : kResultFailure;
            }
            lists->enclosures = lists->asset->GetEnclosures();
            lists->renditions = lists->asset->GetRenditions();
            WaitForLoad(waits, RFL::QueryInterface<IZOCServerResource>(lists->enclosures));
            WaitForLoad(waits, RFL::QueryInterface<IZOCServerResource>(lists->renditions));
            return inResult;
        });
}

void BulkTransaction::UpdateAssetStateForRestoredAsset(const AssetLists& inRestored) {
    const BulkAssetState state =
        ReadBulkAssetState(inRestored.asset, inRestored.enclosures, inRestored.renditions);
    const ImmutableString assetID = inRestored.asset->GetAssetIdentifier();
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::UpdateAssetStateForRestoredAsset");
    AddToBulkState(state, mState.assets[assetID]);
}

}  // namespace ZOCL
