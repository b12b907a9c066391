// The registry half of media locators.
#include "Model/LocalMediaLinks.h"

#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

namespace {

using RFL::RegistryAccess;
using RFL::RegistryKey;
using RFL::RegistryRoot;

const UString kLocalPath = u"LocalPath";

UString ParentKey() {
    return Registry::GetZORegistryBaseKey() + u"ZOMediaLocator";
}

bool CanNameOneKey(const ImmutableString& inID) {
    const std::string_view text = inID.view();
    return !text.empty() && text.find('\\') == std::string_view::npos &&
           text.find('\0') == std::string_view::npos;
}

}  // namespace

bool IsLocalMediaLink(const ImmutableString& inHRef) {
    return inHRef.view().find("zomedia://localhost-") != std::string_view::npos;
}

ImmutableString ReadLocalMediaLink(const ImmutableString& inLocatorID) {
    RegistryKey parent;
    RegistryKey key;
    UString path;
    if (!CanNameOneKey(inLocatorID) ||
        RegistryKey::Open(RegistryRoot::User, ParentKey(), RegistryAccess::Read, parent) < 0 ||
        parent.OpenSubKey(ostcore::utility::ToUTF16(inLocatorID), RegistryAccess::Read, key) < 0 ||
        key.GetStringValue(kLocalPath, path) < 0) {
        return ImmutableString();
    }
    return ImmutableString(ostcore::utility::ToUTF8(path));
}

void WriteLocalMediaLink(const ImmutableString& inLocatorID, const ImmutableString& inHRef) {
    RegistryKey parent;
    RegistryKey key;
    if (CanNameOneKey(inLocatorID) && RegistryKey::Create(RegistryRoot::User, ParentKey(), parent) >= 0 &&
        parent.CreateSubKey(ostcore::utility::ToUTF16(inLocatorID), key) >= 0) {
        key.SetStringValue(kLocalPath, ostcore::utility::ToUTF16(inHRef));
    }
}

void ForgetLocalMediaLink(const ImmutableString& inLocatorID) {
    RegistryKey parent;
    if (CanNameOneKey(inLocatorID) &&
        RegistryKey::Open(RegistryRoot::User, ParentKey(), RegistryAccess::ReadWrite, parent) >= 0) {
        parent.DeleteSubKey(ostcore::utility::ToUTF16(inLocatorID));
    }
}

}  // namespace ZOCL
