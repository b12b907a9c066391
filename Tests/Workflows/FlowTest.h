// The flows over scripted documents and scripted windows: a session at c5 of a production whose head is c8.
// Each request that the tests know has a letter, so that what went over the wire reads as one word.
#pragma once

#include <algorithm>
#include <thread>

#include "Connection/LoggedInServer.h"
#include "Dialogs/UIProperties.h"
#include "Dialogs/ZOPublishDialog.h"
#include "Dialogs/ZOResolveDialog.h"
#include "Frame/ProgressWindow.h"
#include "Frame/Station.h"
#include "ostcore/threads/Executor.h"
#include "ostcore/threads/MainThread.h"
#include "ostui/BackEnd.h"
#include "RFL/Registry.h"
#include "SessionTest.h"
#include "ZOClient/Messages.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {

using Publish::Continuation;
using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::StartsWith;
using Texts = std::vector<std::string>;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

class FlowTest : public SessionTest {
protected:
    FlowTest() {
        ostcore::threads::ResetMainThread();
        ostcore::threads::SetMainThread();
        ExchangeLoggedInServer(server);
        RFL::CloseRegistry();
        ForgetUIProperties();
        RegisterStation();
    }
    ~FlowTest() override {
        Settle();
        EXPECT_THAT(windows.Mismatches(), IsEmpty());
        EXPECT_THAT(ostui::GetRunningDialogs(), IsEmpty());
        EXPECT_EQ(net->PendingCount(), 0u);
        for (const std::string& line : net->Lines()) {
            EXPECT_EQ(line.find("transaction"), std::string::npos) << line;
        }
        ExchangeLoggedInServer(nullptr);
        ostcore::threads::ResetMainThread();
    }
    static ScriptedAnswer SessionAnswer(const std::string& inCommit) {
        std::string body = SessionBody(inCommit);
        return JSONAnswer(
            body.insert(body.size() - 2, "," + LinkTo(kRelation_Productions_Production_History, "/h")));
    }
    static ScriptedAnswer Differences(const std::string& inLists) {
        return JSONAnswer("{'info':{'leftSideCommitId':'c8','rightSideCommitId':'c9'},'differences':{" +
                          inLists + "}}");
    }
    static std::string Conflict(const std::string& inFields, const std::string& inPath) {
        const std::string hub = "','href':'" + std::string(kHub);
        return "{" + inFields + ",'zo:conflictsWithContentId':'x','links':[{'rel':'self" + hub + inPath +
               "'},{'rel':'accept-theirs" + hub + "/theirs" + inPath + "'},{'rel':'accept-yours" + hub +
               "/mine" + inPath + "'}]}";
    }
    static std::string AssetConflict(const std::string& inID) {
        return Conflict("'zo:assetId':'" + inID + "','zo:differenceType':'UPDATED','zo:name':'" + inID + "'",
                        "/asset/" + inID);
    }
    /// A client that has asked for nothing yet. A letter and a status, "?" for no response or "!" for no
    /// start: what goes wrong.
    void Begin(const std::string& inFailure = "", const std::string& inDifferences = "'assets':[]") {
        RFL::QueryInterface<DataServer>(server)->ReleaseCaches();
        const auto production =
            JSONAnswer("{'zo:productionId':'p1','zo:commitId':'c8','links':[" + Lists("/p1") +
                       ",{'rel':'self','href':'" + HubURL("/p1").str() +
                       "'},{'rel':'latest-version','href':'" + HubURL("/p1/latest").str() + "'}]}");
        On(lines.at('s'), SessionAnswer("c5"));
        On(lines.at('p'), production);
        On(lines.at('l'), production);
        On(lines.at('e'), JSONAnswer("{'enclosures':[],'links':[]}"));
        On(lines.at('a'), JSONAnswer("{'assets':[{'zo:assetId':'a','properties':{'name':'Alpha',"
                                     "'cdzo:assetType':'bin'},'links':[]}]}"));
        On(lines.at('o'), Differences(inDifferences));
        On(lines.at('h'), JSONAnswer("{'versions':[{'commitId':'c6'},{'commitId':'c5'}]}"));
        On(lines.at('L'), SessionAnswer("c9"));
        On(lines.at('P'), SessionAnswer("c10"));
        for (const char answer : {'1', '2', '3', '4', '5'}) {
            On(lines.at(answer), SessionAnswer(std::string("c2") + answer));
        }
        if (!inFailure.empty()) {
            const std::string how = inFailure.substr(1);
            On(lines.at(inFailure[0]), how == "!"   ? ScriptedAnswer::FailStart()
                                       : how == "?" ? ScriptedAnswer::NoResponse()
                                                    : ScriptedAnswer::Status(std::stoi(how)));
        }
        net->ClearRequests();
    }
    void Hold(char inLetter) { On(lines.at(inLetter), ScriptedAnswer::Hold()); }
    bool IsOut(char inLetter) const { return Wire().find(inLetter) != std::string::npos; }
    /// A request that is out may not be held yet.
    void Release(const ScriptedAnswer& inAnswer) {
        while (net->PendingCount() > 0) {
            net->ReleaseHeld(inAnswer);
            std::this_thread::yield();
        }
    }
    std::string Wire() const {
        std::string wire;
        for (const RecordedRequest& request : net->Requests()) {
            const auto known = std::find_if(lines.begin(), lines.end(), [&](const auto& inLine) {
                return inLine.second == request.verb + " " + request.Path();
            });
            wire += known == lines.end() ? '~' : known->first;
        }
        return wire;
    }
    /// The letters of the requests that change something.
    std::string Posts() const {
        std::string posts = Wire();
        posts.erase(std::remove_if(posts.begin(), posts.end(), [](char c) { return c >= 'a'; }), posts.end());
        return posts;
    }
    void Settle() {
        for (int round = 0; round < 3; ++round) {
            EXPECT_TRUE(net->WaitUntilIdle());
            EXPECT_TRUE(ostcore::threads::WaitForExecutors(20000));
        }
        ostcore::threads::PumpMainThread();
    }
    /// A box is closed by its OK, and its text kept.
    void ExpectBox() {
        windows.Answer(ostui::kMessageBoxID, [this](ScriptedWindow& ioWindow) {
            boxes.push_back(ioWindow.Text(ostui::kMessageBoxText));
            ioWindow.Press("okButton");
        });
    }
    std::string LastBox() const { return boxes.empty() ? std::string() : boxes.back(); }
    static void WaitForList(ScriptedWindow& ioWindow) {
        ioWindow.WaitUntil([&] { return ioWindow.Find(ZOPublishDialog::kPublishView)->isVisible; });
    }
    static void SignOut() {
        ZOTerminateConnectionMessage message;
        message.forced = true;
        PostLibraryMessage(message);
    }

    const std::map<char, std::string> lines{{'s', "GET /s1"},
                                            {'p', "GET /p1"},
                                            {'l', "GET /p1/latest"},
                                            {'e', "GET /s1/enclosures"},
                                            {'a', "GET /s1/assets"},
                                            {'o', "GET /s1/out"},
                                            {'h', "GET /h"},
                                            {'L', "POST /s1/pull"},
                                            {'P', "POST /s1/push"},
                                            {'1', "POST /theirs/asset/a"},
                                            {'2', "POST /theirs/asset/b"},
                                            {'3', "POST /theirs/props"},
                                            {'4', "POST /mine/asset/a"},
                                            {'5', "POST /mine/asset/b"}};
    ScriptedWindows windows;
    Texts boxes;
    const shared_ptr<Publish::PublishWorkflowTracker> tracker =
        boost::make_shared<Publish::PublishWorkflowTracker>();
};

}  // namespace ZOCL
