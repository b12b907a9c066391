// What this process calls itself before the server.
#include "ostcore/config/ClientInfo.h"

#include "ostcore/threads/Mutex.h"

namespace ostcore {
namespace config {
namespace {

struct ClientInfo {
    threads::Mutex mutex;
    std::string name ZO_GUARDED_BY(mutex) = "ZOClient";
    std::string buildNumber ZO_GUARDED_BY(mutex) = "0";
};

ClientInfo& TheInfo() {
    static ClientInfo* const info = new ClientInfo;
    return *info;
}

std::string WithoutControlCharacters(std::string inText) {
    const auto isControl = [](char inCharacter) {
        return static_cast<unsigned char>(inCharacter) < 0x20 || inCharacter == 0x7F;
    };
    inText.erase(std::remove_if(inText.begin(), inText.end(), isControl), inText.end());
    return inText;
}

}  // namespace

std::string GetClientName() {
    ClientInfo& info = TheInfo();
    threads::MutexLock lock(info.mutex);
    return info.name;
}

void SetClientName(const std::string& inName) {
    ClientInfo& info = TheInfo();
    threads::MutexLock lock(info.mutex);
    info.name = WithoutControlCharacters(inName);
}

std::string GetClientBuildNumber() {
    ClientInfo& info = TheInfo();
    threads::MutexLock lock(info.mutex);
    return info.buildNumber;
}

void SetClientBuildNumber(const std::string& inBuildNumber) {
    ClientInfo& info = TheInfo();
    threads::MutexLock lock(info.mutex);
    info.buildNumber = WithoutControlCharacters(inBuildNumber);
}

utility::Guid GetProcessInstanceID() {
    static const utility::Guid instance = utility::Guid::CreateUnique();
    return instance;
}

}  // namespace config
}  // namespace ostcore
