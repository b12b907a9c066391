#include "Client.h"

#include <cstdlib>
#include <deque>
#include <filesystem>

#include "ostcore/debug/DebugDatabase.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "ZOClient/Library.h"

namespace faults {
namespace {

constexpr std::chrono::seconds kPatience(60);
const char* const kProxyVariables[] = {"http_proxy",   "https_proxy",   "HTTPS_PROXY",     "all_proxy",
                                       "ALL_PROXY",    "no_proxy",      "NO_PROXY",        "ZOCLIENT_PROXY",
                                       "SSL_CERT_DIR", "SSL_CERT_FILE", "ZOCLIENT_CA_FILE"};

struct TraceLog {
    std::mutex mutex;
    std::vector<std::string> lines;
};
TraceLog& TheTraceLog() {
    static TraceLog& log = *new TraceLog;
    return log;
}

std::string gRunDirectory;

/// Starts the library in directories of this run, at full trace, and takes both down at the end.
class Library : public testing::Environment {
public:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "zo-faults-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        mDirectory = pattern;
        gRunDirectory = mDirectory;
        setenv("ZOCLIENT_STATE_HOME", (mDirectory + "/state").c_str(), 1);
        setenv("ZOCLIENT_CONFIG_HOME", (mDirectory + "/config").c_str(), 1);
        setenv("ZOCLIENT_CACHE_HOME", (mDirectory + "/cache").c_str(), 1);
        for (const char* const variable : kProxyVariables) {
            unsetenv(variable);
        }
        ostcore::debug::SetTraceLevel("*", ostcore::debug::kTraceLevel_Progress);
        ostcore::debug::SetTraceSink([](const std::string& inLine) {
            const std::lock_guard<std::mutex> lock(TheTraceLog().mutex);
            TheTraceLog().lines.push_back(inLine);
        });
        // Each test is about one exchange; those about a retry turn them on again.
        ostcore::debug::DebugDatabase::SetOverride("ZOClient.DisableRetries", "true");
        ZOCL::Initialize();
    }
    void TearDown() override {
        ZOCL::Shutdown();
        ostcore::debug::SetTraceSink({});
        std::filesystem::remove_all(mDirectory);
    }

private:
    std::string mDirectory;
};
[[maybe_unused]] const auto* const gLibrary = testing::AddGlobalTestEnvironment(new Library);

}  // namespace

struct Client::Calls {
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<Outcome> outcomes;
};

std::shared_ptr<Client::Calls> Client::MakeCalls() {
    return std::make_shared<Calls>();
}

std::size_t Client::NewCall() {
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    mCalls->outcomes.emplace_back();
    return mCalls->outcomes.size() - 1;
}

ZOCL::RequestCompletion Client::CompletionOf(std::size_t inCall) {
    return [calls = mCalls, inCall](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                                    const shared_ptr<Response>& inResponse) {
        const std::lock_guard<std::mutex> lock(calls->mutex);
        Outcome& outcome = calls->outcomes[inCall];
        ++outcome.calls;
        outcome.result = inResult;
        outcome.response = inResponse;
        calls->changed.notify_all();
    };
}

Outcome Client::Await(std::size_t inCall) {
    std::unique_lock<std::mutex> lock(mCalls->mutex);
    Outcome& outcome = mCalls->outcomes[inCall];
    if (outcome.started) {
        EXPECT_TRUE(mCalls->changed.wait_for(lock, kPatience, [&] { return outcome.calls > 0; }))
            << "a request does not end";
    }
    // What waits here must not keep the objects alive.
    Outcome result = outcome;
    outcome.server = nullptr;
    outcome.response = nullptr;
    return result;
}

ZOCL::ZOSCredentials Client::Credentials() {
    ZOCL::ZOSCredentials credentials;
    credentials.username = ImmutableString(kUsername);
    credentials.password = kPassword;
    return credentials;
}

Outcome Client::Connect(const std::string& inServer) {
    return Connect(inServer, Credentials());
}

Outcome Client::Connect(const std::string& inServer, const ZOCL::ZOSCredentials& inCredentials) {
    const std::size_t call = NewCall();
    const auto completion = [calls = mCalls, call](const Guid&, const InterfaceRef<IZOCDataServer>& inFound,
                                                   int inResult, const shared_ptr<Response>& inResponse) {
        const std::lock_guard<std::mutex> lock(calls->mutex);
        Outcome& outcome = calls->outcomes[call];
        ++outcome.calls;
        outcome.result = inResult;
        outcome.server = inFound;
        outcome.response = inResponse;
        calls->changed.notify_all();
    };
    Guid requestID;
    const bool started =
        IZOCDataServer::ConnectToServer(ImmutableString(inServer), inCredentials, requestID,
                                        inServer.rfind("https:", 0) == 0, completion, false, true);
    {
        const std::lock_guard<std::mutex> lock(mCalls->mutex);
        mCalls->outcomes[call].started = started;
    }
    const Outcome outcome = Await(call);
    ostcore::threads::PumpMainThread();
    return outcome;
}

