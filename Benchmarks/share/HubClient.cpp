// Requests of a benchmark and their ends.
#include "HubClient.h"

#include <cstdio>
#include <cstdlib>

#include "ostnet/http/NetworkProcessor.h"

namespace bench {

using namespace ZOCL;

namespace {

constexpr std::size_t kInFlight = 10;

}  // namespace

void Demand(bool inCondition, const char* inWhat) {
    if (!inCondition) {
        std::fprintf(stderr, "bench: %s\n", inWhat);
        std::_Exit(1);
    }
}

RequestCompletion Ended::Completion() {
    return [this](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                  const shared_ptr<ostnet::Response>&) {
        const std::lock_guard<std::mutex> lock(mMutex);
        mResult = inResult;
        mResource = inResource;
        mIsDone = true;
        mChanged.notify_all();
    };
}

InterfaceRef<IZOCServerResource> Ended::Wait(bool inStarted, const char* inWhat) {
    Demand(inStarted, inWhat);
    std::unique_lock<std::mutex> lock(mMutex);
    mChanged.wait(lock, [this] { return mIsDone; });
    Demand(mResult >= 0, inWhat);
    return mResource;
}

void Many::Run(const char* inWhat) {
    mWhat = inWhat;
    for (std::size_t i = 0; i < std::min(kInFlight, mCount); ++i) {
        StartNext();
    }
    std::unique_lock<std::mutex> lock(mMutex);
    mChanged.wait(lock, [this] { return mDone == mCount; });
}

void Many::StartNext() {
    std::size_t index = 0;
    {
        const std::lock_guard<std::mutex> lock(mMutex);
        if (mNext == mCount) {
            return;
        }
        index = mNext++;
    }
    Demand(mStart(index, [this](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>&,
                                const shared_ptr<ostnet::Response>&) { OnEnded(inResult); }),
           mWhat);
}

void Many::OnEnded(int inResult) {
    Demand(inResult >= 0, mWhat);
    StartNext();
    const std::lock_guard<std::mutex> lock(mMutex);
    if (++mDone == mCount) {
        mChanged.notify_all();
    }
}

std::uint64_t RequestsSoFar() {
    ostnet::http::RequestProcessor::Statistics statistics;
    ostnet::http::GetGlobalRequestProcessor()->GetStatistics(statistics);
    return statistics.started;
}

InterfaceRef<IZOCDataServer> SignIn(const HubProcess& inHub, const char* inUser) {
    ZOSCredentials credentials;
    credentials.username = ImmutableString(inUser);
    credentials.password = inHub.Password();
    std::mutex mutex;
    std::condition_variable changed;
    InterfaceRef<IZOCDataServer> server;
    bool isDone = false;
    Guid id;
    const bool started = IZOCDataServer::ConnectToServer(
        ImmutableString(inHub.URL()), credentials, id, false,
        [&](const Guid&, const InterfaceRef<IZOCDataServer>& inServer, int,
            const shared_ptr<ostnet::Response>&) {
            const std::lock_guard<std::mutex> lock(mutex);
            server = inServer;
            isDone = true;
            changed.notify_all();
        },
        false, true);
    Demand(started, "a connect did not start");
    std::unique_lock<std::mutex> lock(mutex);
    changed.wait(lock, [&] { return isDone; });
    Demand(static_cast<bool>(server), "a user cannot sign in");
    return server;
}

InterfaceRef<IZOCProduction> MakeProduction(const InterfaceRef<IZOCDataServer>& inServer) {
    const auto list = inServer->GetProductionList(true);
    Demand(static_cast<bool>(list), "there is no list of productions");
    Ended made;
    const bool started =
        list->GetNewProduction(Guid::CreateUnique(), u"Bench", u"", false, made.Completion());
    return As<IZOCProduction>(made.Wait(started, "no production can be made"));
}

InterfaceRef<IZOCEditingSession> OpenSession(const InterfaceRef<IZOCProduction>& inProduction) {
    InterfaceRef<IZOCEditingSession> session;
    Demand(inProduction->CreateEditingSession(session, u"Bench", u"", false), "no session can be had");
    return session;
}

InterfaceRef<IZOCTransaction> OpenTransaction(const InterfaceRef<IZOCEditingSession>& inSession,
                                              const ImmutableString& inType) {
    Ended made;
    const bool started = inSession->CreateTransaction(Guid::CreateUnique(), made.Completion(), inType);
    return As<IZOCTransaction>(made.Wait(started, "no transaction can be opened"));
}

}  // namespace bench
