// The automatic merge of a session's conflicts over the scripted network: what is asked for and how often,
// and what each failure leaves behind.
#include "Collaboration/ZOAutoResolveOperation.h"
#include "Connection/ServiceDocument.h"
#include "MergeTest.h"
#include "OperationTest.h"
#include "ZOClient/XMPMerge.h"

namespace ZOCL {
namespace {

using testing::UnorderedElementsAre;

/// An enclosure in conflict; the asset is empty for one of the production.
struct XMPConflict {
    std::string name;
    std::string base;
    std::string asset = {};
};

std::string Dated(const std::string& inDate) {
    return PacketText("<xmp:MetadataDate>" + inDate + "</xmp:MetadataDate>");
}

class AutoResolveTest : public OperationTest {
protected:
    AutoResolveTest() {
        ServiceDocument document;
        document.links.push_back({kRelation_Productions_Production_ByIdAndCommitId, ImmutableString(),
                                  HubURL("/{productionId}/{commitId}"), ImmutableString(),
                                  ImmutableString()});
        RFL::QueryInterface<DataServer>(server)->TakeLinksDocument(document);
        session = MakeSession();
        On("GET /s1", JSONAnswer(SessionBody(), "\"t1\""));
        On("GET /s1/transactions", JSONAnswer(ListBody("")));
        On("POST /s1/new-transaction", JSONAnswer(TransactionBody("t1", "{'transactionType':'edit'}")));
        On("POST /t1/commit", JSONAnswer(SessionBody("c6")));
        On("POST /t1/rollback", ScriptedAnswer::Status(204));
    }
    ~AutoResolveTest() override {
        session.Reset();
        operation.Reset();
    }

    static std::string EnclosureJSON(const std::string& inRoot, const std::string& inName) {
        const std::string place = inRoot + "/x/" + inName;
        return "{'name':'" + inName + "','zo:enclosureContentId':'" + place + "','links':[" +
               LinkTo(kRelation_Enclosures_Enclosure, place) + ",{'rel':'edit','href':'" +
               HubURL(place).str() + "'}]}";
    }
    /// One state: its lists, and for each enclosure a packet with this date.
    void ServeState(const std::string& inRoot, const std::vector<XMPConflict>& inItems,
                    const std::string& inDate) {
        std::string enclosures;
        std::string assets;
        for (const XMPConflict& item : inItems) {
            const std::string json = EnclosureJSON(inRoot, item.name);
            if (item.asset.empty()) {
                enclosures += (enclosures.empty() ? "" : ",") + json;
            } else {
                assets += (assets.empty() ? "" : ",") + ("{'zo:assetId':'" + item.asset) +
                          "','properties':{'name':'n'},'enclosures':{'enclosures':[" + json +
                          "],'links':[]},'links':[" + LinkTo(kRelation_Enclosures, inRoot + "/ae") + "]}";
            }
            On("GET " + inRoot + "/x/" + item.name, ScriptedAnswer::Body(Dated(inDate), "application/xml"));
            On("PUT " + inRoot + "/x/" + item.name, JSONAnswer(json));
        }
        On("GET " + inRoot + "/enclosures", JSONAnswer("{'enclosures':[" + enclosures + "],'links':[]}"));
        On("GET " + inRoot + "/assets", JSONAnswer("{'assets':[" + assets + "],'links':[]}"));
        if (inRoot.compare(0, 3, "/p1") == 0) {
            On("GET " + inRoot, JSONAnswer("{'zo:productionId':'p1','links':[" + Lists(inRoot) + "]}"));
        }
    }
    static ScriptedAnswer DifferencesOf(const std::vector<XMPConflict>& inItems,
                                        const std::string& inMore = "") {
        std::string entries = inMore;
        for (const XMPConflict& item : inItems) {
            entries +=
                (entries.empty() ? "{'zo:name':'" : ",{'zo:name':'") + item.name +
                "','zo:differenceType':'UPDATED','zo:conflictsWithContentId':'other','zo:baseCommitId':'" +
                item.base + "'" + (item.asset.empty() ? "" : ",'zo:assetId':'" + item.asset + "'") +
                ",'links':[{'rel':'accept-yours','href':'" + HubURL("/accept/" + item.name).str() + "'}]}";
        }
        return JSONAnswer("{'info':{'leftSideCommitId':'c9'},'differences':{'enclosures':[" + entries +
                          "]}}");
    }
    /// The conflicts of a session that was merged with c9, and what each later question finds.
    void Serve(const std::vector<XMPConflict>& inItems, const std::vector<ScriptedAnswer>& inDifferences) {
        ServeState("/p1/c9", inItems, "2024-02");
        ServeState("/p1/c1", inItems, "2024-01");
        ServeState("/p1/c2", inItems, "2024-01");
        ServeState("/s1", inItems, "2024-03");
        ServeState("/t1", inItems, "2024-03");
        const auto asked = make_shared<std::atomic<std::size_t>>(0);
        On("GET /s1/out", [asked, inDifferences](const RecordedRequest&) {
            return inDifferences[std::min(asked->fetch_add(1), inDifferences.size() - 1)];
        });
    }
    const InterfaceRef<ZOAutoResolveOperation>& MakeOperation() {
        return operation = InterfaceRef<ZOAutoResolveOperation>(
                   new ZOAutoResolveOperation(session, ImmutableString("c5")));
    }
    int Run() { return OperationTest::Run(MakeOperation()); }
    std::vector<std::string> Written() const {
        std::vector<std::string> paths;
        for (const RecordedRequest& request : net->Requests()) {
            if (request.verb == "PUT") {
                paths.push_back(request.Path());
            }
        }
        return paths;
    }

