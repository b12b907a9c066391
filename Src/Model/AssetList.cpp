// Listing and finding the assets of a production.
#include "Model/AssetList.h"

#include "Model/Asset.h"
#include "Model/ResourceCreation.h"
#include "ostcore/utility/StringConversion.h"
#include "Relations.h"

namespace ZOCL {

using ostcore::serialization::JSONView;
using ostcore::threads::ScopedLock;

namespace {

std::string_view TextOf(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsNull() ? std::string_view() : value.AsString();
}

IZOCAssetList::AssetListItem MakeItem(const dto::Asset& inAsset,
                                      const InterfaceRef<IZOCDataServer>& inServer) {
    const JSONView asset(inAsset.Body());
    const JSONView properties = asset.Find("properties");
    IZOCAssetList::AssetListItem item;
    item.name = ostcore::utility::ToUTF16(TextOf(properties, "name"));
    item.description = ostcore::utility::ToUTF16(TextOf(properties, "description"));
    item.server = inServer;
    item.assetIdentifier = ImmutableString(TextOf(asset, "zo:assetId"));
    item.parentIdentifier = ImmutableString(TextOf(properties, "zo:parent"));
    item.eTag = ImmutableString(TextOf(asset, "zo:etag"));
    item.assetType = ImmutableString(TextOf(properties, "cdzo:assetType"));
    item.mediaLocatorIdentifier = ImmutableString(TextOf(properties, "mediaLocator"));
    return item;
}

}  // namespace

void AssetIndex::Build() const {
    const std::size_t count = mAssets.size();
    mByIdentifier.reserve(count);
    mByName.reserve(count);
    std::size_t position = 0;
    JSONView(mAssets.Body()).ForEachElement([&](JSONView inAsset) {
        mByIdentifier.emplace(TextOf(inAsset, "zo:assetId"), position);
        mByName.emplace(TextOf(inAsset.Find("properties"), "name"), position);
        ++position;
    });
}

bool AssetIndex::FindByIdentifier(std::string_view inIdentifier, dto::Asset& outAsset) const {
    std::call_once(mOnce, [this] { Build(); });
    const auto found = mByIdentifier.find(inIdentifier);
    if (found == mByIdentifier.end()) {
        return false;
    }
    outAsset = mAssets[found->second];
    return true;
}

bool AssetIndex::FindByName(std::string_view inName, dto::Asset& outAsset) const {
    std::call_once(mOnce, [this] { Build(); });
    const auto found = mByName.find(inName);
    if (found == mByName.end()) {
        return false;
    }
    outAsset = mAssets[found->second];
    return true;
}

void AssetList::PostLoadDTO() {
    const auto index = make_shared<const AssetIndex>(GetBody("AssetList::PostLoadDTO"));
    shared_ptr<const AssetIndex> formerIndex = index;
    AddedAssets formerAssets;
    ScopedLock lock(IZOCDataServer::GetLock(), "AssetList::PostLoadDTO");
    mIndex.swap(formerIndex);
    mAddedAssets.swap(formerAssets);
}

void AssetList::InvalidateContent() {
    InternalDTOInit(GetHTTPURL(), GetServer(), nullptr, dto::ContainedAssets(), false,
                    ResourceWritability::kKeep);
}

shared_ptr<const AssetIndex> AssetList::GetIndex(const char* inLabel) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
        if (mIndex) {
            return mIndex;
        }
    }
    static const shared_ptr<const AssetIndex> none = make_shared<const AssetIndex>(dto::ContainedAssets());
    return none;
}

template <class Predicate>
std::vector<IZOCAssetList::AssetListItem> AssetList::CollectItems(const char* inLabel,
                                                                  const Predicate& inPredicate) {
    const auto index = GetIndex(inLabel);
    const InterfaceRef<IZOCDataServer> server = GetServer();
    std::vector<AssetListItem> items;
    for (const dto::Asset& asset : index->Assets()) {
        if (inPredicate(JSONView(asset.Body()).Find("properties"))) {
            items.push_back(MakeItem(asset, server));
        }
    }
    return items;
}

std::vector<IZOCAssetList::AssetListItem> AssetList::GetAllItems() {
    return CollectItems("AssetList::GetAllItems", [](JSONView) { return true; });
}

std::vector<IZOCAssetList::AssetListItem> AssetList::GetAssetsByType(const ImmutableString& inType) {
    return CollectItems("AssetList::GetAssetsByType", [&](JSONView inProperties) {
        return TextOf(inProperties, "cdzo:assetType") == inType.view();
    });
}

std::vector<IZOCAssetList::AssetListItem> AssetList::GetAssetsWithParentIdentifier(
    const ImmutableString& inParent) {
    return CollectItems("AssetList::GetAssetsWithParentIdentifier", [&](JSONView inProperties) {
        return TextOf(inProperties, "zo:parent") == inParent.view();
    });
}

InterfaceRef<IZOCAsset> AssetList::MakeAsset(const dto::Asset& inBody) {
    return MakeFromBody<Asset>(inBody, ImmutableString(), GetServer(), GetWritability());
}

InterfaceRef<IZOCAsset> AssetList::GetAssetByName(const UString& inName) {
    dto::Asset found;
    const auto index = GetIndex("AssetList::GetAssetByName");
    return index->FindByName(ostcore::utility::ToUTF8(inName), found) ? MakeAsset(found) : nullptr;
}

InterfaceRef<IZOCAsset> AssetList::GetAssetByIdentifier(const ImmutableString& inIdentifier) {
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "AssetList::GetAssetByIdentifier");
        const auto added = mAddedAssets.find(inIdentifier);
        if (added != mAddedAssets.end()) {
            return added->second;
        }
    }
    dto::Asset found;
    const auto index = GetIndex("AssetList::GetAssetByIdentifier");
    return index->FindByIdentifier(inIdentifier, found) ? MakeAsset(found) : nullptr;
}

InterfaceRef<IZOCAssetList> AssetList::GetLatestVersion() {
    return MakeAtURL<AssetList>(GetLinkHref(kRelation_LatestVersion), GetServer(), GetWritability());
}

ImmutableString AssetList::GetAssetFactoryURL() {
    return GetLinkHref(kRelation_Create);
}

void AssetList::AddAsset(const InterfaceRef<IZOCAsset>& inAsset, const char* inLabel) {
    const ImmutableString identifier = inAsset->GetAssetIdentifier();
    ScopedLock lock(IZOCDataServer::GetLock(), inLabel);
    mAddedAssets[identifier] = inAsset;
}

bool AssetList::RestoreAsset(const ImmutableString& inContentID, const Guid& inRequestID,
                             const RequestCompletion& inCompletion) {
    const ImmutableString url =
        ExpandTemplate(GetLinkHref(kRelation_Assets_Restore), {{"{assetContentId}", inContentID}});
    const InterfaceRef<AssetList> self(this);
    const auto onRestored = [self, inCompletion](const Guid& inID, int inResult,
                                                 const InterfaceRef<IZOCServerResource>& inAsset,
                                                 const shared_ptr<ostnet::Response>& inResponse) {
        const auto asset = RFL::QueryInterface<IZOCAsset>(inAsset);
        if (inResult >= 0 && asset) {
            self->AddAsset(asset, "AssetList::OnAssetRestored");
        }
        if (inCompletion) {
            inCompletion(inID, inResult, inAsset, inResponse);
        }
    };
    return PostJSONForNew<Asset>(inRequestID, url, GetServer(),
                                 ostcore::serialization::JSONValue::EmptyObject(), onRestored,
                                 GetWritability());
}

}  // namespace ZOCL
