// What a session tells of its surroundings, and how it is shared and brought up to date.
#include "CollaborationFactory.h"
#include "Model/DataServerCaches.h"
#include "Model/OwnCommit.h"
#include "Model/Production.h"
#include "Model/ProductionList.h"
#include "Model/ResourceCreation.h"
#include "Model/TransactionList.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"
#include "RequestChain/RepeatMark.h"
#include "ResourceFactory.h"

namespace ZOCL {

using ostcore::threads::ScopedLock;
using ostcore::utility::ToUTF8;

namespace {

// The fields of the forms of push and pull.
const ImmutableString kField_CommitMessage(":commitMessage");
const ImmutableString kField_CommitID(":commitId");
const ImmutableString kField_ResolveStrategy(":resolveStrategy");
const ImmutableString kField_MergeStrategy(":mergeStrategy");

const char* MergeStrategyText(int inStrategy) {
    switch (inStrategy) {
        case kMergeStrategy_Yours:
            return "accept-yours";
        case kMergeStrategy_Theirs:
            return "accept-theirs";
        case kMergeStrategy_Interactive:
            return "interactive";
        case kMergeStrategy_Safe:
            return "safe";
        default:
            return "";
    }
}

const char* ResolveStrategyText(int inStrategy) {
    switch (inStrategy) {
        case kResolveStrategy_None:
            return "NONE";
        case kResolveStrategy_Auto:
            return "AUTO";
        default:
            return "";
    }
}

void AddUnlessEmpty(ostnet::http::Form& ioForm, const ImmutableString& inField, const UString& inText) {
    if (!inText.empty()) {
        ioForm.emplace_back(inField, ToUTF8(inText));
    }
}

InterfaceRef<IZOCDifferences> MakeDifferences(const ImmutableString& inURL,
                                              const InterfaceRef<IZOCDataServer>& inServer) {
    CollaborationFactory* const factory = GetCompositionRoot().collaboration;
    return factory && !inURL.empty() ? factory->MakeDifferences(inURL, inServer) : nullptr;
}

}  // namespace

void Production::SetCreationContext(const InterfaceRef<Production>& inParent,
                                    const InterfaceRef<TransactionList>& inTransactions) {
    InterfaceRef<Production> parent = inParent;
    InterfaceRef<TransactionList> transactions = inTransactions;
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::SetCreationContext");
    std::swap(mParent, parent);
    std::swap(mListOfParent, transactions);
    lock.Unlock();
}

ImmutableString Production::GetBaseCommit() {
    return GetBody("Production::GetBaseCommit").BaseCommitID();
}

InterfaceRef<IZOCProduction> Production::GetParentProduction() {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "Production::GetParentProduction");
        if (mParent) {
            return mParent;
        }
    }
    return FindOrMakeProduction(GetServer(), GetParentLink());
}

ImmutableString Production::GetParentProductionIdentifier() {
    return GetBody("Production::GetParentProductionIdentifier").ParentIdentifier();
}

bool Production::PostStrategyForm(const ImmutableString& inRelation, const ostnet::http::Form& inForm,
                                  const Guid& inRequestID, const RequestCompletion& inCompletion) {
    const ImmutableString link = IsLoaded() ? GetLinkHref(inRelation) : ImmutableString();
    if (link.empty()) {
        return false;
    }
    const auto target = ServerResource::MakePlain(link, GetServer(), ResourceWritability::kReadOnly);
    return target->PostMultiPart(inForm, inRequestID, inCompletion);
}

bool Production::Push(const Guid& inRequestID, const RequestCompletion& inCompletion,
                      const UString& inCommitMessage, int inResolveStrategy, const UString& inCommitId) {
    ostnet::http::Form form;
    AddUnlessEmpty(form, kField_CommitMessage, inCommitMessage);
    AddUnlessEmpty(form, kField_CommitID, inCommitId);
    form.emplace_back(kField_ResolveStrategy, ResolveStrategyText(inResolveStrategy));
    return PostStrategyForm(kRelation_Sessions_Session_Push, form, inRequestID,
                            MakePushCompletion(inCommitMessage, inCommitId, inCompletion));
}

RequestCompletion Production::MakePushCompletion(const UString& inMessage, const UString& inCommitID,
                                                 const RequestCompletion& inCompletion) {
    const ImmutableString stated(ToUTF8(inCommitID));
    const ShareAttempt attempt{stated.empty() ? GetLoadedRevision() : stated, inMessage};
    return [self = InterfaceRef<Production>(this), attempt, inCompletion](
               const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
               const shared_ptr<ostnet::Response>& inResponse) {
        if (!inCompletion) {
            return;
        }
        if (!IsRefusedRepetition(inResponse)) {
            inCompletion(inID, inResult, inResource, inResponse);
            return;
        }
        FindOwnShare(
            self->GetHTTPURL(), self->GetServer(), attempt,
            [=](const InterfaceRef<Production>& inSession, const shared_ptr<ostnet::Response>& inAnswer) {
                if (inSession) {
                    inCompletion(inID, kResultSuccess, inSession, inAnswer);
                } else {
                    inCompletion(inID, inResult, inResource, inResponse);
                }
            });
    };
}

bool Production::Pull(const Guid& inRequestID, const RequestCompletion& inCompletion, int inMergeStrategy,
                      const UString& inCommitId) {
    ostnet::http::Form form;
    form.emplace_back(kField_MergeStrategy, MergeStrategyText(inMergeStrategy));
    AddUnlessEmpty(form, kField_CommitID, inCommitId);
    return PostStrategyForm(kRelation_Sessions_Session_Pull, form, inRequestID, inCompletion);
}

InterfaceRef<IZOCDifferences> Production::GetOutgoingChanges() {
    return MakeDifferences(GetLinkHref(kRelation_Sessions_Session_OutgoingChanges), GetServer());
}

InterfaceRef<IZOCDifferences> Production::GetIncomingChanges() {
    return MakeDifferences(GetLinkHref(kRelation_Sessions_Session_IncomingChanges), GetServer());
}

InterfaceRef<IZOCTransactionList> Production::GetOrCreateTransactionList() {
    const ImmutableString link = GetLinkHref(kRelation_Transactions);
    const auto made = TransactionList::Make(link, GetServer(), GetIdentifier());
    ScopedLock lock(IZOCDataServer::GetLock(), "Production::GetOrCreateTransactionList()");
    if (!mTransactions && made) {
        ostcore::debug::Trace("ZOCL", ostcore::debug::kTraceLevel_Progress,
                              "Production::GetOrCreateTransactionList() - setting mTransactions");
        mTransactions = made;
    }
    return mTransactions;
}

}  // namespace ZOCL
