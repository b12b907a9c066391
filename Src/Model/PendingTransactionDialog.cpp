// Waiting for changes of others, under a progress window with two ways out.
#include "Model/PendingTransactionDialog.h"

#include "Frame/ProgressWindow.h"
#include "Model/PendingTransactions.h"
#include "Operations/WaitForPendingTransactionOperation.h"
#include "ostcore/config/ZString.h"
#include "ostui/MessageBox.h"

namespace ZOCL {

using ostcore::ZString;

namespace {

constexpr const char* kTitle =
    "$$$/ZOCL/ZOPendingTransactionDialog/WaitingForChangesTitle=Waiting For Changes";
constexpr const char* kCaption =
    "$$$/ZOCL/ZOPendingTransactionDialog/WaitingForChangesToBeSaved=Waiting for changes to be saved by @0 on "
    "@1 (@2).";
constexpr const char* kCloseProduction =
    "$$$/ZOCL/ZOPendingTransactionDialog/CloseProductionButton=Close Production";
constexpr const char* kDiscardChanges =
    "$$$/ZOCL/ZOPendingTransactionDialog/DiscardChangesButton=Discard Changes";
constexpr const char* kQuestionTitle =
    "$$$/ZOCL/PendingTransactionDialog/DiscardChanges/title=Orvane Meridane";
constexpr const char* kQuestion =
    "$$$/ZOCL/PendingTransactionDialog/DiscardChanges/message=Discarding the pending changes cannot be "
    "undone. "
    "Are you sure you want to continue?";

ProgressWindowSettings MakeSettings(const IZOCTransactionList::Entry& inFirst) {
    ProgressWindowSettings settings;
    settings.layout = kPendingTransactionWindowID;
    settings.title = ZString(kTitle).AsUTF8();
    settings.caption = ZString(kCaption, {inFirst.owner.str(), inFirst.metadata.machineName.str(),
                                          inFirst.metadata.machineIP.str()})
                           .AsUTF8();
    settings.cancelText = ZString(kCloseProduction).AsUTF8();
    settings.secondText = ZString(kDiscardChanges).AsUTF8();
    return settings;
}

}  // namespace

PendingTransactionDialog::PendingTransactionDialog(const InterfaceRef<TransactionList>& inList,
                                                   const std::vector<ImmutableString>& inIgnoredTypes)
    : mList(inList), mIgnoredTypes(inIgnoredTypes) {}

bool PendingTransactionDialog::IsDiscardConfirmed() {
    ostui::MessageBoxSettings question;
    question.title = ZString(kQuestionTitle).AsUTF8();
    question.message = ZString(kQuestion).AsUTF8();
    question.buttons = ostui::kMessageBoxYes | ostui::kMessageBoxNo;
    question.defaultButton = ostui::kMessageBoxNo;
    return ostui::RunMessageBox(question) == ostui::kMessageBoxYes;
}

void PendingTransactionDialog::Discard(const shared_ptr<CompoundAsyncOperation>& inOperation) {
    for (const auto& entry : mList->GetPendingItems(mIgnoredTypes)) {
        RollbackAsPartOf(inOperation, mList, entry, [this](int inResult) {
            int none = kResultSuccess;
            if (inResult < 0) {
                mDiscardResult.compare_exchange_strong(none, inResult);
            }
            return kResultSuccess;
        });
    }
}

int PendingTransactionDialog::Run(const shared_ptr<CompoundAsyncOperation>& inOperation) {
    const InterfaceRef<WaitForPendingTransactionOperation> wait(
        new WaitForPendingTransactionOperation(RFL::StationRegistry::RegisterUniqueStation()));
    wait->Init(mList, mIgnoredTypes);
    if (wait->GetPendingItems().empty()) {
        return kResultSuccess;
    }
    ProgressWindowSettings settings = MakeSettings(wait->GetPendingItems().front());
    // A question that is answered with No leaves this window open and the wait going on.
    settings.onSecond = &PendingTransactionDialog::IsDiscardConfirmed;
    switch (RunProgressWindow(wait, settings)) {
        case ProgressEnd::kCompleted:
            return wait->GetResult();
        case ProgressEnd::kCancelled:
            return kResultDialogCancelled;
        case ProgressEnd::kForceAborted:
            return wait->GetForceAbortResult();
        case ProgressEnd::kSecondButton:
            wait->ForceAbort(kResultDialogAlternativeCancelled);
            Discard(inOperation);
            return kResultSuccess;
        case ProgressEnd::kNotRun:
        case ProgressEnd::kNotStarted:
            break;
    }
    return kResultNotStarted;
}

}  // namespace ZOCL
