// A sandbox over scripted documents: a session, its production, and what differs between them.
#pragma once

#include <map>

#include "Connection/LoggedInServer.h"
#include "Frame/Station.h"
#include "ModelTest.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/MainThread.h"
#include "ZOClient/Library.h"
#include "ZOClient/ZOSandbox.h"

namespace ZOCL {

class SandboxTest : public ModelTest {
protected:
    SandboxTest() {
        ostcore::threads::ResetMainThread();
        ostcore::threads::SetMainThread();
        RegisterStation();
        ExchangeLoggedInServer(server);
        net->SetHandler([this](const RecordedRequest& inRequest) {
            std::lock_guard<std::mutex> lock(mAnswerMutex);
            const auto found = mAnswers.find(inRequest.Path());
            return found == mAnswers.end() ? ScriptedAnswer::Status(404) : found->second;
        });
        listener.reset(new RFL::Listener(GetStationID()));
        listener->AddHandler<ZOSandboxStateChangedMessage>(
            [this](const ZOSandboxStateChangedMessage& inMessage) {
                ++changes;
                lastURL = inMessage.url;
            });
        listener->AddHandler<ZOCloseProductionMessage>([this](const ZOCloseProductionMessage&) { ++closes; });
        Answer("/s", SessionAnswer("\"s1\""));
        Answer("/p", ProductionAnswer("c1"));
        Answer("/out", DifferencesAnswer("c1", ""));
    }
    ~SandboxTest() override {
        SetCurrentZOSandbox(nullptr);
        sandbox.reset();
        Settle();
        ExchangeLoggedInServer(nullptr);
        listener.reset();
        ostcore::threads::ResetMainThread();
    }

    static ScriptedAnswer SessionAnswer(const std::string& inTag) {
        return JSONAnswer("{'zo:sessionId':'s','zo:parentProductionId':'p','links':[{'rel':'self','href':'" +
                              HubURL("/s").str() + "'},{'rel':'up','href':'" + HubURL("/p").str() + "'}," +
                              LinkTo(kRelation_Sessions_Session_Push, "/push") + "," +
                              LinkTo(kRelation_Sessions_Session_OutgoingChanges, "/out") + "," +
                              LinkTo(kRelation_Transactions, "/t") + "," +
                              LinkTo(kRelation_Enclosures, "/s/e") + "," + LinkTo(kRelation_Assets, "/s/a") +
                              "]}",
                          inTag);
    }
    static ScriptedAnswer ProductionAnswer(const std::string& inCommit) {
        return JSONAnswer("{'zo:productionId':'p','zo:commitId':'" + inCommit + "','links':[" +
                              LinkTo(kRelation_Enclosures, "/p/e") + "," + LinkTo(kRelation_Assets, "/p/a") +
                              "]}",
                          "\"p-" + inCommit + "\"");
    }
    static ScriptedAnswer DifferencesAnswer(const std::string& inBase, const std::string& inAssets) {
        return JSONAnswer("{'info':{'leftSideCommitId':'" + inBase + "'},'differences':{'assets':[" +
                          inAssets + "]}}");
    }
    void Answer(const std::string& inPath, const ScriptedAnswer& inAnswer) {
        std::lock_guard<std::mutex> lock(mAnswerMutex);
        mAnswers[inPath] = inAnswer;
    }

    void MakeSandbox() {
        sandbox = boost::make_shared<ZOSandbox>(HubURL("/s"));
        net->ClearRequests();
    }
    /// Until nothing of an update is under way but what is held; then messages are delivered.
    void Settle() {
        for (int round = 0; round < 3; ++round) {
            EXPECT_TRUE(net->WaitUntilIdle());
            EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        }
        ostcore::threads::PumpMainThread();
    }
    void Update() {
        ASSERT_TRUE(sandbox->UpdateSandboxStateAsync());
        Settle();
    }
    /// The identifiers of the requests for a path, in order.
    std::vector<Guid> RequestsFor(const std::string& inPath) const {
        std::vector<Guid> identifiers;
        for (const RecordedRequest& request : net->Requests()) {
            if (request.Path() == inPath) {
                identifiers.push_back(request.requestID);
            }
        }
        return identifiers;
    }
    /// In sync, dirty, conflicts, sync uncertain, dirty uncertain; a letter for each that is set.
    std::string State() const {
        return std::string(sandbox->IsInSync() ? "S" : "-") + (sandbox->IsDirty() ? "D" : "-") +
               (sandbox->HasConflicts() ? "C" : "-") + (sandbox->IsSyncStateUncertain() ? "s" : "-") +
               (sandbox->IsDirtyStateUncertain() ? "d" : "-");
    }

    shared_ptr<ZOSandbox> sandbox;
    shared_ptr<RFL::Listener> listener;
    int changes = 0;
    int closes = 0;
    ImmutableString lastURL;

private:
    std::mutex mAnswerMutex;
    std::map<std::string, ScriptedAnswer> mAnswers;
};

}  // namespace ZOCL
