// One user changes 2,000 assets, each by a request of its own, and shares them; another gets them. What this
// costs in time and requests is the baseline of the bulk form.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <functional>

#include "HLM/HLM.h"
#include "HubClient.h"
#include "HubProcess.h"
#include "ZOClient/Library.h"

namespace {

using namespace ZOCL;
using bench::As;
using bench::Demand;
using bench::Ended;
using bench::LoadNow;
using bench::Many;

constexpr std::size_t kAssets = 2000;

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
    const auto transaction = bench::OpenTransaction(inSession, kTransactionType_Edit);
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
    const std::uint64_t requestsBefore = bench::RequestsSoFar();
    const auto before = std::chrono::steady_clock::now();
    inWork();
    const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - before;
    std::printf("bench %s: %.0f ms and %llu requests for %zu assets, recorded\n", inName, took.count(),
                static_cast<unsigned long long>(bench::RequestsSoFar() - requestsBefore), kAssets);
}

void Run(const bench::HubProcess& inHub) {
    const auto anna = bench::SignIn(inHub, "anna");
    const auto production = bench::MakeProduction(anna);
    AddAssets(anna, production);
    const auto ben = bench::SignIn(inHub, "ben");
    const auto annasSession = bench::OpenSession(OpenBench(anna));
    const auto bensSession = bench::OpenSession(OpenBench(ben));
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
