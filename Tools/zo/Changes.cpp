// Loads differences.
#include "Changes.h"

#include "Assets.h"
#include "ostcore/utility/StringConversion.h"

namespace zo {
namespace {

using ZOCL::IZOCDifferences;

void Append(std::vector<Change>& ioAll, ItemKind inKind,
            const std::vector<IZOCDifferences::Entry>& inEntries) {
    for (const auto& entry : inEntries) {
        Change change;
        change.kind = inKind;
        change.entry = entry;
        ioAll.push_back(std::move(change));
    }
}

}  // namespace

const char* ItemKindName(ItemKind inKind) {
    switch (inKind) {
        case ItemKind::Asset:
            return "asset";
        case ItemKind::Enclosure:
            return "enclosure";
        case ItemKind::Properties:
            break;
    }
    return "properties";
}

std::string Change::What() const {
    return ostcore::utility::FoldCaseASCII(entry.differenceType.str());
}

ItemKey KeyOf(const Change& inChange) {
    return {inChange.kind, inChange.AssetID(),
            inChange.kind == ItemKind::Enclosure ? inChange.entry.name.str() : std::string()};
}

std::vector<Change> ChangesOf(const ZOCL::InterfaceRef<IZOCDifferences>& inDifferences) {
    std::vector<Change> all;
    Append(all, ItemKind::Asset, inDifferences->GetAssetDifferences());
    Append(all, ItemKind::Enclosure, inDifferences->GetEnclosureDifferences());
    Append(all, ItemKind::Properties, inDifferences->GetPropertiesDifferences());
    return all;
}

std::vector<Change> LoadChanges(Context& ioContext, const ZOCL::InterfaceRef<IZOCDifferences>& inDifferences,
                                const std::string& inWhat) {
    LoadResource(ioContext, inDifferences, inWhat);
    return ChangesOf(inDifferences);
}

std::vector<Change> LoadOutgoing(Context& ioContext, const WorkSession& inSession) {
    return LoadChanges(ioContext, inSession.session->GetOutgoingChanges(),
                       "loading what the session on " + inSession.productionName + " has to share");
}

std::vector<Change> LoadIncoming(Context& ioContext, const WorkSession& inSession) {
    return LoadChanges(ioContext, inSession.session->GetIncomingChanges(),
                       "loading what others have shared on " + inSession.productionName);
}

void AssetNames::Add(Context& ioContext, const LoadedProduction& inProduction) {
    for (const AssetItem& item : LoadAssetList(ioContext, inProduction)->GetAllItems()) {
        mKnown.emplace(item.assetIdentifier.str(),
                       Known{ostcore::utility::ToUTF8(item.name), XMPEnclosureOf(item)});
    }
}

void AssetNames::Add(const std::vector<Change>& inChanges) {
    for (const Change& change : inChanges) {
        if (change.kind == ItemKind::Asset && !change.entry.name.empty()) {
            mKnown.emplace(change.AssetID(), Known{change.entry.name.str(), {}});
        }
    }
}

std::string AssetNames::NameOf(const std::string& inAssetID) const {
    const auto found = mKnown.find(inAssetID);
    return found == mKnown.end() ? inAssetID : found->second.name;
}

bool AssetNames::IsXMP(const Change& inChange) const {
    const auto found = mKnown.find(inChange.AssetID());
    return inChange.kind == ItemKind::Enclosure && found != mKnown.end() &&
           found->second.xmpEnclosure == inChange.entry.name.view();
}

std::string AssetNames::Describe(const Change& inChange) const {
    if (inChange.kind == ItemKind::Properties) {
        return "the properties of the production";
    }
    if (inChange.kind == ItemKind::Asset) {
        return inChange.entry.name.empty() ? NameOf(inChange.AssetID()) : inChange.entry.name.str();
    }
    if (inChange.AssetID().empty()) {
        return "the enclosure " + inChange.entry.name.str() + " of the production";
    }
    return (IsXMP(inChange) ? "the XMP metadata" : "the enclosure " + inChange.entry.name.str()) + " of " +
           NameOf(inChange.AssetID());
}

}  // namespace zo
