// bench asset-list: a full asset list is parsed and bound, against two other ways of reading it.
#include <malloc.h>

#include <algorithm>
#include <chrono>
#include <cstdio>

#include "AssetListBody.h"
#include "Sides.h"

namespace {

constexpr std::size_t kAssets = 50000;
constexpr int kRounds = 9;

template <class Run>
double TimeOf(Run inRun, const Body& inBody) {
    const auto start = std::chrono::steady_clock::now();
    inRun(inBody);
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
}

double Median(std::vector<double> inTimes) {
    std::sort(inTimes.begin(), inTimes.end());
    return inTimes[inTimes.size() / 2];
}

void PrintSpeed(const char* inName, double inOurs, double inBaseline, const char* inWhat, double inTarget) {
    const double ratio = inBaseline / inOurs;
    std::printf("bench %s: ours %.1f ms, baseline %.1f ms (%s), ratio %.2f, target %.1f: %s\n", inName,
                inOurs, inBaseline, inWhat, ratio, inTarget, ratio >= inTarget ? "holds" : "falls short");
}

std::size_t LinkBytes(const std::vector<plain::Link>& inLinks) {
    std::size_t bytes = 0;
    for (const plain::Link& link : inLinks) {
        bytes += link.rel.size() + link.href.size();
    }
    return bytes;
}

void AddLinks(const std::vector<plain::Link>& inLinks, Digest& ioDigest) {
    ioDigest.links += inLinks.size();
    ioDigest.textBytes += LinkBytes(inLinks);
}

void AddProperties(const plain::Properties& inProperties, Digest& ioDigest) {
    ioDigest.textBytes += inProperties.name.size() + inProperties.description.size() +
                          inProperties.mediaLocator.size() + inProperties.parent.size() +
                          inProperties.assetType.size();
    for (const std::string& tag : inProperties.tags) {
        ioDigest.textBytes += tag.size();
    }
    ioDigest.ticks += inProperties.zeroPoint;
    if (inProperties.subClip) {
        ioDigest.ticks += inProperties.subClip->start + inProperties.subClip->end;
    }
}

}  // namespace

Digest DigestOf(const plain::AssetList& inList) {
    Digest digest;
    AddLinks(inList.links, digest);
    for (const plain::Asset& asset : inList.assets) {
        ++digest.assets;
        digest.textBytes += asset.id.size() + asset.etag.size() + asset.contentId.size();
        AddProperties(asset.properties, digest);
        AddLinks(asset.links, digest);
        for (const plain::Enclosure& enclosure : asset.enclosures) {
            digest.textBytes += enclosure.etag.size() + enclosure.contentId.size() + enclosure.name.size();
            AddLinks(enclosure.links, digest);
        }
        for (const plain::Rendition& rendition : asset.renditions) {
            digest.textBytes += rendition.id.size() + rendition.mimeType.size();
            AddLinks(rendition.links, digest);
        }
    }
    return digest;
}

int main() {
    const Body body = MakeAssetListBody(kAssets, 20160331);
    const double megabytes = static_cast<double>(body->size()) / 1e6;
    // First of all, while the heap is small and gives back what is freed.
    const double peak = MeasurePeakBytes(body);

    // From here on freed memory is kept, so that no side pays for the first touch of its pages.
    mallopt(M_TRIM_THRESHOLD, -1);
    mallopt(M_MMAP_MAX, 0);
    const Digest digest = DigestOfOurs(body);
    if (digest.assets != kAssets || !(digest == DigestOfNlohmann(body)) ||
        !(digest == DigestOfOnDemand(body))) {
        std::fprintf(stderr, "bench asset-list: the sides do not read the same\n");
        return 1;
    }
    std::vector<double> ours;
    std::vector<double> nlohmann;
    std::vector<double> onDemand;
    std::vector<double> oursWhole;
    std::vector<double> onDemandWhole;
    for (int round = 0; round < kRounds; ++round) {
        ours.push_back(TimeOf(RunOurs, body));
        onDemand.push_back(TimeOf(RunOnDemand, body));
        nlohmann.push_back(TimeOf(RunNlohmann, body));
        oursWhole.push_back(TimeOf(DigestOfOurs, body));
        onDemandWhole.push_back(TimeOf(DigestOfOnDemand, body));
    }
    PrintSpeed("asset-list-nlohmann", Median(ours), Median(nlohmann), "nlohmann parse and copy", 4.0);
    PrintSpeed("asset-list-ondemand", Median(ours), Median(onDemand), "simdjson On-Demand into plain structs",
               0.5);
    // Ours puts off what nobody asks for, so this is what it costs when everything is asked for once.
    std::printf(
        "note asset-list: with every field of every asset read once: ours %.1f ms, On-Demand %.1f ms\n",
        Median(oursWhole), Median(onDemandWhole));
    const double ratio = peak / 1e6 / megabytes;
    std::printf(
        "bench asset-list-memory: ours %.1f MB, baseline %.1f MB (the body), ratio %.2f, target at most 5.0: "
        "%s\n",
        peak / 1e6, megabytes, ratio, peak > 0 && ratio <= 5.0 ? "holds" : "falls short");
    return 0;
}
