// The share step and its results.
#include "Workflows/ShareStep.h"

#include "Collaboration/ZOPublishOperation.h"
#include "Frame/ProgressWindow.h"
#include "Model/SessionConflictMessage.h"
#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "Workflows/WorkflowTools.h"
#include "ZOClient/Dialogs.h"

namespace ZOCL {

using ostcore::ZString;

namespace {

constexpr std::int32_t kStatusConflict = 409;
const char kTitle[] = "$$$/ZOCL/ZOPublishDialog/ZOPublishProgressDialogTitle=Share My Changes";
const char kCaption[] = "$$$/ZOCL/ZOPublishDialog/ProgressText=Sharing \"@0\"...";
const char kOperationName[] = "$$$/ZOCL/ShareStr=Share";
const char kConflictTitle[] = "$$$/ZOCL/PublishDialogConflictTitleStr=Orvane Meridane";
const char kConflictMessage[] =
    "$$$/ZOCL/PublishDialogConflictError=A newer version of the production exists on the server. Please sync "
    "to the latest version.";
const char kSessionConflictExtra[] =
    "$$$/ZOCL/PublishDialogSessionConflict/ResolveMessageStr=Close the Share dialog to resolve these "
    "changes.";
const char kErrorTitle[] = "$$$/ZOCL/PublishDialogResultTitleStr=Orvane Meridane";
const char kErrorMessage[] = "$$$/ZOCL/PublishDialogError=There was an error while sharing the production.";

bool IsSuccess(int inResult, std::int32_t inStatus) {
    return inResult >= 0 && inStatus >= 200 && inStatus <= 299;
}

/// Quiet: the user is told nothing.
void ProcessResult(const ShareStep& inStep, const InterfaceRef<ZOPublishOperation>& inOperation,
                   const ShareOutcome& inOutcome, std::int32_t inStatus, bool inIsQuiet) {
    const auto complete = [&] {
        if (inStep.completion) {
            inStep.completion(inOutcome.isShared, inOutcome.commitId);
        }
    };
    if (inOutcome.result < 0 && inStatus == kStatusConflict) {
        if (!inIsQuiet) {
            ShowMessage(kConflictTitle, kConflictMessage, ostui::MessageBoxIcon::kCaution);
        }
        return complete();
    }
    if (inOutcome.result == kResultHTTPPreconditionFailed) {
        if (!inIsQuiet) {
            ShowSessionConflictMessage(
                IZOCDataServer::GetLoggedInServerRef(), ZString(kOperationName).AsString(),
                inOperation->GetRecentCommitMetadata(), ZString(kSessionConflictExtra).AsString());
        }
        return complete();
    }
    complete();
    if (!inOutcome.isShared && !inIsQuiet && inOutcome.result != kResultDialogCancelled) {
        ShowMessage(kErrorTitle, kErrorMessage);
    }
}

UString NameFor(const ShareStep& inStep) {
    const auto session = RFL::QueryInterface<IZOCProduction>(inStep.session);
    return inStep.productionName.empty() && session ? session->GetName() : inStep.productionName;
}

}  // namespace

ShareOutcome RunShareStep(const ShareStep& inStep) {
    ShareOutcome outcome;
    if (!inStep.session || inStep.commitId.empty()) {
        return outcome;
    }
    const LoginWatch login;
    const InterfaceRef<ZOPublishOperation> operation(
        new ZOPublishOperation(inStep.session, inStep.comment, inStep.commitId));
    const UString caption = ZString(kCaption, {ostcore::utility::ToUTF8(NameFor(inStep))}).AsString();
    {
        const ScopedSilence silence(inStep.isSilent);
        DoIndeterminateProgressDialog(ZString(kTitle).AsString(), caption, operation, false, true);
    }
    const shared_ptr<ostnet::Response> response = operation->GetResponse();
    const std::int32_t status = response ? response->status : 0;
    outcome.result = GetEffectiveResult(operation);
    outcome.isShared = IsSuccess(outcome.result, status);
    outcome.commitId = operation->GetCommitId();
    ProcessResult(inStep, operation, outcome, status, inStep.isSilent || login.HasEnded());
    const auto resource = RFL::QueryInterface<IZOCServerResource>(inStep.session);
    if (!login.HasEnded()) {
        RefreshSandbox(resource ? resource->GetHTTPURL() : ImmutableString());
    }
    return outcome;
}

}  // namespace ZOCL
