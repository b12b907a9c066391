// Writing logins into the registry.
#include "Connection/RememberedLogin.h"

#include "HLM/HLM.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

void WipePassword(std::string& ioPassword) {
    volatile char* bytes = ioPassword.data();
    for (std::size_t i = 0; i < ioPassword.size(); ++i) {
        bytes[i] = 0;
    }
    ioPassword.clear();
}

void RememberLogin(const ZOLoginData& inData) {
    if (HLM::GetIsHeadless()) {
        Registry::StoreLoginData(inData, ostcore::utility::ToUTF16(inData.username.view()));
    }
    Registry::SetZORegistryValue(Registry::kRegistryHasLoggedInValue, u"true");
    if (!Registry::IsZOEnabled()) {
        Registry::ResetIsZOEnabled();
    }
}

void ShareRenewedLogin(const ZOLoginData& inData) {
    // A headless process has its login under its user's name, and has written it when it was accepted.
    ZOLoginData stored;
    if (HLM::GetIsHeadless() || inData.username.IsNull() ||
        !Registry::GetLastLoginData(stored, true, UString())) {
        return;
    }
    const bool isThisLogin = stored.serverURL == inData.serverURL && stored.secure == inData.secure &&
                             stored.username == inData.username;
    if (isThisLogin && stored.token != inData.token) {
        Registry::StoreLoginData(inData, UString());
    }
}

}  // namespace ZOCL
