// Two searches, each a short row of requests; whatever fails on the way means that nothing was found.
#include "Model/OwnCommit.h"

#include "CollaborationFactory.h"
#include "dto/ProductionHistory.h"
#include "Links.h"
#include "Model/Production.h"
#include "Model/ResourceCreation.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"
#include "ResourceFactory.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

namespace {

/// So many versions are looked at: others may have committed since.
constexpr int kLongestSearch = 50;

UString TitleOf(const InterfaceRef<IZOCHistoryVersion>& inVersion) {
    UString date, userName, title, message, revision;
    inVersion->GetInfo(date, userName, title, message, revision);
    return title;
}

bool BearsRequest(const InterfaceRef<IZOCHistoryVersion>& inVersion, const std::string& inRequest) {
    try {
        const std::string title = ostcore::utility::ToUTF8(TitleOf(inVersion));
        return dto::CommitTitle::FromJSON(title).Metadata().RequestID() == inRequest;
    } catch (const std::exception&) {
        // Not written by a client of this library.
        return false;
    }
}

/// One search. It lives in the completion of the request that is under way.
class Search : public boost::enable_shared_from_this<Search> {
public:
    Search(const InterfaceRef<IZOCDataServer>& inServer, const OwnCommitCompletion& inCompletion)
        : mServer(inServer), mCompletion(inCompletion) {}
    virtual ~Search() = default;

    void Start(const ImmutableString& inSessionURL) {
        mSession = MakeAtURL<Production>(inSessionURL, mServer, ResourceWritability::kWritable);
        const auto onLoaded = [self = shared_from_this()](const Guid&, int inResult,
                                                          const InterfaceRef<IZOCServerResource>&,
                                                          const shared_ptr<ostnet::Response>& inAnswer) {
            self->mAnswer = inAnswer;
            if (inResult < 0 || !self->mSession->IsLoaded() || !self->LooksPromising()) {
                self->End(false);
            } else {
                self->WalkHistory();
            }
        };
        if (!mSession || !mSession->Load(Guid::CreateUnique(), onLoaded, true)) {
            End(false);
        }
    }

protected:
    /// Whether the session as it is now leaves the question open.
    virtual bool LooksPromising() { return true; }
    virtual bool IsTheOne(const InterfaceRef<IZOCHistoryVersion>& inVersion) = 0;
    virtual int LongestSearch() const = 0;
    virtual void OnVersionFound() { End(true); }

    void End(bool inIsFound) {
        mCompletion(inIsFound ? mSession : InterfaceRef<Production>(),
                    inIsFound ? mAnswer : shared_ptr<ostnet::Response>());
    }

    const InterfaceRef<IZOCDataServer> mServer;
    InterfaceRef<Production> mSession;

private:
    void WalkHistory() {
        const auto self = shared_from_this();
        const auto seen = boost::make_shared<int>(0);
        const HistoryVisitor visit = [self, seen](const InterfaceRef<IZOCHistoryVersion>& inVersion,
                                                  int& outResult) {
            const bool isTheOne = inVersion && self->IsTheOne(inVersion);
            outResult = isTheOne ? kResultSuccess : kResultHTTPNotFound;
            return isTheOne || ++*seen >= self->LongestSearch();
        };
        const auto onWalked = [self](int inResult, const InterfaceRef<IZOCHistoryVersion>&) {
            if (inResult >= 0) {
                self->OnVersionFound();
            } else {
                self->End(false);
            }
        };
        if (!mSession->LoadHistoryWith(visit, onWalked)) {
            End(false);
        }
    }

    const OwnCommitCompletion mCompletion;
    shared_ptr<ostnet::Response> mAnswer;
};

class CommitSearch final : public Search {
public:
    CommitSearch(const InterfaceRef<IZOCDataServer>& inServer, const Guid& inRequestID,
                 const OwnCommitCompletion& inCompletion)
        : Search(inServer, inCompletion), mRequest(inRequestID.ToString()) {}

private:
    bool IsTheOne(const InterfaceRef<IZOCHistoryVersion>& inVersion) override {
        return BearsRequest(inVersion, mRequest);
    }
    int LongestSearch() const override { return kLongestSearch; }

    const std::string mRequest;
};

// The title of a shared commit is the user's own text and bears nothing of the request. But a share moves the
// session onto the new commit, and that commit holds what the session held.
class ShareSearch final : public Search {
public:
    ShareSearch(const InterfaceRef<IZOCDataServer>& inServer, const ShareAttempt& inAttempt,
                const OwnCommitCompletion& inCompletion)
        : Search(inServer, inCompletion), mAttempt(inAttempt) {}

private:
    bool LooksPromising() override {
        const ImmutableString commit = mSession->GetLoadedRevision();
        return !commit.empty() && commit == mSession->GetBaseCommit() && commit != mAttempt.commit;
    }
    bool IsTheOne(const InterfaceRef<IZOCHistoryVersion>& inVersion) override {
        return inVersion->GetRevision() == mSession->GetLoadedRevision() &&
               inVersion->GetUserID() == mServer->GetLoginData().username &&
               TitleOf(inVersion) == mAttempt.message;
    }
    int LongestSearch() const override { return 1; }
    void OnVersionFound() override {
        const InterfaceRef<IZOCDifferences> differences = MakeDifferences();
        const auto resource = RFL::QueryInterface<IZOCServerResource>(differences);
        const auto onLoaded = [self = shared_from_this(), this, differences](
                                  const Guid&, int inResult, const InterfaceRef<IZOCServerResource>& inLoaded,
                                  const shared_ptr<ostnet::Response>&) {
            End(inResult >= 0 && inLoaded && inLoaded->IsLoaded() && !differences->HasDifferences());
        };
        if (!resource || !resource->Load(Guid::CreateUnique(), onLoaded, true)) {
            End(false);
        }
    }
    InterfaceRef<IZOCDifferences> MakeDifferences() const {
        CollaborationFactory* const factory = GetCompositionRoot().collaboration;
        const ImmutableString url =
            ExpandTemplate(mServer->GetLink(kRelation_Productions_Production_DifferenceByCommit),
                           {{"{productionId}", mSession->GetIdentifier()},
                            {"{baseCommitId}", mAttempt.commit},
                            {"{commitId}", mSession->GetLoadedRevision()}});
        return factory && !url.empty() ? factory->MakeDifferences(url, mServer) : nullptr;
    }

    const ShareAttempt mAttempt;
};

}  // namespace

void FindOwnCommit(const ImmutableString& inSessionURL, const InterfaceRef<IZOCDataServer>& inServer,
                   const Guid& inRequestID, const OwnCommitCompletion& inCompletion) {
    boost::make_shared<CommitSearch>(inServer, inRequestID, inCompletion)->Start(inSessionURL);
}

void FindOwnShare(const ImmutableString& inSessionURL, const InterfaceRef<IZOCDataServer>& inServer,
                  const ShareAttempt& inAttempt, const OwnCommitCompletion& inCompletion) {
    boost::make_shared<ShareSearch>(inServer, inAttempt, inCompletion)->Start(inSessionURL);
}

}  // namespace ZOCL
