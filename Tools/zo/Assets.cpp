// Assets and what belongs to them.
#include "Assets.h"

#include <algorithm>
#include <deque>
#include <map>
#include <set>

#include "Failure.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;
using ZOCL::ImmutableString;
using ZOCL::InterfaceRef;

constexpr std::size_t kLoadsAtOnce = 16;

struct Load {
    InterfaceRef<ZOCL::IZOCServerResource> resource;
    std::string what;
    // A thing that may be missing is left unloaded.
    bool mayBeMissing = false;
};

// Loads resources, several at a time, and throws the first failure when all have ended.
class Loader {
public:
    explicit Loader(Context& ioContext) : mContext(ioContext) {}

    template <class T>
    void Add(const InterfaceRef<T>& inObject, const std::string& inWhat, bool inMayBeMissing) {
        const auto resource = RFL::QueryInterface<ZOCL::IZOCServerResource>(inObject);
        if (resource && !resource->IsLoaded() && mSeen.insert(resource.GetUnchecked()).second) {
            mWaiting.push_back({resource, inWhat, inMayBeMissing});
        }
    }

    void Run() {
        mTotal = mWaiting.size();
        StartMore();
        mContext.Loop().Wait();
        if (mFailure) {
            throw Failure(*mFailure);
        }
    }

private:
    void StartMore() {
        while (!mWaiting.empty() && !mFailure && mContext.Loop().InFlight() < kLoadsAtOnce) {
            const Load load = mWaiting.front();
            mWaiting.pop_front();
            mContext.Loop().Start(
                [load](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                    return load.resource->Load(inRequest, inCompletion, false);
                },
                [load](const ZOCL::Guid& inRequest) { load.resource->TryToCancelRequest(inRequest); },
                [this, load](const Outcome& inOutcome) { OnLoaded(load, inOutcome); });
        }
    }

    void OnLoaded(const Load& inLoad, const Outcome& inOutcome) {
        ++mDone;
        const bool missing = ExitCodeFor(inOutcome.result, inOutcome.response) == ExitCode::NotFound;
        if (!inOutcome.Succeeded() && !(missing && inLoad.mayBeMissing) && !mFailure) {
            mFailure = std::make_unique<Failure>(
                Failure::OfRequest(inLoad.what, inOutcome.result, inOutcome.response));
        }
        if (mTotal > kLoadsAtOnce) {
            mContext.Out().Progress("loading", mDone, mTotal, 0);
        }
        StartMore();
    }

    Context& mContext;
    std::deque<Load> mWaiting;
    std::set<const void*> mSeen;
    std::unique_ptr<Failure> mFailure;
    std::size_t mDone = 0;
    std::size_t mTotal = 0;
};

}  // namespace

InterfaceRef<ZOCL::IZOCAssetList> LoadAssetList(Context& ioContext, const LoadedProduction& inProduction) {
    const auto list = inProduction.production->GetAssets();
    LoadResource(ioContext, list, "loading the assets of " + inProduction.name);
    return list;
}

const AssetItem& FindAsset(const std::vector<AssetItem>& inItems, const std::string& inWhich,
                           const std::string& inProduction) {
    const AssetItem* found = nullptr;
    for (const AssetItem& item : inItems) {
        if (item.assetIdentifier.view() == inWhich) {
            return item;
        }
    }
    for (const AssetItem& item : inItems) {
        if (ToUTF8(item.name) != inWhich) {
            continue;
        }
        if (found) {
            throw Failure(ExitCode::Usage,
                          "several assets of " + inProduction + " have the name '" + inWhich + "'",
                          "name it by its identifier; 'zo assets' shows them");
        }
        found = &item;
    }
    if (!found) {
        throw Failure(ExitCode::NotFound, "there is no asset '" + inWhich + "' in " + inProduction,
                      "run 'zo assets' for the names and identifiers");
    }
    return *found;
}

NamedAsset LoadNamedAsset(Context& ioContext, const LoadedProduction& inProduction,
                          const std::string& inWhich) {
    const auto list = LoadAssetList(ioContext, inProduction);
    const std::vector<AssetItem> items = list->GetAllItems();
    NamedAsset named;
    named.item = FindAsset(items, inWhich, inProduction.name);
    named.asset = list->GetAssetByIdentifier(named.item.assetIdentifier);
    named.name = ToUTF8(named.item.name);
    if (!named.asset) {
        throw Failure(ExitCode::Failure, "reading the asset " + named.name + ": the list does not hold it",
                      "run the command again");
    }
    return named;
}

