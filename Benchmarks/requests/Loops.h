// Loops of many small GETs, of which a fixed number is under way at any time, and how their cost is taken.
#pragma once

#include <curl/curl.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "ostnet/http/RequestProcessor.h"

namespace bench {

constexpr int kRequests = 10000;
constexpr int kInFlight = 50;

using HeaderList = std::vector<std::pair<const char*, const char*>>;

/// What a loop asks for. Each place of those under way has a URL of its own, so that no two requests are
/// alike at any time.
struct Workload {
    std::string url;
    HeaderList headers;
    std::size_t bodySize = 0;

    std::string URLOfPlace(int inPlace) const { return url + "?place=" + std::to_string(inPlace); }
};

/// Over a request processor: each completion starts the next request, as a caller of the library would.
class ProcessorLoop {
public:
    ProcessorLoop(boost::shared_ptr<ostnet::http::RequestProcessor> inProcessor, const Workload& inWorkload);
    void Run();

private:
    void StartNext(int inPlace);
    void OnAnswered(int inPlace, const ostnet::Response& inResponse);

    const boost::shared_ptr<ostnet::http::RequestProcessor> mProcessor;
    const std::size_t mBodySize;
    std::vector<ostnet::ImmutableString> mURLs;
    ostnet::Headers mHeaders;
    std::atomic<int> mLeft{0}, mOpen{0};
    std::mutex mMutex;
    std::condition_variable mDone;
};

/// The engine alone: one thread, as many handles as requests under way, each used again and again, the body
/// kept in a string. Nothing is parsed, checked or handed to another thread.
class BareLoop {
public:
    explicit BareLoop(const Workload& inWorkload);
    ~BareLoop();
    BareLoop(const BareLoop&) = delete;
    BareLoop& operator=(const BareLoop&) = delete;
    void Run();

private:
    static std::size_t OnBody(char* inBytes, std::size_t inUnit, std::size_t inCount, void* inBody);
    void CheckAnswer(CURL* inHandle, CURLcode inResult) const;

    const std::size_t mBodySize;
    std::vector<std::string> mBodies;
    std::vector<CURL*> mHandles;
    curl_slist* mHeaders = nullptr;
    CURLM* mMulti = nullptr;
};

struct Measure {
    double requestsPerSecond = 0;
    /// Of all threads of this process.
    double microsecondsPerRequest = 0;
};

/// Seconds of processor time that this process has used.
double ProcessorSeconds();
/// Ends the program when the condition does not hold.
void Demand(bool inCondition, const char* inWhat);
double Median(std::vector<double> inValues);
double MedianOf(const std::vector<Measure>& inMeasures, double Measure::*inValue);
/// Of each measure and its neighbour in time: over all rounds the machine does not keep its pace.
double MedianRatio(const std::vector<Measure>& inOurs, const std::vector<Measure>& inBaseline,
                   double Measure::*inValue);

template <typename Loop>
Measure TakeTime(Loop& ioLoop) {
    const double processorBefore = ProcessorSeconds();
    const auto before = std::chrono::steady_clock::now();
    ioLoop.Run();
    const std::chrono::duration<double> wall = std::chrono::steady_clock::now() - before;
    return {kRequests / wall.count(), (ProcessorSeconds() - processorBefore) * 1e6 / kRequests};
}

}  // namespace bench