    InterfaceRef<Production> session;
    InterfaceRef<ZOAutoResolveOperation> operation;
};

const char* const kOthers =
    "{'zo:name':'notes.txt','zo:conflictsWithContentId':'x','zo:baseCommitId':'c3'},"
    "{'zo:name':'_xmp','zo:conflictsWithContentId':'x','zo:baseCommitId':'c3'},"
    "{'zo:name':'quiet_xmp','zo:baseCommitId':'c3'}";

TEST_F(AutoResolveTest, EveryStateIsLoadedOnceAndEverythingIsCommittedAtOnce) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"},
                                         {"b_xmp", "c1"},
                                         {"c_xmp", "c2"},
                                         {"d_xmp", "c2", "asset1"},
                                         {"d_xmp", "c1", "asset2"}};
    Serve(items, {DifferencesOf(items, kOthers), DifferencesOf({}, kOthers)});
    EXPECT_EQ(Run(), kResultSuccess);
    EXPECT_TRUE(operation->ConflictsRemain()) << "what is no XMP enclosure is not decided";
    for (const char* path :
         {"/p1/c9", "/p1/c1", "/p1/c2", "/p1/c9/enclosures", "/p1/c1/enclosures", "/p1/c2/enclosures",
          "/p1/c9/assets", "/p1/c1/assets", "/p1/c2/assets", "/s1/enclosures", "/s1/assets", "/t1/enclosures",
          "/t1/assets", "/p1/c1/x/a_xmp", "/p1/c9/x/a_xmp", "/s1/x/a_xmp", "/p1/c2/x/c_xmp"}) {
        EXPECT_EQ(CountOf("GET", path), 1u) << path;
    }
    EXPECT_EQ(CountOf("GET", "/p1/c3"), 0u);
    EXPECT_EQ(CountOf("GET", "/p1/c1/x/c_xmp"), 0u) << "an ancestor is asked of its own commit alone";
    EXPECT_THAT(Written(), UnorderedElementsAre("/t1/x/a_xmp", "/t1/x/b_xmp", "/t1/x/c_xmp", "/t1/x/d_xmp",
                                                "/t1/x/d_xmp"));
    const auto packet = OrvaneXMP::ReadPacket(Last("PUT", "/t1/x/a_xmp").Field(":enclosure"));
    ASSERT_TRUE(packet);
    EXPECT_EQ(packet.packet->Property(XMPNames::MetadataDate()).Value(), "2024-03");
    const auto lines = net->Lines();
    EXPECT_EQ(lines.front(), "GET " + HubURL("/s1").str());
    EXPECT_EQ(lines[lines.size() - 3], "POST " + HubURL("/t1/commit").str());
    EXPECT_EQ(lines.back(), "GET " + HubURL("/s1/out").str());
    EXPECT_EQ(CountOf("GET", "/s1/out"), 2u);
    EXPECT_THAT(Last("POST", "/t1/commit").body, testing::HasSubstr("Automatically resolved XMP conflicts."));
    EXPECT_EQ(CountOf("POST", "/t1/rollback"), 0u);
    EXPECT_THAT(Last("POST", "/s1/new-transaction").body,
                testing::HasSubstr(Quote("'answersConflicts':'true'")));
    ASSERT_FALSE(progress.empty());
    EXPECT_EQ(progress.back(), 1.0);
    EXPECT_TRUE(std::is_sorted(progress.begin(), progress.end()));
}

