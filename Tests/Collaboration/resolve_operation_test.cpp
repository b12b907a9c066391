// Conflicts over the scripted network: which rows the differences make, and the answers that leave one by
// one.
#include "Collaboration/ZOPrepareResolveOperation.h"
#include "Collaboration/ZOResolveOperation.h"
#include "OperationTest.h"

namespace ZOCL {
namespace {

class ResolveTest : public OperationTest {
protected:
    ResolveTest() {
        requests = {{'s', {"GET /s1", SessionAnswer("c5")}},
                    {'a', {"POST /theirs/a", SessionAnswer("c2")}},
                    {'b', {"POST /theirs/b", SessionAnswer("c3")}},
                    {'p', {"POST /theirs/p", SessionAnswer("c4")}},
                    {'A', {"POST /mine/a", SessionAnswer("c2")}},
                    {'P', {"POST /mine/p", SessionAnswer("c4")}},
                    {'o', {"GET /s1/out", Differences("'assets':[{'zo:assetId':'a'}]")}},
                    {'h', {"GET /h", ForeignHistory()}},
                    {'l', {"GET /s1/assets", JSONAnswer("{'assets':[" + Asset("a", "Clip") + "]}")}},
                    {'g', {"GET /gone", JSONAnswer(Asset("g", "Cut"))}}};
    }
    static std::string Asset(const std::string& inID, const std::string& inName) {
        return "{'zo:assetId':'" + inID + "','properties':{'name':'" + inName +
               "','cdzo:assetType':'bin','mediaLocator':'l'},'links':[]}";
    }
    /// A row for each letter, p of the production's properties, b offered by the other side alone; the type.
    static InterfaceRef<ZOResolveOperation> Resolve(std::string inRows) {
        const auto type = Publish::ResolveType(inRows.back() - '0');
        inRows.pop_back();
        std::vector<ConflictItemData> rows;
        for (const char letter : inRows) {
            ConflictItemData row;
            row.displayName = ImmutableString(std::string(1, letter));
            row.type = letter == 'p' ? kConflictType_ProductionProperties : kConflictType_XMPMetadata;
            row.assetURL = HubURL(std::string("/") + letter);
            row.acceptTheirsURL = HubURL(std::string("/theirs/") + letter);
            row.acceptYoursURL = letter == 'b' ? ImmutableString() : HubURL(std::string("/mine/") + letter);
            rows.push_back(row);
        }
        return InterfaceRef<ZOResolveOperation>(
            new ZOResolveOperation(HubURL("/s1"), rows, type, ImmutableString("c1")));
    }
    /// How many were answered; assets replaced, properties replaced, conflicts remain, changes, a foreign
    /// commit: a letter for each; the commit.
    static std::string State(const ZOResolveOperation& inResolve) {
        return std::to_string(inResolve.GetResolvedCount()) + (inResolve.AssetsReplaced() ? "A" : "") +
               (inResolve.ProductionPropertiesReplaced() ? "P" : "") +
               (inResolve.ConflictsRemain() ? "C" : "") + (inResolve.HasChanges() ? "D" : "") +
               (inResolve.HasRecentCommitMetadata() ? "H" : "") + " " + inResolve.GetCommitId().str();
    }
};

TEST_F(ResolveTest, EachAnswerNamesTheCommitThatTheOneBeforeCameBackWith) {
    Begin();
    const auto operation = Resolve("abp1");
    EXPECT_EQ(Run(operation), kResultSuccess);
    ASSERT_EQ(Wire(), "sabpo");
    for (std::size_t at = 1; at < 4; ++at) {
        EXPECT_EQ(net->Requests()[at].Header("Content-Type"), "application/json;charset=utf-8");
        EXPECT_EQ(net->Requests()[at].body, Quote("{':commitId':'c" + std::to_string(at) + "'}"));
        EXPECT_EQ(operation->GetResolvedAssetURLs()[at - 1].view().back(), "abp"[at - 1]);
    }
    EXPECT_EQ(told, "Resolving \"a\"...\n1/3\nResolving \"b\"...\n2/3\nResolving \"p\"...\n3/3\n");
}

TEST_F(ResolveTest, TheFirstFailureEndsTheLoopAndWhatWasAnsweredStays) {
    const std::pair<const char*, Case> rows[] = {
        {"p0", {"", kResultSuccess, "spo", "1PD c4"}},
        {"pab1", {"", kResultSuccess, "spabo", "3APD c3"}},
        {"ap2", {"", kResultSuccess, "sAPo", "2D c4"}},
        {"0", {"", kResultSuccess, "so", "0D c1"}},
        {"aba2", {"", kResultFailure, "sAo", "1D c2"}},
        {"ab0", {"a404", kResultHTTPNotFound, "sao", "0D c1"}},
        {"ab0", {"b!", kResultNoResponseObject, "sabo", "1AD c2"}},
        {"ab0", {"b412", kResultHTTPPreconditionFailed, "sabh", "1ACDH c2"}},
        // An answer that names no commit leaves the next one guarded by the last that is known.
        {"ab0", {"a204", kResultSuccess, "sabo", "2AD c3"}},
        {"a0", {"o404", kResultSuccess, "sao", "1ACD c2"}},
        {"a0", {"s404", kResultSuccess, "sa", "1ACD c2"}},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.first);
        RunEach(
            {row.second}, [&] { return Resolve(row.first); }, State);
    }
}

TEST_F(ResolveTest, ACancelLetsTheAnswerUnderWayFinishAndStartsNoOther) {
    Begin();
    const auto operation = Resolve("abpap0");
    Stop(operation, 'b', kResultCancelled);
    EXPECT_EQ(operation->GetResolvedCount(), 2u);
    EXPECT_EQ(Wire(), "sabo");
    EXPECT_THAT(told, testing::EndsWith("Cancelling...\n2/5\n"));
    Begin();
    Stop(Resolve("ab0"), 'a', kResultHTTPUnauthorized, true);
    EXPECT_EQ(Wire(), "sao");
    EXPECT_EQ(told, "Resolving \"a\"...\n");
}

TEST_F(ResolveTest, EveryConflictIsARowThatSaysWhatItIsAbout) {
    Begin();
    On("GET /s1/out",
       Differences(
           "'assets':[" + Conflict("'zo:assetId':'a','zo:name':'old'", "/a") + "," +
           Conflict("'zo:assetId':'g','zo:name':'Cut?'", "/gone") + "," +
           Conflict("'zo:assetId':'h','zo:name':'Lost'", "/lost") + ",{'zo:assetId':'q'}],'enclosures':[" +
           Conflict("'zo:name':'l_xmp'", "/1") + "," + Conflict("'zo:name':'m_xmp'", "/2") + "," +
           Conflict("'zo:assetId':'a','zo:name':'z_xmp'", "/3") + "," +
           Conflict("'zo:assetId':'a','zo:name':'cues'", "/4") + "," + Conflict("'zo:name':'_xmp'", "/5") +
           "],'properties':" + Conflict("'zo:baseCommitId':'c1'", "/s1")));
    const InterfaceRef<ZOPrepareResolveOperation> operation(new ZOPrepareResolveOperation(HubURL("/s1")));
    EXPECT_EQ(Run(operation), kResultSuccess);
    EXPECT_EQ(operation->GetCommitId().view(), "c9");
    std::string rows;
    for (const ConflictItemData& row : operation->GetConflicts()) {
        rows += row.assetIdentifier.str() + "|" + row.displayName.str() + "|" + row.path.str() + "|" +
                row.type.str() + "|" + ostcore::utility::ToUTF8(GetConflictKindText(row.kind)) + "\n";
        const std::string path = row.assetURL.str().substr(HubURL("").view().size());
        EXPECT_EQ(row.acceptTheirsURL, HubURL("/theirs" + path));
        EXPECT_EQ(row.acceptYoursURL, HubURL("/mine" + path));
    }
    EXPECT_EQ(rows,
              "a|Clip|/|bin|Asset\ng|Cut|/|bin|Asset\nh|Lost|||Asset\n"
              "a|Clip|/|XMPMetadata|XMP Metadata\nm_xmp|m||XMPMetadata|XMP Metadata\n"
              "a|Clip|/|XMPMetadata|XMP Metadata\na|Clip: cues|/|Enclosure|Attached Data\n"
              "_xmp|_xmp||Enclosure|Attached Data\n"
              "ProductionProperties|Production Settings|/|ProductionProperties|Production Settings\n");
}

}  // namespace
}  // namespace ZOCL
