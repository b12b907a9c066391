// set, put, rm: single changes, each in a transaction of its own unless one was left open.
#include "Failure.h"
#include "ostcore/utility/StringConversion.h"
#include "Payloads.h"
#include "Verbs.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF16;
using ostcore::utility::ToUTF8;
using ZOCL::ImmutableString;

// --- set

struct Assignment {
    std::string key;
    std::string value;
};

std::vector<Assignment> AssignmentsOf(const Arguments& inArgs) {
    std::vector<Assignment> all;
    for (const std::string& word : inArgs.PositionalsFrom(0)) {
        const std::size_t equals = word.find('=');
        if (equals == std::string::npos || equals == 0) {
            throw Failure(ExitCode::Usage, "'" + word + "' is not of the form KEY=VALUE",
                          "for instance: zo set --asset clip01 name='Clip 1'");
        }
        all.push_back({word.substr(0, equals), word.substr(equals + 1)});
    }
    return all;
}

std::vector<ImmutableString> TagsOf(const std::string& inText) {
    std::vector<ImmutableString> tags;
    for (std::size_t begin = 0; begin <= inText.size();) {
        const std::size_t end = std::min(inText.find(',', begin), inText.size());
        if (end > begin) {
            tags.emplace_back(inText.substr(begin, end - begin));
        }
        begin = end + 1;
    }
    return tags;
}

void CheckKeys(const std::vector<Assignment>& inAll, std::initializer_list<const char*> inKnown,
               const std::string& inOf) {
    for (const Assignment& one : inAll) {
        std::string known;
        bool isKnown = false;
        for (const char* key : inKnown) {
            isKnown = isKnown || one.key == key;
            known += (known.empty() ? "" : ", ") + std::string(key);
        }
        if (!isKnown) {
            throw Failure(ExitCode::Usage, inOf + " has no property '" + one.key + "' that can be set",
                          "it is one of " + known);
        }
    }
}

void CheckAssignments(const std::vector<Assignment>& inAll, bool inOfAsset) {
    if (inOfAsset) {
        CheckKeys(inAll, {"name", "description", "parent", "type", "tags"}, "an asset");
    } else {
        CheckKeys(inAll, {"name", "description"}, "a production");
    }
    for (const Assignment& one : inAll) {
        if (one.key == "name" && one.value.empty()) {
            throw Failure(ExitCode::Usage, "a name cannot be empty");
        }
    }
}

ZOCL::AssetBaseProperties Changed(Context& ioContext, const LoadedProduction& inView,
                                  ZOCL::AssetBaseProperties inProperties,
                                  const std::vector<Assignment>& inAll) {
    for (const Assignment& one : inAll) {
        if (one.key == "name") {
            inProperties.name = ToUTF16(one.value);
        } else if (one.key == "description") {
            inProperties.description = ToUTF16(one.value);
        } else if (one.key == "type") {
            inProperties.assetType = ImmutableString(one.value);
        } else if (one.key == "tags") {
            inProperties.tags = TagsOf(one.value);
        } else {
            inProperties.parent = one.value.empty()
                                      ? ImmutableString()
                                      : LoadNamedAsset(ioContext, inView, one.value).item.assetIdentifier;
        }
    }
    return inProperties;
}

Written SetOf(const std::vector<Assignment>& inAll, const std::string& inID, const std::string& inName) {
    Written written;
    for (const Assignment& one : inAll) {
        Json json("set");
        json.Set("assetId", inID).Set("name", inName).Set("key", one.key).Set("value", one.value);
        written.Add(json, "set " + one.key + " of " + inName + " to '" + one.value + "'");
    }
    return written;
}

