// Calls of the library and their ends.
#include "Host.h"

#include "HLM/HLM.h"
#include "ostcore/threads/MainThread.h"
#include "RFL/Registry.h"
#include "ZOClient/Library.h"

namespace campaign {

namespace {

/// How an asynchronous call ended. Completions share it: a second one, which must not be, may come late.
struct Call {
    bool hasEnded = false;
    Ended ended;
    InterfaceRef<IZOCDataServer> server;
};

}  // namespace

struct Host::Calls {
    mutable std::mutex mutex;
    CallCounts counts;
    bool wasEnded = false;

    void Begin() {
        const std::lock_guard<std::mutex> lock(mutex);
        ++counts.started;
    }
    void NeverBegan() {
        const std::lock_guard<std::mutex> lock(mutex);
        --counts.started;
    }
    bool HasEnded(const Call& inCall) const {
        const std::lock_guard<std::mutex> lock(mutex);
        return inCall.hasEnded;
    }
    void End(Call& ioCall, const Ended& inEnded, const InterfaceRef<IZOCDataServer>& inServer) {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ++counts.ended;
            counts.endedAgain += ioCall.hasEnded ? 1 : 0;
            ioCall.hasEnded = true;
            ioCall.ended = inEnded;
            ioCall.server = inServer;
        }
        // Wakes the main thread.
        ostcore::threads::AsyncCallFromMainThread([] {});
    }
    void WaitFor(const Call& inCall) const {
        while (!HasEnded(inCall)) {
            ostcore::threads::WaitAndPumpMainThread(1000);
        }
    }
};

Host::Host() : mCalls(std::make_shared<Calls>()) {
    HLM::SetIsHeadless(true);
    HLM::SetEndProcessFunction([calls = mCalls] {
        const std::lock_guard<std::mutex> lock(calls->mutex);
        calls->wasEnded = true;
    });
    ZOCL::Initialize();
}

Host::~Host() {
    mServer.Reset();
    IZOCDataServer::Terminate(false);
    ostcore::threads::PumpMainThread();
    ZOCL::Shutdown();
    RFL::CloseRegistry();
}

int Host::Connect(const std::string& inServer, const std::string& inUser, const std::string& inPassword) {
    mServer.Reset();
    IZOCDataServer::Terminate(false);
    ZOCL::ZOSCredentials credentials;
    credentials.username = ImmutableString(inUser);
    credentials.password = inPassword;
    const auto call = std::make_shared<Call>();
    Guid id;
    mCalls->Begin();
    const bool started = IZOCDataServer::ConnectToServer(
        ImmutableString(inServer), credentials, id, false,
        [calls = mCalls, call](const Guid&, const InterfaceRef<IZOCDataServer>& inEndedServer, int inResult,
                               const ZOCL::shared_ptr<ostnet::Response>&) {
            calls->End(*call, {inResult, nullptr}, inEndedServer);
        },
        true, true);
    if (!started) {
        mCalls->NeverBegan();
        return ZOCL::kResultNotStarted;
    }
    mCalls->WaitFor(*call);
    mServer = call->server;
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    mCalls->wasEnded = false;
    return call->ended.result;
}

Ended Host::Run(const Start& inStart) {
    const auto call = std::make_shared<Call>();
    mCalls->Begin();
    const bool started = inStart(
        Guid::CreateUnique(),
        [calls = mCalls, call](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                               const ZOCL::shared_ptr<ostnet::Response>&) {
            calls->End(*call, {inResult, inResource}, nullptr);
        });
    if (!started) {
        mCalls->NeverBegan();
        return {};
    }
    mCalls->WaitFor(*call);
    return call->ended;
}

CallCounts Host::Counts() const {
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    return mCalls->counts;
}

bool Host::WasEnded() const {
    const std::lock_guard<std::mutex> lock(mCalls->mutex);
    return mCalls->wasEnded;
}

}  // namespace campaign
