// Start and end of the library, and the questions that a host asks of the whole.
#pragma once

#include <string>
#include <vector>

#include "ostcore/utility/BinaryResource.h"
#include "ZOClient/Export.h"
#include "ZOClient/ResultCodes.h"
#include "ZOClient/Types.h"

namespace ostcore {
namespace logging {
class ISyslogLogger;
}
}  // namespace ostcore

namespace ZOCL {

/// The lowest server version that this build was written against.
ZOCL_EXPORT extern const std::uint32_t kServerMajorVersion;
ZOCL_EXPORT extern const std::uint32_t kServerMinorVersion;

/// Starts the library; the calling thread becomes the host's main thread if none was declared. Calls nest:
/// only the first Initialize and the last Shutdown act. Main thread only.
ZOCL_EXPORT void Initialize();
/// Ends the library: no request and no timer of it is left, and no function of the host is called any more.
/// Idle threads of the platform's pools may stay until the process ends. Main thread only, not from a
/// completion.
ZOCL_EXPORT void Shutdown();

/// The station to which all messages of the library are posted (Messages.h). Any thread, after Initialize.
ZOCL_EXPORT ImmutableString GetStationID();

/// Whether a login was ever accepted for this user (or, for want of that, on this machine).
ZOCL_EXPORT bool IsZOEnabled();
/// Whether there is a logged-in data server. Any thread.
ZOCL_EXPORT bool IsLoggedIn();

/// The media protocol versions that the host speaks; both 0 means none. Any thread.
ZOCL_EXPORT void SetCompatibleMediaProtocolVersions(unsigned long inFirst, unsigned long inSecond);

/// Whether the server's version is at least the wanted one: the registry value "ServerVersion" when it
/// parses, else kServerMajorVersion.kServerMinorVersion. Any thread.
ZOCL_EXPORT bool ServerIsCompatible(const InterfaceRef<IZOCDataServer>& inServer);

/// Loads the library's own texts in a language that it ships ("de"; "de_AT" takes those of "de"). The texts
/// are read when ostcore::config::Localizer::SetLanguage says that language; English needs no loading. False:
/// there is no such language, and nothing changes. Any thread.
ZOCL_EXPORT bool LoadShippedLanguage(const std::string& inLanguage);
/// What LoadShippedLanguage can load, in order. Any thread.
ZOCL_EXPORT std::vector<std::string> GetShippedLanguages();

/// Gives an icon by the name that a layout or a row of a tree calls it by ("SP_Folder_Sm"): an SVG document,
/// null when there is no such icon. For the back end that shows the library's windows. Any thread.
using ImageSupply = function<ostcore::utility::BinaryResource(const std::string& inName)>;
ZOCL_EXPORT ImageSupply GetGenericButtonImageSupply();

/// The process-wide syslog logger; made at first use, ended by Shutdown.
ZOCL_EXPORT shared_ptr<ostcore::logging::ISyslogLogger> GetSyslogLogger();

}  // namespace ZOCL
