// Finds the session by what is remembered, else by the production's list of sessions.
#include "Sessions.h"

#include "Failure.h"
#include "ostcore/serialization/JSON.h"
#include "ostcore/utility/StringConversion.h"
#include "ZOClient/CommitMetadata.h"
#include "ZOClient/IZOCUser.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;
using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;

constexpr std::size_t kMaximumPages = 1000;

std::string UserID(Context& ioContext) {
    const auto user = ioContext.Server()->GetLoggedInUser();
    LoadResource(ioContext, user, "asking " + ioContext.ConnectedTarget().server + " who is signed in");
    return user->GetUserID().str();
}

// The address of the user's own session among all that the user may see; empty when there is none.
std::string FindSessionURL(Context& ioContext, const LoadedProduction& inProduction) {
    const std::string what = "listing the sessions on " + inProduction.name;
    auto page = inProduction.production->GetEditingSessions();
    std::string user;
    for (std::size_t pages = 0; page && pages < kMaximumPages; ++pages) {
        LoadResource(ioContext, page, what);
        for (const auto& entry : page->GetAllItems()) {
            user = user.empty() ? UserID(ioContext) : user;
            if (entry.owner.view() == user && !entry.url.empty()) {
                return entry.url.str();
            }
        }
        page = page->GetNextPage();
    }
    return {};
}

WorkSession Describe(const LoadedProduction& inView, const OpenRecord& inOpen) {
    WorkSession session;
    session.view = inView;
    session.session = RFL::QueryInterface<ZOCL::IZOCEditingSession>(inView.production);
    session.productionID = inOpen.production;
    session.productionName = inOpen.name;
    return session;
}

bool IsSessionOf(const LoadedProduction& inView, const OpenRecord& inOpen) {
    const auto session = RFL::QueryInterface<ZOCL::IZOCEditingSession>(inView.production);
    return session && inView.production->IsEditingSession() &&
           session->GetParentProductionIdentifier().view() == inOpen.production;
}

// What stands at a remembered address; nothing when it is gone.
std::optional<LoadedProduction> LoadIfThere(Context& ioContext, const std::string& inURL,
                                            const std::string& inWhat) {
    try {
        return LoadByHubURL(ioContext, inURL, inWhat);
    } catch (const Failure& failure) {
        if (failure.Code() != ExitCode::NotFound) {
            throw;
        }
        return std::nullopt;
    }
}

std::optional<WorkSession> FindRemembered(Context& ioContext, const OpenRecord& inOpen) {
    if (inOpen.session.empty()) {
        return std::nullopt;
    }
    const auto view = LoadIfThere(ioContext, inOpen.session, "loading the session on " + inOpen.name);
    return view && IsSessionOf(*view, inOpen) ? std::optional(Describe(*view, inOpen)) : std::nullopt;
}

std::optional<WorkSession> FindListed(Context& ioContext, const OpenRecord& inOpen,
                                      const LoadedProduction& inProduction) {
    const std::string url = FindSessionURL(ioContext, inProduction);
    const auto view =
        url.empty() ? std::nullopt : LoadIfThere(ioContext, url, "loading the session on " + inOpen.name);
    return view ? std::optional(Describe(*view, inOpen)) : std::nullopt;
}

// Who moved the session since a commit, for people; empty when the history does not tell.
std::string WhoMoved(Context& ioContext, const WorkSession& inSession, const std::string& inSeenCommit) {
    InterfaceRef<ZOCL::IZOCHistoryVersion> found;
    ioContext.Loop().RunToEnd([&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
        return ZOCL::FindRecentRevisionWithCommitMetadata(
            inSession.view.production, ImmutableString(inSeenCommit),
            [&found, inRequest, inCompletion](int inResult,
                                              const InterfaceRef<ZOCL::IZOCHistoryVersion>& inVersion) {
                found = inResult >= 0 ? inVersion : nullptr;
                inCompletion(inRequest, inResult, nullptr, nullptr);
            });
    });
    ZOCL::CommitMetadata metadata;
    if (!ZOCL::GetCommitMetadataFromHistoryVersion(found, metadata)) {
        return {};
    }
    const std::string message = ToUTF8(metadata.commitMessage);
    return metadata.metadata.applicationName.str() + " on " + metadata.metadata.machineName.str() + ", " +
           ShortTime(found->GetTime()) + (message.empty() ? "" : ": " + message);
}

}  // namespace

OpenRecord RequireOpen(Context& ioContext) {
    ioContext.Server();
    const Target& target = ioContext.ConnectedTarget();
    const auto open = ioContext.Remembered().Open(target.server, target.user);
    if (!open) {
        throw Failure(ExitCode::NotFound, target.user + " has no production open at " + target.server,
                      "run 'zo open PRODUCTION'; 'zo productions' lists them");
    }
    return *open;
}

void ChangeOpen(Context& ioContext, const std::function<void(OpenRecord&)>& inChange) {
    const Target& target = ioContext.ConnectedTarget();
    ioContext.Remembered().ChangeOpen(target.server, target.user, inChange);
}

std::optional<WorkSession> FindSession(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    if (auto remembered = FindRemembered(ioContext, open)) {
        return remembered;
    }
    return FindListed(ioContext, open, LoadProductionAt(ioContext, open.production, ""));
}

