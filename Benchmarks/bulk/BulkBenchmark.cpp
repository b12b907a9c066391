// An ingest of 10,000 assets with a sidecar of 4 KiB each: in bulk, one by one, and as a bare libcurl program
// that posts the recorded forms to a hub that has not seen them.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <thread>
#include <utility>
#include <vector>

#include "FormRecorder.h"
#include "HLM/HLM.h"
#include "HubClient.h"
#include "Sidecars.h"
#include "ZOClient/IZOCBulkTransaction.h"
#include "ZOClient/Library.h"

namespace {

using namespace ZOCL;
using bench::As;
using bench::Demand;
using bench::Ended;
using bench::Many;

constexpr std::size_t kAssets = 10'000;
/// One by one takes long, and its rate does not depend on the number.
constexpr std::size_t kSingleAssets = 1'000;
constexpr int kRounds = 3;
/// A form is full when its payloads exceed this, or all of it exceeds this and an eighth.
constexpr std::size_t kFormLimit = 33'554'432;
constexpr std::size_t kLargestForm = kFormLimit + kFormLimit / 8;
/// What one asset adds to a form at most: its sidecar, its properties and three part heads.
constexpr std::size_t kAssetBytes = bench::kSidecarBytes + 2048;
constexpr double kWantedOverSingle = 10.0;
constexpr double kWantedOfBare = 0.7;

using Clock = std::chrono::steady_clock;

double SecondsSince(Clock::time_point inStart) {
    return std::chrono::duration<double>(Clock::now() - inStart).count();
}

double MedianOf(std::vector<double> inValues) {
    std::sort(inValues.begin(), inValues.end());
    return inValues[inValues.size() / 2];
}

struct Clip {
    AssetBaseProperties properties;
    ImmutableString enclosure;
    shared_ptr<RecycledMemory const> sidecar;
};

std::vector<Clip> MakeClips(std::size_t inCount) {
    std::vector<Clip> clips(inCount);
    for (std::size_t i = 0; i < inCount; ++i) {
        const std::string name = "clip" + std::to_string(i) + ".mov";
        clips[i].properties.name = UString(name.begin(), name.end());
        clips[i].properties.assetType = kAssetType_MasterClip;
        clips[i].properties.mediaLocator =
            IZOCMediaLocator::CreateMediaLocatorID(Guid(1, i), Guid::CreateUnique());
        clips[i].enclosure = GetXMPEnclosureName(clips[i].properties.mediaLocator);
        clips[i].sidecar = RecycledMemory::CreateFromBytes(bench::SidecarOf(i));
    }
    return clips;
}

/// A hub of its own with a transaction on it.
struct Site {
    bench::HubProcess hub;
    InterfaceRef<IZOCDataServer> server = bench::SignIn(hub, "anna");
    InterfaceRef<IZOCTransaction> transaction =
        bench::OpenTransaction(bench::OpenSession(bench::MakeProduction(server)), kTransactionType_Ingest);

