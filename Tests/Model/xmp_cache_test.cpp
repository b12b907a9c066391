// The packets that a session keeps: which of two counts, who gets them, and that none is lost.
#include "Model/Asset.h"
#include "SessionTest.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace ZOCL {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

/// Writes down what is handed to it as enclosures of the production.
class RecordingBulk final : public IZOCBulkTransaction {
public:
    std::uint32_t AddRef() noexcept override { return mCount.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mCount.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID&, void**) noexcept override { return kResultFailure; }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID&, void**) noexcept override { return kResultFailure; }

    bool CreateNewAsset(const AssetCompletion&, const AssetBaseProperties&, const ImmutableString&,
                        const optional<SubClip>&, const ImmutableString&,
                        const shared_ptr<RecycledMemory const>&, const ImmutableString&,
                        const shared_ptr<RecycledMemory const>&, const SourceAssetReference&) override {
        return false;
    }
    shared_ptr<CompoundAsyncOperation> GetCreateOperation() override { return nullptr; }
    void FinishedCreatingNewAssets() override {}
    void NotifyOfRestoredAsset(const InterfaceRef<IZOCAsset>&) override {}
    bool DeleteAsset(const ResultCompletion&, const ImmutableString&) override { return false; }
    void FinishedDeletingAssets() override {}
    bool SetAssetProperties(const ResultCompletion&, const ImmutableString&,
                            const optional<AssetBaseProperties>&, const optional<SubClip>&,
                            const optional<ImmutableString>&) override {
        return false;
    }
    bool SetAssetEnclosure(const ResultCompletion&, const ImmutableString&, const ImmutableString&,
                           const shared_ptr<RecycledMemory const>&) override {
        return false;
    }
    void SetAssetRendition(const ImmutableString&, const ImmutableString&,
                           const shared_ptr<RecycledMemory const>&) override {}
    void SetProductionEnclosure(const ImmutableString& inName, const shared_ptr<RecycledMemory const>& inData,
                                bool inCreateOnly) override {
        written.push_back(inName.str() + " " + std::string(inData->view()) + (inCreateOnly ? " new" : ""));
    }
    shared_ptr<CompoundAsyncOperation> GetEditOperation() override { return nullptr; }
    void FinishedEditing() override {}
    InterfaceRef<IZOCBulkTransaction> AddRefSelf() override {
        return InterfaceRef<IZOCBulkTransaction>(this);
    }
    void AddEnclosureToNewAsset(std::size_t, const ImmutableString&,
                                const shared_ptr<RecycledMemory const>&) override {}
    bool CreateNewAsset(const AssetCompletion&, const BulkNewAsset&) override { return false; }
    bool IsCompletelyFinished() override { return true; }

    std::vector<std::string> written;

private:
    RFL::RefCount mCount;
};

class XMPCacheTest : public SessionTest {
protected:
    static std::string Enclosures(const std::string& inRoot, const std::vector<std::string>& inNames) {
        std::string items;
        for (const std::string& name : inNames) {
            items += (items.empty() ? "" : ",") + ("{'name':'" + name + "','zo:enclosureId':'i-" + name) +
                     "','links':[" + LinkTo(kRelation_Enclosures_Enclosure, "/payload/" + name) + "," +
                     LinkTo(kRelation_Edit, inRoot + "/edit/" + name) + "]}";
        }
        return "{'enclosures':[" + items + "],'links':[" + LinkTo(kRelation_Create, inRoot + "/enclosures") +
               "]}";
    }
    static std::vector<std::string> Cached(const InterfaceRef<Production>& inSession) {
        const InterfaceRef<RecordingBulk> bulk(new RecordingBulk);
        inSession->StoreCachedXMPChangesInBulkTransaction(bulk);
        return bulk->written;
    }
    InterfaceRef<IZOCTransaction> MakeTransaction() {
        return InterfaceRef<IZOCTransaction>(Make<Production>(TransactionBody("t1", "{}")));
    }
    /// The result of storing what the session has.
    static int Store(const InterfaceRef<Production>& inSession,
                     const InterfaceRef<IZOCTransaction>& inTransaction) {
        Outcome outcome;
        const RequestCompletion complete = outcome.Function();
        EXPECT_TRUE(inSession->StoreProductionChangesInTransaction(
            inTransaction, [complete](int inResult) { complete(Guid(), inResult, nullptr, nullptr); }));
        const int result = outcome.Wait();
        EXPECT_EQ(outcome.Calls(), 1);
        return result;
    }
    void ServeTransaction() {
        On("GET /t1/enclosures", JSONAnswer(Enclosures("/t1", {"a_xmp", "c_xmp"})));
        On("POST /t1/enclosures", JSONAnswer("{'name':'b_xmp','links':[]}"));
        On("PUT /t1/edit/a_xmp", ScriptedAnswer::Status(200));
        On("PUT /t1", ScriptedAnswer::Status(200).With("ETag", "\"t9\""));
    }
};

TEST_F(XMPCacheTest, AChangeIsNotOverwrittenByARead) {
    const auto session = MakeSession();
    EXPECT_FALSE(session->HasCachedXMPChanges());
    session->CacheXMP("b", "read", false);
    session->CacheXMP("c", "changed", true);
    session->CacheXMP("c", "read", false);
    session->CacheXMP("a", "first", true);
    session->CacheXMP("a", "second", true);
    session->CacheXMP("b", "read again", false);
    session->CacheXMP("", "of nothing", true);
    EXPECT_TRUE(session->HasCachedXMPChanges());
    EXPECT_THAT(Cached(session), ElementsAre("a_xmp second", "b_xmp read again new", "c_xmp changed"));
    EXPECT_TRUE(session->HasCachedXMPChanges()) << "they stay until they have arrived";
    session->SetName(u"New");
    session->ClearXMPCache();
    EXPECT_THAT(Cached(session), ElementsAre());
    EXPECT_TRUE(session->HasCachedXMPChanges()) << "the name is still to be stored";
    session->StoreCachedXMPChangesInBulkTransaction(nullptr);

    const auto production = Make<Production>("{'zo:productionId':'p1','links':[" + Lists("/p1") + "]}");
    production->CacheXMP("a", "x", true);
    EXPECT_FALSE(production->HasCachedXMPChanges());
    EXPECT_EQ(Requests(), 0u);
}

