// What the tests of single layers share: a scripted network below, and a record of what callers were told.
#pragma once

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <vector>

#include "ostcore/threads/Mutex.h"
#include "ZOClientTesting/ScriptedProcessor.h"

namespace ostnet_test {

using ostcore::threads::Mutex;
using ostcore::threads::MutexLock;
using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;
using ostnet::Headers;
using ostnet::http::CompletionFunction;
using ostnet::http::RequestOptions;
using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScriptedAnswer;
using ZOClientTesting::ScriptedProcessor;
using ResponseRef = boost::shared_ptr<ostnet::Response>;

/// Every completion of every request, in the order of their coming. Threads: any.
class Told {
public:
    CompletionFunction Function() {
        return [this](const Guid& inID, const ResponseRef& inResponse) {
            MutexLock lock(mMutex);
            mResponses[inID].push_back(inResponse);
        };
    }
    std::size_t Calls(const Guid& inID) const { return All(inID).size(); }
    std::size_t Total() const {
        MutexLock lock(mMutex);
        std::size_t total = 0;
        for (const auto& entry : mResponses) {
            total += entry.second.size();
        }
        return total;
    }
    /// The one response; a response with status -1000 when the completion was not called exactly once.
    ResponseRef Only(const Guid& inID) const {
        const std::vector<ResponseRef> all = All(inID);
        return all.size() == 1 ? all[0] : boost::make_shared<ostnet::Response>(-1000);
    }
    int Status(const Guid& inID) const {
        const ResponseRef response = Only(inID);
        return response ? response->status : -2000;
    }
    /// Lets go of the responses.
    void Forget() {
        MutexLock lock(mMutex);
        mResponses.clear();
    }
    std::string Body(const Guid& inID) const { return Only(inID)->GetPayloadAsUTF8String(); }

private:
    std::vector<ResponseRef> All(const Guid& inID) const {
        MutexLock lock(mMutex);
        const auto found = mResponses.find(inID);
        return found == mResponses.end() ? std::vector<ResponseRef>() : found->second;
    }

    mutable Mutex mMutex;
    std::map<Guid, std::vector<ResponseRef>> mResponses ZO_GUARDED_BY(mMutex);
};

}  // namespace ostnet_test
