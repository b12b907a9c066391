// The loads: session, differences, then for each item the common ancestor, the shared head and the session's
// own packet, side by side.
#include "Collaboration/ZOAutoResolveOperation.h"

#include <set>

#include "Collaboration/XMPEnclosureBase.h"
#include "Frame/ProgressWindow.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/Trace.h"
#include "Resources/JoinText.h"
#include "ZOClient/XMPMerge.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;

namespace {

const char kTitle[] = "$$$/ZOCL/ZOAutoResolveProgressDialog/Title=Resolve Conflicts";
const char kCaption[] =
    "$$$/ZOCL/ZOAutoResolveProgressDialog/Caption=Attempting to automatically resolve conflicts...";

constexpr AutoMergeTexts kBaseTexts{
    "OnBaseCommitProductionLoaded: Failed to load base commit production, url = ",
    "OnBaseCommitEnclosuresLoaded: Failed to load base commit production enclosures, url = ",
    "OnBaseCommitEnclosurePayloadLoaded: Failed to load base commit production enclosure payload, url = "};
constexpr AutoMergeTexts kHeadTexts{
    "OnHeadRevisionProductionLoaded: Failed to load base commit production, url = ",
    "OnHeadRevisionEnclosuresLoaded: Failed to load base commit production enclosures, url = ",
    "OnProductionEnclosurePayloadLoaded: Failed to load production enclosure payload, url = "};
constexpr AutoMergeTexts kSessionTexts{
    nullptr, "OnSessionEnclosurePayloadLoaded: Failed to load base session enclosure payload, url = ",
    "OnSessionEnclosurePayloadLoaded: Failed to load base session enclosure payload, url = "};

/// Three loads, a merge and a write.
constexpr std::size_t kStepsOfItem = 5;

ostcore::debug::TraceChannel& Channel() {
    static ostcore::debug::TraceChannel channel("ZOCL.AutoMerge");
    return channel;
}

template <class T>
InterfaceRef<IZOCServerResource> AsResource(const InterfaceRef<T>& inObject) {
    return RFL::QueryInterface<IZOCServerResource>(inObject);
}

ImmutableString URLOf(const InterfaceRef<IZOCServerResource>& inResource) {
    return inResource ? inResource->GetHTTPURL() : ImmutableString();
}

bool IsLoaded(int inResult, const InterfaceRef<IZOCServerResource>& inResource) {
    return inResult >= 0 && inResource && inResource->IsLoaded();
}

CompoundAsyncOperation::WorkFunction LoadOnce(const InterfaceRef<IZOCServerResource>& inResource) {
    return [inResource](const Guid& inID, const RequestCompletion& inCompletion) {
        return inResource && inResource->Load(inID, inCompletion, true);
    };
}

/// What others may hold as well is asked for anew.
CompoundAsyncOperation::WorkFunction LoadAnew(const InterfaceRef<IZOCServerResource>& inResource) {
    return [inResource](const Guid& inID, const RequestCompletion& inCompletion) {
        if (!inResource) {
            return false;
        }
        return inResource->IsLoaded() ? inResource->Refresh(inID, inCompletion)
                                      : inResource->Load(inID, inCompletion, true);
    };
}

template <class Intermediate>
void InitiateForgiving(const shared_ptr<CompoundAsyncOperation>& inOperation,
                       const CompoundAsyncOperation::WorkFunction& inWork,
                       const Intermediate& inIntermediate) {
    constexpr bool kForgiveNotModified = true;
    inOperation->Initiate(inWork, inIntermediate, CompoundAsyncOperation::TryToCancelFunction(),
                          kForgiveNotModified);
}

}  // namespace

ZOAutoResolveOperation::ZOAutoResolveOperation(const InterfaceRef<IZOCEditingSession>& inSession,
                                               const ImmutableString& inCommitID)
    : mSession(inSession), mServer(IZOCDataServer::GetLoggedInServerRef()), mCommitID(inCommitID) {}

UString ZOAutoResolveOperation::GetDescription() {
    return u"ZOAutoResolveOperation";
}

bool ZOAutoResolveOperation::ConflictsRemain() const {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::ConflictsRemain");
    return mConflictsRemain;
}

void ZOAutoResolveOperation::SetConflictsRemain(bool inRemain) {
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::SetConflictsRemain");
    mConflictsRemain = inRemain;
}

void ZOAutoResolveOperation::TraceFailure(const char* inText, const ImmutableString& inURL) const {
    // What a cancel stops has not failed.
    if (!IsCanceled() && Channel().IsEnabled(ostcore::debug::kTraceLevel_Error)) {
        ostcore::debug::Trace(Channel(), ostcore::debug::kTraceLevel_Error, JoinText(inText, inURL));
    }
}

