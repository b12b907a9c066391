// The operations behind sharing, getting the latest and resolving over scripted documents. Each request that
// a test knows has a letter, so that what went over the wire reads as one word.
#pragma once

#include <sstream>

#include "Connection/LoggedInServer.h"
#include "IForceAbortEnabledOperation.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/Gate.h"
#include "ostcore/threads/MainThread.h"
#include "ostcore/utility/StringConversion.h"
#include "SessionTest.h"

namespace ZOCL {

class OperationTest : public SessionTest {
protected:
    struct Known {
        const char* line;
        ScriptedAnswer answer;
    };
    struct Case {
        const char* failures;
        int result;
        const char* wire;
        const char* state;
    };

    OperationTest() {
        ostcore::threads::ResetMainThread();
        ostcore::threads::SetMainThread();
        ExchangeLoggedInServer(server);
    }
    ~OperationTest() override {
        Settle();
        ExchangeLoggedInServer(nullptr);
        ostcore::threads::ResetMainThread();
    }
    static ScriptedAnswer SessionAnswer(const std::string& inCommit) {
        std::string body = SessionBody(inCommit);
        return JSONAnswer(
            body.insert(body.size() - 2, "," + LinkTo(kRelation_Productions_Production_History, "/h")));
    }
    /// The session was at c5, and another host has made c6.
    static ScriptedAnswer ForeignHistory() {
        return JSONAnswer(
            "{'versions':[{'commitId':'c6','title':'{\\'commitMessage\\':\\'theirs\\'}'},"
            "{'commitId':'c5'}]}");
    }
    static ScriptedAnswer Differences(const std::string& inLists) {
        return JSONAnswer("{'info':{'leftSideCommitId':'c8','rightSideCommitId':'c9'},'differences':{" +
                          inLists + "}}");
    }
    static std::string Conflict(const std::string& inFields, const std::string& inPath) {
        return "{" + inFields + ",'zo:conflictsWithContentId':'x','links':[" + LinkTo("self", inPath) + "," +
               LinkTo("accept-theirs", "/theirs" + inPath) + "," + LinkTo("accept-yours", "/mine" + inPath) +
               "]}";
    }

    /// A client that has asked for nothing yet. Words say what goes wrong: the letter of a request, then a
    /// status, "!" for a request that does not start, "?" for no response, "[" for a body that is no
    /// document.
    void Begin(const std::string& inFailures = "") {
        RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
        for (const auto& known : requests) {
            On(known.second.line, known.second.answer);
        }
        std::istringstream words(inFailures);
        for (std::string word; words >> word;) {
            const std::string how = word.substr(1);
            On(requests.at(word[0]).line, how == "!"   ? ScriptedAnswer::FailStart()
                                          : how == "?" ? ScriptedAnswer::NoResponse()
                                          : how == "[" ? JSONAnswer("[")
                                                       : ScriptedAnswer::Status(std::stoi(how)));
        }
        net->ClearRequests();
    }
    /// The letters of what was asked for, "<" for what no letter stands for.
    std::string Wire() const {
        std::string wire;
        for (const RecordedRequest& request : net->Requests()) {
            char letter = '<';
            for (const auto& known : requests) {
                letter = known.second.line == request.verb + " " + request.Path() ? known.first : letter;
            }
            wire += letter;
        }
        return wire;
    }
    void Settle() {
        for (int round = 0; round < 3; ++round) {
            EXPECT_TRUE(net->WaitUntilIdle());
            EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        }
        ostcore::threads::PumpMainThread();
    }
    template <class Operation>
    void Start(const InterfaceRef<Operation>& inOperation) {
        ends = 0;
        told.clear();
        progress.clear();
        listener.reset(new RFL::Listener(inOperation->GetStationID()));
        listener->AddHandler<RFL::OperationCompleteMessage>(
            [this](const RFL::OperationCompleteMessage&) { ++ends; });
        listener->AddHandler<RFL::UpdateOperationDescriptionMessage>(
            [this](const RFL::UpdateOperationDescriptionMessage& inMessage) {
                told += ostcore::utility::ToUTF8(inMessage.text) + "\n";
            });
        listener->AddHandler<RFL::UpdateOperationProgressMessage>(
            [this](const RFL::UpdateOperationProgressMessage& inMessage) {
                told +=
                    std::to_string(int(inMessage.value)) + "/" + std::to_string(int(inMessage.range)) + "\n";
                progress.push_back(inMessage.value / inMessage.range);
            });
        ASSERT_TRUE(inOperation->Start());
    }
    /// Runs it to its end, which comes once.
    template <class Operation>
    int Run(const InterfaceRef<Operation>& inOperation) {
        Start(inOperation);
        Settle();
        EXPECT_EQ(ends, 1);
        return inOperation->GetResult();
    }
    /// Begins, makes an operation and runs it for each case; what it says of itself is the state.
    template <class Make, class Describe>
    void RunEach(const std::vector<Case>& inCases, const Make& inMake, const Describe& inDescribe) {
        for (const Case& row : inCases) {
            SCOPED_TRACE(row.failures);
            Begin(row.failures);
            const auto operation = inMake();
            EXPECT_EQ(Run(operation), row.result);
            EXPECT_EQ(Wire(), row.wire);
            EXPECT_EQ(inDescribe(*operation), row.state);
        }
    }
    /// Stops the operation while the answer to a request is held: a cancel ends it once, a tear-down
    /// is silent.
    template <class Operation>
    void Stop(const InterfaceRef<Operation>& inOperation, char inHeld, int inResult,
              bool inTearDown = false) {
        const auto isOut = make_shared<ostcore::threads::Gate>();
        const Known& held = requests.at(inHeld);
        On(held.line, [isOut](const RecordedRequest&) {
            isOut->Open();
            return ScriptedAnswer::Hold();
        });
        Start(inOperation);
        ASSERT_TRUE(ostcore::threads::Gate::PassThrough(isOut, 20000)) << inHeld;
        if (inTearDown) {
            RFL::QueryInterface<IForceAbortEnabledOperation>(inOperation)->ForceAbort(inResult);
        } else {
            inOperation->Abort();
        }
        On(held.line, held.answer);
        while (net->PendingCount() != 0) {
            net->ReleaseHeld(held.answer);
            std::this_thread::yield();
        }
        Settle();
        EXPECT_EQ(ends, inTearDown ? 0 : 1) << inHeld;
        EXPECT_EQ(inOperation->GetResult(), inTearDown ? kResultFailure : inResult) << inHeld;
    }

    std::map<char, Known> requests;
    shared_ptr<RFL::Listener> listener;
    int ends = 0;
    std::string told;
    std::vector<double> progress;
};

}  // namespace ZOCL
