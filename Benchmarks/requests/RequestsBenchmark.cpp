// Small GETs over kept connections: the base processor against a bare loop over the engine that it uses.
#include <cstdio>

#include "BenchmarkServer.h"
#include "Loops.h"
#include "ostnet/http/NetworkProcessor.h"

namespace {

constexpr std::size_t kBodySize = 1024;
constexpr int kPairs = 31;
constexpr double kRateTarget = 0.85;
constexpr double kProcessorTimeTarget = 1.3;

const bench::HeaderList kHeaders = {
    {"Cookie", "login-token=5f3a9c0e-6f7b-4d55-9c0b-0f6f3a7d1c11;"},
    {"Expect", "102-processing"},
    {"If-None-Match", "\"9a0364b9e99bb480\""},
    {"Cache-Control", "no-cache"},
    {"X-Request", "bench"},
};

ostnet::NetworkSettings MakeSettings() {
    ostnet::NetworkSettings settings;
    settings.userAgent = "bench";
    settings.proxy = "";
    return settings;
}

}  // namespace

int main() {
    const bench::BenchmarkServer server(kBodySize);
    const bench::Workload workload{
        "http://127.0.0.1:" + std::to_string(server.Port()) + "/content/zo/data/asset/1", kHeaders,
        kBodySize};
    curl_global_init(CURL_GLOBAL_DEFAULT);
    bench::ProcessorLoop ours(boost::make_shared<ostnet::http::NetworkProcessor>(MakeSettings()), workload);
    bench::BareLoop bare(workload);
    ours.Run();
    bare.Run();
    std::vector<bench::Measure> oursMeasured, bareMeasured;
    for (int round = 0; round < kPairs; ++round) {
        oursMeasured.push_back(bench::TakeTime(ours));
        bareMeasured.push_back(bench::TakeTime(bare));
    }
    const double ourRate = bench::MedianOf(oursMeasured, &bench::Measure::requestsPerSecond);
    const double bareRate = bench::MedianOf(bareMeasured, &bench::Measure::requestsPerSecond);
    const double ourTime = bench::MedianOf(oursMeasured, &bench::Measure::microsecondsPerRequest);
    const double bareTime = bench::MedianOf(bareMeasured, &bench::Measure::microsecondsPerRequest);
    const double rateRatio =
        bench::MedianRatio(oursMeasured, bareMeasured, &bench::Measure::requestsPerSecond);
    const double timeRatio =
        bench::MedianRatio(oursMeasured, bareMeasured, &bench::Measure::microsecondsPerRequest);
    std::printf(
        "bench requests: ours %.0f requests/s, baseline %.0f requests/s (bare libcurl multi loop), "
        "ratio %.2f, target %.2f: %s\n",
        ourRate, bareRate, rateRatio, kRateTarget, rateRatio >= kRateTarget ? "holds" : "falls short");
    std::printf(
        "bench requests-cpu: ours %.1f us, baseline %.1f us (bare libcurl multi loop), ratio %.2f, "
        "target %.1f: %s\n",
        ourTime, bareTime, timeRatio, kProcessorTimeTarget,
        timeRatio <= kProcessorTimeTarget ? "holds" : "falls short");
    return 0;
}
