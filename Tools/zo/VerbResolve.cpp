// conflicts, resolve: what both sides have changed, and which side is to stay.
#include <set>

#include "Conflicts.h"
#include "Failure.h"
#include "GuidedFlow.h"
#include "ostcore/serialization/JSON.h"
#include "ostcore/utility/StringConversion.h"
#include "ostnet/HeaderConstants.h"
#include "Payloads.h"
#include "Verbs.h"
#include "WriteLock.h"
#include "Writing.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ZOCL::ImmutableString;

enum class Decision { Mine, Theirs, Copy };

Decision DecisionOf(const Arguments& inArgs) {
    if (inArgs.Has("mine") + inArgs.Has("theirs") + inArgs.Has("copy") != 1) {
        throw Failure(ExitCode::Usage, "resolve takes one of --mine, --theirs and --copy",
                      "'zo conflicts' shows both sides");
    }
    return inArgs.Has("mine") ? Decision::Mine : inArgs.Has("theirs") ? Decision::Theirs : Decision::Copy;
}

// By name or identifier of the asset, by name of the enclosure, or "production" for its properties.
bool IsNamed(const Conflict& inConflict, const std::string& inWord) {
    if (inConflict.key.kind == ItemKind::Properties) {
        return inWord == "production";
    }
    const bool isAsset =
        !inConflict.key.assetID.empty() && (inConflict.key.assetID == inWord || inConflict.asset == inWord);
    return isAsset || (inConflict.key.kind == ItemKind::Enclosure && inConflict.key.name == inWord);
}

std::vector<Conflict> Chosen(const Arguments& inArgs, const std::vector<Conflict>& inAll) {
    const std::vector<std::string> words = inArgs.PositionalsFrom(0);
    if (words.empty() != inArgs.Has("all")) {
        throw Failure(ExitCode::Usage, "resolve takes either items or --all",
                      "'zo conflicts' lists the items; 'production' stands for its properties");
    }
    if (words.empty()) {
        return inAll;
    }
    std::vector<Conflict> chosen;
    std::set<ItemKey> seen;
    for (const std::string& word : words) {
        bool isKnown = false;
        for (const Conflict& conflict : inAll) {
            if (IsNamed(conflict, word)) {
                isKnown = true;
                // Two words may mean the same item.
                if (seen.insert(conflict.key).second) {
                    chosen.push_back(conflict);
                }
            }
        }
        if (!isKnown) {
            throw Failure(ExitCode::NotFound, "nothing of the name '" + word + "' is in conflict",
                          "'zo conflicts' lists what is");
        }
    }
    return chosen;
}

// --- Copies of my side

// The asset as it is in the session, with all that hangs on it, becomes a second asset.
class AssetCopy {
public:
    AssetCopy(Context& ioContext, const WorkSession& inSession, const OpenTransaction& inTransaction)
        : mContext(ioContext), mTransaction(inTransaction), mList(LoadAssetList(ioContext, inSession.view)) {}

    /// The new asset's name; empty when the session has removed the asset, so that there is nothing to keep.
    std::string Make(const std::string& inAssetID) {
        const auto items = mList->GetAllItems();
        for (const AssetItem& item : items) {
            if (item.assetIdentifier.view() == inAssetID) {
                return Copy(LoadDetails(mContext, mList, {item}, Locators::Leave).front());
            }
        }
        return {};
    }

private:
    std::string Copy(const AssetDetails& inMine) {
        ZOCL::AssetBaseProperties properties = inMine.asset->GetAssetBaseProperties();
        const std::string name =
            ostcore::utility::ToUTF8(properties.name) + " (" + mContext.ConnectedTarget().user + "'s copy)";
        properties.name = ToUTF16(name);
        ZOCL::SubClip subClip;
        const bool isSubClip = inMine.asset->GetSubClip(subClip);
        const Outcome made = RunRequest(
            mContext, "keeping a copy as " + name,
            [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                return isSubClip
                           ? mTransaction.transaction->CreateNewAsset(inRequest, inCompletion, properties,
                                                                      subClip)
                           : mTransaction.transaction->CreateNewAsset(inRequest, inCompletion, properties);
            });
        NamedAsset copy;
        copy.asset = RFL::QueryInterface<ZOCL::IZOCAsset>(made.resource);
        copy.name = name;
        CopyEnclosures(inMine, copy);
        CopyRenditions(inMine, RFL::QueryInterface<ZOCL::IZOCWritableAsset>(made.resource), name);
        return name;
    }

