// Pages of history, titles of commits, and the walk that looks for a foreign commit.
#include <boost/date_time/posix_time/posix_time.hpp>
#include <cstdlib>
#include <ctime>

#include "Collaboration/ProductionHistory.h"
#include "Collaboration/RecentCommitMetadataBase.h"
#include "Model/Production.h"
#include "ModelTest.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {
namespace {

using ostcore::utility::ToUTF16;

/// A title as it stands inside of a document.
constexpr const char* kTitleInJSON =
    " {\\'commitMessage\\':\\'Fine cut\\',\\'metadata\\':{\\'applicationName\\':\\'Lumenta\\',"
    "\\'machineName\\':\\'edit-2\\'}}\\t";

class ZoneGuard {
public:
    explicit ZoneGuard(const char* inZone) : mFormer(std::getenv("TZ") ? std::getenv("TZ") : "") {
        Set(inZone);
    }
    ~ZoneGuard() { Set(mFormer.c_str()); }
    ZoneGuard(const ZoneGuard&) = delete;
    ZoneGuard& operator=(const ZoneGuard&) = delete;

private:
    static void Set(const char* inZone) {
        *inZone ? setenv("TZ", inZone, 1) : unsetenv("TZ");
        tzset();
    }
    const std::string mFormer;
};

class HistoryTest : public ModelTest {
protected:
    static std::string Version(const std::string& inCommit, const std::string& inTitle) {
        return "{'commitId':'" + inCommit + "','timestamp':'2026-02-03T20:05:06Z','title':'" + inTitle +
               "','committer':{'name':'anna','displayName':'Anna K.'}}";
    }
    static std::string Page(const std::vector<std::string>& inVersions, const std::string& inNext = "") {
        std::string text = "{'versions':[";
        for (const std::string& version : inVersions) {
            text += (&version == &inVersions.front() ? "" : ",") + version;
        }
        return text + "],'links':[" +
               (inNext.empty() ? "" : "{'rel':'next','href':'" + HubURL(inNext).str() + "'}") + "]}";
    }
    InterfaceRef<IZOCProduction> MakeProduction() {
        return Make<Production>("{'links':[" + LinkTo(kRelation_Productions_Production_History, "/h") + "]}");
    }

