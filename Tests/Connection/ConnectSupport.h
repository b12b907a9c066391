// What the tests of the connection share: a registry of their own, a scripted network, recorded traces and
// connects whose end can be waited for.
#pragma once

#include <stdlib.h>

#include <condition_variable>
#include <filesystem>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Connection/ContentCache.h"
#include "Connection/DataServer.h"
#include "Connection/LoggedInServer.h"
#include "HLM/HLM.h"
#include "ostcore/debug/Trace.h"
#include "ostcore/threads/MainThread.h"
#include "RFL/Registry.h"
#include "ZOClient/Registry.h"
#include "ZOClientTesting/ScriptedHub.h"

namespace ZOCL {

using ZOClientTesting::RecordedRequest;
using ZOClientTesting::ScopedProcessor;
using ZOClientTesting::ScriptedAnswer;
using ZOClientTesting::ScriptedHub;

const std::string kCanaryPassword = "canary-password-7421";
const std::string kDiscovery = "http://hub.test:60138/content/zo/api/discovery.json";
const std::string kLinks = "http://hub.test:60138/zo/links";
const std::string kLogin = "http://hub.test:60138/zo/login";
const std::string kLogout = "http://hub.test:60138/zo/logout";

/// The end of a connect, waited for and counted.
class ConnectOutcome {
public:
    IZOCDataServer::ConnectCompletion Function() {
        const auto state = mState;
        return [state](const Guid& inID, const InterfaceRef<IZOCDataServer>& inServer, int inResult,
                       const shared_ptr<ostnet::Response>& inResponse) {
            std::lock_guard<std::mutex> lock(state->mutex);
            ++state->calls;
            state->id = inID;
            state->server = inServer;
            state->result = inResult;
            state->response = inResponse;
            state->thread = std::this_thread::get_id();
            state->changed.notify_all();
        };
    }
    int Wait() {
        std::unique_lock<std::mutex> lock(mState->mutex);
        if (!mState->changed.wait_for(lock, std::chrono::seconds(60), [&] { return mState->calls > 0; })) {
            ADD_FAILURE() << "the connect did not end";
        }
        return mState->result;
    }
    int Calls() const {
        std::lock_guard<std::mutex> lock(mState->mutex);
        return mState->calls;
    }
    InterfaceRef<IZOCDataServer> Server() const { return mState->server; }
    shared_ptr<ostnet::Response> Response() const { return mState->response; }
    Guid ID() const { return mState->id; }
    std::thread::id Thread() const { return mState->thread; }

private:
    struct State {
        std::mutex mutex;
        std::condition_variable changed;
        int calls = 0;
        Guid id;
        InterfaceRef<IZOCDataServer> server;
        int result = 1;
        shared_ptr<ostnet::Response> response;
        std::thread::id thread;
    };
    shared_ptr<State> mState = make_shared<State>();
};

inline ZOSCredentials AnnasCredentials() {
    ZOSCredentials credentials;
    credentials.username = ImmutableString("anna");
    credentials.password = kCanaryPassword;
    return credentials;
}

class ConnectTest : public testing::Test {
protected:
    explicit ConnectTest(std::size_t inWorkers = 2) : net(inWorkers), hub(net.get()) {
        std::string pattern = (std::filesystem::temp_directory_path() / "zoclient-connect-XXXXXX").string();
        mDirectory = mkdtemp(pattern.data());
        for (const char* variable : {"ZOCLIENT_CONFIG_HOME", "ZOCLIENT_CACHE_HOME", "ZOCLIENT_STATE_HOME"}) {
            setenv(variable, (mDirectory + "/state").c_str(), 1);
        }
        setenv("ZOCLIENT_MACHINE_CONFIG", (mDirectory + "/machine.sqlite").c_str(), 1);
        ReplaceContentCache(QM::CreateDataCacheInMemory());
        RFL::CloseRegistry();
        Registry::ResetIsZOEnabled();
        HLM::SetIsHeadless(false);
        mFormerSink = ostcore::debug::SetTraceSink([this](const std::string& inLine) {
            std::lock_guard<std::mutex> lock(mMutex);
            mTraces += inLine + "\n";
        });
        ostcore::debug::SetTraceLevel("*", ostcore::debug::kTraceLevel_Progress);
        hub.AddUser("anna", kCanaryPassword);
    }
    ~ConnectTest() override {
        ExchangeLoggedInServer(nullptr);
        net->WaitUntilIdle();
        net->Shutdown();
        ostcore::threads::ResetMainThread();
        EXPECT_THAT(Traces(), testing::Not(testing::HasSubstr(kCanaryPassword)));
        EXPECT_THAT(Traces(), testing::Not(testing::HasSubstr("scripted-1")));
        ostcore::debug::SetTraceLevel("*", 0);
        ostcore::debug::SetTraceSink(mFormerSink);
        HLM::SetIsHeadless(false);
        RFL::CloseRegistry();
        std::error_code ignored;
        std::filesystem::remove_all(mDirectory, ignored);
    }

    std::string Traces() const {
        std::lock_guard<std::mutex> lock(mMutex);
        return mTraces;
    }
    Guid Connect(ConnectOutcome& ioOutcome, const ZOSCredentials& inCredentials = AnnasCredentials(),
                 bool inKeepCredentials = false, bool inBecomeLoggedIn = true) {
        Guid id;
        EXPECT_TRUE(IZOCDataServer::ConnectToServer(ImmutableString(hub.BaseURL()), inCredentials, id, false,
                                                    ioOutcome.Function(), inKeepCredentials,
                                                    inBecomeLoggedIn));
        return id;
    }
    /// Signed in; the test fails when that does not succeed.
    InterfaceRef<IZOCDataServer> SignIn(bool inKeepCredentials = false) {
        ConnectOutcome outcome;
        Connect(outcome, AnnasCredentials(), inKeepCredentials);
        EXPECT_EQ(outcome.Wait(), kResultSuccess);
        EXPECT_TRUE(outcome.Server());
        net->WaitUntilIdle();
        net->ClearRequests();
        return outcome.Server();
    }

    ScopedProcessor net;
    ScriptedHub hub;
    std::string mDirectory;

private:
    mutable std::mutex mMutex;
    std::string mTraces;
    ostcore::debug::TraceSink mFormerSink;
};

}  // namespace ZOCL
