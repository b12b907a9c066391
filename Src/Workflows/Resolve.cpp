// Conflicts: the list of them, the window, and the way without a window.
#include <algorithm>

#include "Dialogs/ResolveChoices.h"
#include "Dialogs/ZOResolveDialog.h"
#include "ostcore/config/ZString.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "Workflows/ResolveFlow.h"
#include "Workflows/WorkflowTools.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {
namespace Publish {

using ostcore::ZString;
using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;

namespace {

const char kPrepareTitle[] = "$$$/ZOCL/PrepareResolveProgressTitle=Resolve Conflicts";
const char kPrepareCaption[] = "$$$/ZOCL/PrepareResolveProgressCaption=Loading conflict details for \"@0\"";
const char kSuccessTitle[] = "$$$/ZOCL/ResolveDialogAllSuccessfulTitle=Resolve Conflicts";
const char kSuccessMessage[] =
    "$$$/ZOCL/ResolveDialogAllSuccessful=All conflicts were successfully resolved.";

/// Null when the conflicts could not be read.
InterfaceRef<ZOPrepareResolveOperation> LoadConflicts(const UString& inProductionName,
                                                      const ImmutableString& inSessionURL) {
    const InterfaceRef<ZOPrepareResolveOperation> prepare(new ZOPrepareResolveOperation(inSessionURL));
    const bool isRead = DoIndeterminateProgressDialog(
        ZString(kPrepareTitle).AsString(), ZString(kPrepareCaption, {ToUTF8(inProductionName)}).AsString(),
        prepare, true, false);
    return isRead ? prepare : nullptr;
}

ConflictItem MakeConflictItem(const ConflictItemData& inData,
                              const std::set<ImmutableString>& inCopyableTypes) {
    ConflictItem item;
    item.displayName = ToUTF16(inData.displayName.str());
    item.path = ToUTF16(inData.path.str());
    item.typeText = GetConflictKindText(inData.kind);
    item.identifier = inData.assetIdentifier;
    item.resolveTypes = GetResolveTypes(inData, inCopyableTypes);
    return item;
}

}  // namespace

bool GetCurrentConflictList(const UString& inProductionName, const ImmutableString& inSessionURL,
                            const std::set<ImmutableString>& inCopyableTypes,
                            std::vector<ConflictItem>& outItems) {
    outItems.clear();
    const auto conflicts = LoadConflicts(inProductionName, inSessionURL);
    if (!conflicts) {
        return false;
    }
    for (const ConflictItemData& data : conflicts->GetConflicts()) {
        outItems.push_back(MakeConflictItem(data, inCopyableTypes));
    }
    return true;
}

bool Resolve(const UString& inProductionName, const ImmutableString& inSessionURL,
             const ImmutableString& inProductionURL, const ResolveCompletion& inResolveCompletion,
             const ConflictsKeptFunction& inConflictsKept, const std::set<ImmutableString>& inCopyableTypes,
             const shared_ptr<PublishWorkflowTracker>& inTracker,
             const WorkflowContinuation& inWorkflowContinuation) {
    if (!ostcore::threads::IsMainThread()) {
        return false;
    }
    const auto flow = boost::make_shared<ResolveFlow>(
        ResolveFlowSettings{inProductionName, inSessionURL, inProductionURL, inResolveCompletion,
                            inConflictsKept, inCopyableTypes, inTracker, inWorkflowContinuation});
    ZOResolveDialog::Settings settings;
    settings.productionName = inProductionName;
    settings.sessionURL = inSessionURL;
    settings.copyableTypes = inCopyableTypes;
    settings.onConflictsKnown = [flow](const ImmutableString& inCommitId) { flow->SetCommitId(inCommitId); };
    settings.resolve = [flow](const std::vector<ConflictItemData>& inItems, ResolveType inType) {
        return flow->Run(inItems, inType).settled;
    };
    settings.mustWait = [flow] { return flow->WaitsForHost(); };
    bool isResolved = false;
    {
        const ScopedResolve mark(inSessionURL);
        ZOResolveDialog dialog(settings);
        flow->SetOnHostDone([&dialog] { dialog.Refresh(); });
        isResolved = dialog.RunModal() == ostui::kResponseOK;
        flow->SetOnHostDone({});
    }
    if (isResolved && !flow->HasLoginEnded()) {
        ShowMessage(kSuccessTitle, kSuccessMessage, ostui::MessageBoxIcon::kNote);
        flow->Finish();
    }
    return isResolved;
}

bool ResolveIndividualConflicts(const UString& inProductionName, const ImmutableString& inSessionURL,
                                const ImmutableString& inProductionURL,
                                const std::vector<ImmutableString>& inConflictIdentifiers,
                                ResolveType inResolveType, const ResolveCompletion& inResolveCompletion,
                                const ConflictsKeptFunction& inConflictsKept,
                                const std::set<ImmutableString>& inCopyableTypes) {
    if (!ostcore::threads::IsMainThread()) {
        return false;
    }
    const LoginWatch login;
    const ScopedResolve mark(inSessionURL);
    const auto conflicts = LoadConflicts(inProductionName, inSessionURL);
    if (!conflicts || login.HasEnded()) {
        return false;
    }
    std::vector<ConflictItemData> items = conflicts->GetConflicts();
    const auto isUnwanted = [&](const ConflictItemData& inItem) {
        return std::find(inConflictIdentifiers.begin(), inConflictIdentifiers.end(),
                         inItem.assetIdentifier) == inConflictIdentifiers.end();
    };
    items.erase(std::remove_if(items.begin(), items.end(), isUnwanted), items.end());
    if (items.empty() || !AllowResolveType(items, inResolveType, inCopyableTypes)) {
        return false;
    }
    const auto flow = boost::make_shared<ResolveFlow>(
        ResolveFlowSettings{inProductionName, inSessionURL, inProductionURL, inResolveCompletion,
                            inConflictsKept, inCopyableTypes, nullptr, WorkflowContinuation()});
    flow->SetCommitId(conflicts->GetCommitId());
    return flow->Run(items, inResolveType).result >= 0;
}

}  // namespace Publish
}  // namespace ZOCL