std::string XMPEnclosureOf(const AssetItem& inItem) {
    return inItem.mediaLocatorIdentifier.empty()
               ? std::string()
               : ZOCL::GetXMPEnclosureName(inItem.mediaLocatorIdentifier).str();
}

std::vector<AssetDetails> LoadDetails(Context& ioContext, const InterfaceRef<ZOCL::IZOCAssetList>& inList,
                                      const std::vector<AssetItem>& inItems, Locators inLocators) {
    const auto server = ioContext.Server();
    std::vector<AssetDetails> all;
    std::map<std::string, InterfaceRef<ZOCL::IZOCMediaLocator>> locators;
    Loader loader(ioContext);
    for (const AssetItem& item : inItems) {
        AssetDetails details;
        details.item = item;
        details.asset = inList->GetAssetByIdentifier(item.assetIdentifier);
        const std::string name = ToUTF8(item.name);
        if (!details.asset) {
            throw Failure(ExitCode::Failure, "reading the asset " + name + ": the list does not hold it",
                          "run the command again");
        }
        details.enclosures = details.asset->GetEnclosures();
        details.renditions = details.asset->GetRenditions();
        loader.Add(details.enclosures, "loading the enclosures of " + name, false);
        loader.Add(details.renditions, "loading the renditions of " + name, false);
        if (inLocators == Locators::Load && !item.mediaLocatorIdentifier.empty()) {
            auto& locator = locators[item.mediaLocatorIdentifier.str()];
            if (!locator) {
                locator = server->GetMediaLocator(item.mediaLocatorIdentifier);
                loader.Add(locator, "loading the media locator of " + name, true);
            }
            details.locator = locator;
        }
        all.push_back(details);
    }
    loader.Run();
    return all;
}

std::vector<EnclosureText> EnclosuresOf(const InterfaceRef<ZOCL::IZOCEnclosures>& inEnclosures) {
    std::vector<EnclosureText> texts;
    if (!inEnclosures) {
        return texts;
    }
    for (const ImmutableString& name : inEnclosures->GetEnclosureNames()) {
        const auto enclosure = inEnclosures->GetEnclosure(name);
        texts.push_back(
            {name.str(), enclosure->GetEnclosureID().str(), enclosure->GetEnclosureContentID().str()});
    }
    return texts;
}

std::vector<RenditionText> RenditionsOf(const InterfaceRef<ZOCL::IZOCRenditions>& inRenditions) {
    std::vector<RenditionText> texts;
    if (!inRenditions) {
        return texts;
    }
    // The interface finds a rendition by its flavour, the first of each.
    std::set<std::string> seen;
    for (const ImmutableString& flavour : inRenditions->GetFlavors()) {
        const auto rendition = inRenditions->FindRendition(flavour);
        if (rendition && seen.insert(flavour.str()).second) {
            texts.push_back(
                {flavour.str(), rendition->GetRenditionID().str(), rendition->GetContentID().str()});
        }
    }
    return texts;
}

Json AssetJson(const AssetItem& inItem) {
    Json json("asset");
    json.Set("id", inItem.assetIdentifier)
        .Set("name", inItem.name)
        .Set("description", inItem.description)
        .Set("assetType", inItem.assetType)
        .Set("parent", inItem.parentIdentifier)
        .Set("mediaLocator", inItem.mediaLocatorIdentifier)
        .Set("etag", inItem.eTag);
    return json;
}

Json AssetJson(const AssetDetails& inDetails) {
    Json json = AssetJson(inDetails.item);
    json.Set("contentId", inDetails.asset->GetContentIdentifier());
    json.SetList("tags", inDetails.asset->GetTags());
    json.Set("mediaHref", inDetails.locator ? inDetails.locator->GetMediaHRef() : ImmutableString());
    json.Set("mediaName", inDetails.locator ? inDetails.locator->GetDisplayName() : ImmutableString());
    std::vector<Json> enclosures;
    for (const EnclosureText& text : EnclosuresOf(inDetails.enclosures)) {
        enclosures.push_back(
            Json::Part().Set("name", text.name).Set("id", text.id).Set("contentId", text.contentID));
    }
    std::vector<Json> renditions;
    for (const RenditionText& text : RenditionsOf(inDetails.renditions)) {
        renditions.push_back(
            Json::Part().Set("flavour", text.flavour).Set("id", text.id).Set("contentId", text.contentID));
    }
    return json.SetList("enclosures", enclosures).SetList("renditions", renditions);
}

}  // namespace zo
