// Small GETs over kept connections: the base processor against a bare loop over the engine that it uses.
#include <curl/curl.h>
#include <sys/resource.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <stdexcept>
#include <string>
#include <vector>

#include "BenchmarkServer.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/NetworkProcessor.h"

namespace {

using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostnet::Headers;
using ostnet::Response;

constexpr int kRequests = 10000;
constexpr int kInFlight = 50;
constexpr std::size_t kBodySize = 1024;
constexpr int kRounds = 7;
constexpr double kRateTarget = 0.85;
constexpr double kProcessorTimeTarget = 1.3;

const std::pair<const char*, const char*> kHeaders[] = {
    {"Cookie", "login-token=5f3a9c0e-6f7b-4d55-9c0b-0f6f3a7d1c11;"},
    {"Expect", "102-processing"},
    {"If-None-Match", "\"9a0364b9e99bb480\""},
    {"Cache-Control", "no-cache"},
    {"X-Request", "bench"},
};

struct Measure {
    double requestsPerSecond = 0;
    double microsecondsPerRequest = 0;
};

double ProcessorSeconds() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    const auto seconds = [](const timeval& inTime) {
        return static_cast<double>(inTime.tv_sec) + static_cast<double>(inTime.tv_usec) * 1e-6;
    };
    return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

template <typename Function>
Measure TakeTime(Function inFunction) {
    const double processorBefore = ProcessorSeconds();
    const auto before = std::chrono::steady_clock::now();
    inFunction();
    const std::chrono::duration<double> wall = std::chrono::steady_clock::now() - before;
    return {kRequests / wall.count(), (ProcessorSeconds() - processorBefore) * 1e6 / kRequests};
}

void Demand(bool inCondition, const char* inWhat) {
    if (!inCondition) {
        std::fprintf(stderr, "bench_requests: %s\n", inWhat);
        std::exit(1);
    }
}

/// Ours: each completion starts the next request, as a caller of the library would.
class Ours {
public:
    explicit Ours(const std::string& inURL) : mURL(inURL), mProcessor(MakeSettings()) {
        for (const auto& [name, value] : kHeaders) {
            mHeaders.emplace(ImmutableString(name), ImmutableString(value));
        }
    }
    void Run() {
        mLeft = kRequests;
        mOpen = kRequests;
        for (int i = 0; i < kInFlight; ++i) {
            StartNext();
        }
        std::unique_lock<std::mutex> lock(mMutex);
        mDone.wait(lock, [this] { return mOpen == 0; });
    }

private:
    static ostnet::NetworkSettings MakeSettings() {
        ostnet::NetworkSettings settings;
        settings.userAgent = "bench";
        settings.proxy = "";
        return settings;
    }
    void StartNext() {
        if (mLeft.fetch_sub(1) <= 0) {
            return;
        }
        const bool started = mProcessor.GET(
            Guid::CreateUnique(),
            [this](const Guid&, const boost::shared_ptr<Response>& inResponse) { OnAnswered(*inResponse); },
            mURL, mHeaders, {});
        Demand(started, "a request did not start");
    }
    void OnAnswered(const Response& inResponse) {
        Demand(inResponse.status == 200 && inResponse.payload && inResponse.payload->size() == kBodySize,
               "an answer of ours is not the server's");
        StartNext();
        if (mOpen.fetch_sub(1) == 1) {
            std::lock_guard<std::mutex> lock(mMutex);
            mDone.notify_all();
        }
    }

