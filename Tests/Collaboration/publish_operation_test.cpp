// Sharing over the scripted network: the one request, what each answer to it means, and what the window
// lists.
#include "Collaboration/ZOPreparePublishOperation.h"
#include "Collaboration/ZOPublishOperation.h"
#include "OperationTest.h"

namespace ZOCL {
namespace {

std::string Bin(const std::string& inID, const std::string& inParent) {
    return "{'zo:assetId':'" + inID + "','properties':{'name':'n-" + inID +
           "','cdzo:assetType':'bin','mediaLocator':'l','zo:parent':'" + inParent + "'},'links':[]}";
}

class PublishTest : public OperationTest {
protected:
    PublishTest() {
        requests = {
            {'s', {"GET /s1", SessionAnswer("c5")}},
            {'P', {"POST /s1/push", SessionAnswer("c7")}},
            {'h', {"GET /h", ForeignHistory()}},
            {'a',
             {"GET /s1/assets", JSONAnswer("{'assets':[" + Bin("a", "b") + "," + Bin("b", "") + "," +
                                           Bin("d", "gone") + "," + Bin("e", "e") + "]}")}},
            {'o',
             {"GET /s1/out", Differences("'assets':[" + Changed("REMOVED", LinkTo("self", "/z")) +
                                         Changed("REMOVED", LinkTo("self", "/y")) +
                                         Changed("REMOVED", LinkTo("self", "/x")) + Changed("REMOVED", "") +
                                         Changed("ADDED", LinkTo("self", "/new")) + "{}]")}},
            {'x', {"GET /x", JSONAnswer(Bin("x", "a"))}},
            {'y', {"GET /y", ScriptedAnswer::Status(404)}},
            {'z', {"GET /z", JSONAnswer("[]")}}};
    }
    static std::string Changed(const std::string& inType, const std::string& inLink) {
        return "{'zo:differenceType':'" + inType + "','links':[" + inLink + "]},";
    }
    InterfaceRef<IZOCEditingSession> Session() {
        return RFL::QueryInterface<IZOCEditingSession>(server->GetProductionFromURL(HubURL("/s1")));
    }
    static InterfaceRef<ZOPublishOperation> Share(const InterfaceRef<IZOCEditingSession>& inSession) {
        return InterfaceRef<ZOPublishOperation>(
            new ZOPublishOperation(inSession, u"Day one", ImmutableString("c5")));
    }
    InterfaceRef<ZOPreparePublishOperation> Prepare() {
        return InterfaceRef<ZOPreparePublishOperation>(
            new ZOPreparePublishOperation(HubURL("/s1"), Session()));
    }
};

TEST_F(PublishTest, EachAnswerEndsTheOperationOnceWithWhatItMeans) {
    InterfaceRef<ZOPublishOperation> last;
    RunEach(
        {{"P412", kResultHTTPPreconditionFailed, "sPh", " theirs"},
         {"P412 h404", kResultHTTPPreconditionFailed, "sPh", " "},
         {"P412 h!", kResultHTTPPreconditionFailed, "sPh", " "},
         {"", kResultSuccess, "sP", "c7 "},
         {"P204", kResultSuccess, "sP", " "},
         {"P[", kResultSuccess, "sP", " "},
         {"P?", kResultNoHTTPResponse, "sP", " "},
         {"P!", kResultFailure, "sP", " "},
         {"s404", kResultFailure, "s", " "},
         {"P409", kResultHTTPConflict, "sP", " "}},
        [&] { return last = Share(Session()); },
        [](const ZOPublishOperation& inShare) {
            return inShare.GetCommitId().str() + " " +
                   ostcore::utility::ToUTF8(inShare.GetRecentCommitMetadata().commitMessage);
        });
    EXPECT_EQ(last->GetResponse()->status, 409);
    const std::vector<std::pair<std::string, std::string>> form{
        {":commitMessage", "Day one"}, {":commitId", "c5"}, {":resolveStrategy", "NONE"}};
    EXPECT_EQ(LastRequest().form, form);
    EXPECT_TRUE(Traced("ZOPublishOperation failed to start push on editing session: \"N\""));
    EXPECT_EQ(Run(Share(nullptr)), kResultFailure);

    // A cancel leaves it to the server.
    Begin();
    Stop(Share(Session()), 'P', kResultSuccess);
    Stop(Share(Session()), 'P', kResultHTTPUnauthorized, true);
}

TEST_F(PublishTest, TheListHoldsTheSessionsAssetsAndThoseThatItHasRemoved) {
    Begin();
    const auto operation = Prepare();
    EXPECT_EQ(Run(operation), kResultSuccess);
    EXPECT_EQ(Wire(), "saoxyz");
    std::string items;
    for (const ProductionItemData& item : operation->GetItems()) {
        items += item.displayName.str() + item.path.str().substr(0, 9) + (item.asset ? "!" : "") + " ";
    }
    EXPECT_EQ(items, "n-a/n-b n-b/ n-d/ n-e/n-e/n-e/ n-x/n-b/n-a! ") << "a ring of bins ends";
    // Others may have changed the list since it was loaded.
    net->ClearRequests();
    EXPECT_EQ(Run(Prepare()), kResultSuccess);
    EXPECT_EQ(net->Requests()[0].Header("If-None-Match"), "\"t1\"");

    for (const char* failure : {"s404", "a404", "a!", "a[", "o404", "o!"}) {
        Begin(failure);
        EXPECT_EQ(Run(Prepare()), kResultFailure) << failure;
        EXPECT_EQ(Wire().back(), failure[0]);
    }
    Begin("x! y! z!");
    EXPECT_EQ(Run(Prepare()), kResultSuccess);
    for (const char held : {'a', 'o', 'z'}) {
        Begin();
        Stop(Prepare(), held, kResultCancelled);
        EXPECT_EQ(Wire(), held == 'a' ? "sa" : held == 'o' ? "sao" : "saoxyz");
    }
}

}  // namespace
}  // namespace ZOCL