void ZOAutoResolveOperation::CountSteps(std::size_t inCount) {
    constexpr std::size_t kParts = 100;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::CountSteps");
        mStepsDone += inCount;
        if (mIsTellingSteps) {
            return;
        }
        mIsTellingSteps = true;
    }
    // One thread at a time tells, and goes on while the others count, so that progress never goes back.
    // Thousands of small steps are shown in a hundred larger ones.
    while (true) {
        std::size_t done = 0;
        std::size_t all = 0;
        {
            ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::CountSteps");
            done = mStepsDone;
            all = mStepsAll;
            if (all == 0 || done * kParts / all == mStepsTold * kParts / all) {
                mIsTellingSteps = false;
                return;
            }
            mStepsTold = done;
        }
        RFL::StationUtils::PostMessageToUIThread(
            GetStationID(),
            RFL::UpdateOperationProgressMessage(static_cast<double>(done), static_cast<double>(all)), false);
    }
}

ZOAutoResolveOperation::Operation ZOAutoResolveOperation::MakeOperation(
    const CompoundAsyncOperation::FinalCompletion& inFinal) {
    Operation operation = CompoundAsyncOperation::Create(inFinal, mServer, false);
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::MakeOperation");
        mOperation = operation;
    }
    return operation;
}

void ZOAutoResolveOperation::Abort() {
    ZOOperationBase::Abort();
    Operation operation;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::Abort");
        operation = mOperation;
    }
    if (operation) {
        operation->TryToCancel();
    }
}

void ZOAutoResolveOperation::End(int inResult) {
    Operation ended;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::End");
        ended.swap(mOperation);
    }
    FinishOperation(inResult);
}

bool ZOAutoResolveOperation::Start() {
    if (!mSession || !mServer || IsCanceled()) {
        return false;
    }
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const Operation operation = MakeOperation([self](int inResult) { self->OnLoadsEnded(inResult); });
    InitiateForgiving(
        operation,
        [self](const Guid& inID, const RequestCompletion& inCompletion) {
            return self->mSession->Refresh(inID, inCompletion);
        },
        [self, operation](int inResult) { return self->OnSessionRefreshed(operation, inResult); });
    return true;
}

int ZOAutoResolveOperation::OnSessionRefreshed(const Operation& inOperation, int inResult) {
    if (inResult < 0) {
        return inResult;
    }
    const auto production = RFL::QueryInterface<IZOCProduction>(mSession);
    mOutgoingChanges = mSession->GetOutgoingChanges();
    mEnclosures = production ? production->GetEnclosures() : nullptr;
    if (!mOutgoingChanges || !mEnclosures) {
        return kResultFailure;
    }
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::OnSessionRefreshed");
        mLoadsInFlight = 2;
    }
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const auto onLoaded = [self, inOperation](int inLoadResult) {
        return self->OnOneOfTwoLoaded(inOperation, inLoadResult);
    };
    InitiateForgiving(inOperation, LoadAnew(AsResource(mOutgoingChanges)), onLoaded);
    InitiateForgiving(inOperation, LoadAnew(AsResource(mEnclosures)), onLoaded);
    return kResultSuccess;
}

int ZOAutoResolveOperation::OnOneOfTwoLoaded(const Operation& inOperation, int inResult) {
    bool isLast = false;
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::OnOneOfTwoLoaded");
        isLast = --mLoadsInFlight == 0;
    }
    if (inResult < 0) {
        return inResult;
    }
    return isLast ? OnDifferencesAndEnclosuresLoaded(inOperation) : kResultSuccess;
}

int ZOAutoResolveOperation::OnDifferencesAndEnclosuresLoaded(const Operation& inOperation) {
    if (!IsLoaded(kResultSuccess, AsResource(mOutgoingChanges)) ||
        !IsLoaded(kResultSuccess, AsResource(mEnclosures))) {
        return kResultFailure;
    }
    SetConflictsRemain(mOutgoingChanges->HasConflicts());
    MakeItems();
    if (mItems.empty()) {
        return kResultSuccess;
    }
    AutoMergeItems all;
    for (const auto& item : mItems) {
        all.push_back(item.second);
    }
    const ImmutableString production = mSession->GetParentProductionIdentifier();
    // The shared commit that the session was merged with, which is the head unless somebody has shared since.
    mHeadCommitId = mOutgoingChanges->GetBaseCommitID();
    LoadProduction(inOperation, make_shared<Source>(
                                    Source{mServer->GetProductionByIdAndCommitId(production, mHeadCommitId),
                                           all, &AutoMergeItem::head, &kHeadTexts}));
    for (auto& base : mBaseCommitItems) {
        base.second.production = mServer->GetProductionByIdAndCommitId(production, base.first);
        LoadProduction(inOperation, make_shared<Source>(Source{base.second.production, base.second.items,
                                                               &AutoMergeItem::base, &kBaseTexts}));
    }
    LoadLists(inOperation, make_shared<Source>(Source{RFL::QueryInterface<IZOCProduction>(mSession), all,
                                                      &AutoMergeItem::session, &kSessionTexts}));
    return kResultSuccess;
}

