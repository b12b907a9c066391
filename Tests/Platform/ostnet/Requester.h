// What the tests of the base processor share: requests that are waited for, and a signal between threads.
#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <string>
#include <vector>

#include "net/RawServer.h"
#include "ostnet/HeaderConstants.h"
#include "ostnet/http/NetworkProcessor.h"

namespace ostnet_test {

using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;
using ostnet::Headers;
using ostnet::NetworkSettings;
using ostnet::Response;
using ostnet::http::NetworkProcessor;
using ostnet::http::RequestOptions;
using ResponseRef = boost::shared_ptr<Response>;
using PayloadRef = boost::shared_ptr<RecycledMemory const>;
using zotest::net::Connection;
using zotest::net::RawServer;
using zotest::net::ReceivedRequest;

constexpr std::chrono::seconds kPatience(60);

/// A flag that threads wait for.
class Signal {
public:
    void Set() {
        std::lock_guard<std::mutex> lock(mMutex);
        mIsSet = true;
        mChanged.notify_all();
    }
    bool Wait() {
        std::unique_lock<std::mutex> lock(mMutex);
        return mChanged.wait_for(lock, kPatience, [this] { return mIsSet; });
    }

private:
    std::mutex mMutex;
    std::condition_variable mChanged;
    bool mIsSet = false;
};

/// Gathers completions by request and counts them, so that a second one shows.
class Completions {
public:
    ostnet::http::CompletionFunction Function() {
        return [this](const Guid& inID, const ResponseRef& inResponse) {
            std::lock_guard<std::mutex> lock(mMutex);
            ++mCalls[inID];
            ++mTotal;
            mResponses[inID] = inResponse;
            mThreads[inID] = std::this_thread::get_id();
            mChanged.notify_all();
        };
    }
    /// Null when none comes in time.
    ResponseRef Wait(const Guid& inID) {
        std::unique_lock<std::mutex> lock(mMutex);
        mChanged.wait_for(lock, kPatience, [&] { return mCalls.count(inID) != 0; });
        return mResponses[inID];
    }
    bool WaitForTotal(std::size_t inCount) {
        std::unique_lock<std::mutex> lock(mMutex);
        return mChanged.wait_for(lock, kPatience, [&] { return mTotal >= inCount; });
    }
    int Calls(const Guid& inID) {
        std::lock_guard<std::mutex> lock(mMutex);
        const auto found = mCalls.find(inID);
        return found == mCalls.end() ? 0 : found->second;
    }
    std::size_t Total() {
        std::lock_guard<std::mutex> lock(mMutex);
        return mTotal;
    }
    std::thread::id Thread(const Guid& inID) {
        std::lock_guard<std::mutex> lock(mMutex);
        return mThreads[inID];
    }

private:
    std::mutex mMutex;
    std::condition_variable mChanged;
    std::map<Guid, int> mCalls;
    std::map<Guid, ResponseRef> mResponses;
    std::map<Guid, std::thread::id> mThreads;
    std::size_t mTotal = 0;
};

/// A processor with settings of its own, free of the machine's proxies, and blocking requests over it.
class Requester {
public:
    explicit Requester(const NetworkSettings& inSettings = DefaultSettings()) : mProcessor(inSettings) {}

    static NetworkSettings DefaultSettings() {
        NetworkSettings settings;
        settings.userAgent = "ZOTest/1";
        return settings;
    }
    NetworkProcessor& Processor() { return mProcessor; }
    Completions& Done() { return mDone; }

    /// Starts a request; a null ID when it was refused.
    Guid Start(const std::string& inURL, Headers inHeaders = {}, const RequestOptions& inOptions = {}) {
        const Guid id = Guid::CreateUnique();
        const bool started =
            mProcessor.GET(id, mDone.Function(), ImmutableString(inURL), std::move(inHeaders), inOptions);
        return started ? id : Guid();
    }
    Guid StartPost(const std::string& inURL, const std::string& inBody, Headers inHeaders = {}) {
        const Guid id = Guid::CreateUnique();
        const bool started =
            mProcessor.POST(id, mDone.Function(), ImmutableString(inURL), std::move(inHeaders),
                            RecycledMemory::CreateFromBytes(inBody), {});
        return started ? id : Guid();
    }
    ResponseRef Get(const std::string& inURL, Headers inHeaders = {}, const RequestOptions& inOptions = {}) {
        return mDone.Wait(Start(inURL, std::move(inHeaders), inOptions));
    }
    ResponseRef Post(const std::string& inURL, const std::string& inBody, Headers inHeaders = {}) {
        return mDone.Wait(StartPost(inURL, inBody, std::move(inHeaders)));
    }

private:
    Completions mDone;  // outlives the processor, which may still complete in its destructor
    NetworkProcessor mProcessor;
};

inline std::string Body(const ResponseRef& inResponse) {
    return inResponse ? inResponse->GetPayloadAsUTF8String() : std::string("(no response)");
}

}  // namespace ostnet_test
