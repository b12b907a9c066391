// The gathering of changes, and the chain of phases that sends them.
#include "Model/BulkTransaction.h"

#include "ostcore/debug/Assert.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

bool IsSource(const SourceAssetReference& inSource) {
    return !inSource.productionID.empty() || !inSource.commitID.empty() || !inSource.assetID.empty();
}

BulkAssetCreation MakeCreation(const IZOCBulkTransaction::AssetCompletion& inCompletion,
                               const BulkNewAsset& inAsset) {
    BulkAssetCreation creation;
    creation.completion = inCompletion;
    creation.properties = inAsset.properties;
    creation.subClip = inAsset.subClip;
    if (!inAsset.mediaLocator.empty()) {
        creation.mediaLocator = inAsset.mediaLocator;
    }
    for (const auto& [name, data] : inAsset.enclosures) {
        if (!name.empty()) {
            creation.enclosures[name].data = data;
        }
    }
    for (const auto& [type, data] : inAsset.renditions) {
        if (!type.empty() && data) {
            creation.renditions[type] = data;
        }
    }
    return creation;
}

}  // namespace

bool BulkTransaction::Init(const shared_ptr<CompoundAsyncOperation>& inParent) {
    ZO_ASSERT_ONCE(!mSetup.createLink.empty(), "!mBulkCreateLink.empty()",
                   "The transaction has no link for creations in bulk.");
    ZO_ASSERT_ONCE(!mSetup.editLink.empty(), "!mBulkEditLink.empty()",
                   "The transaction has no link for edits in bulk.");
    const bool isComplete = inParent && mSetup.server && mSetup.assets && mSetup.enclosures &&
                            !mSetup.createLink.empty() && !mSetup.editLink.empty();
    if (isComplete) {
        BuildChain(inParent);
    }
    shared_ptr<OperationHold> hold;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::Init");
        mHasEnded = !mReadyToCreate.operation;
        hold.swap(mCompletelyFinished.hold);
        if (mHasEnded) {
            return false;
        }
    }
    WaitForAssetList();
    hold->Release(kResultSuccess);
    return true;
}

void BulkTransaction::BuildChain(const OperationRef& inParent) {
    const auto self = shared_from_this();
    const auto open = [](const OperationRef& inAround, const auto& inEnd) {
        Phase phase;
        if (inAround) {
            inAround->CreateSubOperation(phase.operation, inEnd, false);
        }
        if (phase.operation) {
            phase.hold = OperationHold::Take(phase.operation);
        }
        return phase;
    };
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::Init");
    mCompletelyFinished = open(inParent, [self](int inResult) { return self->CompletelyFinished(inResult); });
    mEditingFinished = open(mCompletelyFinished.operation, nullptr);
    mReadyToEdit =
        open(mEditingFinished.operation, [self](int inResult) { return self->ReadyToEdit(inResult); });
    mDeletionFinished = open(mReadyToEdit.operation, nullptr);
    mReadyToDelete =
        open(mDeletionFinished.operation, [self](int inResult) { return self->ReadyToDelete(inResult); });
    mCreationFinished = open(mReadyToDelete.operation, nullptr);
    mReadyToCreate =
        open(mCreationFinished.operation, [self](int inResult) { return self->ReadyToCreate(inResult); });
}

void BulkTransaction::Abandon() {
    OperationRef unfinished;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::Abandon");
        if (mReadyToEdit.hold) {
            unfinished = mCompletelyFinished.operation;
        }
    }
    if (unfinished) {
        unfinished->TryToCancel();
    }
}

void BulkTransaction::ReleaseHold(Phase BulkTransaction::*inPhase, const char* inLabel) {
    shared_ptr<OperationHold> hold;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
        hold.swap((this->*inPhase).hold);
    }
    if (hold) {
        hold->Release(kResultSuccess);
    }
}

bool BulkTransaction::CreateNewAsset(const AssetCompletion& inCompletion, const BulkNewAsset& inAsset) {
    BulkAssetCreation creation = MakeCreation(inCompletion, inAsset);
    OperationRef operation;
    shared_ptr<OperationHold> hold;
    std::size_t index = 0;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::CreateNewAsset");
        operation = mReadyToCreate.operation;
        if (!operation) {
            return false;
        }
        index = mAssetCreations.size();
        mAssetCreations.push_back(std::move(creation));
        if (IsSource(inAsset.source) && operation->GetResult() >= 0) {
            // From here on the creations wait for the copy, whoever finishes them meanwhile. On an operation
            // that has failed the hold would end at once, under the lock.
            hold = OperationHold::Take(operation);
        }
    }
    if (hold) {
        CopySourceEnclosures(shared_from_this(), operation, index, inAsset.source);
        hold->Release(kResultSuccess);
    }
    return true;
}

