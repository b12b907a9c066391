// One user changes 2,000 assets, each by a request of its own, and shares them; another gets them. What this
// costs in time and requests is the baseline of the bulk form.
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <mutex>
#include <string>

#include "HLM/HLM.h"
#include "HubProcess.h"
#include "ostnet/http/NetworkProcessor.h"
#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/Library.h"

namespace {

using namespace ZOCL;

constexpr std::size_t kAssets = 2000;
constexpr std::size_t kInFlight = 10;

void Demand(bool inCondition, const char* inWhat) {
    if (!inCondition) {
        std::fprintf(stderr, "bench_share: %s\n", inWhat);
        std::_Exit(1);
    }
}

/// Waits for the end of one request.
class Ended {
public:
    RequestCompletion Completion() {
        return [this](const Guid&, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                      const shared_ptr<ostnet::Response>&) {
            const std::lock_guard<std::mutex> lock(mMutex);
            mResult = inResult;
            mResource = inResource;
            mIsDone = true;
            mChanged.notify_all();
        };
    }
    InterfaceRef<IZOCServerResource> Wait(bool inStarted, const char* inWhat) {
        Demand(inStarted, inWhat);
        std::unique_lock<std::mutex> lock(mMutex);
        mChanged.wait(lock, [this] { return mIsDone; });
        Demand(mResult >= 0, inWhat);
        return mResource;
    }

private:
    std::mutex mMutex;
    std::condition_variable mChanged;
    bool mIsDone = false;
    int mResult = 0;
    InterfaceRef<IZOCServerResource> mResource;
};

/// Runs many requests, a few at a time; each that ends starts the next.
class Many {
public:
    using Start = std::function<bool(std::size_t inIndex, const RequestCompletion& inCompletion)>;

