// Lists, finds and loads productions through the library's asynchronous calls.
#include "Productions.h"

#include <algorithm>
#include <set>

#include "Failure.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;
using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;
using Entry = ZOCL::IZOCProductionList::Entry;

// A list that names itself as its next page must not keep us for ever.
constexpr std::size_t kMaximumPages = 100000;

bool IsURL(const std::string& inText) {
    return inText.compare(0, 7, "http://") == 0 || inText.compare(0, 8, "https://") == 0;
}

// Identifiers are opaque, but they are never such that they could change the URL they are put into.
bool CouldBeIdentifier(const std::string& inText) {
    return !inText.empty() && std::all_of(inText.begin(), inText.end(), [](char inCharacter) {
        return (inCharacter >= '0' && inCharacter <= '9') || (inCharacter >= 'a' && inCharacter <= 'z') ||
               (inCharacter >= 'A' && inCharacter <= 'Z') || inCharacter == '-' || inCharacter == '_';
    });
}

Failure NoSuchProduction(Context& ioContext, const std::string& inWhich) {
    return Failure(ExitCode::NotFound,
                   "there is no production '" + inWhich + "' at " + ioContext.ConnectedTarget().server +
                       " that " + ioContext.ConnectedTarget().user + " may see",
                   "run 'zo productions' for the names and identifiers");
}

// The entry that is meant; null when there is none. Throws when a name is that of several.
const Entry* FindEntry(const std::vector<Entry>& inEntries, const std::string& inWhich) {
    const Entry* found = nullptr;
    for (const Entry& entry : inEntries) {
        if (entry.identifier.view() == inWhich) {
            return &entry;
        }
    }
    for (const Entry& entry : inEntries) {
        if (ToUTF8(entry.name) != inWhich) {
            continue;
        }
        if (found) {
            throw Failure(ExitCode::Usage, "several productions have the name '" + inWhich + "'",
                          "name it by its identifier; 'zo productions' shows them");
        }
        found = &entry;
    }
    return found;
}

LoadedProduction LoadByURL(Context& ioContext, const std::string& inURL) {
    const auto server = ioContext.Server();
    const std::string base = ioContext.ConnectedTarget().server + "/";
    if (inURL.compare(0, base.size(), base) != 0) {
        throw Failure(ExitCode::Usage, inURL + " does not lie at " + ioContext.ConnectedTarget().server,
                      "sign in to that hub first with 'zo login'");
    }
    const Outcome outcome = ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return server->LoadProductionFromURL(ImmutableString(inURL), inRequest, inCompletion);
        },
        [&](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
    const auto production = RFL::QueryInterface<ZOCL::IZOCProduction>(outcome.resource);
    if (!outcome.Succeeded() || !production || production->GetIdentifier().empty()) {
        throw Failure::OfRequest("loading the production at " + inURL,
                                 outcome.Succeeded() ? ZOCL::kResultFailure : outcome.result,
                                 outcome.response);
    }
    return DescribeProduction(production);
}

}  // namespace

void CheckIsCommit(const std::string& inText) {
    if (!CouldBeIdentifier(inText)) {
        throw Failure(ExitCode::Usage, "'" + inText + "' is no commit",
                      "'zo show' and 'zo history' tell commits");
    }
}

LoadedProduction DescribeProduction(const InterfaceRef<ZOCL::IZOCProduction>& inProduction) {
    LoadedProduction loaded;
    loaded.production = inProduction;
    loaded.id = inProduction->GetIdentifier().str();
    loaded.name = ToUTF8(inProduction->GetName());
    loaded.commit = inProduction->GetLoadedRevision().str();
    loaded.url = RFL::QueryInterface<ZOCL::IZOCServerResource>(inProduction)->GetHTTPURL().str();
    return loaded;
}

