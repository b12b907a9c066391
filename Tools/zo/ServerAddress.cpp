// Checks and completes the address of a hub.
#include "ServerAddress.h"

#include <algorithm>
#include <cstring>

#include "Failure.h"
#include "ZOClient/IZOCDataServer.h"

namespace zo {
namespace {

constexpr const char* kSecure = "https://";
constexpr const char* kPlain = "http://";

bool StartsWith(const std::string& inText, const std::string& inPrefix) {
    return inText.compare(0, inPrefix.size(), inPrefix) == 0;
}

Failure BadAddress(const std::string& inText) {
    return Failure(
        ExitCode::Usage, "'" + inText + "' is no address of a hub",
        "it is a host, or https://HOST:PORT or http://HOST:PORT, without a path and without a user");
}

std::string HostOf(const std::string& inServer) {
    const std::size_t start = inServer.find("://") + 3;
    if (start < inServer.size() && inServer[start] == '[') {
        return inServer.substr(start, inServer.find(']', start) - start + 1);
    }
    return inServer.substr(start, inServer.find(':', start) - start);
}

bool IsHostCharacter(char inCharacter) {
    const auto byte = static_cast<unsigned char>(inCharacter);
    return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
           byte >= 0x80 || inCharacter == '.' || inCharacter == '-' || inCharacter == '_' ||
           inCharacter == ':' || inCharacter == '[' || inCharacter == ']';
}

}  // namespace

std::string CompleteServerAddress(const std::string& inText, Scheme inDefault) {
    std::string text = inText;
    if (text.find("://") == std::string::npos) {
        text = (inDefault == Scheme::Secure ? kSecure : kPlain) + text;
    }
    while (text.back() == '/' && text.size() > text.find("://") + 3) {
        text.pop_back();
    }
    if (!StartsWith(text, kSecure) && !StartsWith(text, kPlain)) {
        throw BadAddress(inText);
    }
    const std::string authority = text.substr(text.find("://") + 3);
    if (authority.empty() || !std::all_of(authority.begin(), authority.end(), IsHostCharacter)) {
        throw BadAddress(inText);
    }
    return ZOCL::IZOCDataServer::MakeDataServerURL(ZOCL::ImmutableString(text), IsSecureAddress(text)).str();
}

bool IsSecureAddress(const std::string& inServer) {
    return StartsWith(inServer, kSecure);
}

bool IsLoopbackAddress(const std::string& inServer) {
    const std::string host = HostOf(inServer);
    const bool isAddress = std::all_of(
        host.begin(), host.end(), [](char inCharacter) { return std::strchr("0123456789.", inCharacter); });
    return host == "localhost" || host == "[::1]" || (isAddress && StartsWith(host, "127."));
}

bool IsUsableUserName(const std::string& inName) {
    return std::none_of(inName.begin(), inName.end(), [](char inCharacter) {
        const auto byte = static_cast<unsigned char>(inCharacter);
        return byte < 0x20 || byte == 0x7F || inCharacter == '\\';
    });
}

}  // namespace zo
