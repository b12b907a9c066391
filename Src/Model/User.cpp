// Reading an account.
#include "Model/User.h"

#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using ostcore::utility::ToUTF16;

ImmutableString User::GetUserID() {
    return GetBody("ZOCL::User::GetUserID").Identifier();
}

UString User::GetFirstName() {
    const auto properties = GetBody("ZOCL::User::GetFirstName").Properties();
    return ToUTF16(properties.FirstName());
}

UString User::GetLastName() {
    const auto properties = GetBody("ZOCL::User::GetLastName").Properties();
    return ToUTF16(properties.LastName());
}

ImmutableString User::GetEmail() {
    return GetBody("ZOCL::User::GetEmail").Properties().Email();
}

std::vector<IZOCUser::Login> User::GetCurrentLogins() {
    std::vector<Login> logins;
    const dto::UserBlock body = GetBody("ZOCL::User::GetCurrentLogins");
    for (const dto::Login& login : body.Logins()) {
        logins.push_back({login.IP(), login.HostName(), login.UserAgent()});
    }
    return logins;
}

}  // namespace ZOCL