    void Commit(std::size_t inExpected) {
        Ended committed;
        const bool started = transaction->Commit(Guid::CreateUnique(), committed.Completion(), u"bench");
        const auto session =
            As<IZOCProduction>(committed.Wait(started, "the transaction cannot be committed"));
        const auto assets = session->GetAssets();
        bench::LoadNow(assets, "the assets of the session cannot be loaded");
        const auto items = assets->GetAllItems();
        Demand(items.size() == inExpected, "assets are missing");
        const auto enclosures = assets->GetAssetByIdentifier(items.front().assetIdentifier)->GetEnclosures();
        bench::LoadNow(enclosures, "the enclosures of an asset cannot be loaded");
        Demand(enclosures->GetEnclosureNames().size() == 1, "an asset has not got its sidecar");
    }
};

/// What a transaction has written is packed and stored behind its end; nothing else is to be measured
/// meanwhile.
void RestUntilIdle() {
    std::clock_t before = std::clock(), used = CLOCKS_PER_SEC;
    while (used > CLOCKS_PER_SEC / 100) {
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        const std::clock_t now = std::clock();
        used = now - std::exchange(before, now);
    }
}

double InBulk(Site& ioSite, const std::vector<Clip>& inClips) {
    Ended ended;
    const auto start = Clock::now();
    const auto operation = CompoundAsyncOperation::Create(
        [completion = ended.Completion()](int inResult) { completion(Guid(), inResult, nullptr, nullptr); },
        ioSite.server, false);
    const auto bulk = ioSite.transaction->CreateBulkTransaction(operation);
    Demand(static_cast<bool>(bulk), "there is no bulk transaction");
    for (const Clip& clip : inClips) {
        bulk->CreateNewAsset(
            [](int inResult, const InterfaceRef<IZOCAsset>& inAsset) {
                Demand(inResult >= 0 && inAsset, "an asset was not made");
            },
            clip.properties, {}, boost::none, clip.enclosure, clip.sidecar, {}, nullptr, {});
    }
    bulk->FinishedEditing();
    ended.Wait(true, "the bulk transaction failed");
    const double seconds = SecondsSince(start);
    RestUntilIdle();
    return seconds;
}

double OneByOne(const std::vector<Clip>& inClips) {
    Site site;
    const auto server = site.server;
    const ImmutableString factory = site.transaction->GetAssetFactoryURL();
    const auto start = Clock::now();
    Many(inClips.size(), [&](std::size_t inIndex, const RequestCompletion& inCompletion) {
        const Clip& clip = inClips[inIndex];
        return IZOCWritableAsset::Create(
            Guid::CreateUnique(), factory, server, clip.properties,
            [server, &clip, inCompletion](const Guid& inID, int inResult,
                                          const InterfaceRef<IZOCServerResource>& inResource,
                                          const shared_ptr<ostnet::Response>& inResponse) {
                const auto asset = RFL::QueryInterface<IZOCWritableAsset>(inResource);
                if (inResult < 0 || !asset ||
                    !CreateEnclosure(Guid::CreateUnique(), asset->GetEnclosureFactoryURL(), server,
                                     clip.enclosure, clip.sidecar, inCompletion)) {
                    inCompletion(inID, inResult < 0 ? inResult : kResultFailure, inResource, inResponse);
                }
            });
    }).Run("an asset cannot be made");
    const double seconds = SecondsSince(start);
    site.Commit(inClips.size());
    return seconds;
}

std::string CookieOf(const bench::RecordedForm& inForm) {
    for (const auto& [name, value] : inForm.headers) {
        if (name == "Cookie") {
            return value;
        }
    }
    return {};
}

/// Cookie and address come from a bulk transaction of one asset.
double Bare(bench::FormRecorder& ioRecorder, const std::vector<bench::RecordedForm>& inForms) {
    Site site;
    InBulk(site, MakeClips(1));
    const auto probe = ioRecorder.Take();
    Demand(probe.size() == 1, "the probe was not one form");
    bench::BarePoster poster;
    const auto start = Clock::now();
    for (const bench::RecordedForm& form : inForms) {
        const long status = poster.Post(probe.front().url, form, CookieOf(probe.front()));
        Demand(status >= 200 && status < 300, "the hub does not take a recorded form");
    }
    const double seconds = SecondsSince(start);
    site.Commit(kAssets + 1);
    return seconds;
}

/// All forms are full, but for the last one. They are packed side by side, so that they reach the network in
/// any order.
bool KeepTheSizeRule(const std::vector<bench::RecordedForm>& inForms) {
    std::size_t withRoom = 0;
    for (const bench::RecordedForm& form : inForms) {
        const std::size_t size = form.UnpackedSize();
        if (size == 0 || size > kLargestForm + kAssetBytes) {
            return false;
        }
        withRoom += size <= kFormLimit ? 1 : 0;
    }
    return !inForms.empty() && withRoom <= 1;
}

const char* Judge(double inRatio, double inTarget) {
    return inRatio >= inTarget ? "holds" : "falls short";
}

void Run(bench::FormRecorder& ioRecorder) {
    const std::vector<Clip> clips = MakeClips(kAssets);
    const std::vector<Clip> few(clips.begin(), clips.begin() + kSingleAssets);
    std::vector<double> ours, bare, single;
    std::size_t requests = 0, bytes = 0;
    for (int round = 0; round < kRounds; ++round) {
        std::vector<bench::RecordedForm> forms;
        {
            Site site;
            const std::uint64_t before = bench::RequestsSoFar();
            ours.push_back(kAssets / InBulk(site, clips));
            requests = bench::RequestsSoFar() - before;
            forms = ioRecorder.Take();
            site.Commit(kAssets);
        }
        Demand(KeepTheSizeRule(forms), "the forms are not as the size rule demands");
        bytes = 0;
        for (const bench::RecordedForm& form : forms) {
            bytes += form.UnpackedSize();
        }
        std::printf(
            "bench bulk-requests: %zu forms of %.1f MiB in all, %zu requests, for %zu assets, recorded\n",
            forms.size(), static_cast<double>(bytes) / (1 << 20), requests, kAssets);
        bare.push_back(kAssets / Bare(ioRecorder, forms));
        single.push_back(kSingleAssets / OneByOne(few));
    }
    const double rate = MedianOf(ours), bareRate = MedianOf(bare), singleRate = MedianOf(single);
    std::printf(
        "bench bulk-single: ours %.0f assets/s, baseline %.0f assets/s (two requests an asset, ten at a "
        "time, "
        "%zu assets), ratio %.1f, target %.1f: %s\n",
        rate, singleRate, kSingleAssets, rate / singleRate, kWantedOverSingle,
        Judge(rate / singleRate, kWantedOverSingle));
    std::printf(
        "bench bulk-bare: ours %.0f assets/s, baseline %.0f assets/s (bare libcurl posts the same forms), "
        "ratio "
        "%.2f, target %.2f: %s\n",
        rate, bareRate, rate / bareRate, kWantedOfBare, Judge(rate / bareRate, kWantedOfBare));
}

}  // namespace

int main() {
    const bench::HubProcess home;  // for its directory
    setenv("ZOCLIENT_CONFIG_HOME", (home.Directory() + "/config").c_str(), 1);
    setenv("ZOCLIENT_STATE_HOME", (home.Directory() + "/state").c_str(), 1);
    setenv("ZOCLIENT_CACHE_HOME", (home.Directory() + "/cache").c_str(), 1);
    HLM::SetIsHeadless(true);
    const auto recorder = boost::make_shared<bench::FormRecorder>(ostnet::http::GetGlobalRequestProcessor());
    ostnet::http::SetGlobalRequestProcessor(recorder);
    Initialize();
    Run(*recorder);
    IZOCDataServer::Terminate(false);
    ostnet::http::SetGlobalRequestProcessor(nullptr);
    Shutdown();
    return 0;
}
