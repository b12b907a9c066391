// The texts of the session conflict.
#include "Model/SessionConflictMessage.h"

#include "ostcore/config/ZString.h"
#include "ostcore/utility/StringConversion.h"
#include "ostui/MessageBox.h"

namespace ZOCL {

using ostcore::ZString;
using ostcore::utility::ToUTF8;

namespace {

constexpr const char* kTitle = "$$$/ZOCL/SessionConflictTitle=Orvane Meridane";
constexpr const char* kDefaultExtra =
    "$$$/ZOCL/SessionConflictError/DefaultResolveMessage=Press OK to resolve these changes.";
constexpr const char* kWithMetadata =
    "$$$/ZOCL/SessionConflictError/WithExtraMetadataStr=\"@0\" could not be completed because unexpected "
    "changes to @1's unshared version of the production occurred in @2 on the machine \"@3\". @4";
constexpr const char* kWithoutMetadata =
    "$$$/ZOCL/SessionConflictErrorStr=\"@0\" could not be completed because unexpected changes to @1's "
    "unshared version of the production were detected. @2";

}  // namespace

void ShowSessionConflictMessage(const InterfaceRef<IZOCDataServer>& inServer, const UString& inOperationName,
                                const CommitMetadata& inMetadata, const UString& inExtra) {
    const std::string operation = ToUTF8(inOperationName);
    const std::string user = inServer ? ToUTF8(inServer->GetLoggedInUserName()) : std::string();
    const std::string extra = inExtra.empty() ? ZString(kDefaultExtra).AsUTF8() : ToUTF8(inExtra);
    const ImmutableString& application = inMetadata.metadata.applicationName;
    const ImmutableString& machine = inMetadata.metadata.machineName;
    ostui::MessageBoxSettings box;
    box.title = ZString(kTitle).AsUTF8();
    box.defaultButton = ostui::kMessageBoxOK;
    box.message =
        application.empty() || machine.empty()
            ? ZString(kWithoutMetadata, {operation, user, extra}).AsUTF8()
            : ZString(kWithMetadata, {operation, user, application.str(), machine.str(), extra}).AsUTF8();
    ostui::RunMessageBox(box);
}

}  // namespace ZOCL