TEST_F(AutoResolveTest, AFailureOfOneStepLeavesItsItemsInConflictAndNoOthers) {
    struct Row {
        const char* request;
        ScriptedAnswer answer;
        const char* trace;
        bool isFirstWritten;
        bool isSecondWritten;
    };
    const ScriptedAnswer gone = ScriptedAnswer::Status(404);
    const Row rows[] = {
        {"GET /p1/c9", gone,
         "OnHeadRevisionProductionLoaded: Failed to load base commit production, url = ", false, false},
        {"GET /p1/c9/enclosures", gone,
         "OnHeadRevisionEnclosuresLoaded: Failed to load base commit production enclosures, url = ", false,
         false},
        {"GET /p1/c1", gone,
         "OnBaseCommitProductionLoaded: Failed to load base commit production, url = ", false, true},
        {"GET /p1/c1/enclosures", JSONAnswer("{'enclosures':7}"),
         "OnBaseCommitEnclosuresLoaded: Failed to load base commit production enclosures, url = ", false,
         true},
        {"GET /p1/c1/x/a_xmp", gone,
         "OnBaseCommitEnclosurePayloadLoaded: Failed to load base commit production enclosure payload, url "
         "= ",
         false, true},
        {"GET /p1/c9/x/a_xmp", ScriptedAnswer::NoResponse(),
         "OnProductionEnclosurePayloadLoaded: Failed to load production enclosure payload, url = ", false,
         true},
        {"GET /s1/x/b_xmp", gone,
         "OnSessionEnclosurePayloadLoaded: Failed to load base session enclosure payload, url = ", true,
         false},
        // The other side has removed it.
        {"GET /p1/c9/enclosures", JSONAnswer("{'enclosures':[" + EnclosureJSON("/p1/c9", "b_xmp") + "]}"),
         "OnProductionEnclosurePayloadLoaded: Failed to load production enclosure payload, url = ", false,
         true},
        {"GET /p1/c9/x/a_xmp", ScriptedAnswer::Body("<x", "application/xml"), "MergeItem: Failed to read",
         false, true},
        {"GET /p1/c9/x/a_xmp",
         ScriptedAnswer::Body(PacketText("<dc:format>x</dc:format>"), "application/xml"), nullptr, true,
         true},
        {"PUT /t1/x/a_xmp", ScriptedAnswer::Status(500), "OnEnclosureWritten: Failed", false, true},
    };
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}, {"b_xmp", "c2"}};
    for (const Row& row : rows) {
        ReplaceContentCache(QM::CreateDataCacheInMemory());
        session = MakeSession();
        Serve(items, {DifferencesOf(items)});
        On("PUT /t1/x/a_xmp", JSONAnswer(EnclosureJSON("/t1", "a_xmp")));
        On(row.request, row.answer);
        net->ClearRequests();
        EXPECT_EQ(Run(), kResultSuccess) << row.request;
        EXPECT_TRUE(operation->ConflictsRemain()) << row.request;
        const bool isWrite = std::string(row.request).compare(0, 3, "PUT") == 0;
        EXPECT_EQ(CountOf("PUT", "/t1/x/a_xmp"), row.isFirstWritten || isWrite ? 1u : 0u) << row.request;
        EXPECT_EQ(CountOf("PUT", "/t1/x/b_xmp"), row.isSecondWritten ? 1u : 0u) << row.request;
        const bool isAnyWritten = row.isFirstWritten || row.isSecondWritten;
        EXPECT_EQ(CountOf("POST", "/t1/commit"), isAnyWritten ? 1u : 0u) << row.request;
        // What was written and is in conflict all the same is accepted, the other one is not touched.
        EXPECT_EQ(CountOf("POST", "/accept/a_xmp"), row.isFirstWritten ? 1u : 0u) << row.request;
        EXPECT_EQ(CountOf("POST", "/accept/b_xmp"), row.isSecondWritten ? 1u : 0u) << row.request;
        EXPECT_TRUE(!row.trace || Traced(row.trace)) << row.trace;
    }
}

