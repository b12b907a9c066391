// Reads and removes the token value under Software\...\<user>.
#include "StoredToken.h"

#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/Registry.h"

namespace zo {
namespace {

const std::u16string kTokenValue = u"LastAuthenticationToken";

Failure RegistryFailure(const std::string& inWhat, int inResult) {
    return Failure(
        ExitCode::Failure,
        inWhat + " the login token in the registry failed: " + RFL::DescribeRegistryResult(inResult),
        "try again, and check the configuration directory when it stays");
}

}  // namespace

bool StoredToken::Exists() const {
    ZOCL::ZOLoginData data;
    return ZOCL::Registry::GetLastLoginData(data, true, ostcore::utility::ToUTF16(mUser)) &&
           !data.token.empty();
}

std::optional<std::u16string> StoredToken::Take() {
    RFL::RegistryKey key;
    const std::u16string path = ZOCL::Registry::GetZORegistryBaseKey() + ostcore::utility::ToUTF16(mUser);
    int result = RFL::RegistryKey::Open(RFL::RegistryRoot::User, path, RFL::RegistryAccess::ReadWrite, key);
    std::u16string token;
    if (result >= 0) {
        result = key.GetStringValue(kTokenValue, token);
    }
    if (result == RFL::kResultRegistryMissing) {
        return std::nullopt;
    }
    if (result < 0) {
        throw RegistryFailure("reading", result);
    }
    result = key.DeleteValue(kTokenValue);
    if (result < 0 && result != RFL::kResultRegistryMissing) {
        throw RegistryFailure("removing", result);
    }
    return token;
}

void StoredToken::PutBack(const std::u16string& inToken) {
    RFL::RegistryKey key;
    const std::u16string path = ZOCL::Registry::GetZORegistryBaseKey() + ostcore::utility::ToUTF16(mUser);
    int result = RFL::RegistryKey::Create(RFL::RegistryRoot::User, path, key);
    if (result >= 0) {
        result = key.Apply({RFL::RegistryChange::ExpectAbsent(kTokenValue),
                            RFL::RegistryChange::SetString(kTokenValue, inToken)});
    }
    if (result < 0 && result != RFL::kResultRegistryChanged) {
        throw RegistryFailure("restoring", result);
    }
}

}  // namespace zo
