#include "ostnet/utility/LocalHostIPAddress.h"

#include <arpa/inet.h>
#include <ifaddrs.h>
#include <net/if.h>
#include <netdb.h>
#include <netinet/in.h>

#include <memory>

#include "ostcore/config/ClientInfo.h"

namespace ostnet {
namespace utility {
namespace {

struct FreeInterfaces {
    void operator()(ifaddrs* inList) const { freeifaddrs(inList); }
};
using Interfaces = std::unique_ptr<ifaddrs, FreeInterfaces>;

Interfaces GetInterfaces() {
    ifaddrs* list = nullptr;
    return Interfaces(getifaddrs(&list) == 0 ? list : nullptr);
}

bool IsOfUse(const ifaddrs& inInterface, int inFamily) {
    if (!inInterface.ifa_addr || inInterface.ifa_addr->sa_family != inFamily ||
        (inInterface.ifa_flags & IFF_UP) == 0 || (inInterface.ifa_flags & IFF_LOOPBACK) != 0) {
        return false;
    }
    if (inFamily != AF_INET6) {
        return true;
    }
    const void* address = inInterface.ifa_addr;
    return !IN6_IS_ADDR_LINKLOCAL(&static_cast<const sockaddr_in6*>(address)->sin6_addr);
}

std::string AddressText(const sockaddr& inAddress) {
    const socklen_t size = inAddress.sa_family == AF_INET ? sizeof(sockaddr_in) : sizeof(sockaddr_in6);
    char text[NI_MAXHOST] = "";
    return getnameinfo(&inAddress, size, text, sizeof text, nullptr, 0, NI_NUMERICHOST) == 0 ? text : "";
}

std::string FindAddress() {
    const Interfaces interfaces = GetInterfaces();
    for (const int family : {AF_INET, AF_INET6}) {
        for (const ifaddrs* entry = interfaces.get(); entry; entry = entry->ifa_next) {
            if (IsOfUse(*entry, family)) {
                if (std::string text = AddressText(*entry->ifa_addr); !text.empty()) {
                    return text;
                }
            }
        }
    }
    return "127.0.0.1";
}

}  // namespace

ImmutableString LocalHostIPAddress() {
    static const std::string sAddress = FindAddress();
    return ImmutableString(sAddress);
}

}  // namespace utility

ImmutableString GetProcessUniqueID() {
    return ImmutableString(ostcore::config::GetProcessInstanceID().ToString());
}

}  // namespace ostnet