TEST_F(AutoResolveTest, AContradictionStaysWhileTheOthersMerge) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}, {"b_xmp", "c1"}};
    Serve(items, {DifferencesOf(items), DifferencesOf({items[0]})});
    const auto format = [](const char* inText) {
        return ScriptedAnswer::Body(PacketText(std::string("<dc:format>") + inText + "</dc:format>"),
                                    "application/xml");
    };
    On("GET /p1/c1/x/a_xmp", format("a"));
    On("GET /p1/c9/x/a_xmp", format("b"));
    On("GET /s1/x/a_xmp", format("c"));
    EXPECT_EQ(Run(), kResultSuccess);
    EXPECT_TRUE(operation->ConflictsRemain());
    EXPECT_THAT(Written(), UnorderedElementsAre("/t1/x/b_xmp"));
    EXPECT_EQ(CountOf("POST", "/accept/a_xmp"), 0u);
}

TEST_F(AutoResolveTest, WhatTheHubStillCallsAConflictIsAccepted) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}, {"b_xmp", "c1"}, {"c_xmp", "c1"}};
    Serve(items, {DifferencesOf(items), DifferencesOf({items[0], items[2]}), DifferencesOf({})});
    On("POST /accept/a_xmp", JSONAnswer(SessionBody("c7")));
    On("POST /accept/c_xmp", JSONAnswer(SessionBody("c8")));
    EXPECT_EQ(Run(), kResultSuccess);
    EXPECT_FALSE(operation->ConflictsRemain());
    EXPECT_EQ(CountOf("POST", "/accept/a_xmp"), 1u);
    EXPECT_EQ(CountOf("POST", "/accept/b_xmp"), 0u);
    EXPECT_EQ(CountOf("POST", "/accept/c_xmp"), 1u);
    EXPECT_EQ(CountOf("GET", "/s1/out"), 3u);
}

TEST_F(AutoResolveTest, WithoutAConflictOfMetadataNothingIsAskedForMore) {
    Serve({}, {DifferencesOf({}, kOthers)});
    EXPECT_EQ(Run(), kResultSuccess);
    EXPECT_TRUE(operation->ConflictsRemain());
    EXPECT_EQ(Requests(), 3u);
    Serve({}, {DifferencesOf({})});
    EXPECT_EQ(Run(), kResultSuccess);
    EXPECT_FALSE(operation->ConflictsRemain());

    const std::vector<XMPConflict> items{{"a_xmp", "c1"}};
    for (const char* request : {"GET /s1", "GET /s1/out", "GET /s1/enclosures"}) {
        session = MakeSession();
        Serve(items, {DifferencesOf(items)});
        On("GET /s1", JSONAnswer(SessionBody(), "\"t1\""));
        On(request, ScriptedAnswer::Status(503));
        net->ClearRequests();
        EXPECT_EQ(Run(), kResultHTTPServiceUnavailable) << request;
        EXPECT_TRUE(operation->ConflictsRemain());
        EXPECT_EQ(CountOf("GET", "/p1/c9"), 0u);
    }
    const InterfaceRef<ZOAutoResolveOperation> none(new ZOAutoResolveOperation(nullptr, ImmutableString()));
    EXPECT_FALSE(none->Start());
    EXPECT_TRUE(none->ConflictsRemain());
}