TEST_F(XMPCacheTest, ReadsTheChangeElseTheEnclosureElseTellsWhyNot) {
    const auto session = MakeSession();
    session->CacheXMP("a", "changed", true);
    EXPECT_EQ(session->ReadXMP(ImmutableString("a")), "changed");
    EXPECT_EQ(session->ReadXMP(ImmutableString()), "");
    EXPECT_EQ(session->ReadXMP(InterfaceRef<IZOCAsset>()), "");
    EXPECT_EQ(Requests(), 0u);
    On("GET /s1/enclosures", ScriptedAnswer::Status(404));
    session->CacheXMP("b", "an old copy", false);
    EXPECT_EQ(session->ReadXMP(ImmutableString("b")), "");
    EXPECT_TRUE(Traced("Failed to load XMP enclosure for production, enclosureName: b_xmp, uri: " +
                       session->GetHTTPURL().str()));
    On("GET /s1/enclosures", JSONAnswer(Enclosures("/s1", {"b_xmp", "c_xmp"})));
    On("GET /payload/b_xmp", ScriptedAnswer::Body("packet", "application/json"));
    EXPECT_EQ(session->ReadXMP(ImmutableString("b")), "packet");
    const auto asset = Make<Asset>("{'zo:assetId':'1','properties':{'mediaLocator':'b'},'links':[]}");
    EXPECT_EQ(session->ReadXMP(InterfaceRef<IZOCAsset>(asset)), "packet");
    EXPECT_EQ(session->ReadXMP(ImmutableString("c")), "");
    EXPECT_TRUE(Traced("enclosureName: c_xmp"));
    EXPECT_EQ(session->ReadXMP(ImmutableString("d")), "");
    EXPECT_TRUE(Traced("No XMP data to read because production did not have XMP enclosure, uri: " +
                       session->GetHTTPURL().str() + ", enclosureName: d_xmp"));
    EXPECT_EQ(CountOf("GET", "/payload/b_xmp"), 1u);
}

TEST_F(XMPCacheTest, StoresChangesOverWhatIsThereAndCopiesWhereNothingIs) {
    ServeTransaction();
    const auto session = MakeSession();
    session->SetName(u"New");
    session->CacheXMP("a", "changed a", true);
    session->CacheXMP("b", "copy of b", false);
    session->CacheXMP("c", "copy of c", false);
    EXPECT_EQ(Store(session, MakeTransaction()), kResultSuccess);
    EXPECT_EQ(net->Requests().front().Path(), "/t1") << "the properties go first, while their tag is true";
    EXPECT_THAT(Last("PUT", "/t1/edit/a_xmp").body, HasSubstr("\r\n\r\nchanged a\r\n"));
    EXPECT_THAT(Last("POST", "/t1/enclosures").body, HasSubstr("\r\n\r\nb_xmp\r\n"));
    EXPECT_THAT(Last("POST", "/t1/enclosures").body, HasSubstr("\r\n\r\ncopy of b\r\n"));
    EXPECT_EQ(Requests(), 4u) << "one for the list, and none for c";
    EXPECT_FALSE(session->HasCachedXMPChanges());
    EXPECT_EQ(Store(session, MakeTransaction()), kResultSuccess);
    EXPECT_EQ(Requests(), 4u);
}

TEST_F(XMPCacheTest, KeepsEverythingThatCouldNotBeStored) {
    ServeTransaction();
    const auto session = MakeSession();
    session->SetName(u"New");
    session->CacheXMP("a", "changed a", true);
    session->CacheXMP("b", "changed b", true);
    session->CacheXMP("c", "copy of c", false);
    On("POST /t1/enclosures", [&](const RecordedRequest&) {
        // While it is under way, the host goes on.
        session->CacheXMP("a", "read meanwhile", false);
        session->CacheXMP("b", "newer b", true);
        return ScriptedAnswer::Status(507);
    });
    EXPECT_LT(Store(session, MakeTransaction()), 0);
    EXPECT_THAT(Cached(session), ElementsAre("a_xmp changed a", "b_xmp newer b", "c_xmp copy of c new"));
    for (const char* line : {"PUT /t1", "GET /t1/enclosures"}) {
        ServeTransaction();
        On(line, ScriptedAnswer::Status(403));
        session->SetName(u"Newer");
        EXPECT_EQ(Store(session, MakeTransaction()), kResultHTTPForbidden) << line;
        EXPECT_TRUE(session->HasCachedXMPChanges());
    }
    const auto bare = Make<Production>("{'zo:transactionId':'t2','links':[]}");
    EXPECT_LT(Store(session, InterfaceRef<IZOCTransaction>(bare)), 0);
    ServeTransaction();
    EXPECT_EQ(Store(session, MakeTransaction()), kResultSuccess);
    EXPECT_THAT(Last("POST", "/t1/enclosures").body, HasSubstr("newer b"));
    EXPECT_FALSE(session->HasCachedXMPChanges());
}

}  // namespace
}  // namespace ZOCL
