// Finds assets and loads what belongs to them: locators, enclosures, renditions.
#pragma once

#include <string>
#include <vector>

#include "Productions.h"

namespace zo {

using AssetItem = ZOCL::IZOCAssetList::AssetListItem;

/// The loaded list of a production.
ZOCL::InterfaceRef<ZOCL::IZOCAssetList> LoadAssetList(Context& ioContext,
                                                      const LoadedProduction& inProduction);

/// By identifier or exact name. Throws a Failure when there is none, or the name is that of several.
const AssetItem& FindAsset(const std::vector<AssetItem>& inItems, const std::string& inWhich,
                           const std::string& inProduction);

/// One asset of a production, session or transaction, by identifier or exact name.
struct NamedAsset {
    AssetItem item;
    ZOCL::InterfaceRef<ZOCL::IZOCAsset> asset;
    std::string name;
};
NamedAsset LoadNamedAsset(Context& ioContext, const LoadedProduction& inProduction,
                          const std::string& inWhich);

/// One asset with all that hangs on it, loaded.
struct AssetDetails {
    AssetItem item;
    ZOCL::InterfaceRef<ZOCL::IZOCAsset> asset;
    /// Null when the asset has none.
    ZOCL::InterfaceRef<ZOCL::IZOCMediaLocator> locator;
    ZOCL::InterfaceRef<ZOCL::IZOCEnclosures> enclosures;
    ZOCL::InterfaceRef<ZOCL::IZOCRenditions> renditions;
};

enum class Locators { Leave, Load };

/// Loads what the list did not bring, several requests at a time. A locator that the hub does not know is
/// left out; any other failure ends it.
std::vector<AssetDetails> LoadDetails(Context& ioContext,
                                      const ZOCL::InterfaceRef<ZOCL::IZOCAssetList>& inList,
                                      const std::vector<AssetItem>& inItems, Locators inLocators);

struct EnclosureText {
    std::string name;
    std::string id;
    std::string contentID;
};
std::vector<EnclosureText> EnclosuresOf(const ZOCL::InterfaceRef<ZOCL::IZOCEnclosures>& inEnclosures);

struct RenditionText {
    std::string flavour;
    std::string id;
    std::string contentID;
};
std::vector<RenditionText> RenditionsOf(const ZOCL::InterfaceRef<ZOCL::IZOCRenditions>& inRenditions);

/// The name of the enclosure that holds an asset's XMP packet; empty for an asset without a media locator.
std::string XMPEnclosureOf(const AssetItem& inItem);

/// The JSON object of an asset: what the list says, and with details the rest.
Json AssetJson(const AssetItem& inItem);
Json AssetJson(const AssetDetails& inDetails);

}  // namespace zo