    void CopyEnclosures(const AssetDetails& inMine, const NamedAsset& inCopy) {
        for (const EnclosureText& text : EnclosuresOf(inMine.enclosures)) {
            const auto enclosure = inMine.enclosures->GetEnclosure(ImmutableString(text.name));
            RunRequest(mContext, "reading the enclosure " + text.name,
                       [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                           return enclosure->LoadEnclosureData(inRequest, inCompletion);
                       });
            WriteAssetEnclosure(mContext, inCopy, text.name, enclosure->GetEnclosurePayload());
        }
    }

    void CopyRenditions(const AssetDetails& inMine, const ZOCL::InterfaceRef<ZOCL::IZOCWritableAsset>& inCopy,
                        const std::string& inName) {
        const auto server = mContext.Server();
        for (const RenditionText& text : RenditionsOf(inMine.renditions)) {
            const auto payload = inMine.renditions->FindRendition(text.flavour)->GetPayloadResource(false);
            LoadResource(mContext, payload, "reading the rendition " + text.flavour);
            RunRequest(mContext, "writing the rendition " + text.flavour + " of " + inName,
                       [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                           return inCopy &&
                                  ZOCL::IZOCWritableRenditions::CreateRendition(
                                      server, inCopy->GetRenditionFactoryURL(), ImmutableString(text.flavour),
                                      payload->GetResponseData(), inRequest, inCompletion);
                       });
        }
    }

    Context& mContext;
    const OpenTransaction& mTransaction;
    const ZOCL::InterfaceRef<ZOCL::IZOCAssetList> mList;
};

void RefuseCopiesOfProduction(const std::vector<Conflict>& inChosen) {
    for (const Conflict& conflict : inChosen) {
        if (conflict.key.assetID.empty()) {
            throw Failure(ExitCode::Usage, "there can be no copy of " + conflict.text,
                          "decide it with --mine or --theirs, and name the others for --copy");
        }
    }
}

// All copies in one transaction; gives the session's new commit.
std::string KeepCopies(Context& ioContext, const WorkSession& inSession,
                       const std::vector<Conflict>& inChosen, std::map<std::string, std::string>& outNames) {
    WritePlan plan;
    plan.message = "Kept copies of what was in conflict";
    return WriteQuietly(ioContext, inSession, plan, [&](const OpenTransaction& inTransaction) {
        AssetCopy copies(ioContext, inSession, inTransaction);
        for (const Conflict& conflict : inChosen) {
            if (outNames.count(conflict.key.assetID) == 0) {
                outNames[conflict.key.assetID] = copies.Make(conflict.key.assetID);
            }
        }
    });
}

// --- Deciding

