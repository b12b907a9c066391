// The merge of what was loaded, and the way of the results into the session.
#include <exception>

#include "Collaboration/XMPTreeMerge.h"
#include "Collaboration/ZOAutoResolveOperation.h"
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "ostcore/config/ZString.h"
#include "ostnet/HeaderConstants.h"
#include "Resources/JoinText.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

const char kCommitMessage[] =
    "$$$/ZOCL/ZOAutoResolveOperation/commitMessage=Automatically resolved XMP conflicts.";
constexpr const char* kKey_CommitID = ":commitId";
/// What the transaction says of itself, so that its commit ends the conflicts of what it wrote.
constexpr const char* kMetadata_AnswersConflicts = "answersConflicts";
constexpr const char* kMetadata_Yes = "true";

InterfaceRef<IZOCWritableEnclosure> FindWritable(const InterfaceRef<IZOCProduction>& inProduction,
                                                 const AutoMergeItem& inItem) {
    InterfaceRef<IZOCEnclosures> enclosures;
    if (inItem.assetID.empty()) {
        enclosures = inProduction->GetEnclosures();
    } else if (const auto assets = inProduction->GetAssets()) {
        const auto asset = assets->GetAssetByIdentifier(inItem.assetID);
        enclosures = asset ? asset->GetEnclosures() : nullptr;
    }
    return enclosures
               ? RFL::QueryInterface<IZOCWritableEnclosure>(enclosures->GetEnclosure(inItem.enclosureName))
               : nullptr;
}

}  // namespace

/// True when there is something to write.
bool ZOAutoResolveOperation::MergeItems() {
    bool hasMerged = false;
    for (const auto& entry : mItems) {
        if (IsCanceled()) {
            return false;
        }
        AutoMergeItem& item = *entry.second;
        if (item.base.payload && item.head.payload && item.session.payload) {
            MergeItem(item);
        }
        // Of thousands of items the packets need not all stay.
        item.base = item.head = item.session = AutoMergeItem::Side();
        hasMerged = hasMerged || item.merged;
        if (!item.merged) {
            SetConflictsRemain(true);
        }
        CountSteps(1);
    }
    return hasMerged;
}

void ZOAutoResolveOperation::MergeItem(AutoMergeItem& ioItem) {
    const auto base = OrvaneXMP::ReadPacket(ioItem.base.payload->view());
    const auto latest = OrvaneXMP::ReadPacket(ioItem.head.payload->view());
    const auto user = OrvaneXMP::ReadPacket(ioItem.session.payload->view());
    for (const OrvaneXMP::ReadResult* const read : {&base, &latest, &user}) {
        if (!*read) {
            const std::string text =
                "MergeItem: Failed to read a packet, " + read->failure.Text() + ", name = ";
            return TraceFailure(text.c_str(), ioItem.enclosureName);
        }
    }
    try {
        const auto result = MergeXMPTrees(*base.packet, *latest.packet, *user.packet);
        if (result->GetUnResolvedConflicts().empty()) {
            ioItem.merged =
                RecycledMemory::CreateFromBytes(OrvaneXMP::WritePacket(result->GetMergedPacket()));
        }
    } catch (const std::exception&) {
        // Too large together, or no memory for it: the user decides.
        TraceFailure("MergeItem: Failed to write the merged packet, name = ", ioItem.enclosureName);
    }
}

void ZOAutoResolveOperation::StartWriting() {
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const Operation operation = MakeOperation([self](int inResult) { self->OnWritesEnded(inResult); });
    // Once it is on its way the server may have opened the transaction, which then has to be rolled back: a
    // cancel lets it come to its end.
    const CompoundAsyncOperation::TryToCancelFunction goOn = [](const Guid&) {};
    operation->Initiate(
        [self](const Guid& inID, const RequestCompletion& inCompletion) {
            const ExtraTransactionMetadata extra{{kMetadata_AnswersConflicts, kMetadata_Yes}};
            return self->mSession->CreateTransaction(inID, inCompletion, kTransactionType_Edit, extra);
        },
        [self, operation](int inResult, const InterfaceRef<IZOCServerResource>& inTransaction,
                          const shared_ptr<ostnet::Response>&) {
            return self->OnTransactionCreated(operation, inResult, inTransaction);
        },
        goOn);
}

