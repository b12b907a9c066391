// A headless host as small as can be: signs in, tells that it is ready, and asks the hub again and again from
// a worker, while its main thread does nothing but run what is queued for it. It ends when the library ends
// it.
#include <stdio.h>
#include <stdlib.h>

#include <future>
#include <string>

#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ostnet/NetworkSettings.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/Library.h"

namespace {

using namespace ZOCL;

constexpr std::uint32_t kPauseMilliseconds = 50;

void AskForEver(const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inURL) {
    inServer->GET(Guid::CreateUnique(),
                  [inServer, inURL](const Guid&, const shared_ptr<ostnet::Response>& inResponse) {
                      if (inResponse && inResponse->status == 200) {
                          AskForEver(inServer, inURL);
                      }
                  },
                  inURL, {});
}

}  // namespace

/// Arguments: the URL of the hub. Its password is anna's.
int main(int inCount, char** inValues) {
    if (inCount != 2) {
        return 2;
    }
    ostcore::debug::SetTraceSink([](const std::string& inLine) { fprintf(stderr, "%s\n", inLine.c_str()); });
    ostcore::debug::SetTraceLevel("ZOCL", ostcore::debug::kTraceLevel_Error);
    HLM::SetIsHeadless(true);
    Initialize();
    ZOSCredentials credentials;
    credentials.username = ImmutableString("anna");
    credentials.password = "annas-secret";
    std::promise<InterfaceRef<IZOCDataServer>> ended;
    Guid id;
    IZOCDataServer::ConnectToServer(
        ImmutableString(inValues[1]), credentials, id, false,
        [&ended](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
                 const shared_ptr<ostnet::Response>&) { ended.set_value(inServer); },
        true, true);
    const InterfaceRef<IZOCDataServer> server = ended.get_future().get();
    if (!server) {
        return 3;
    }
    // After the login, whose answer may take its time.
    ostnet::NetworkLimits limits;
    limits.responseTimeout = 1000;
    ostnet::SetNetworkLimits(limits);
    printf("ready\n");
    fflush(stdout);
    AskForEver(server, server->GetDiscoveryURL());
    for (;;) {
        ostcore::threads::WaitAndPumpMainThread(0xFFFFFFFFu);
    }
}
