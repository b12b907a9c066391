// The window that tells a user of other logins of the same account.
#include "Frame/Station.h"
#include "ostcore/config/ZString.h"
#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/utility/LocalHostIPAddress.h"
#include "ostui/Dialog.h"
#include "ZOClient/Authentication.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCServerResource.h"
#include "ZOClient/IZOCUser.h"
#include "ZOClient/Messages.h"
#include "ZOClient/Progress.h"
#include "ZOClient/ResultCodes.h"

namespace ZOCL {

namespace {

const char kTitle[] =
    "$$$/Cadenzo/ZOCL/ZOCurrentLoginsDialog/kResZOCLZOCurrentLoginsDialogTitle=Multiple Sign Ins";
const char kInfo[] =
    "$$$/ZOCL/ZOCurrentLoginsDialog/InfoText=The user \"@0\" is currently signed in to the Meridane server "
    "\"@1\" from more than one machine:";
const char kThisMachine[] = "$$$/ZOCL/ZOCurrentLoginsDialog/CurrentHostname=@0 (this machine)";
const char kMachineColumn[] = "$$$/Cadenzo/ZOCL/ZOCurrentLoginsDialog/Col_MachineName=Machine Name";
const char kAddressColumn[] = "$$$/Cadenzo/ZOCL/ZOCurrentLoginsDialog/Col_IPAddress=IP Address";
const char kContinue[] = "$$$/ZOCL/ZOCurrentLoginsDialog/ContinueButton=Continue";
const char kSignOut[] = "$$$/ZOCL/ZOCurrentLoginsDialog/SignOutButton=Sign Out";

U8String Text(const char* inKey) {
    return ostcore::ZString(inKey).AsUTF8();
}

U8String MakeRow(const IZOCUser::Login& inLogin) {
    const U8String machine = inLogin.hostName.IsNull() ? inLogin.ip.str() : inLogin.hostName.str();
    const bool isHere = inLogin.ip == ostnet::utility::LocalHostIPAddress();
    return (isHere ? ostcore::ZString(kThisMachine, {machine}).AsUTF8() : machine) + "\t" + inLogin.ip.str();
}

/// Whether the user wants to go on.
bool AskWhetherToContinue(const InterfaceRef<IZOCDataServer>& inServer,
                          const std::vector<IZOCUser::Login>& inLogins) {
    std::vector<U8String> rows;
    for (const IZOCUser::Login& login : inLogins) {
        rows.push_back(MakeRow(login));
    }
    const ZOLoginData data = inServer->GetLoginData();
    ostui::Dialog dialog("ZOCurrentLoginsDialog", Text(kTitle));
    dialog.AddStaticText("infoLabelText",
                         ostcore::ZString(kInfo, {data.username.str(), data.serverURL.str()}).AsUTF8());
    dialog.AddList("currentLoginsTree", Text(kMachineColumn) + "\t" + Text(kAddressColumn), std::move(rows));
    dialog.AddButton("okButton", Text(kContinue), ostui::kResponseOK);
    dialog.AddButton("cancelButton", Text(kSignOut), ostui::kResponseCancel);
    dialog.SetDefaultButton("okButton");
    dialog.SetCancelButton("cancelButton");
    return dialog.RunModal() == ostui::kResponseOK;
}

}  // namespace

bool HandleMultipleLogins() {
    if (ostcore::debug::DebugDatabase::GetBool("ZOClient.ShouldSuppressUI", false)) {
        return true;
    }
    const InterfaceRef<IZOCDataServer> server = IZOCDataServer::GetLoggedInServerRef();
    const InterfaceRef<IZOCUser> user = server ? server->GetLoggedInUser() : nullptr;
    // The newest list, as other machines come and go.
    if (!user || LoadServerResourceWithProgress(RFL::QueryInterface<IZOCServerResource>(user), true) < 0) {
        return false;
    }
    const std::vector<IZOCUser::Login> logins = user->GetCurrentLogins();
    if (logins.size() < 2 || AskWhetherToContinue(server, logins)) {
        return true;
    }
    ZOTerminateConnectionMessage message;
    message.forced = true;
    RFL::StationUtils::PostMessageToUIThread(CurrentStation(), message, true);
    return false;
}

}  // namespace ZOCL
