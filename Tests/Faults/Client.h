// A host of the client library for these tests: it connects and loads, counts completions, and watches the
// traces for secrets.
#pragma once

#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "BadHub.h"
#include "ostnet/NetworkSettings.h"
#include "ZOClient/IZOCDataServer.h"

namespace faults {

using ostcore::shared_ptr;
using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostnet::Response;
using RFL::InterfaceRef;
using ZOCL::IZOCAsset;
using ZOCL::IZOCAssetList;
using ZOCL::IZOCDataServer;
using ZOCL::IZOCEnclosures;
using ZOCL::IZOCProduction;
using ZOCL::IZOCProductionList;
using ZOCL::IZOCServerResource;

/// How one asynchronous call ended. Shared with its completion, which may come late or, by a fault, twice.
struct Outcome {
    bool started = false;
    int calls = 0;
    int result = 0;
    InterfaceRef<IZOCDataServer> server;  // of a connect
    shared_ptr<Response> response;

    int CurlError() const { return response ? response->curlError : -1; }
};

/// The host: all its calls and how they ended.
class Client {
public:
    /// Signs in and waits for the end.
    Outcome Connect(const std::string& inServer);
    Outcome Connect(const std::string& inServer, const ZOCL::ZOSCredentials& inCredentials);
    /// Loads any resource and waits for the end.
    template <class Interface>
    Outcome Load(const InterfaceRef<Interface>& inResource) {
        return LoadResource(RFL::QueryInterface<IZOCServerResource>(inResource));
    }
    /// Starts a load whose end Await waits for.
    std::size_t StartLoad(const InterfaceRef<IZOCServerResource>& inResource);
    Outcome Await(std::size_t inCall);
    Outcome Refresh(const InterfaceRef<IZOCServerResource>& inResource);
    /// Every call that has started has ended, and once.
    void ExpectEachEndedOnce();

    static ZOCL::ZOSCredentials Credentials();

private:
    struct Calls;
    Outcome LoadResource(const InterfaceRef<IZOCServerResource>& inResource);
    std::size_t NewCall();
    ZOCL::RequestCompletion CompletionOf(std::size_t inCall);

    const std::shared_ptr<Calls> mCalls = MakeCalls();
    static std::shared_ptr<Calls> MakeCalls();
};

/// Every test runs at full trace and ends with the look whether a secret has shown itself, and whether each
/// request has ended once.
class FaultTest : public testing::Test {
protected:
    void SetUp() override;
    void TearDown() override;

    /// Signs in at the hub, which must succeed.
    InterfaceRef<IZOCDataServer> SignIn(const BadHub& inHub);
    /// The production of the hub, loaded.
    InterfaceRef<IZOCProduction> LoadProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                const BadHub& inHub);
    /// A fresh, unloaded object for the document of a step.
    static InterfaceRef<IZOCServerResource> ResourceOf(Step inStep,
                                                       const InterfaceRef<IZOCDataServer>& inServer,
                                                       const InterfaceRef<IZOCProduction>& inProduction,
                                                       const BadHub& inHub);
    /// Nothing that was sent to the hub holds a secret where it does not belong.
    static void ExpectSecretsInTheirPlaces(const std::vector<ReceivedRequest>& inRequests);

    Client mClient;
};

template <class Interface>
InterfaceRef<IZOCServerResource> AsResource(const InterfaceRef<Interface>& inObject) {
    return RFL::QueryInterface<IZOCServerResource>(inObject);
}

/// The lines of all traces since the test began.
std::vector<std::string> TracedLines();
/// Whether a line with this text was traced.
bool WasTraced(const std::string& inText);
/// The directory that holds all that this run writes.
std::string RunDirectory();

}  // namespace faults