int ZOAutoResolveOperation::OnTransactionCreated(const Operation& inOperation, int inResult,
                                                 const InterfaceRef<IZOCServerResource>& inTransaction) {
    mTransaction = inResult >= 0 ? RFL::QueryInterface<IZOCTransaction>(inTransaction) : nullptr;
    if (!mTransaction) {
        TraceFailure("OnTransactionCreated: Failed to create transaction, url = ",
                     RFL::QueryInterface<IZOCServerResource>(mSession)->GetHTTPURL());
        return inResult < 0 ? inResult : kResultFailure;
    }
    bool isOfAssets = false;
    bool isOfProduction = false;
    for (const auto& entry : mItems) {
        if (entry.second->merged) {
            (entry.second->assetID.empty() ? isOfProduction : isOfAssets) = true;
        }
    }
    if (isOfProduction) {
        LoadListAndWrite(inOperation, false);
    }
    if (isOfAssets) {
        LoadListAndWrite(inOperation, true);
    }
    return kResultSuccess;
}

void ZOAutoResolveOperation::LoadListAndWrite(const Operation& inOperation, bool inOfAssets) {
    const auto production = RFL::QueryInterface<IZOCProduction>(mTransaction);
    const auto list = inOfAssets ? RFL::QueryInterface<IZOCServerResource>(production->GetAssets())
                                 : RFL::QueryInterface<IZOCServerResource>(production->GetEnclosures());
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    inOperation->Initiate(
        [list](const Guid& inID, const RequestCompletion& inCompletion) {
            return list && list->Load(inID, inCompletion, true);
        },
        [self, inOperation, inOfAssets](int inResult) {
            if (inResult < 0) {
                return inResult;
            }
            for (const auto& entry : self->mItems) {
                if (entry.second->merged && entry.second->assetID.empty() != inOfAssets) {
                    self->WriteItem(inOperation, entry.second);
                }
            }
            return kResultSuccess;
        });
}

void ZOAutoResolveOperation::WriteItem(const Operation& inOperation,
                                       const shared_ptr<AutoMergeItem>& inItem) {
    const auto enclosure = FindWritable(RFL::QueryInterface<IZOCProduction>(mTransaction), *inItem);
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    inOperation->Initiate(
        [enclosure, payload = inItem->merged](const Guid& inID, const RequestCompletion& inCompletion) {
            return enclosure && enclosure->PutEnclosurePayload(payload, inID, inCompletion);
        },
        [self, inItem](int inResult) {
            if (inResult < 0) {
                inItem->merged.reset();
                self->TraceFailure("OnEnclosureWritten: Failed to write merged payload, name = ",
                                   inItem->enclosureName);
            }
            self->CountSteps(1);
            return kResultSuccess;
        });
}

void ZOAutoResolveOperation::OnWritesEnded(int inResult) {
    bool hasWritten = false;
    for (const auto& entry : mItems) {
        hasWritten = hasWritten || entry.second->merged;
    }
    {
        // From here on a cancel comes too late.
        Operation ended;
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::OnWritesEnded");
        ended.swap(mOperation);
    }
    if (inResult < 0 || IsCanceled() || !hasWritten) {
        return GiveUp(IsCanceled() ? kResultCancelled : inResult);
    }
    Commit();
}

void ZOAutoResolveOperation::Commit() {
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const RequestCompletion onCommitted =
        [self](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
               const shared_ptr<ostnet::Response>& inResponse) { self->OnCommitted(inResult, inResponse); };
    if (!mTransaction->Commit(Guid::CreateUnique(), onCommitted,
                              ostcore::ZString(kCommitMessage).AsString())) {
        OnCommitted(kResultNotStarted, nullptr);
    }
}