WorkSession RequireSession(Context& ioContext) {
    auto session = FindSession(ioContext);
    if (!session) {
        throw Failure(ExitCode::NotFound,
                      ioContext.ConnectedTarget().user + " has no session on " + RequireOpen(ioContext).name,
                      "the first change makes one: 'zo add', 'zo set', 'zo put' or 'zo rm'");
    }
    return *session;
}

WorkSession OpenSession(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    auto session = FindRemembered(ioContext, open);
    if (!session) {
        const LoadedProduction production = LoadProductionAt(ioContext, open.production, "");
        session = FindListed(ioContext, open, production);
        if (!session) {
            const auto name =
                ostcore::utility::ToUTF16(ioContext.ConnectedTarget().user + " on " + open.name);
            const auto made = std::make_shared<InterfaceRef<ZOCL::IZOCEditingSession>>();
            ioContext.Loop().RunBlocking([made, name, parent = production.production] {
                parent->CreateEditingSession(*made, name, ZOCL::UString(), false);
            });
            const auto resource = RFL::QueryInterface<ZOCL::IZOCServerResource>(*made);
            if (!resource) {
                throw Failure(ExitCode::NotPermitted,
                              "making a session on " + open.name + ": the hub gave none",
                              "ask the owner of the production for the right to change it");
            }
            session = Describe(LoadByHubURL(ioContext, resource->GetHTTPURL().str(),
                                            "loading the new session on " + open.name),
                               open);
        }
    }
    RememberSession(ioContext, *session);
    return *session;
}

void RememberSession(Context& ioContext, const WorkSession& inSession) {
    ChangeOpen(ioContext, [&](OpenRecord& ioRecord) {
        ioRecord.session = inSession.view.url;
        ioRecord.seenCommit = inSession.view.commit;
    });
}

std::string SeenCommit(Context& ioContext, const WorkSession& inSession) {
    const OpenRecord open = RequireOpen(ioContext);
    const bool isKnown = open.session == inSession.view.url && !open.seenCommit.empty();
    return isKnown ? open.seenCommit : inSession.view.commit;
}

void RefreshSession(Context& ioContext, WorkSession& ioSession) {
    ioSession.view =
        LoadByHubURL(ioContext, ioSession.view.url, "loading the session on " + ioSession.productionName);
    ioSession.session = RFL::QueryInterface<ZOCL::IZOCEditingSession>(ioSession.view.production);
}

LoadedProduction LoadSharedProduction(Context& ioContext, const WorkSession& inSession) {
    return LoadProductionAt(ioContext, inSession.productionID, "");
}

LoadedProduction LoadByHubURL(Context& ioContext, const std::string& inURL, const std::string& inWhat) {
    const auto server = ioContext.Server();
    const auto run = [&](const StartFunction& inStart) {
        const Outcome outcome = ioContext.Loop().Run(
            inStart, [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
        if (!outcome.Succeeded() && outcome.result != ZOCL::kResultHTTPNotModified) {
            throw Failure::OfRequest(inWhat, outcome.result, outcome.response);
        }
        return outcome;
    };
    const Outcome loaded = run([&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
        return server->LoadProductionFromURL(ImmutableString(inURL), inRequest, inCompletion);
    });
    const auto resource = loaded.resource;
    // Without a response it was loaded before: then its latest state is asked for.
    if (resource && !loaded.response) {
        run([&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return resource->Refresh(inRequest, inCompletion);
        });
    }
    const auto production = RFL::QueryInterface<ZOCL::IZOCProduction>(resource);
    if (!production || !resource->IsLoaded()) {
        throw Failure(ExitCode::Failure, inWhat + ": the hub's answer is not what it should be",
                      "the hub and this program may be of different versions");
    }
    return DescribeProduction(production);
}

LoadedProduction LoadForReading(Context& ioContext) {
    const OpenRecord open = RequireOpen(ioContext);
    if (ioContext.Args().Has("shared") || (open.session.empty() && open.transaction.empty())) {
        return LoadOpenProduction(ioContext);
    }
    if (!open.transaction.empty()) {
        if (const auto view =
                LoadIfThere(ioContext, open.transaction, "loading the open transaction on " + open.name)) {
            return *view;
        }
    }
    if (const auto view = LoadIfThere(ioContext, open.session, "loading the session on " + open.name)) {
        return *view;
    }
    ioContext.Out().Note("the session on " + open.name + " is gone; this is the shared production");
    ChangeOpen(ioContext, [](OpenRecord& ioRecord) { ioRecord.session = ioRecord.seenCommit = ""; });
    return LoadOpenProduction(ioContext);
}

std::string TextInAnswer(const boost::shared_ptr<ostnet::Response>& inResponse, const char* inKey) {
    if (!inResponse || !inResponse->payload) {
        return {};
    }
    try {
        const auto root = ostcore::serialization::JSONParse(inResponse->payload);
        const auto value = ostcore::serialization::JSONView(root).Find(inKey);
        return value.IsString() ? std::string(value.AsString()) : std::string();
    } catch (const std::exception&) {
        return {};
    }
}

Failure SessionMoved(Context& ioContext, const WorkSession& inSession, const std::string& inWhat,
                     const std::string& inSeenCommit) {
    const std::string who = WhoMoved(ioContext, inSession, inSeenCommit);
    return Failure(ExitCode::SessionChanged,
                   inWhat + ": the session on " + inSession.productionName + " was changed from elsewhere" +
                       (who.empty() ? "" : " (" + who + ")"),
                   "look at it with 'zo status' and 'zo diff', then try again");
}

}  // namespace zo
