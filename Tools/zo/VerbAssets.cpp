// assets: the assets of the open production.
#include <algorithm>

#include "Assets.h"
#include "ostcore/utility/StringConversion.h"
#include "Sessions.h"
#include "Verbs.h"

namespace zo {
namespace {

using ostcore::utility::ToUTF8;

std::string NamesOf(const std::vector<EnclosureText>& inTexts, const std::string& inLocator) {
    std::string names;
    for (const EnclosureText& text : inTexts) {
        // The usual one has the locator's identifier for a name; here its ending says enough.
        const bool isXMP = text.name == ZOCL::GetXMPEnclosureName(ZOCL::ImmutableString(inLocator)).str();
        names += (names.empty() ? "" : ", ") + (isXMP && !inLocator.empty() ? std::string("xmp") : text.name);
    }
    return names.empty() ? "-" : names;
}

std::string FlavoursOf(const std::vector<RenditionText>& inTexts) {
    std::string flavours;
    for (const RenditionText& text : inTexts) {
        flavours += (flavours.empty() ? "" : ", ") + text.flavour;
    }
    return flavours.empty() ? "-" : flavours;
}

std::vector<AssetItem> Selected(Context& ioContext, const ZOCL::InterfaceRef<ZOCL::IZOCAssetList>& inList,
                                const std::string& inProduction) {
    const auto type = ioContext.Args().Value("type");
    const auto parent = ioContext.Args().Value("parent");
    std::vector<AssetItem> items =
        type ? inList->GetAssetsByType(ZOCL::ImmutableString(*type)) : inList->GetAllItems();
    if (parent) {
        const std::vector<AssetItem> all = inList->GetAllItems();
        const ZOCL::ImmutableString id = FindAsset(all, *parent, inProduction).assetIdentifier;
        items.erase(std::remove_if(items.begin(), items.end(),
                                   [&](const AssetItem& inItem) { return inItem.parentIdentifier != id; }),
                    items.end());
    }
    return items;
}

void ListLong(Context& ioContext, const ZOCL::InterfaceRef<ZOCL::IZOCAssetList>& inList,
              const std::vector<AssetItem>& inItems) {
    Table table({{"NAME", 10},
                 {"TYPE"},
                 {"ID", 8},
                 {"LOCATOR", 8},
                 {"MEDIA", 8},
                 {"ENCLOSURES", 10},
                 {"RENDITIONS", 10}});
    for (const AssetDetails& details : LoadDetails(ioContext, inList, inItems, Locators::Load)) {
        ioContext.Out().Record(AssetJson(details));
        const std::string locator = details.item.mediaLocatorIdentifier.str();
        const std::string href = details.locator ? details.locator->GetMediaHRef().str() : std::string();
        table.AddRow({ToUTF8(details.item.name), details.item.assetType.str(),
                      details.item.assetIdentifier.str(), locator.empty() ? "-" : locator,
                      href.empty() ? "-" : href, NamesOf(EnclosuresOf(details.enclosures), locator),
                      FlavoursOf(RenditionsOf(details.renditions))});
    }
    ioContext.Out().Print(table);
}

void ListShort(Context& ioContext, const std::vector<AssetItem>& inItems) {
    Table table({{"NAME", 12}, {"TYPE"}, {"ID", 8}, {"PARENT", 8}, {"DESCRIPTION", 11}});
    for (const AssetItem& item : inItems) {
        ioContext.Out().Record(AssetJson(item));
        const std::string parent = item.parentIdentifier.str();
        table.AddRow({ToUTF8(item.name), item.assetType.str(), item.assetIdentifier.str(),
                      parent.empty() ? "-" : parent, ToUTF8(item.description)});
    }
    ioContext.Out().Print(table);
}

}  // namespace

void RunAssets(Context& ioContext) {
    const LoadedProduction loaded = LoadForReading(ioContext);
    const auto list = LoadAssetList(ioContext, loaded);
    const std::vector<AssetItem> items = Selected(ioContext, list, loaded.name);
    if (items.empty()) {
        ioContext.Out().Note("no assets");
        return;
    }
    if (ioContext.Args().Has("long")) {
        ListLong(ioContext, list, items);
    } else {
        ListShort(ioContext, items);
    }
}

}  // namespace zo
