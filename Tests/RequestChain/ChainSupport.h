// What the tests of the layers share: a network that notes what is asked of it, on time that stands still.
#pragma once

#include <map>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Scheduler.h"
#include "RequestChain/PackedRequest.h"
#include "ZOClientTesting/ScriptedProcessor.h"

namespace ZOCL {

using ostcore::threads::ScopedGlobalScheduler;
using ostcore::threads::VirtualScheduler;
using std::chrono::milliseconds;
using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScriptedAnswer;
using ZOClientTesting::ScriptedProcessor;
using Verb = PackedRequest::Verb;

inline ImmutableString URLOf(const std::string& inPath) {
    return ImmutableString("http://hub.test" + inPath);
}

/// Notes the delays of what is posted, and can be deaf.
class NotingProcessor : public ostnet::http::ForwardingProcessor {
public:
    using ForwardingProcessor::ForwardingProcessor;
    bool PostFunction(const function<void()>& inFunction, std::uint32_t inDelay) override {
        if (inDelay > 0) {
            delays.push_back(inDelay);
        }
        return (inDelay == 0 || !refusesDelays) && ForwardingProcessor::PostFunction(inFunction, inDelay);
    }
    void TryToCancelRequest(const Guid& inRequestID) override {
        ++cancels;
        if (!ignoresCancels) {
            ForwardingProcessor::TryToCancelRequest(inRequestID);
        }
    }
    std::vector<std::uint32_t> delays;
    int cancels = 0;
    bool refusesDelays = false;
    bool ignoresCancels = false;
};

/// One thread, virtual time: what is due runs when the test says so.
class LayerTest : public testing::Test {
protected:
    ~LayerTest() override { net->Shutdown(); }

    ostnet::http::CompletionFunction Note() {
        return [this](const Guid& inID, const shared_ptr<ostnet::Response>& inResponse) {
            EXPECT_EQ(++calls[inID], 1) << "completed twice";
            statuses.push_back(inResponse ? inResponse->status : -100);
            last = inResponse;
        };
    }
    Guid Start(ostnet::http::RequestProcessor& ioLayer, Verb inVerb = Verb::kGet,
               const std::string& inPath = "/a") {
        const Guid id = Guid::CreateUnique();
        EXPECT_TRUE(Pack(inVerb, URLOf(inPath), {}, {}).Send(ioLayer, id, Note()));
        return id;
    }
    /// Moves the time on, and runs all that it brings.
    void Pass(milliseconds inSpan) {
        net->DeliverAll();
        for (milliseconds left = inSpan; left.count() > 0;) {
            const auto next = time->TimeToNext();
            const auto step = next && *next < left ? std::chrono::duration_cast<milliseconds>(*next) : left;
            time->Advance(step);
            left -= step;
            net->DeliverAll();
            if (step.count() == 0 && !time->TimeToNext()) {
                break;
            }
        }
        EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
    }

    shared_ptr<VirtualScheduler> time = boost::make_shared<VirtualScheduler>();
    ScopedGlobalScheduler scope{time};
    shared_ptr<ScriptedProcessor> net = ScriptedProcessor::Create(0);
    std::map<Guid, int> calls;
    std::vector<int> statuses;
    shared_ptr<ostnet::Response> last;
};

}  // namespace ZOCL