void ZOAutoResolveOperation::OnCommitted(int inResult, const shared_ptr<ostnet::Response>&) {
    if (inResult < 0) {
        TraceFailure("OnCommitted: Failed to commit, url = ",
                     RFL::QueryInterface<IZOCServerResource>(mTransaction)->GetHTTPURL());
        return GiveUp(inResult);
    }
    mTransaction.Reset();
    const ImmutableString revision = RFL::QueryInterface<IZOCProduction>(mSession)->GetLoadedRevision();
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::OnCommitted");
        mCommitID = revision;
    }
    ReloadDifferences(true);
}

void ZOAutoResolveOperation::ReloadDifferences(bool inMayAcceptOwn) {
    mOutgoingChanges = mSession->GetOutgoingChanges();
    const auto resource = RFL::QueryInterface<IZOCServerResource>(mOutgoingChanges);
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const RequestCompletion onLoaded = [self, resource, inMayAcceptOwn](
                                           const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                                           const shared_ptr<ostnet::Response>&) {
        const bool isLoaded = inResult >= 0 && resource->IsLoaded();
        self->SetConflictsRemain(!isLoaded || self->mOutgoingChanges->HasConflicts());
        if (!isLoaded || !inMayAcceptOwn || !self->AcceptOwnSides()) {
            self->End(kResultSuccess);
        }
    };
    if (!resource || !resource->Load(Guid::CreateUnique(), onLoaded, true)) {
        SetConflictsRemain(true);
        End(kResultSuccess);
    }
}

/// A merge can come out as what the session has already, which is no change that answers by itself.
bool ZOAutoResolveOperation::AcceptOwnSides() {
    std::vector<ImmutableString> links;
    for (const IZOCDifferences::Entry& entry : mOutgoingChanges->GetEnclosureDifferences()) {
        const auto item = mItems.find(ItemKey(entry.identifier, entry.name));
        if (entry.IsInConflict() && !entry.acceptYoursURL.empty() && item != mItems.end() &&
            item->second->merged) {
            links.push_back(entry.acceptYoursURL);
        }
    }
    if (links.empty()) {
        return false;
    }
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const Operation operation =
        CompoundAsyncOperation::Create([self](int) { self->ReloadDifferences(false); }, mServer, false);
    const auto body = RecycledMemory::CreateFromBytes(JoinText("{\"", kKey_CommitID, "\":\"\"}"));
    const auto acceptAll = [=](const Guid& inID, const RequestCompletion& inCompletion) {
        for (std::size_t at = 1; at < links.size(); ++at) {
            operation->Initiate(
                [server = self->mServer, link = links[at], body](const Guid& inPostID,
                                                                 const RequestCompletion& inPosted) {
                    return server->PostToURL(link, body, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8,
                                             inPostID, inPosted);
                },
                [](int) { return kResultSuccess; });
        }
        return self->mServer->PostToURL(links[0], body, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8,
                                        inID, inCompletion);
    };
    operation->Initiate(acceptAll, [](int) { return kResultSuccess; });
    return true;
}

void ZOAutoResolveOperation::GiveUp(int inResult) {
    SetConflictsRemain(true);
    const InterfaceRef<IZOCTransaction> transaction = std::exchange(mTransaction, nullptr);
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const RequestCompletion onRolledBack =
        [self, inResult](const Guid&, int, const InterfaceRef<IZOCServerResource>&,
                         const shared_ptr<ostnet::Response>&) { self->EndAfterFailure(inResult); };
    if (!transaction || !transaction->Rollback(Guid::CreateUnique(), onRolledBack)) {
        EndAfterFailure(inResult);
    }
}

void ZOAutoResolveOperation::EndAfterFailure(int inResult) {
    if (inResult != kResultHTTPPreconditionFailed) {
        return End(inResult);
    }
    // The session was changed behind our back; find out by whom.
    ImmutableString known;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::EndAfterFailure");
        known = mCommitID;
    }
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const bool isStarted = FindRecentRevisionWithCommitMetadata(
        RFL::QueryInterface<IZOCProduction>(mSession), known,
        [self, inResult](int inWalkResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
            self->ProcessRecentRevisionResult(inWalkResult, inVersion);
            self->End(inResult);
        });
    if (!isStarted) {
        End(inResult);
    }
}

}  // namespace ZOCL