void BulkTransaction::AddEnclosureToNewAsset(std::size_t inIndex, const ImmutableString& inName,
                                             const BulkPayload& inData) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::AddEnclosureToNewAsset");
    if (inIndex < mAssetCreations.size() && !inName.empty()) {
        mAssetCreations[inIndex].enclosures[inName].data = inData;
    }
}

void BulkTransaction::AddSourceEnclosure(std::size_t inIndex, const ImmutableString& inName,
                                         const BulkPayload& inData) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::AddSourceEnclosure");
    if (inIndex < mAssetCreations.size() && !inName.empty()) {
        mAssetCreations[inIndex].enclosures.emplace(inName, BulkEnclosureEdit{false, inData, {}});
    }
}

shared_ptr<CompoundAsyncOperation> BulkTransaction::GetCreateOperation() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::GetCreateOperation");
    return mReadyToCreate.operation;
}

void BulkTransaction::FinishedCreatingNewAssets() {
    ReleaseHold(&BulkTransaction::mReadyToCreate, "ZOCL::BulkTransaction::FinishedCreatingNewAssets");
}

bool BulkTransaction::DeleteAsset(const ResultCompletion& inCompletion, const ImmutableString& inAssetID) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::DeleteAsset");
    if (!mReadyToDelete.operation || mSetup.deleteLink.empty()) {
        return false;
    }
    mAssetDeletions.push_back({inAssetID, inCompletion});
    return true;
}

void BulkTransaction::FinishedDeletingAssets() {
    ReleaseHold(&BulkTransaction::mReadyToDelete, "ZOCL::BulkTransaction::FinishedDeletingAssets");
}

bool BulkTransaction::SetAssetProperties(const ResultCompletion& inCompletion,
                                         const ImmutableString& inAssetID,
                                         const optional<AssetBaseProperties>& inProperties,
                                         const optional<SubClip>& inSubClip,
                                         const optional<ImmutableString>& inMediaLocator) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::SetAssetProperties");
    if (!mReadyToEdit.operation) {
        return false;
    }
    BulkAssetEdit& edit = mEdits.assets[inAssetID];
    edit.properties = inProperties;
    edit.subClip = inSubClip;
    edit.mediaLocator = inMediaLocator;
    if (inCompletion) {
        edit.completions.push_back(inCompletion);
    }
    return true;
}

bool BulkTransaction::SetAssetEnclosure(const ResultCompletion& inCompletion,
                                        const ImmutableString& inAssetID, const ImmutableString& inName,
                                        const BulkPayload& inData) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::SetAssetEnclosure");
        if (!mReadyToEdit.operation) {
            return false;
        }
        BulkEnclosureEdit& edit = mEdits.assets[inAssetID].enclosures[inName];
        edit.data = inData;
        if (inCompletion) {
            edit.completions.push_back(inCompletion);
        }
    }
    WaitForEnclosures(inAssetID);
    return true;
}

void BulkTransaction::SetAssetRendition(const ImmutableString& inAssetID,
                                        const ImmutableString& inContentType, const BulkPayload& inData) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::SetAssetRendition");
        if (!mReadyToEdit.operation) {
            return;
        }
        mEdits.assets[inAssetID].renditions[inContentType] = inData;
    }
    WaitForRenditions(inAssetID);
}

void BulkTransaction::SetProductionEnclosure(const ImmutableString& inName, const BulkPayload& inData,
                                             bool inCreateOnly) {
    OperationRef operation;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::SetProductionEnclosure");
        if (!mReadyToEdit.operation) {
            return;
        }
        BulkEnclosureEdit& edit = mEdits.production[inName];
        edit.createOnly = inCreateOnly;
        edit.data = inData;
        if (!mWaitsForProductionEnclosures) {
            mWaitsForProductionEnclosures = true;
            operation = mReadyToEdit.operation;
        }
    }
    if (operation) {
        WaitForLoad(operation, RFL::QueryInterface<IZOCServerResource>(mSetup.enclosures));
    }
}

shared_ptr<CompoundAsyncOperation> BulkTransaction::GetEditOperation() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::GetEditOperation");
    return mReadyToEdit.operation;
}

void BulkTransaction::FinishedEditing() {
    FinishedCreatingNewAssets();
    FinishedDeletingAssets();
    ReleaseHold(&BulkTransaction::mReadyToEdit, "ZOCL::BulkTransaction::FinishedEditing");
}

bool BulkTransaction::IsCompletelyFinished() {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::IsCompletelyFinished");
    return mHasEnded;
}

}  // namespace ZOCL