    const ImmutableString mURL;
    Headers mHeaders;
    std::atomic<int> mLeft{0}, mOpen{0};
    std::mutex mMutex;
    std::condition_variable mDone;
    ostnet::http::NetworkProcessor mProcessor;
};

/// The baseline: one thread, as many handles as requests in flight, each used again and again, the body kept
/// in a string. Nothing is parsed, checked or handed to another thread.
class Bare {
public:
    explicit Bare(const std::string& inURL) : mBodies(kInFlight) {
        for (const auto& [name, value] : kHeaders) {
            mHeaders = curl_slist_append(mHeaders, (std::string(name) + ": " + value).c_str());
        }
        mMulti = curl_multi_init();
        for (std::string& body : mBodies) {
            CURL* handle = curl_easy_init();
            curl_easy_setopt(handle, CURLOPT_URL, inURL.c_str());
            curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L);
            curl_easy_setopt(handle, CURLOPT_HTTPHEADER, mHeaders);
            curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &Bare::OnBody);
            curl_easy_setopt(handle, CURLOPT_WRITEDATA, &body);
            curl_easy_setopt(handle, CURLOPT_PRIVATE, &body);
            mHandles.push_back(handle);
        }
    }
    ~Bare() {
        for (CURL* handle : mHandles) {
            curl_easy_cleanup(handle);
        }
        curl_multi_cleanup(mMulti);
        curl_slist_free_all(mHeaders);
    }
    void Run() {
        int left = kRequests - kInFlight, open = kRequests;
        for (CURL* handle : mHandles) {
            curl_multi_add_handle(mMulti, handle);
        }
        while (open > 0) {
            int running = 0, queued = 0;
            curl_multi_perform(mMulti, &running);
            while (const CURLMsg* message = curl_multi_info_read(mMulti, &queued)) {
                CURL* handle = message->easy_handle;
                CheckAnswer(handle, message->data.result);
                curl_multi_remove_handle(mMulti, handle);
                --open;
                if (left-- > 0) {
                    curl_multi_add_handle(mMulti, handle);
                }
            }
            if (open > 0) {
                curl_multi_poll(mMulti, nullptr, 0, 1000, nullptr);
            }
        }
    }

private:
    static std::size_t OnBody(char* inBytes, std::size_t inUnit, std::size_t inCount, void* inBody) {
        static_cast<std::string*>(inBody)->append(inBytes, inUnit * inCount);
        return inUnit * inCount;
    }
    static void CheckAnswer(CURL* inHandle, CURLcode inResult) {
        long status = 0;
        std::string* body = nullptr;
        curl_easy_getinfo(inHandle, CURLINFO_RESPONSE_CODE, &status);
        curl_easy_getinfo(inHandle, CURLINFO_PRIVATE, &body);
        Demand(inResult == CURLE_OK && status == 200 && body->size() == kBodySize,
               "an answer of the baseline is not the server's");
        body->clear();
    }

    std::vector<std::string> mBodies;
    std::vector<CURL*> mHandles;
    curl_slist* mHeaders = nullptr;
    CURLM* mMulti = nullptr;
};

double Median(std::vector<double> inValues) {
    std::nth_element(inValues.begin(), inValues.begin() + static_cast<long>(inValues.size() / 2),
                     inValues.end());
    return inValues[inValues.size() / 2];
}

double MedianOf(const std::vector<Measure>& inMeasures, double Measure::*inValue) {
    std::vector<double> values;
    for (const Measure& measure : inMeasures) {
        values.push_back(measure.*inValue);
    }
    return Median(values);
}

}  // namespace

int main() {
    const bench::BenchmarkServer server(kBodySize);
    const std::string url = "http://127.0.0.1:" + std::to_string(server.Port()) + "/content/zo/data/asset/1";
    curl_global_init(CURL_GLOBAL_DEFAULT);
    Ours ours(url);
    Bare bare(url);
    ours.Run();
    bare.Run();
    std::vector<Measure> oursMeasured, bareMeasured;
    for (int round = 0; round < kRounds; ++round) {
        oursMeasured.push_back(TakeTime([&] { ours.Run(); }));
        bareMeasured.push_back(TakeTime([&] { bare.Run(); }));
    }
    const double ourRate = MedianOf(oursMeasured, &Measure::requestsPerSecond);
    const double bareRate = MedianOf(bareMeasured, &Measure::requestsPerSecond);
    const double ourTime = MedianOf(oursMeasured, &Measure::microsecondsPerRequest);
    const double bareTime = MedianOf(bareMeasured, &Measure::microsecondsPerRequest);
    const double rateRatio = ourRate / bareRate, timeRatio = ourTime / bareTime;
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
