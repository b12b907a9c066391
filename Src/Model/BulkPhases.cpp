// What happens when a phase is ready: its items leave as requests of the operation around it.
#include "Model/BulkTransaction.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

template <class Item, class Write, class Fits, class Complete>
shared_ptr<BulkPending> MakePending(std::vector<Item> inItems, const Write& inWrite, const Fits& inFits,
                                    const Complete& inComplete) {
    BulkKind<Item> kind;
    kind.write = inWrite;
    kind.fits = inFits;
    kind.complete = inComplete;
    return boost::make_shared<BulkItems<Item>>(std::move(inItems), kind);
}

bool FitCreations(const std::vector<BulkAssetCreation>& inSent, const BulkAnswer& inAnswer) {
    if (inAnswer.assets.size() > inSent.size()) {
        return false;
    }
    for (std::size_t i = 0; i < inAnswer.assets.size(); ++i) {
        if (!FitsEdit(inSent[i], inAnswer.assets[i])) {
            return false;
        }
    }
    return true;
}

bool FitAssetItems(const std::vector<BulkAssetItem>& inSent, const BulkAnswer& inAnswer) {
    if (inAnswer.assets.size() > inSent.size()) {
        return false;
    }
    std::map<ImmutableString, const BulkAssetEdit*> edits;
    for (const auto& [assetID, edit] : inSent) {
        edits.emplace(assetID, &edit);
    }
    for (const BulkAnswer::Asset& asset : inAnswer.assets) {
        const auto edit = edits.find(asset.id);
        if (edit != edits.end() && !FitsEdit(*edit->second, asset)) {
            return false;
        }
    }
    return true;
}

bool FitEnclosures(const std::vector<BulkEnclosureItem>& inSent, const BulkAnswer& inAnswer) {
    return inAnswer.enclosures.size() <= inSent.size();
}

}  // namespace

void BulkTransaction::Send(const OperationRef& inOperation, const ImmutableString& inURL,
                           BulkSender::Verb inVerb, const shared_ptr<BulkPending>& inFirst,
                           const shared_ptr<BulkPending>& inSecond) {
    make_shared<BulkSender>(inOperation, mSetup.server, inURL, inVerb, inFirst, inSecond)->Start();
}

int BulkTransaction::ReadyToCreate(int inResult) {
    Phase ready;
    Phase finished;
    std::vector<BulkAssetCreation> creations;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::ReadyToCreate");
        std::swap(ready, mReadyToCreate);
        std::swap(finished, mCreationFinished);
        creations.swap(mAssetCreations);
    }
    if (inResult >= 0) {
        SendCreations(finished.operation, std::move(creations));
    }
    finished.hold->Release(inResult);
    return inResult;
}

int BulkTransaction::ReadyToDelete(int inResult) {
    Phase ready;
    Phase finished;
    std::vector<BulkAssetDeletion> deletions;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::ReadyToDelete");
        std::swap(ready, mReadyToDelete);
        std::swap(finished, mDeletionFinished);
        deletions.swap(mAssetDeletions);
    }
    if (inResult >= 0) {
        SendDeletions(finished.operation, std::move(deletions));
    }
    finished.hold->Release(inResult);
    return inResult;
}

int BulkTransaction::ReadyToEdit(int inResult) {
    Phase ready;
    Phase finished;
    Edits edits;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::ReadyToEdit");
        std::swap(ready, mReadyToEdit);
        std::swap(finished, mEditingFinished);
        std::swap(edits, mEdits);
    }
    if (inResult >= 0) {
        SendEdits(finished.operation, edits);
    }
    finished.hold->Release(inResult);
    return inResult;
}

int BulkTransaction::CompletelyFinished(int inResult) {
    Phase finished;
    BulkState state;
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::CompletelyFinished");
    std::swap(finished, mCompletelyFinished);
    std::swap(state, mState);
    mHasEnded = true;
    lock.Unlock();
    return inResult;
}

void BulkTransaction::SendCreations(const OperationRef& inOperation,
                                    std::vector<BulkAssetCreation> inCreations) {
    const auto self = shared_from_this();
    Send(inOperation, mSetup.createLink, BulkSender::Verb::kPost,
         MakePending(
             std::move(inCreations),
             [](BulkForm& ioForm, std::size_t inIndex, const BulkAssetCreation& inCreation) {
                 return ioForm.AddNewAsset(inIndex, inCreation);
             },
             &FitCreations,
             [self](int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetCreation>& ioItems) {
                 self->OnAssetsCreated(inResult, inAnswer, ioItems);
             }),
         nullptr);
}

