// What the layers cost: the whole chain over the base processor, over the engine alone, and on an answer from
// memory; and the packing of uploads against zlib.
#include <cstdio>
#include <functional>

#include "BenchmarkServer.h"
#include "DeflateSides.h"
#include "Loops.h"
#include "ostnet/http/NetworkProcessor.h"
#include "RequestChain/RequestChain.h"

namespace {

using bench::Measure;

constexpr std::size_t kBodySize = 1024;
constexpr int kRounds = 9;
constexpr int kPairs = 31;
constexpr double kCachedBound = 5.0;
constexpr double kOverProcessorTarget = 1.15;
constexpr double kOverEngineTarget = 1.5;
constexpr double kPackingTarget = 2.0;
constexpr std::size_t kLargeBody = 10u << 20;
constexpr std::size_t kSmallBody = 64u << 10;

const char kToken[] = "login-token=5f3a9c0e-6f7b-4d55-9c0b-0f6f3a7d1c11;";
const bench::HeaderList kOwnHeaders = {{"Cache-Control", "no-cache"}, {"X-Request", "bench"}};
/// The same on the wire, for those who have no layers to add the rest.
const bench::HeaderList kAllHeaders = {{"Cookie", kToken},
                                       {"Expect", "102-processing"},
                                       {"If-None-Match", "\"5d8c72a5edda8d6a\""},
                                       {"Cache-Control", "no-cache"},
                                       {"X-Request", "bench"}};

boost::shared_ptr<ostnet::http::NetworkProcessor> MakeNetwork() {
    ostnet::NetworkSettings settings;
    settings.userAgent = "bench";
    settings.proxy = "";
    return boost::make_shared<ostnet::http::NetworkProcessor>(settings);
}

ZOCL::RequestChain MakeChain(const boost::shared_ptr<ostnet::http::NetworkProcessor>& inNetwork) {
    ostnet::http::SetGlobalRequestProcessor(inNetwork);
    ZOCL::ChainCallbacks callbacks;
    callbacks.tokenNotification = [] {};
    callbacks.recoverableErrors = [](bool) {};
    ZOCL::RequestChain chain = ZOCL::BuildRequestChain(callbacks, ostnet::ImmutableString(kToken));
    chain.recoverableError->SetRetriesEnabled(true);
    return chain;
}

bench::Workload At(const bench::BenchmarkServer& inServer, const bench::HeaderList& inHeaders) {
    return {"http://127.0.0.1:" + std::to_string(inServer.Port()) + "/content/zo/data/asset/1", inHeaders,
            kBodySize};
}

double MedianTime(const std::vector<Measure>& inTimes) {
    return bench::MedianOf(inTimes, &Measure::microsecondsPerRequest);
}

double MedianRatio(const std::vector<Measure>& inOurs, const std::vector<Measure>& inBaseline) {
    return bench::MedianRatio(inOurs, inBaseline, &Measure::microsecondsPerRequest);
}

void PrintTime(const char* inName, double inOurs, double inBaseline, const char* inWhat, double inRatio,
               double inTarget) {
    std::printf("bench %s: ours %.2f us, baseline %.2f us (%s), ratio %.2f, target %.2f: %s\n", inName,
                inOurs, inBaseline, inWhat, inRatio, inTarget, inRatio <= inTarget ? "holds" : "falls short");
}

void CompareRequests(const bench::BenchmarkServer& inLive, const bench::BenchmarkServer& inLasting) {
    const auto network = MakeNetwork();
    const ZOCL::RequestChain chain = MakeChain(network);
    bench::ProcessorLoop cached(chain.common, At(inLasting, kOwnHeaders));
    bench::ProcessorLoop layered(chain.common, At(inLive, kOwnHeaders));
    bench::ProcessorLoop processor(MakeNetwork(), At(inLive, kAllHeaders));
    bench::BareLoop bare(At(inLive, kAllHeaders));
    cached.Run();
    layered.Run();
    processor.Run();
    bare.Run();
    std::vector<Measure> cachedTimes, layeredTimes, processorTimes, bareTimes;
    for (int round = 0; round < kPairs; ++round) {
        cachedTimes.push_back(bench::TakeTime(cached));
        layeredTimes.push_back(bench::TakeTime(layered));
        processorTimes.push_back(bench::TakeTime(processor));
        bareTimes.push_back(bench::TakeTime(bare));
    }
    const double cachedTime = MedianTime(cachedTimes);
    const double layeredTime = MedianTime(layeredTimes);
    PrintTime("chain-cached", cachedTime, kCachedBound, "the bound for an answer from memory",
              cachedTime / kCachedBound, 1.0);
    PrintTime("chain-network", layeredTime, MedianTime(processorTimes), "base processor without layers",
              MedianRatio(layeredTimes, processorTimes), kOverProcessorTarget);
    PrintTime("chain-engine", layeredTime, MedianTime(bareTimes), "bare libcurl multi loop",
              MedianRatio(layeredTimes, bareTimes), kOverEngineTarget);
    ostnet::http::SetGlobalRequestProcessor(nullptr);
}

double MegabytesPerSecond(std::size_t inBytes, const std::function<void()>& inPack) {
    std::vector<double> rates;
    for (int round = 0; round < kRounds; ++round) {
        const double before = bench::ProcessorSeconds();
        inPack();
        rates.push_back(static_cast<double>(inBytes) / (bench::ProcessorSeconds() - before) / 1e6);
    }
    return bench::Median(rates);
}

void ComparePacking(const char* inName, const std::vector<bench::Body>& inBodies) {
    std::size_t bytes = 0;
    for (const bench::Body& body : inBodies) {
        bytes += body->size();
    }
    bench::ZlibSide zlib;
    std::size_t ourSize = 0, zlibSize = 0;
    const double ourRate = MegabytesPerSecond(bytes, [&] { ourSize = bench::PackOurs(inBodies); });
    const double zlibRate = MegabytesPerSecond(bytes, [&] { zlibSize = zlib.Pack(inBodies); });
    std::printf(
        "bench %s: ours %.0f MB/s, baseline %.0f MB/s (zlib, stream reused), ratio %.2f, target %.1f: %s\n",
        inName, ourRate, zlibRate, ourRate / zlibRate, kPackingTarget,
        ourRate >= kPackingTarget * zlibRate ? "holds" : "falls short");
    std::printf("bench %s-size: ours %zu bytes, baseline %zu bytes (the same), ratio %.3f, target 1.0: %s\n",
                inName, ourSize, zlibSize, static_cast<double>(ourSize) / static_cast<double>(zlibSize),
                ourSize <= zlibSize ? "holds" : "falls short");
}

}  // namespace

int main() {
    const bench::BenchmarkServer live(kBodySize);
    const bench::BenchmarkServer lasting(kBodySize, "private, max-age=31536000, immutable");
    curl_global_init(CURL_GLOBAL_DEFAULT);
    CompareRequests(live, lasting);
    const std::string text = bench::MakeAssetJSON(kLargeBody);
    ComparePacking("deflate-json", bench::CutIntoBodies(text, kLargeBody));
    ComparePacking("deflate-64k", bench::CutIntoBodies(text, kSmallBody));
    return 0;
}