void ZOAutoResolveOperation::MakeItems() {
    for (const IZOCDifferences::Entry& entry : mOutgoingChanges->GetEnclosureDifferences()) {
        const ImmutableString assetName =
            entry.IsInConflict() ? GetXMPEnclosureBase(entry.name) : ImmutableString();
        if (assetName.empty()) {
            continue;
        }
        const auto item = make_shared<AutoMergeItem>();
        item->assetName = assetName;
        item->enclosureName = entry.name;
        item->assetID = entry.identifier;
        if (mItems.emplace(ItemKey(entry.identifier, entry.name), item).second) {
            mBaseCommitItems[entry.baseCommitID].items.push_back(item);
        }
    }
    ScopedLock lock(IZOCDataServer::GetLock(), "ZOAutoResolveOperation::MakeItems");
    mStepsAll = mItems.size() * kStepsOfItem;
}

void ZOAutoResolveOperation::LoadProduction(const Operation& inOperation,
                                            const shared_ptr<const Source>& inSource) {
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    const auto resource = AsResource(inSource->production);
    inOperation->Initiate(LoadOnce(resource), [self, inOperation, inSource, resource](int inResult) {
        if (IsLoaded(inResult, resource)) {
            self->LoadLists(inOperation, inSource);
        } else {
            self->TraceFailure(inSource->texts->production, URLOf(resource));
            self->CountSteps(inSource->items.size());
        }
        return kResultSuccess;
    });
}

void ZOAutoResolveOperation::LoadLists(const Operation& inOperation,
                                       const shared_ptr<const Source>& inSource) {
    std::set<bool> kinds;
    for (const auto& item : inSource->items) {
        kinds.insert(!item->assetID.empty());
    }
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    for (const bool isOfAssets : kinds) {
        const auto list = isOfAssets ? AsResource(inSource->production->GetAssets())
                                     : AsResource(inSource->production->GetEnclosures());
        // The session's own enclosures have just been loaded, its assets may be older than its head.
        const auto onLoaded = [self, inOperation, inSource, list, isOfAssets](int inResult) {
            if (!IsLoaded(inResult, list)) {
                self->TraceFailure(inSource->texts->enclosures, URLOf(list));
            }
            self->LoadPayloads(inOperation, inSource, isOfAssets);
            return kResultSuccess;
        };
        InitiateForgiving(inOperation, isOfAssets ? LoadAnew(list) : LoadOnce(list), onLoaded);
    }
}

void ZOAutoResolveOperation::LoadPayloads(const Operation& inOperation,
                                          const shared_ptr<const Source>& inSource, bool inOfAssets) {
    const InterfaceRef<IZOCEnclosures> enclosures = inSource->production->GetEnclosures();
    const InterfaceRef<IZOCAssetList> assets = inSource->production->GetAssets();
    for (const auto& item : inSource->items) {
        if (item->assetID.empty() == inOfAssets) {
            continue;
        }
        const InterfaceRef<IZOCAsset> asset =
            inOfAssets && assets ? assets->GetAssetByIdentifier(item->assetID) : nullptr;
        ((*item).*(inSource->side)).enclosures = !inOfAssets ? enclosures
                                                 : asset     ? asset->GetEnclosures()
                                                             : nullptr;
        LoadPayload(inOperation, inSource, item);
    }
}

void ZOAutoResolveOperation::LoadPayload(const Operation& inOperation,
                                         const shared_ptr<const Source>& inSource,
                                         const shared_ptr<AutoMergeItem>& inItem) {
    const InterfaceRef<IZOCEnclosures> enclosures = ((*inItem).*(inSource->side)).enclosures;
    const InterfaceRef<ZOAutoResolveOperation> self(this);
    inOperation->Initiate(
        [enclosures, inItem](const Guid& inID, const RequestCompletion& inCompletion) {
            return enclosures && LoadSpecificEnclosure(enclosures, inItem->enclosureName, inID, inCompletion);
        },
        [self, inSource, inItem, enclosures](int inResult) {
            const InterfaceRef<IZOCEnclosure> enclosure =
                inResult >= 0 ? enclosures->GetEnclosure(inItem->enclosureName) : nullptr;
            if (enclosure && enclosure->EnclosureDataIsLoaded()) {
                ((*inItem).*(inSource->side)).payload = enclosure->GetEnclosurePayload();
            } else {
                self->TraceFailure(inSource->texts->payload, URLOf(AsResource(enclosures)));
            }
            self->CountSteps(1);
            return kResultSuccess;
        });
}

void ZOAutoResolveOperation::OnLoadsEnded(int inResult) {
    if (inResult < 0 || IsCanceled() || !MergeItems()) {
        return End(IsCanceled() ? kResultCancelled : inResult);
    }
    StartWriting();
}

bool AutoResolveXMPConflicts(const ImmutableString& inSessionURL, const ImmutableString& inCommitID) {
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    const auto session =
        server && !inSessionURL.empty()
            ? RFL::QueryInterface<IZOCEditingSession>(server->GetProductionFromURL(inSessionURL))
            : nullptr;
    const InterfaceRef<ZOAutoResolveOperation> operation(new ZOAutoResolveOperation(session, inCommitID));
    ProgressWindowSettings settings;
    settings.title = ostcore::ZString(kTitle).AsUTF8();
    settings.caption = ostcore::ZString(kCaption).AsUTF8();
    RunProgressWindow(operation, settings);
    return operation->ConflictsRemain();
}

}  // namespace ZOCL