Written SetAsset(Context& ioContext, const LoadedProduction& inView, const std::vector<Assignment>& inAll,
                 bool inWrite) {
    const NamedAsset named = LoadNamedAsset(ioContext, inView, *ioContext.Args().Value("asset"));
    const auto properties = Changed(ioContext, inView, named.asset->GetAssetBaseProperties(), inAll);
    if (inWrite) {
        const auto writable = RFL::QueryInterface<ZOCL::IZOCWritableAsset>(named.asset);
        RunRequest(ioContext, "changing the asset " + named.name,
                   [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                       return writable &&
                              writable->SetAssetBasePropertiesAndUpdate(properties, inRequest, inCompletion);
                   });
    }
    return SetOf(inAll, named.item.assetIdentifier.str(), named.name);
}

Written SetProduction(Context& ioContext, const WorkSession& inSession, const OpenTransaction& inTransaction,
                      const std::vector<Assignment>& inAll) {
    for (const Assignment& one : inAll) {
        if (one.key == "name") {
            inSession.view.production->SetName(ToUTF16(one.value));
        } else {
            inSession.view.production->SetDescription(ToUTF16(one.value));
        }
    }
    RunRequest(ioContext, "changing the production " + inSession.productionName,
               [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                   return inSession.session->StoreProductionChangesInTransaction(
                       inTransaction.transaction, [inRequest, inCompletion](int inResult) {
                           inCompletion(inRequest, inResult, nullptr, nullptr);
                       });
               });
    return SetOf(inAll, "", inSession.productionName);
}

// --- put

Json EnclosureJson(const char* inType, const NamedAsset* inAsset, const std::string& inName,
                   std::uint64_t inBytes) {
    Json json(inType);
    json.Set("kind", "enclosure")
        .Set("assetId", inAsset ? inAsset->item.assetIdentifier.str() : std::string())
        .Set("asset", inAsset ? inAsset->name : std::string());
    return json.Set("name", inName).Set("bytes", inBytes);
}

Written Put(Context& ioContext, const LoadedProduction& inView, const OpenTransaction* inTransaction,
            const Payload& inPayload) {
    const Arguments& args = ioContext.Args();
    const std::string name = *args.Value("enclosure");
    Written written;
    const std::uint64_t bytes = inPayload->view().size();
    const auto asset = args.Value("asset");
    if (asset) {
        const NamedAsset named = LoadNamedAsset(ioContext, inView, *asset);
        if (inTransaction) {
            WriteAssetEnclosure(ioContext, named, name, inPayload);
        }
        written.Add(
            EnclosureJson("put", &named, name, bytes),
            "put the enclosure " + name + " of " + named.name + " (" + std::to_string(bytes) + " bytes)");
    } else {
        if (inTransaction) {
            WriteProductionEnclosure(ioContext, *inTransaction, name, inPayload);
        }
        written.Add(EnclosureJson("put", nullptr, name, bytes),
                    "put the enclosure " + name + " of the production (" + std::to_string(bytes) + " bytes)");
    }
    return written;
}

// --- rm

void Delete(Context& ioContext, const ZOCL::InterfaceRef<ZOCL::IZOCWritableServerResource>& inResource,
            const std::string& inWhat) {
    RunRequest(ioContext, inWhat,
               [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                   return inResource && inResource->Delete(inRequest, inCompletion);
               });
}

template <class T>
ZOCL::InterfaceRef<ZOCL::IZOCWritableServerResource> Writable(const ZOCL::InterfaceRef<T>& inObject) {
    return RFL::QueryInterface<ZOCL::IZOCWritableServerResource>(inObject);
}

Written RemoveEnclosure(Context& ioContext, const LoadedProduction& inView, const std::string& inName,
                        bool inWrite) {
    const auto which = ioContext.Args().Positional(0);
    NamedAsset named;
    auto enclosures = inView.production->GetEnclosures();
    std::string of = inView.name;
    if (which) {
        named = LoadNamedAsset(ioContext, inView, *which);
        enclosures = named.asset->GetEnclosures();
        of = named.name;
    }
    LoadResource(ioContext, enclosures, "loading the enclosures of " + of);
    const auto enclosure = enclosures->GetEnclosure(ImmutableString(inName));
    if (!enclosure) {
        throw Failure(ExitCode::NotFound, of + " has no enclosure " + inName,
                      "'zo show' and 'zo assets --long' list them");
    }
    if (inWrite) {
        Delete(ioContext, Writable(enclosure), "removing the enclosure " + inName + " of " + of);
    }
    Written written;
    written.Add(EnclosureJson("removed", which ? &named : nullptr, inName, 0),
                "removed the enclosure " + inName + " of " + of);
    return written;
}

