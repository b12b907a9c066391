// Progress windows for hosts and flows.
#include "Collaboration/WorkflowOperation.h"
#include "Frame/BatchOperationBase.h"
#include "Frame/ProgressWindow.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Dialogs.h"
#include "ZOClient/ZOOperationBase.h"

namespace ZOCL {

using ostcore::utility::ToUTF8;

namespace {

/// What an operation of the library has ended with; of a host's own, only that it has ended is known.
int ResultOf(const InterfaceRef<RFL::IBatchOperation>& inOperation) {
    if (const auto known = RFL::QueryInterface<ZOOperationBase>(inOperation)) {
        return known->GetResult();
    }
    const RFL::IBatchOperation* const operation = inOperation.GetUnchecked();
    if (const auto* const step = dynamic_cast<const WorkflowOperation*>(operation)) {
        return step->GetResult();
    }
    const auto* const small = dynamic_cast<const BatchOperationBase*>(operation);
    return small ? small->GetResult() : kResultSuccess;
}

bool RunUnderWindow(const UString& inTitle, const UString& inCaption,
                    const InterfaceRef<RFL::IBatchOperation>& inOperation, bool inCanCancel,
                    bool inWaitForConfirm, const UString& inCancelText, ProgressBarKind inBar) {
    ProgressWindowSettings settings;
    settings.title = ToUTF8(inTitle);
    settings.caption = ToUTF8(inCaption);
    settings.canCancel = inCanCancel;
    settings.cancelText = ToUTF8(inCancelText);
    settings.bar = inBar;
    if (inWaitForConfirm) {
        settings.finalText = [inOperation] {
            const auto teller = RFL::QueryInterface<IZOCOperationFinalText>(inOperation);
            return teller ? ToUTF8(teller->GetFinalText()) : U8String();
        };
    }
    return RunProgressWindow(inOperation, settings) == ProgressEnd::kCompleted && ResultOf(inOperation) >= 0;
}

}  // namespace

bool DoProgressDialog(const UString& inTitle, const UString& inCaption,
                      const InterfaceRef<RFL::IBatchOperation>& inOperation, bool inCanCancel,
                      bool inWaitForConfirm, const UString& inCancelText) {
    return RunUnderWindow(inTitle, inCaption, inOperation, inCanCancel, inWaitForConfirm, inCancelText,
                          ProgressBarKind::kDeterminate);
}

bool DoIndeterminateProgressDialog(const UString& inTitle, const UString& inCaption,
                                   const InterfaceRef<RFL::IBatchOperation>& inOperation, bool inCanCancel,
                                   bool inWaitForConfirm, const UString& inCancelText) {
    return RunUnderWindow(inTitle, inCaption, inOperation, inCanCancel, inWaitForConfirm, inCancelText,
                          ProgressBarKind::kRunning);
}

}  // namespace ZOCL