std::size_t Client::StartLoad(const InterfaceRef<IZOCServerResource>& inResource) {
    const std::size_t call = NewCall();
    const bool started = inResource->Load(Guid::CreateUnique(), CompletionOf(call), true);
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    mCalls->outcomes[call].started = started;
    return call;
}

Outcome Client::LoadResource(const InterfaceRef<IZOCServerResource>& inResource) {
    return Await(StartLoad(inResource));
}

Outcome Client::Refresh(const InterfaceRef<IZOCServerResource>& inResource) {
    const std::size_t call = NewCall();
    const bool started = inResource->Refresh(Guid::CreateUnique(), CompletionOf(call));
    {
        const std::lock_guard<std::mutex> lock(mCalls->mutex);
        mCalls->outcomes[call].started = started;
    }
    return Await(call);
}

void Client::ExpectEachEndedOnce() {
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    for (std::size_t call = 0; call < mCalls->outcomes.size(); ++call) {
        const Outcome& outcome = mCalls->outcomes[call];
        EXPECT_EQ(outcome.calls, outcome.started ? 1 : 0) << "call " << call;
    }
}

void FaultTest::SetUp() {
    const std::lock_guard<std::mutex> lock(TheTraceLog().mutex);
    TheTraceLog().lines.clear();
}

void FaultTest::TearDown() {
    IZOCDataServer::Terminate(false);
    ostnet::SetNetworkLimits(ostnet::NetworkLimits());
    ostcore::threads::PumpMainThread();
    mClient.ExpectEachEndedOnce();
    EXPECT_FALSE(TracedLines().empty()) << "without traces there is nothing to search";
    EXPECT_FALSE(WasTraced(kPassword)) << "the password was traced";
    EXPECT_FALSE(WasTraced(kTokenValue)) << "the token was traced";
}

InterfaceRef<IZOCDataServer> FaultTest::SignIn(const BadHub& inHub) {
    const Outcome outcome = mClient.Connect(inHub.URL(""));
    EXPECT_EQ(outcome.result, ZOCL::kResultSuccess) << ZOCL::GetResultName(outcome.result);
    EXPECT_TRUE(outcome.server);
    return outcome.server;
}

InterfaceRef<IZOCProduction> FaultTest::LoadProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                       const BadHub& inHub) {
    const auto production = inServer->GetProductionFromURL(ImmutableString(inHub.URL("/p/1")));
    EXPECT_TRUE(production && AsResource(production)->IsLoaded());
    return production;
}

InterfaceRef<IZOCServerResource> FaultTest::ResourceOf(Step inStep,
                                                       const InterfaceRef<IZOCDataServer>& inServer,
                                                       const InterfaceRef<IZOCProduction>& inProduction,
                                                       const BadHub& inHub) {
    switch (inStep) {
        case Step::kProductions:
            return AsResource(inServer->GetProductionList(false));
        case Step::kProduction:
            return AsResource(
                inServer->GetProductionByIdAndCommitId(ImmutableString("1"), ImmutableString()));
        case Step::kAssets:
            return AsResource(inProduction->GetAssetsWithParent(ImmutableString("any")));
        case Step::kEnclosures:
            return AsResource(inServer->GetEnclosures());
        default:
            return IZOCServerResource::Create(ImmutableString(inHub.URL("/e/1")), inServer,
                                              ZOCL::ResourceWritability::kReadOnly);
    }
}

void FaultTest::ExpectSecretsInTheirPlaces(const std::vector<ReceivedRequest>& inRequests) {
    for (const ReceivedRequest& request : inRequests) {
        const std::string line = request.method + " " + request.target;
        EXPECT_EQ(line.find(kPassword), std::string::npos) << line;
        EXPECT_EQ(line.find(kTokenValue), std::string::npos) << line;
        const bool isLogin = BadHub::StepOf(request) == Step::kLogin;
        EXPECT_EQ(request.body.find(kPassword) != std::string::npos, isLogin) << line;
        EXPECT_EQ(request.body.find(kTokenValue), std::string::npos) << line;
        EXPECT_EQ(request.head.find(kPassword), std::string::npos) << line;
        const auto token = request.head.find(kTokenValue);
        if (token != std::string::npos) {
            EXPECT_EQ(request.Header("Cookie"), "login-token=" + std::string(kTokenValue) + ";") << line;
            EXPECT_EQ(request.head.find(kTokenValue, token + 1), std::string::npos) << line;
        }
    }
}

std::vector<std::string> TracedLines() {
    const std::lock_guard<std::mutex> lock(TheTraceLog().mutex);
    return TheTraceLog().lines;
}

bool WasTraced(const std::string& inText) {
    const std::lock_guard<std::mutex> lock(TheTraceLog().mutex);
    for (const std::string& line : TheTraceLog().lines) {
        if (line.find(inText) != std::string::npos) {
            return true;
        }
    }
    return false;
}

std::string RunDirectory() {
    return gRunDirectory;
}

}  // namespace faults
