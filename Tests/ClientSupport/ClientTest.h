// A data server over the scripted network, with traces and assertions on record.
#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Collaboration/CollaborationResources.h"
#include "Connection/ContentCache.h"
#include "Connection/DataServer.h"
#include "Connection/ServiceDocument.h"
#include "dto/TransferStructure.h"
#include "Model/ModelResourceFactory.h"
#include "ostcore/debug/Assert.h"
#include "ostcore/debug/Trace.h"
#include "ResourceFactory.h"
#include "Resources/ServerResource.h"
#include "ZOClientTesting/ScriptedProcessor.h"

namespace ZOCL {

using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScopedProcessor;
using ZOClientTesting::ScriptedAnswer;

constexpr const char* kHub = "http://hub.test:60138";

inline ImmutableString HubURL(const std::string& inPath) {
    return ImmutableString(kHub + inPath);
}

inline shared_ptr<RecycledMemory const> Bytes(std::string_view inText) {
    return RecycledMemory::CreateFromBytes(inText);
}

/// Replaces every ' by ", so that JSON can be read in a test.
inline std::string Quote(std::string inText) {
    for (char& c : inText) {
        c = c == '\'' ? '"' : c;
    }
    return inText;
}

/// A JSON answer with a tag.
inline ScriptedAnswer JSONAnswer(const std::string& inBody, const std::string& inTag = "\"t1\"") {
    ScriptedAnswer answer = ScriptedAnswer::JSON(Quote(inBody));
    return inTag.empty() ? answer : std::move(answer).With("ETag", inTag);
}

/// Waits for the one call of a completion, and counts the calls.
class Outcome {
public:
    RequestCompletion Function() {
        const auto state = mState;
        return [state](const Guid& inID, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                       const shared_ptr<ostnet::Response>& inResponse) {
            std::lock_guard<std::mutex> lock(state->mutex);
            ++state->calls;
            state->id = inID;
            state->result = inResult;
            state->resource = inResource;
            state->response = inResponse;
            state->thread = std::this_thread::get_id();
            state->changed.notify_all();
        };
    }
    /// The result; fails the test when none comes.
    int Wait() {
        std::unique_lock<std::mutex> lock(mState->mutex);
        if (!mState->changed.wait_for(lock, std::chrono::seconds(30), [&] { return mState->calls > 0; })) {
            ADD_FAILURE() << "the completion was not called";
        }
        return mState->result;
    }
    int Calls() const {
        std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->calls;
    }
    Guid ID() const { return mState->id; }
    InterfaceRef<IZOCServerResource> Resource() const { return mState->resource; }
    shared_ptr<ostnet::Response> Response() const { return mState->response; }
    std::thread::id Thread() const { return mState->thread; }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
        int calls = 0;
        Guid id;
        int result = 1;
        InterfaceRef<IZOCServerResource> resource;
        shared_ptr<ostnet::Response> response;
        std::thread::id thread;
    };
    shared_ptr<State> mState = make_shared<State>();
};

class ClientTest : public testing::Test {
protected:
    explicit ClientTest(std::size_t inWorkers = 2) : net(inWorkers) {
        ReplaceContentCache(QM::CreateDataCacheInMemory());
        GetCompositionRoot().resources = GetModelResourceFactory();
        GetCompositionRoot().collaboration = GetCollaborationFactory();
        mFormerSink = ostcore::debug::SetTraceSink([this](const std::string& inLine) {
            std::lock_guard<std::mutex> lock(mMutex);
            mTraces.push_back(inLine);
            mTraced.notify_all();
        });
        ostcore::debug::SetTraceLevel("*", ostcore::debug::kTraceLevel_Progress);
        ostcore::debug::ResetAssertionSites();
        mFormerHandler =
            ostcore::debug::SetAssertionHandler([this](const ostcore::debug::AssertionFailure& inFailure) {
                std::lock_guard<std::mutex> lock(mMutex);
                mAssertions.push_back(inFailure.expression + ": " + inFailure.message);
            });
        DataServer::Settings settings;
        settings.discoveryURL = HubURL("/content/zo/api/discovery.json");
        server = DataServer::Create(settings);
    }
    ~ClientTest() override {
        net->WaitUntilIdle();
        ostcore::debug::SetAssertionHandler(mFormerHandler);
        ostcore::debug::SetTraceLevel("*", 0);
        ostcore::debug::SetTraceSink(mFormerSink);
        if (server) {
            RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
        }
    }

    /// Everything of one test that a line of the trace holds.
    bool Traced(const std::string& inText) const {
        std::lock_guard<std::mutex> lock(mMutex);
        return IsAmongTraces(inText);
    }
    /// For what a worker writes after the request that the test has waited for.
    bool TracedInTime(const std::string& inText) const {
        std::unique_lock<std::mutex> lock(mMutex);
        return mTraced.wait_for(lock, std::chrono::seconds(30), [&] { return IsAmongTraces(inText); });
    }
    std::vector<std::string> Assertions() const {
        std::lock_guard<std::mutex> lock(mMutex);
        return mAssertions;
    }
    InterfaceRef<ServerResource> Plain(const std::string& inPath,
                                       ResourceWritability inWritability = ResourceWritability::kReadOnly) {
        return ServerResource::MakePlain(HubURL(inPath), server, inWritability);
    }
    RecordedRequest LastRequest() const { return net->Requests().back(); }

    ScopedProcessor net;
    InterfaceRef<IZOCDataServer> server;

private:
    bool IsAmongTraces(const std::string& inText) const {
        return std::any_of(mTraces.begin(), mTraces.end(), [&](const std::string& inLine) {
            return inLine.find(inText) != std::string::npos;
        });
    }

    mutable std::mutex mMutex;
    mutable std::condition_variable mTraced;
    std::vector<std::string> mTraces;
    std::vector<std::string> mAssertions;
    ostcore::debug::TraceSink mFormerSink;
    ostcore::debug::AssertionHandler mFormerHandler;
};

}  // namespace ZOCL