Written RemoveAssets(Context& ioContext, const LoadedProduction& inView, bool inWrite) {
    Written written;
    std::vector<NamedAsset> all;
    for (const std::string& which : ioContext.Args().PositionalsFrom(0)) {
        all.push_back(LoadNamedAsset(ioContext, inView, which));
    }
    for (const NamedAsset& named : all) {
        if (inWrite) {
            Delete(ioContext, Writable(named.asset), "removing the asset " + named.name);
        }
        Json json("removed");
        json.Set("kind", "asset").Set("assetId", named.item.assetIdentifier).Set("asset", named.name);
        written.Add(json.Set("name", "").Set("bytes", 0), "removed the asset " + named.name);
    }
    return written;
}

Written Remove(Context& ioContext, const LoadedProduction& inView, bool inWrite) {
    const auto enclosure = ioContext.Args().Value("enclosure");
    return enclosure ? RemoveEnclosure(ioContext, inView, *enclosure, inWrite)
                     : RemoveAssets(ioContext, inView, inWrite);
}

}  // namespace

void RunSet(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const std::vector<Assignment> all = AssignmentsOf(args);
    const bool ofAsset = args.Has("asset");
    CheckAssignments(all, ofAsset);
    if (args.Has("dry-run")) {
        const LoadedProduction view = LoadForReading(ioContext);
        return TellDryRun(ioContext,
                          ofAsset ? SetAsset(ioContext, view, all, false) : SetOf(all, "", view.name));
    }
    WritePlan plan;
    plan.message = "Changed " + (ofAsset ? *args.Value("asset") : std::string("the production's properties"));
    Write(ioContext, plan, [&](const WorkSession& inSession, const OpenTransaction& inTransaction) {
        return ofAsset ? SetAsset(ioContext, inTransaction.view, all, true)
                       : SetProduction(ioContext, inSession, inTransaction, all);
    });
}

void RunPut(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    if (!args.Has("enclosure")) {
        throw Failure(ExitCode::Usage, "no enclosure is named", "give --enclosure NAME");
    }
    const Payload payload = ReadPayload(*args.Positional(0));
    if (args.Has("dry-run")) {
        return TellDryRun(ioContext, Put(ioContext, LoadForReading(ioContext), nullptr, payload));
    }
    WritePlan plan;
    plan.message = "Put " + *args.Value("enclosure");
    Write(ioContext, plan, [&](const WorkSession&, const OpenTransaction& inTransaction) {
        return Put(ioContext, inTransaction.view, &inTransaction, payload);
    });
}

void RunRemove(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const std::size_t named = args.PositionalsFrom(0).size();
    if (named == 0 && !args.Has("enclosure")) {
        throw Failure(ExitCode::Usage, "nothing is named that could be removed",
                      "name assets, or an enclosure with --enclosure");
    }
    if (named > 1 && args.Has("enclosure")) {
        throw Failure(ExitCode::Usage, "--enclosure takes one asset at most");
    }
    if (args.Has("dry-run")) {
        return TellDryRun(ioContext, Remove(ioContext, LoadForReading(ioContext), false));
    }
    WritePlan plan;
    plan.message =
        "Removed " + args.Value("enclosure")
                         .value_or(named == 1 ? *args.Positional(0) : std::to_string(named) + " assets");
    Write(ioContext, plan, [&](const WorkSession&, const OpenTransaction& inTransaction) {
        return Remove(ioContext, inTransaction.view, true);
    });
}

}  // namespace zo