    Many(std::size_t inCount, Start inStart) : mCount(inCount), mStart(std::move(inStart)) {}
    void Run(const char* inWhat) {
        mWhat = inWhat;
        for (std::size_t i = 0; i < std::min(kInFlight, mCount); ++i) {
            StartNext();
        }
        std::unique_lock<std::mutex> lock(mMutex);
        mChanged.wait(lock, [this] { return mDone == mCount; });
    }

private:
    void StartNext() {
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
    void OnEnded(int inResult) {
        Demand(inResult >= 0, mWhat);
        StartNext();
        const std::lock_guard<std::mutex> lock(mMutex);
        if (++mDone == mCount) {
            mChanged.notify_all();
        }
    }

    const std::size_t mCount;
    const Start mStart;
    const char* mWhat = "";
    std::mutex mMutex;
    std::condition_variable mChanged;
    std::size_t mNext = 0;
    std::size_t mDone = 0;
};

InterfaceRef<IZOCDataServer> SignIn(const bench::HubProcess& inHub, const char* inUser) {
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

std::uint64_t RequestsSoFar() {
    ostnet::http::RequestProcessor::Statistics statistics;
    ostnet::http::GetGlobalRequestProcessor()->GetStatistics(statistics);
    return statistics.started;
}

template <class Interface, class Reference>
InterfaceRef<Interface> As(const Reference& inObject) {
    auto found = RFL::QueryInterface<Interface>(inObject);
    Demand(static_cast<bool>(found), "an object does not answer an interface that it must have");
    return found;
}

template <class Reference>
void LoadNow(const Reference& inObject, const char* inWhat) {
    Demand(As<IZOCServerResource>(inObject)->Load(false), inWhat);
}

InterfaceRef<IZOCProduction> MakeProduction(const InterfaceRef<IZOCDataServer>& inServer) {
    const auto list = inServer->GetProductionList(true);
    Demand(static_cast<bool>(list), "there is no list of productions");
    Ended made;
    const bool started =
        list->GetNewProduction(Guid::CreateUnique(), u"Bench", u"", false, made.Completion());
    return As<IZOCProduction>(made.Wait(started, "no production can be made"));
}

InterfaceRef<IZOCProduction> OpenBench(const InterfaceRef<IZOCDataServer>& inServer) {
    const auto list = inServer->GetProductionList(true);
    for (const auto& entry : list->GetAllItems()) {
        if (entry.name == u"Bench") {
            auto production = list->GetProduction(entry);
            LoadNow(production, "the production cannot be loaded");
            return production;
        }
    }
    Demand(false, "the production is not in the list");
    return nullptr;
}

void AddAssets(const InterfaceRef<IZOCDataServer>& inServer, const InterfaceRef<IZOCProduction>& inTarget) {
    const ImmutableString factory = As<IZOCTransaction>(inTarget)->GetAssetFactoryURL();
    Many(kAssets, [&](std::size_t inIndex, const RequestCompletion& inCompletion) {
        AssetBaseProperties properties;
        properties.name = u"clip " + UString(1, static_cast<char16_t>(u'a' + inIndex % 26));
        properties.assetType = kAssetType_MasterClip;
        return IZOCWritableAsset::Create(Guid::CreateUnique(), factory, inServer, properties, inCompletion);
    }).Run("an asset cannot be made");
}

InterfaceRef<IZOCEditingSession> OpenSession(const InterfaceRef<IZOCProduction>& inProduction) {
    InterfaceRef<IZOCEditingSession> session;
    Demand(inProduction->CreateEditingSession(session, u"Bench", u"", false), "no session can be had");
    return session;
}

InterfaceRef<IZOCTransaction> OpenTransaction(const InterfaceRef<IZOCEditingSession>& inSession) {
    Ended made;
    const bool started =
        inSession->CreateTransaction(Guid::CreateUnique(), made.Completion(), kTransactionType_Edit);
    return As<IZOCTransaction>(made.Wait(started, "no transaction can be opened"));
}

void ChangeAll(const InterfaceRef<IZOCTransaction>& inTransaction) {
    const auto assets = As<IZOCProduction>(inTransaction)->GetAssets();
    LoadNow(assets, "the assets of the transaction cannot be loaded");
    const auto items = assets->GetAllItems();
    Demand(items.size() == kAssets, "assets are missing");
    Many(items.size(), [&](std::size_t inIndex, const RequestCompletion& inCompletion) {
        const auto asset = assets->GetAssetByIdentifier(items[inIndex].assetIdentifier);
        AssetBaseProperties properties = asset->GetAssetBaseProperties();
        properties.description = u"changed";
        return As<IZOCWritableAsset>(asset)->SetAssetBasePropertiesAndUpdate(properties, Guid::CreateUnique(),
                                                                             inCompletion);
    }).Run("an asset cannot be changed");
}

void Share(const InterfaceRef<IZOCEditingSession>& inSession) {
    const auto transaction = OpenTransaction(inSession);
    ChangeAll(transaction);
    Ended committed;
    bool started = transaction->Commit(Guid::CreateUnique(), committed.Completion(), u"two thousand");
    committed.Wait(started, "the transaction cannot be committed");
    Ended shared;
    started = inSession->Push(Guid::CreateUnique(), shared.Completion(), u"two thousand",
                              kResolveStrategy_None, u"");
    shared.Wait(started, "the session cannot be shared");
}

void GetLatest(const InterfaceRef<IZOCEditingSession>& inSession) {
    Ended pulled;
    bool started =
        inSession->Pull(Guid::CreateUnique(), pulled.Completion(), kMergeStrategy_Interactive, u"");
    pulled.Wait(started, "the latest cannot be got");
    Ended refreshed;
    started = inSession->Refresh(Guid::CreateUnique(), refreshed.Completion());
    refreshed.Wait(started, "the session cannot be read again");
    const auto assets = As<IZOCProduction>(inSession)->GetAssets();
    LoadNow(assets, "the assets of the session cannot be loaded");
    std::size_t changed = 0;
    for (const auto& item : assets->GetAllItems()) {
        changed += item.description == u"changed" ? 1 : 0;
    }
    Demand(changed == kAssets, "changed assets did not arrive");
}

void Measure(const char* inName, const std::function<void()>& inWork) {
    const std::uint64_t requestsBefore = RequestsSoFar();
    const auto before = std::chrono::steady_clock::now();
    inWork();
    const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - before;
    std::printf("bench %s: %.0f ms and %llu requests for %zu assets, recorded\n", inName, took.count(),
                static_cast<unsigned long long>(RequestsSoFar() - requestsBefore), kAssets);
}

void Run(const bench::HubProcess& inHub) {
    const auto anna = SignIn(inHub, "anna");
    const auto production = MakeProduction(anna);
    AddAssets(anna, production);
    const auto ben = SignIn(inHub, "ben");
    const auto annasSession = OpenSession(OpenBench(anna));
    const auto bensSession = OpenSession(OpenBench(ben));
    Measure("share-items", [&] { Share(annasSession); });
    Measure("latest-items", [&] { GetLatest(bensSession); });
}

}  // namespace

int main() {
    const bench::HubProcess hub;
    setenv("ZOCLIENT_CONFIG_HOME", (hub.Directory() + "/config").c_str(), 1);
    setenv("ZOCLIENT_STATE_HOME", (hub.Directory() + "/state").c_str(), 1);
    setenv("ZOCLIENT_CACHE_HOME", (hub.Directory() + "/cache").c_str(), 1);
    HLM::SetIsHeadless(true);
    Initialize();
    Run(hub);
    IZOCDataServer::Terminate(false);
    Shutdown();
    return 0;
}