// Posts the decision of one item; the session's commit goes in, and the next one comes out.
std::string Accept(Context& ioContext, const WorkSession& inSession, const Conflict& inConflict,
                   Decision inDecision, const std::string& inCommit) {
    const std::string what = "deciding the conflict of " + inConflict.text;
    const std::string url =
        inDecision == Decision::Mine ? inConflict.acceptMineURL : inConflict.acceptTheirsURL;
    if (url.empty()) {
        throw Failure(ExitCode::Failure, what + ": the hub offers no such decision",
                      "'zo conflicts' shows how it stands now");
    }
    auto body = ostcore::serialization::JSONValue::EmptyObject();
    ostcore::serialization::AddToObject(body, ":commitId", inCommit);
    const auto bytes =
        ostcore::utility::RecycledMemory::CreateFromBytes(ostcore::serialization::GetJSONUTF8String(body));
    const auto server = ioContext.Server();
    const Outcome outcome = ioContext.Loop().Run(
        [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
            return server->PostToURL(ImmutableString(url), bytes,
                                     ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, inRequest,
                                     inCompletion);
        },
        [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
    if (outcome.result == ZOCL::kResultHTTPPreconditionFailed) {
        throw SessionMoved(ioContext, inSession, what, inCommit);
    }
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest(what, outcome.result, outcome.response);
    }
    return TextInAnswer(outcome.response, "zo:commitId");
}

const char* NameOf(Decision inDecision) {
    return inDecision == Decision::Mine ? "mine" : inDecision == Decision::Theirs ? "theirs" : "copy";
}

void TellDecided(Context& ioContext, const Conflict& inConflict, Decision inDecision,
                 const std::string& inCopy, bool inDryRun) {
    Json json = ConflictJson(inConflict, inDryRun ? "open" : "resolved");
    json.Set("decision", NameOf(inDecision)).Set("copy", inCopy).Set("dryRun", inDryRun);
    ioContext.Out().Record(json);
    const std::string taken = inDecision == Decision::Mine ? "kept mine" : "took theirs";
    ioContext.Out().Say((inDryRun ? "would have " : "") + taken + ": " + inConflict.text +
                        (inCopy.empty() ? "" : "; mine is kept as '" + inCopy + "'"));
}

void Decide(Context& ioContext, const WorkSession& inSession, const std::vector<Conflict>& inChosen,
            Decision inDecision, std::size_t inAll) {
    std::string commit = inSession.view.commit;
    std::map<std::string, std::string> copies;
    if (inDecision == Decision::Copy) {
        commit = KeepCopies(ioContext, inSession, inChosen, copies);
    }
    std::size_t done = 0;
    try {
        for (const Conflict& conflict : inChosen) {
            commit = Accept(ioContext, inSession, conflict, inDecision, commit);
            ChangeOpen(ioContext, [&](OpenRecord& ioRecord) { ioRecord.seenCommit = commit; });
            const auto copy = copies.find(conflict.key.assetID);
            TellDecided(ioContext, conflict, inDecision, copy == copies.end() ? "" : copy->second, false);
            ++done;
        }
    } catch (const Failure& failure) {
        if (done == 0) {
            throw;
        }
        ioContext.Out().Error(failure);
        throw Failure(
            failure.Code() == ExitCode::Cancelled ? ExitCode::Cancelled : ExitCode::PartlyDone,
            std::to_string(done) + " of " + std::to_string(inChosen.size()) + " conflicts were decided",
            "'zo conflicts' lists those that remain");
    }
    if (done < inAll) {
        throw Failure(
            ExitCode::ConflictsRemain,
            std::to_string(inAll - done) + (inAll - done == 1 ? " conflict remains" : " conflicts remain"),
            "'zo conflicts' lists them");
    }
    ioContext.Out().Say("no conflict remains; share with 'zo share'");
}

void ResolveOnTheWay(Context& ioContext) {
    RefuseWithOpenTransaction(ioContext, "resolving");
    const WriteLock lock(ioContext);
    WorkSession session = RequireSession(ioContext);
    ResolveWithUser(ioContext, session);
}

}  // namespace

void RunConflicts(Context& ioContext) {
    const WorkSession session = RequireSession(ioContext);
    const std::vector<Conflict> conflicts = LoadOpenConflicts(ioContext, session);
    for (const Conflict& conflict : conflicts) {
        ioContext.Out().Record(ConflictJson(conflict, "open"));
    }
    if (conflicts.empty()) {
        return ioContext.Out().Note("nothing is in conflict");
    }
    PrintConflicts(ioContext, conflicts);
    throw Failure(ExitCode::ConflictsRemain,
                  std::to_string(conflicts.size()) +
                      (conflicts.size() == 1 ? " conflict is" : " conflicts are") + " to be decided",
                  "'zo resolve --mine|--theirs|--copy ITEM' decides one");
}

void RunResolve(Context& ioContext) {
    const bool isDecided = !ioContext.Args().PositionalsFrom(0).empty();
    if (isDecided && ioContext.Args().Has("interactive")) {
        throw Failure(ExitCode::Usage, "with --interactive the items are chosen on the way",
                      "leave out the items, or --interactive");
    }
    if (AsksOnTheWay(ioContext, isDecided ? Asks::WhenTold : Asks::Usually,
                     {"mine", "theirs", "copy", "all"})) {
        return ResolveOnTheWay(ioContext);
    }
    const Decision decision = DecisionOf(ioContext.Args());
    RefuseWithOpenTransaction(ioContext, "resolving");
    const WriteLock lock(ioContext);
    const WorkSession session = RequireSession(ioContext);
    const std::vector<Conflict> all = LoadOpenConflicts(ioContext, session);
    const std::vector<Conflict> chosen = Chosen(ioContext.Args(), all);
    if (decision == Decision::Copy) {
        RefuseCopiesOfProduction(chosen);
    }
    if (chosen.empty()) {
        return ioContext.Out().Note("nothing is in conflict");
    }
    if (ioContext.Args().Has("dry-run")) {
        for (const Conflict& conflict : chosen) {
            TellDecided(ioContext, conflict, decision, "", true);
        }
        return;
    }
    Decide(ioContext, session, chosen, decision, all.size());
}

}  // namespace zo
