#include "Loops.h"

#include <sys/resource.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>

namespace bench {

using ostnet::Guid;
using ostnet::ImmutableString;
using ostnet::Response;

double ProcessorSeconds() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    const auto seconds = [](const timeval& inTime) {
        return static_cast<double>(inTime.tv_sec) + static_cast<double>(inTime.tv_usec) * 1e-6;
    };
    return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

void Demand(bool inCondition, const char* inWhat) {
    if (!inCondition) {
        std::fprintf(stderr, "bench: %s\n", inWhat);
        std::_Exit(1);
    }
}

double Median(std::vector<double> inValues) {
    const auto middle = inValues.begin() + static_cast<long>(inValues.size() / 2);
    std::nth_element(inValues.begin(), middle, inValues.end());
    return *middle;
}

double MedianOf(const std::vector<Measure>& inMeasures, double Measure::*inValue) {
    std::vector<double> values;
    for (const Measure& measure : inMeasures) {
        values.push_back(measure.*inValue);
    }
    return Median(values);
}

double MedianRatio(const std::vector<Measure>& inOurs, const std::vector<Measure>& inBaseline,
                   double Measure::*inValue) {
    std::vector<double> ratios;
    for (std::size_t i = 0; i < inOurs.size(); ++i) {
        ratios.push_back(inOurs[i].*inValue / inBaseline[i].*inValue);
    }
    return Median(ratios);
}

ProcessorLoop::ProcessorLoop(boost::shared_ptr<ostnet::http::RequestProcessor> inProcessor,
                             const Workload& inWorkload)
    : mProcessor(std::move(inProcessor)), mBodySize(inWorkload.bodySize) {
    for (const auto& [name, value] : inWorkload.headers) {
        mHeaders.emplace(ImmutableString(name), ImmutableString(value));
    }
    for (int place = 0; place < kInFlight; ++place) {
        mURLs.emplace_back(inWorkload.URLOfPlace(place));
    }
}

void ProcessorLoop::Run() {
    mLeft = kRequests;
    mOpen = kRequests;
    for (int place = 0; place < kInFlight; ++place) {
        StartNext(place);
    }
    std::unique_lock<std::mutex> lock(mMutex);
    mDone.wait(lock, [this] { return mOpen == 0; });
}

void ProcessorLoop::StartNext(int inPlace) {
    if (mLeft.fetch_sub(1) <= 0) {
        return;
    }
    const bool isStarted =
        mProcessor->GET(Guid::CreateUnique(),
                        [this, inPlace](const Guid&, const boost::shared_ptr<Response>& inResponse) {
                            Demand(inResponse != nullptr, "a request ended without a response");
                            OnAnswered(inPlace, *inResponse);
                        },
                        mURLs[static_cast<std::size_t>(inPlace)], mHeaders, {});
    Demand(isStarted, "a request did not start");
}

void ProcessorLoop::OnAnswered(int inPlace, const Response& inResponse) {
    Demand(inResponse.status == 200 && inResponse.payload && inResponse.payload->size() == mBodySize,
           "an answer of ours is not the server's");
    StartNext(inPlace);
    if (mOpen.fetch_sub(1) == 1) {
        std::lock_guard<std::mutex> lock(mMutex);
        mDone.notify_all();
    }
}

BareLoop::BareLoop(const Workload& inWorkload) : mBodySize(inWorkload.bodySize), mBodies(kInFlight) {
    for (const auto& [name, value] : inWorkload.headers) {
        mHeaders = curl_slist_append(mHeaders, (std::string(name) + ": " + value).c_str());
    }
    mMulti = curl_multi_init();
    for (int place = 0; place < kInFlight; ++place) {
        std::string& body = mBodies[static_cast<std::size_t>(place)];
        CURL* const handle = curl_easy_init();
        curl_easy_setopt(handle, CURLOPT_URL, inWorkload.URLOfPlace(place).c_str());
        curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L);
        curl_easy_setopt(handle, CURLOPT_HTTPHEADER, mHeaders);
        curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &BareLoop::OnBody);
        curl_easy_setopt(handle, CURLOPT_WRITEDATA, &body);
        curl_easy_setopt(handle, CURLOPT_PRIVATE, &body);
        mHandles.push_back(handle);
    }
}

BareLoop::~BareLoop() {
    for (CURL* handle : mHandles) {
        curl_easy_cleanup(handle);
    }
    curl_multi_cleanup(mMulti);
    curl_slist_free_all(mHeaders);
}

void BareLoop::Run() {
    int left = kRequests - kInFlight, open = kRequests;
    for (CURL* handle : mHandles) {
        curl_multi_add_handle(mMulti, handle);
    }
    while (open > 0) {
        int running = 0, queued = 0;
        curl_multi_perform(mMulti, &running);
        while (const CURLMsg* message = curl_multi_info_read(mMulti, &queued)) {
            CURL* const handle = message->easy_handle;
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

std::size_t BareLoop::OnBody(char* inBytes, std::size_t inUnit, std::size_t inCount, void* inBody) {
    static_cast<std::string*>(inBody)->append(inBytes, inUnit * inCount);
    return inUnit * inCount;
}

void BareLoop::CheckAnswer(CURL* inHandle, CURLcode inResult) const {
    long status = 0;
    std::string* body = nullptr;
    curl_easy_getinfo(inHandle, CURLINFO_RESPONSE_CODE, &status);
    curl_easy_getinfo(inHandle, CURLINFO_PRIVATE, &body);
    Demand(inResult == CURLE_OK && status == 200 && body->size() == mBodySize,
           "an answer of the baseline is not the server's");
    body->clear();
}

}  // namespace bench