void LoadResource(Context& ioContext, const InterfaceRef<ZOCL::IZOCServerResource>& inResource,
                  const std::string& inWhat) {
    if (!inResource) {
        throw Failure(ExitCode::Failure, inWhat + ": the hub offers no such thing",
                      "the hub may be older than this program");
    }
    const Outcome outcome = ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return inResource->Load(inRequest, inCompletion, false);
        },
        [&](const ZOCL::Guid& inRequest) { inResource->TryToCancelRequest(inRequest); });
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest(inWhat, outcome.result, outcome.response);
    }
    if (!inResource->IsLoaded()) {
        throw Failure(ExitCode::Failure, inWhat + ": the hub's answer is not what it should be",
                      "the hub and this program may be of different versions");
    }
}

std::vector<Entry> ListProductions(Context& ioContext, ListKind inKind) {
    const auto server = ioContext.Server();
    const std::string what =
        inKind == ListKind::Templates ? "listing the templates" : "listing the productions";
    InterfaceRef<ZOCL::IZOCProductionList> page = inKind == ListKind::Templates
                                                      ? server->GetProductionTemplateList(false)
                                                      : server->GetProductionList(false);
    std::vector<Entry> entries;
    for (std::size_t pages = 0; pages == 0 || (page && pages < kMaximumPages); ++pages) {
        LoadResource(ioContext, page, what + " of " + ioContext.ConnectedTarget().server);
        const std::vector<Entry> items = page->GetAllItems();
        entries.insert(entries.end(), items.begin(), items.end());
        page = page->GetNextPage();
    }
    return entries;
}

LoadedProduction LoadProduction(Context& ioContext, const std::string& inWhich, const std::string& inCommit) {
    if (IsURL(inWhich)) {
        const LoadedProduction loaded = LoadByURL(ioContext, inWhich);
        return inCommit.empty() ? loaded : LoadProductionAt(ioContext, loaded.id, inCommit);
    }
    const std::vector<Entry> entries = ListProductions(ioContext, ListKind::Productions);
    if (const Entry* entry = FindEntry(entries, inWhich)) {
        return LoadProductionAt(ioContext, entry->identifier.str(), inCommit);
    }
    // One that is not listed may still exist; the hub then says why it cannot be had.
    if (CouldBeIdentifier(inWhich)) {
        try {
            return LoadProductionAt(ioContext, inWhich, inCommit);
        } catch (const Failure& failure) {
            if (failure.Code() != ExitCode::NotFound) {
                throw;
            }
        }
    }
    throw NoSuchProduction(ioContext, inWhich);
}

LoadedProduction LoadProductionAt(Context& ioContext, const std::string& inID, const std::string& inCommit) {
    if (!inCommit.empty()) {
        CheckIsCommit(inCommit);
    }
    const auto production =
        ioContext.Server()->GetProductionByIdAndCommitId(ImmutableString(inID), ImmutableString(inCommit));
    LoadResource(ioContext, production,
                 "loading the production " + inID + (inCommit.empty() ? "" : " at commit " + inCommit));
    return DescribeProduction(production);
}

LoadedProduction LoadOpenProduction(Context& ioContext) {
    ioContext.Server();
    const Target& target = ioContext.ConnectedTarget();
    const auto open = ioContext.Remembered().Open(target.server, target.user);
    if (!open) {
        throw Failure(ExitCode::NotFound, target.user + " has no production open at " + target.server,
                      "run 'zo open PRODUCTION'; 'zo productions' lists them");
    }
    return LoadProductionAt(ioContext, open->production, open->commit);
}

LoadedProduction LoadLatestVersion(Context& ioContext, const LoadedProduction& inProduction) {
    const auto latest = inProduction.production->GetLatestVersion();
    if (!latest) {
        return {};
    }
    LoadResource(ioContext, latest, "loading the latest version of " + inProduction.name);
    return DescribeProduction(latest);
}

void RememberOpen(Context& ioContext, const LoadedProduction& inProduction) {
    const Target& target = ioContext.ConnectedTarget();
    ioContext.Remembered().SetOpen(
        {target.server, target.user, inProduction.id, inProduction.name, inProduction.commit, "", "", ""});
}

}  // namespace zo
