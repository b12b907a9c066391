// Whether a server is new enough for this client.
#include "Frame/Version.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/Library.h"
#include "ZOClient/Registry.h"

namespace ZOCL {

const std::uint32_t kServerMajorVersion = 1;
const std::uint32_t kServerMinorVersion = 0;

namespace {

Version GetWantedVersion() {
    Version wanted{kServerMajorVersion, kServerMinorVersion};
    UString pinned;
    if (Registry::GetZORegistryValue(u"ServerVersion", pinned)) {
        ParseVersion(ostcore::utility::ToUTF8(pinned), wanted);
    }
    return wanted;
}

}  // namespace

bool ServerIsCompatible(const InterfaceRef<IZOCDataServer>& inServer) {
    Version server;
    return ParseVersion(inServer->GetServerVersion().view(), server) &&
           VersionSatisfies(server, GetWantedVersion());
}

bool IsZOEnabled() {
    return Registry::IsZOEnabled();
}

}  // namespace ZOCL