    /// Waits for the end of a walk.
    struct Walk {
        Outcome outcome;
        InterfaceRef<IZOCHistoryVersion> version;
        HistoryWalkCompletion Function() {
            return [this](int inResult, const InterfaceRef<IZOCHistoryVersion>& inVersion) {
                version = inVersion;
                outcome.Function()(Guid(), inResult, nullptr, nullptr);
            };
        }
    };
    int FindRecent(const std::string& inKnown, Walk& ioWalk) {
        EXPECT_TRUE(FindRecentRevisionWithCommitMetadata(MakeProduction(), ImmutableString(inKnown),
                                                         ioWalk.Function()));
        return ioWalk.outcome.Wait();
    }
    void ExpectPage(const std::string& inPath, const std::string& inBody) {
        net->Expect("GET", HubURL(inPath).str(), JSONAnswer(inBody));
    }
};

TEST_F(HistoryTest, PagesClampAndEnd) {
    const auto history =
        Make<ProductionHistory>(Page({Version("c3", "x"), Version("c2", "y")}, "/h?start=2"));
    EXPECT_EQ(history->GetHistoryVersionCount(), 2);
    const std::pair<int, const char*> rows[] = {{-1, "c3"}, {0, "c3"}, {1, "c2"}, {2, "c2"}, {99, "c2"}};
    for (const auto& [index, commit] : rows) {
        EXPECT_EQ(history->GetHistoryVersion(index)->GetRevision().view(), commit) << index;
    }
    EXPECT_EQ(history->GetRevision().view(), "c3");
    EXPECT_EQ(history->GetMostRecentRevision().view(), "c3");
    const auto next = RFL::QueryInterface<IZOCServerResource>(history->GetNextPage());
    EXPECT_EQ(next->GetHTTPURL(), HubURL("/h?start=2"));
    EXPECT_FALSE(next->IsLoaded());
    EXPECT_EQ(Requests(), 0u);
    const auto empty = Make<ProductionHistory>(Page({}));
    EXPECT_EQ(empty->GetHistoryVersionCount(), 0);
    EXPECT_FALSE(empty->GetHistoryVersion(0));
    EXPECT_TRUE(empty->GetRevision().IsNull());
    EXPECT_FALSE(empty->GetNextPage());
}

TEST_F(HistoryTest, AVersionTellsOfItself) {
    const ZoneGuard zone("UTC+5");
    const auto history = Make<ProductionHistory>(
        Page({Version("0123456789abcdef", kTitleInJSON), "{'commitId':'c1','title':'by hand'}"}));
    const auto version = history->GetHistoryVersion(0);
    UString date, user, title, message, revision;
    version->GetInfo(date, user, title, message, revision);
    EXPECT_EQ(date, u"02/03/26, 03:05:06 PM");
    EXPECT_EQ(user, u"Anna K.");
    EXPECT_EQ(title.substr(0, 3), u" {\"");
    EXPECT_EQ(message, u"Fine cut");
    EXPECT_EQ(revision, u"01234567");
    EXPECT_EQ(version->GetUserID().view(), "anna");
    EXPECT_EQ(version->GetToolTipString(u"Film"),
              u"Production: Film\nVersion: 01234567\nUser: Anna K. (anna)\nComment: Fine cut");
    EXPECT_EQ(version->GetToolTipString(u""), u"Version: 01234567\nUser: Anna K. (anna)\nComment: Fine cut");
    EXPECT_TRUE(RFL::QueryInterface<IZOCServerResource>(version)->IsLoaded());
    const auto plain = history->GetHistoryVersion(1);
    plain->GetInfo(date, user, title, message, revision);
    EXPECT_EQ(date, u"");
    EXPECT_EQ(message, u"by hand");
    EXPECT_EQ(revision, u"c1");
    EXPECT_TRUE(plain->GetTime().is_not_a_date_time());
}

TEST_F(HistoryTest, OnlyATitleThatAClientWroteHoldsMetadata) {
    struct Row {
        const char* title;
        bool isMetadata;
    };
    const Row rows[] = {
        {"{'commitMessage':'m','metadata':{}}", true},
        {"\t {'metadata':{'applicationName':'a'}} \t", true},
        {"{'SerializerWrappedObject':{'commitMessage':'m'}}", true},
        {"{'SerializerWrappedObject':{'SerializerWrappedObject':{'commitMessage':'m'}}}", false},
        {"{'SerializerWrappedObject':null}", false},
        {"{'SerializerWrappedObject':[1]}", false},
        {"\n{'commitMessage':'m'}", false},
        {"{not json}", false},
        {"{'commitMessage':'m'", false},
        {"{'commitMessage':7}", false},
        {"{'commitMessage':'m','metadata':'x'}", false},
        {"{}", false},
        {"{", false},
        {"}{", false},
        {"", false},
        {" \t ", false},
        {"Colour {grading}", false},
    };
    for (const Row& row : rows) {
        CommitMetadata metadata;
        metadata.commitMessage = u"before";
        EXPECT_EQ(GetCommitMetadataFromTitle(ToUTF16(Quote(row.title)), metadata), row.isMetadata)
            << row.title;
        EXPECT_EQ(metadata.commitMessage == u"before", !row.isMetadata) << row.title;
    }
    CommitMetadata metadata;
    ASSERT_TRUE(GetCommitMetadataFromTitle(
        ToUTF16(Quote("{'commitMessage':'m','metadata':{'applicationName':'a','applicationBuildNumber':'b',"
                      "'applicationInstanceID':'01234567-89ab-4def-8123-456789abcdef','machineID':'i',"
                      "'machineName':'n','machineIP':'ip','transactionType':'edit','future':[1]}}")),
        metadata));
    EXPECT_EQ(metadata.commitMessage, u"m");
    EXPECT_EQ(metadata.metadata.applicationName.view(), "a");
    EXPECT_EQ(metadata.metadata.applicationBuildNumber.view(), "b");
    EXPECT_EQ(metadata.metadata.applicationInstanceID.ToString(), "01234567-89ab-4def-8123-456789abcdef");
    EXPECT_EQ(metadata.metadata.machineID.view(), "i");
    EXPECT_EQ(metadata.metadata.machineName.view(), "n");
    EXPECT_EQ(metadata.metadata.machineIP.view(), "ip");
    EXPECT_EQ(metadata.metadata.transactionType.view(), "edit");
    EXPECT_FALSE(GetCommitMetadataFromHistoryVersion(nullptr, metadata));
}

TEST_F(HistoryTest, TimesAreShownInLocalTime) {
    const ZoneGuard zone("CET-1CEST,M3.5.0,M10.5.0/3");
    const auto shown = [](const char* inTime) {
        return FormatDateTime(boost::posix_time::time_from_string(inTime), "%Y-%m-%d %H:%M:%S");
    };
    EXPECT_EQ(shown("2026-07-01 23:30:00"), u"2026-07-02 01:30:00");
    EXPECT_EQ(shown("2026-01-01 12:00:00.75"), u"2026-01-01 13:00:00");
    EXPECT_EQ(shown("1969-12-31 23:00:00"), u"1970-01-01 00:00:00");
    EXPECT_EQ(shown("9999-12-31 23:30:00"), u"9999-12-31 23:30:00");
    EXPECT_EQ(FormatDateTime(ptime(), "%Y"), u"");
}

TEST_F(HistoryTest, TheWalkEndsAtTheKnownCommitAtAForeignOneOrAtTheEnd) {
    struct Row {
        std::vector<std::string> first, second;
        int result;
        const char* commit;
        std::size_t requests;
    };
    const std::string tells = kTitleInJSON;
    const Row rows[] = {
        {{Version("known", tells)}, {}, kResultAlreadyThere, "known", 1},
        {{Version("c9", tells), Version("known", "")}, {}, kResultSuccess, "c9", 1},
        {{Version("c9", "by hand"), Version("c8", tells)}, {}, kResultSuccess, "c8", 1},
        {{Version("c9", "by hand")}, {Version("c8", tells)}, kResultSuccess, "c8", 2},
        {{Version("c9", "x")}, {Version("known", tells)}, kResultAlreadyThere, "known", 2},
        {{Version("c9", "x")}, {Version("c8", "y")}, kResultHTTPNotFound, nullptr, 2},
        {{}, {}, kResultHTTPNotFound, nullptr, 2},
    };
    for (const Row& row : rows) {
        net->ClearRequests();
        ExpectPage("/h", Page(row.first, "/h2"));
        if (row.requests > 1) {
            // The last page leads back to the first; a walk does not go in circles.
            ExpectPage("/h2", Page(row.second, "/h"));
        }
        Walk walk;
        EXPECT_EQ(FindRecent("known", walk), row.result);
        EXPECT_EQ(walk.version ? walk.version->GetRevision().str() : "", row.commit ? row.commit : "");
        EXPECT_EQ(Requests(), row.requests);
    }
    EXPECT_TRUE(net->Mismatches().empty());
}

TEST_F(HistoryTest, AWalkThatFailsSaysWhy) {
    Walk forbidden, broken, secondFails;
    net->Expect("GET", "", ScriptedAnswer::Status(403));
    EXPECT_EQ(FindRecent("k", forbidden), kResultHTTPForbidden);
    net->Expect("GET", "", JSONAnswer("{'versions':7}"));
    EXPECT_EQ(FindRecent("k", broken), kResultFailure);
    ExpectPage("/h", Page({Version("c9", "x")}, "/h2"));
    net->Expect("GET", "", ScriptedAnswer::FailStart());
    EXPECT_EQ(FindRecent("k", secondFails), kResultNotStarted);
    EXPECT_FALSE(FindRecentRevisionWithCommitMetadata(nullptr, "k", HistoryWalkCompletion()));
    EXPECT_FALSE(FindRecentRevisionWithCommitMetadata(Make<Production>("{}"), "k", HistoryWalkCompletion()));
}

TEST_F(HistoryTest, TheNewestRevisionComesFromTheHistory) {
    ExpectPage("/h", Page({Version("c9", "x"), Version("c8", "y")}));
    Walk walk;
    ASSERT_TRUE(MakeProduction()->GetMostRecentRevision(walk.Function()));
    EXPECT_EQ(walk.outcome.Wait(), kResultSuccess);
    EXPECT_EQ(walk.version->GetRevision().view(), "c9");
}

TEST_F(HistoryTest, OnlyAFoundVersionIsRemembered) {
    struct Operation : RecentCommitMetadataBase {
        using RecentCommitMetadataBase::ProcessRecentRevisionResult;
    } operation;
    const auto version = Make<ProductionHistory>(Page({Version("c", kTitleInJSON)}))->GetHistoryVersion(0);
    const auto plain = Make<ProductionHistory>(Page({Version("c", "x")}))->GetHistoryVersion(0);
    operation.ProcessRecentRevisionResult(kResultAlreadyThere, version);
    operation.ProcessRecentRevisionResult(kResultSuccess, plain);
    operation.ProcessRecentRevisionResult(kResultSuccess, nullptr);
    EXPECT_FALSE(operation.HasRecentCommitMetadata());
    EXPECT_EQ(operation.GetRecentCommitMetadata().commitMessage, u"");
    operation.ProcessRecentRevisionResult(kResultSuccess, version);
    EXPECT_TRUE(operation.HasRecentCommitMetadata());
    EXPECT_EQ(operation.GetRecentCommitMetadata().metadata.machineName.view(), "edit-2");
}

}  // namespace
}  // namespace ZOCL
