// The smallest useful host: signs in, lists the productions, and leaves again. Here the network is the
// scripted one of ZOClientTesting, so that the example runs without a hub; a real host drops that part.
#include <condition_variable>
#include <cstdio>
#include <mutex>
#include <string>

#include "HLM/HLM.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/Library.h"
#include "ZOClientTesting/ScriptedProcessor.h"

namespace {

using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScriptedAnswer;

constexpr const char* kHub = "http://hub.example:60138";

/// The four documents of a hub that knows one user and one production.
ScriptedAnswer AnswerAsHub(const RecordedRequest& inRequest) {
    const std::string relations = "http://ns.meridane.example/zo/rel";
    const auto link = [&](const std::string& inRelation, const std::string& inPath) {
        return "{\"rel\":\"" + relations + inRelation + "\",\"href\":\"" + kHub + inPath + "\"}";
    };
    if (inRequest.Path() == "/content/zo/api/discovery.json") {
        return ScriptedAnswer::JSON(
            "{\"server\":{\"name\":\"Example\",\"version\":\"1.0.0\"},"
            "\"links\":[" +
            link("/discovery/v1", "/links") + "]}");
    }
    if (inRequest.Path() == "/links") {
        const bool signedIn = inRequest.Header("Cookie").find("login-token=example") == 0;
        return ScriptedAnswer::JSON(
            "{\"links\":[" +
            (signedIn ? link("/system/logout", "/logout") + "," + link("/productions", "/productions")
                      : link("/system/login", "/login")) +
            "]}");
    }
    if (inRequest.Path() == "/login") {
        const bool good =
            inRequest.Field("j_username") == "ada" && inRequest.Field("j_password") == "lovelace";
        return good ? ScriptedAnswer::Status(200).With("Set-Cookie", "login-token=example; Path=/")
                    : ScriptedAnswer::Status(401);
    }
    if (inRequest.Path() == "/productions") {
        return ScriptedAnswer::JSON(
            "{\"productions\":[{\"zo:productionId\":\"p1\",\"properties\":{\"name\":\"Harbour Film\"},"
            "\"links\":[]}],\"links\":[]}");
    }
    return ScriptedAnswer::Status(404);
}

/// A completion runs on a worker of the library; this hands its outcome to the thread that waits.
class ConnectWaiter {
public:
    void Complete(const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer, int inResult) {
        const std::lock_guard<std::mutex> lock(mMutex);
        mServer = inServer;
        mResult = inResult;
        mDone = true;
        mChanged.notify_all();
    }
    ZOCL::InterfaceRef<ZOCL::IZOCDataServer> Wait(int& outResult) {
        std::unique_lock<std::mutex> lock(mMutex);
        mChanged.wait(lock, [this] { return mDone; });
        outResult = mResult;
        return mServer;
    }

private:
    std::mutex mMutex;
    std::condition_variable mChanged;
    ZOCL::InterfaceRef<ZOCL::IZOCDataServer> mServer;
    int mResult = 0;
    bool mDone = false;
};

int ListProductions() {
    ZOCL::ZOSCredentials credentials;
    credentials.username = ZOCL::ImmutableString("ada");
    credentials.password = "lovelace";

    const auto waiter = ZOCL::make_shared<ConnectWaiter>();
    ZOCL::Guid requestID;
    const bool started = ZOCL::IZOCDataServer::ConnectToServer(
        ZOCL::ImmutableString("hub.example"), credentials, requestID, false,
        [waiter](const ZOCL::Guid&, const ZOCL::InterfaceRef<ZOCL::IZOCDataServer>& inServer, int inResult,
                 const ZOCL::shared_ptr<ostnet::Response>&) { waiter->Complete(inServer, inResult); },
        false, true);
    int result = ZOCL::kResultNotStarted;
    const auto server = started ? waiter->Wait(result) : nullptr;
    if (!server) {
        std::fprintf(stderr, "cannot sign in: %s\n", ZOCL::GetResultMeaning(result));
        return 1;
    }
    const auto productions = server->GetProductionList(true);
    if (!productions) {
        std::fprintf(stderr, "the hub names no productions\n");
        return 1;
    }
    std::string names;
    for (const auto& entry : productions->GetAllItems()) {
        names += (names.empty() ? "" : ", ") + ostcore::utility::ToUTF8(entry.name);
    }
    std::printf("signed in as %s; productions: %s\n", server->GetCredentials().username.c_str(),
                names.c_str());
    return 0;
}

}  // namespace

int main() {
    HLM::SetIsHeadless(true);
    ZOClientTesting::ScopedProcessor network;
    network->SetHandler(AnswerAsHub);
    ZOCL::Initialize();
    const int exitCode = ListProductions();
    ZOCL::IZOCDataServer::Terminate(false);
    ZOCL::Shutdown();
    return exitCode;
}
