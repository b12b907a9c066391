// Sharing, getting the latest and resolving by two users of a hub that runs as a process of its own.
#include "Collaboration/ZOPreparePublishOperation.h"
#include "Collaboration/ZOPrepareResolveOperation.h"
#include "Collaboration/ZOPublishOperation.h"
#include "Collaboration/ZOResolveOperation.h"
#include "Collaboration/ZOSyncOperation.h"
#include "Connection/LoggedInServer.h"
#include "Frame/ProgressWindow.h"
#include "HubSessionTest.h"

namespace ZOCL {
namespace {

using Session = InterfaceRef<IZOCEditingSession>;

class HubOperationTest : public HubSessionTest {
protected:
    ~HubOperationTest() override { ExchangeLoggedInServer(nullptr); }

    /// Makes an operation and runs it to its end.
    template <class Operation, class... Arguments>
    static InterfaceRef<Operation> Run(int inResult, const Arguments&... inArguments) {
        const InterfaceRef<Operation> operation(new Operation(inArguments...));
        RunProgressWindow(operation, ProgressWindowSettings());
        EXPECT_EQ(operation->GetResult(), inResult) << GetResultName(operation->GetResult());
        return operation;
    }
    template <class T>
    static ImmutableString URL(const InterfaceRef<T>& inObject) {
        return As<IZOCServerResource>(inObject)->GetHTTPURL();
    }
    static ImmutableString Head(const Session& inSession) {
        Refresh(inSession);
        return As<IZOCProduction>(inSession)->GetLoadedRevision();
    }
    /// Puts a mark behind the name of the bin A and into some notes, and deletes the bin B.
    static void Work(const Session& inSession, const UString& inMark) {
        Head(inSession);
        const auto transaction = OpenTransaction(inSession);
        const auto assets = As<IZOCProduction>(transaction)->GetAssets();
        ASSERT_TRUE(As<IZOCServerResource>(assets)->Load(true));
        const auto asset = As<IZOCWritableAsset>(assets->GetAssetByName(u"A"));
        AssetBaseProperties properties = assets->GetAssetByName(u"A")->GetAssetBaseProperties();
        properties.name += inMark;
        Perform([&](const Guid& inID, const RequestCompletion& inDone) {
            return asset->SetAssetBasePropertiesAndUpdate(properties, inID, inDone);
        });
        EXPECT_TRUE(As<IZOCWritableServerResource>(assets->GetAssetByName(u"B"))->Delete());
        for (const char* name : {"b.txt", "c.txt", "d.txt"}) {
            EXPECT_EQ(Write(transaction, name, ostcore::utility::ToUTF8(inMark)), kResultSuccess);
        }
        EXPECT_EQ(Commit(transaction, inMark), kResultSuccess);
    }
    static std::string Payload(const InterfaceRef<IZOCProduction>& inProduction,
                               const ImmutableString& inName) {
        const auto list = inProduction->GetEnclosures();
        EXPECT_TRUE(As<IZOCServerResource>(list)->Load(true));
        const auto enclosure = list->GetEnclosure(inName);
        return enclosure ? enclosure->GetEnclosurePayloadAsUTF8() : "none";
    }
};

TEST_F(HubOperationTest, TwoUsersShareGetTheLatestAndResolveWhatIsInConflict) {
    const Member anna = SignIn("anna");
    const Member ben = SignIn("ben");
    const Session annas = anna.OpenSession();
    const auto start = OpenTransaction(annas);
    Add(start, u"A");
    Add(start, u"B");
    EXPECT_EQ(Commit(start), kResultSuccess);
    ExchangeLoggedInServer(anna.server);
    Run<ZOPublishOperation>(kResultSuccess, annas, u"Start", Head(annas));
    const Session bens = ben.OpenSession();
    Work(annas, u" of anna");
    Work(bens, u" of ben");
    // What she has removed is found in the commit that still holds it.
    const auto items = Run<ZOPreparePublishOperation>(kResultSuccess, URL(annas), annas)->GetItems();
    ASSERT_FALSE(items.empty());
    EXPECT_TRUE(items.back().displayName.view() == "B" && items.back().asset);
    const auto shared = Run<ZOPublishOperation>(kResultSuccess, annas, u"Hers", Head(annas))->GetCommitId();

    ExchangeLoggedInServer(ben.server);
    Run<ZOPublishOperation>(kResultHTTPConflict, bens, u"His", Head(bens));
    const auto latest = Run<ZOSyncOperation>(kResultSuccess, URL(bens), URL(ben.production));
    EXPECT_TRUE(latest->PullSucceeded() && latest->HasConflicts() && latest->HasEnclosureConflicts());
    EXPECT_EQ(latest->GetCommitId(), Head(bens));
    const ImmutableString id = ben.production->GetIdentifier();
    EXPECT_EQ(Payload(As<IZOCProduction>(bens), GetPreSyncHeadCommitIdEnclosureName(id)), shared.str());
    EXPECT_EQ(Payload(As<IZOCProduction>(bens), GetPostSyncBaseCommitIdEnclosureName(id)), shared.str());

    const auto conflicts = Run<ZOPrepareResolveOperation>(kResultSuccess, URL(bens));
    std::map<std::string, ConflictItemData> rows;
    for (const ConflictItemData& row : conflicts->GetConflicts()) {
        rows[row.displayName.str()] = row;
    }
    ASSERT_EQ(rows.size(), 4u);
    ImmutableString commit = conflicts->GetCommitId();
    // One after the other, each from the commit that the one before has left.
    const auto resolve = [&](int inResult, Publish::ResolveType inType,
                             const std::vector<ConflictItemData>& inRows) {
        const auto resolving = Run<ZOResolveOperation>(inResult, URL(bens), inRows, inType, commit);
        EXPECT_EQ(resolving->GetResolvedCount(), inResult < 0 ? 0 : inRows.size());
        EXPECT_EQ(resolving->ConflictsRemain(), inRows.size() == 1 || inResult < 0);
        EXPECT_EQ(resolving->GetCommitId() == commit, inResult < 0);
        commit = resolving->GetCommitId();
        return resolving;
    };
    const std::vector<ConflictItemData> last{rows["c.txt"], rows["d.txt"]};
    resolve(kResultSuccess, Publish::kResolveType_AcceptTheirs, {rows["A of ben"]});
    resolve(kResultSuccess, Publish::kResolveType_AcceptTheirsAndCopy, {rows["b.txt"]});

    // Another host of ben goes on meanwhile; what comes too late is refused, and tells of it.
    const Member elsewhere = SignIn("ben");
    const auto other = OpenTransaction(elsewhere.OpenSession());
    Add(other, u"E");
    EXPECT_EQ(Commit(other, u"From elsewhere"), kResultSuccess);
    const auto late = resolve(kResultHTTPPreconditionFailed, Publish::kResolveType_AcceptYours, last);
    EXPECT_EQ(late->GetRecentCommitMetadata().commitMessage, u"From elsewhere");
    const auto overtaken = Run<ZOPublishOperation>(kResultHTTPPreconditionFailed, bens, u"His", commit);
    EXPECT_EQ(overtaken->GetRecentCommitMetadata().commitMessage, u"From elsewhere");
    commit = Head(bens);
    resolve(kResultSuccess, Publish::kResolveType_AcceptYours, last);

    Run<ZOPublishOperation>(kResultSuccess, bens, u"His", Head(bens));
    EXPECT_EQ(Refresh(As<IZOCEditingSession>(ben.production)), kResultSuccess);
    EXPECT_THAT(Names(ben.production), testing::IsSupersetOf({u"A of anna", u"E"}));
    EXPECT_EQ(Payload(ben.production, "b.txt") + Payload(ben.production, "d.txt"), " of anna of ben");
    EXPECT_EQ(Payload(ben.production, GetPreSyncHeadCommitIdEnclosureName(id)), "none") << "it is no work";
}

}  // namespace
}  // namespace ZOCL