void BulkTransaction::SendDeletions(const OperationRef& inOperation,
                                    std::vector<BulkAssetDeletion> inDeletions) {
    Send(inOperation, mSetup.deleteLink, BulkSender::Verb::kPost,
         MakePending(
             std::move(inDeletions),
             [](BulkForm& ioForm, std::size_t, const BulkAssetDeletion& inDeletion) {
                 return ioForm.AddDeletion(inDeletion.assetID);
             },
             function<bool(const std::vector<BulkAssetDeletion>&, const BulkAnswer&)>(),
             [](int inResult, const BulkAnswer&, std::vector<BulkAssetDeletion>& ioItems) {
                 for (const BulkAssetDeletion& deletion : ioItems) {
                     if (deletion.completion) {
                         deletion.completion(inResult);
                     }
                 }
             }),
         nullptr);
}

void BulkTransaction::SendEdits(const OperationRef& inOperation, Edits& ioEdits) {
    TakeStates(ioEdits);
    BulkAssetSplit assets;
    BulkEnclosureSplit enclosures;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::ReadyToEdit");
        assets = SplitAssetEdits(std::move(ioEdits.assets), mState);
        enclosures = SplitProductionEnclosures(std::move(ioEdits.production), mState.productionEnclosures);
    }
    CallAll(assets.empty, kResultSuccess);
    SendNewItems(inOperation, std::move(assets.created), std::move(enclosures.created));
    SendChanges(inOperation, std::move(assets.edited), std::move(enclosures.edited));
}

void BulkTransaction::SendNewItems(const OperationRef& inOperation, std::vector<BulkAssetItem> inAssetItems,
                                   std::vector<BulkEnclosureItem> inEnclosures) {
    const auto self = shared_from_this();
    const auto assetItems = MakePending(
        std::move(inAssetItems),
        [](BulkForm& ioForm, std::size_t, const BulkAssetItem& inItem) {
            return ioForm.AddNewItems(inItem.first, inItem.second);
        },
        &FitAssetItems,
        [self](int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetItem>& ioItems) {
            self->OnItemsCreated(inResult, inAnswer, ioItems);
        });
    const auto enclosures = MakePending(
        std::move(inEnclosures),
        [](BulkForm& ioForm, std::size_t inIndex, const BulkEnclosureItem& inItem) {
            return ioForm.AddNewProductionEnclosure(inIndex, inItem.first, inItem.second.data);
        },
        &FitEnclosures,
        [self](int inResult, const BulkAnswer& inAnswer, std::vector<BulkEnclosureItem>& ioItems) {
            self->OnProductionEnclosuresCreated(inResult, inAnswer, ioItems);
        });
    Send(inOperation, mSetup.createLink, BulkSender::Verb::kPost, assetItems, enclosures);
}

void BulkTransaction::SendChanges(const OperationRef& inOperation, std::vector<BulkAssetItem> inAssetEdits,
                                  std::vector<BulkEnclosureItem> inEnclosures) {
    const auto self = shared_from_this();
    const auto edits = MakePending(
        std::move(inAssetEdits),
        [self](BulkForm& ioForm, std::size_t, const BulkAssetItem& inItem) {
            return self->WriteEdit(ioForm, inItem);
        },
        &FitAssetItems,
        [self](int inResult, const BulkAnswer& inAnswer, std::vector<BulkAssetItem>& ioItems) {
            self->OnAssetsEdited(inResult, inAnswer, ioItems);
        });
    const auto enclosures = MakePending(
        std::move(inEnclosures),
        [](BulkForm& ioForm, std::size_t, const BulkEnclosureItem& inItem) {
            return ioForm.AddProductionEnclosureEdit(inItem.first, inItem.second.data);
        },
        &FitEnclosures,
        [self](int inResult, const BulkAnswer& inAnswer, std::vector<BulkEnclosureItem>& ioItems) {
            self->OnProductionEnclosuresEdited(inResult, inAnswer, ioItems);
        });
    Send(inOperation, mSetup.editLink, BulkSender::Verb::kPut, edits, enclosures);
}

BulkWritten BulkTransaction::WriteEdit(BulkForm& ioForm, const BulkAssetItem& inItem) {
    BulkAssetState state;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::WriteEdit");
        const auto known = mState.assets.find(inItem.first);
        if (known == mState.assets.end()) {
            return BulkWritten::kNothing;
        }
        state = known->second;
    }
    return ioForm.AddEdit(inItem.first, inItem.second, state);
}

}  // namespace ZOCL
