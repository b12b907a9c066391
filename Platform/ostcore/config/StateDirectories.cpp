// Where state lives, by the XDG base directory rules with one override each.
#include "ostcore/config/StateDirectories.h"

#include <array>
#include <cstdlib>

#include <pwd.h>
#include <unistd.h>

namespace ostcore {
namespace config {
namespace {

using filesupport::Dir;

std::string FromEnvironment(const char* inName) {
    const char* const value = std::getenv(inName);
    return value ? value : "";
}

std::string HomeDirectory() {
    std::string home = FromEnvironment("HOME");
    if (!home.empty()) {
        return home;
    }
    passwd entry{};
    passwd* found = nullptr;
    std::array<char, 4096> buffer{};
    if (::getpwuid_r(::getuid(), &entry, buffer.data(), buffer.size(), &found) == 0 && found &&
        found->pw_dir) {
        return found->pw_dir;
    }
    return "/";
}

Dir FindDirectory(const char* inOverride, const char* inXDGVariable, const char* inPlaceUnderHome) {
    if (const std::string path = FromEnvironment(inOverride); !path.empty()) {
        return Dir(path);
    }
    const std::string base = FromEnvironment(inXDGVariable);
    const bool isAbsolute = !base.empty() && base.front() == '/';
    return (isAbsolute ? Dir(base) : Dir(HomeDirectory()).SubDir(inPlaceUnderHome)).SubDir("zoclient");
}

}  // namespace

Dir GetConfigDirectory() {
    return FindDirectory("ZOCLIENT_CONFIG_HOME", "XDG_CONFIG_HOME", ".config");
}
Dir GetCacheDirectory() {
    return FindDirectory("ZOCLIENT_CACHE_HOME", "XDG_CACHE_HOME", ".cache");
}
Dir GetStateDirectory() {
    return FindDirectory("ZOCLIENT_STATE_HOME", "XDG_STATE_HOME", ".local/state");
}

}  // namespace config
}  // namespace ostcore