TEST_F(AutoResolveTest, ACommitThatIsRefusedLeavesEverythingAndTellsWhoWasThere) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}};
    Serve(items, {DifferencesOf(items)});
    const std::string title =
        "{\\'commitMessage\\':\\'theirs\\',\\'metadata\\':{\\'machineName\\':\\'m2\\'}}";
    On("GET /s1",
       JSONAnswer(SessionBody().insert(SessionBody().size() - 2,
                                       "," + LinkTo(kRelation_Productions_Production_History, "/h"))));
    On("GET /h", JSONAnswer("{'versions':[{'commitId':'c6','title':'" + title + "'},{'commitId':'c5'}]}"));
    session = Make<Production>(SessionBody().insert(
        SessionBody().size() - 2, "," + LinkTo(kRelation_Productions_Production_History, "/h")));
    On("POST /t1/commit", ScriptedAnswer::Status(412));
    EXPECT_EQ(Run(), kResultHTTPPreconditionFailed);
    EXPECT_TRUE(operation->ConflictsRemain());
    EXPECT_EQ(CountOf("POST", "/t1/rollback"), 1u) << "nobody waits for a transaction that is given up";
    EXPECT_EQ(operation->GetRecentCommitMetadata().commitMessage, u"theirs");
    EXPECT_EQ(operation->GetRecentCommitMetadata().metadata.machineName.view(), "m2");

    On("POST /s1/new-transaction", ScriptedAnswer::Status(403));
    net->ClearRequests();
    EXPECT_EQ(Run(), kResultHTTPForbidden);
    EXPECT_TRUE(operation->ConflictsRemain());
    EXPECT_EQ(CountOf("POST", "/t1/commit") + CountOf("POST", "/t1/rollback"), 0u);
}

TEST_F(AutoResolveTest, ACancelStopsTheLoadsAndTakesBackTheWrites) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}, {"b_xmp", "c1"}};
    for (const char* held : {"GET /s1", "GET /p1/c1", "GET /p1/c9/x/a_xmp", "PUT /t1/x/b_xmp"}) {
        ReplaceContentCache(QM::CreateDataCacheInMemory());
        session = MakeSession();
        Serve(items, {DifferencesOf(items)});
        On("GET /s1", JSONAnswer(SessionBody(), "\"t1\""));
        On(held, ScriptedAnswer::Hold());
        net->ClearRequests();
        Start(MakeOperation());
        Settle();
        EXPECT_EQ(ends, 0) << held;
        operation->Abort();
        Settle();
        EXPECT_EQ(ends, 1) << held;
        EXPECT_EQ(operation->GetResult(), kResultCancelled) << held;
        EXPECT_TRUE(operation->ConflictsRemain());
        EXPECT_EQ(CountOf("POST", "/t1/commit"), 0u) << held;
        EXPECT_EQ(CountOf("POST", "/t1/rollback"), held[0] == 'P' ? 1u : 0u) << held;
    }
    MakeOperation()->Abort();
    EXPECT_FALSE(operation->Start());
}

TEST_F(AutoResolveTest, RunsUnderAProgressWindowFromTheURLOfASession) {
    const std::vector<XMPConflict> items{{"a_xmp", "c1"}};
    Serve(items, {DifferencesOf(items), DifferencesOf({})});
    EXPECT_FALSE(AutoResolveXMPConflicts(HubURL("/s1"), ImmutableString("c5")));
    EXPECT_EQ(CountOf("POST", "/t1/commit"), 1u);
    net->ClearRequests();
    EXPECT_TRUE(AutoResolveXMPConflicts(ImmutableString(), ImmutableString("c5")));
    EXPECT_EQ(Requests(), 0u);
    ExchangeLoggedInServer(nullptr);
    EXPECT_TRUE(AutoResolveXMPConflicts(HubURL("/s1"), ImmutableString("c5")));
}

}  // namespace
}  // namespace ZOCL
