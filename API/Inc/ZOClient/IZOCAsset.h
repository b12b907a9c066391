// The items of a production: clips, sequences, bins, compositions and the like.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "ostmediatypes/TickTime.h"
#include "ZOClient/IZOCEnclosure.h"
#include "ZOClient/IZOCMediaLocator.h"
#include "ZOClient/IZOCRendition.h"

namespace ZOCL {

ZOCL_EXPORT extern const ImmutableString kAssetType_Bin;
ZOCL_EXPORT extern const ImmutableString kAssetType_SmartBin;
ZOCL_EXPORT extern const ImmutableString kAssetType_MasterClip;
ZOCL_EXPORT extern const ImmutableString kAssetType_SubClip;
ZOCL_EXPORT extern const ImmutableString kAssetType_Sequence;
ZOCL_EXPORT extern const ImmutableString kAssetType_Synthetic;
ZOCL_EXPORT extern const ImmutableString kAssetType_Synthetic_SF;
ZOCL_EXPORT extern const ImmutableString kAssetType_Composition;

/// The properties of an asset that a host reads and writes. A plain value with a total order.
class ZOCL_EXPORT AssetBaseProperties {
public:
    UString name;
    UString description;
    /// One of the kAssetType_ constants, or another text that a newer client wrote.
    ImmutableString assetType;
    ImmutableString parent;
    ImmutableString mediaLocator;
    std::vector<ImmutableString> tags;
    bool isMulticam = false;
    ostmediatypes::TickTime zeroPoint;
    ImmutableString smartBinQuery;

    AssetBaseProperties() = default;
    AssetBaseProperties(const UString& inName, const UString& inDescription,
                        const ImmutableString& inAssetType, const ImmutableString& inParent,
                        bool inIsMulticam, const ostmediatypes::TickTime& inZeroPoint,
                        const ImmutableString& inSmartBinQuery);

    friend ZOCL_EXPORT bool operator==(const AssetBaseProperties&, const AssetBaseProperties&);
    friend ZOCL_EXPORT bool operator!=(const AssetBaseProperties&, const AssetBaseProperties&);
    friend ZOCL_EXPORT bool operator<(const AssetBaseProperties&, const AssetBaseProperties&);
};

/// The part of a master clip that a sub-clip shows; boundaries in media time.
struct ZOCL_EXPORT SubClip {
    ostmediatypes::TickTime startBoundary = ostmediatypes::kTime_Invalid;
    ostmediatypes::TickTime endBoundary = ostmediatypes::kTime_Invalid;
    bool boundaryIsHard = true;
};

class ZOCL_EXPORT IZOCAsset : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634173736574ull, 0x0000000000000001ull};

    /// False when the asset has no type.
    virtual bool GetAssetType(ImmutableString& outType) = 0;
    /// Localised.
    virtual UString GetAssetTypeDisplayName() = 0;
    virtual ImmutableString GetMediaLocatorIdentifier() = 0;
    /// Null without a locator. With inLoad the locator is loaded, which blocks.
    virtual InterfaceRef<IZOCMediaLocator> GetMediaLocator(bool inLoad) = 0;
    virtual bool HasMediaLocator() = 0;
    virtual UString GetName() = 0;
    virtual UString GetDescription() = 0;
    virtual std::vector<ImmutableString> GetTags() = 0;
    virtual ImmutableString GetAssetIdentifier() = 0;
    virtual ImmutableString GetParentAssetIdentifier() = 0;
    virtual ImmutableString GetContentIdentifier() = 0;
    /// Default values for an unloaded asset.
    virtual AssetBaseProperties GetAssetBaseProperties() = 0;
    /// False when the asset is no sub-clip.
    virtual bool GetSubClip(SubClip& outSubClip) = 0;
    /// Loaded without a request when the asset came with its enclosures. Null without the link.
    virtual InterfaceRef<IZOCEnclosures> GetEnclosures() = 0;
    virtual InterfaceRef<IZOCRenditions> GetRenditions() = 0;
    /// A new, unloaded object at the "latest-version" link; null without the link.
    virtual InterfaceRef<IZOCAsset> GetLatestVersion() = 0;
};

class ZOCL_EXPORT IZOCWritableAsset : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634173736574ull, 0x0000000000000002ull};

    /// Wraps an existing URL. Makes no request.
    static InterfaceRef<IZOCAsset> Create(const ImmutableString& inURL,
                                          const InterfaceRef<IZOCDataServer>& inServer,
                                          ResourceWritability inWritability);
    /// Posts a new asset to a factory; the completion's resource answers IZOCAsset and IZOCWritableAsset.
    static bool Create(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                       const InterfaceRef<IZOCDataServer>& inServer, const AssetBaseProperties& inProperties,
                       const RequestCompletion& inCompletion);

    virtual bool SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator,
                                          const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    virtual bool SetMediaLocatorAndUpdate(const InterfaceRef<IZOCMediaLocator>& inLocator) = 0;
    /// Changes the object alone; true when something changed. Tags compare as a set.
    virtual bool SetAssetBaseProperties(const AssetBaseProperties& inProperties) = 0;
    /// Without a change the completion is called at once on this thread, with result 0 and no response.
    virtual bool SetAssetBasePropertiesAndUpdate(const AssetBaseProperties& inProperties,
                                                 const Guid& inRequestID,
                                                 const RequestCompletion& inCompletion) = 0;
    virtual void SetSubClip(const SubClip& inSubClip) = 0;
    virtual bool SetMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) = 0;
    /// Blocks; sends If-Match with the held tag.
    virtual bool UpdatePropertiesOnServer() = 0;
    virtual bool UpdatePropertiesOnServer(const Guid& inRequestID, const RequestCompletion& inCompletion) = 0;
    virtual ImmutableString GetEnclosureFactoryURL() = 0;
    virtual ImmutableString GetRenditionFactoryURL() = 0;
};

class ZOCL_EXPORT IZOCAssetList : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634173736574ull, 0x4c69737400000001ull};

    struct AssetListItem {
        UString name;
        UString description;
        InterfaceRef<IZOCDataServer> server;
        ImmutableString assetIdentifier;
        ImmutableString parentIdentifier;
        ImmutableString eTag;
        ImmutableString assetType;
        ImmutableString mediaLocatorIdentifier;
    };

    virtual std::vector<AssetListItem> GetAllItems() = 0;
    virtual std::vector<AssetListItem> GetAssetsByType(const ImmutableString& inType) = 0;
    virtual std::vector<AssetListItem> GetAssetsWithParentIdentifier(const ImmutableString& inParent) = 0;
    /// First exact match, built from the list's body without a request; null when there is none.
    virtual InterfaceRef<IZOCAsset> GetAssetByName(const UString& inName) = 0;
    virtual InterfaceRef<IZOCAsset> GetAssetByIdentifier(const ImmutableString& inIdentifier) = 0;
    virtual InterfaceRef<IZOCAssetList> GetLatestVersion() = 0;
};

class ZOCL_EXPORT IZOCWritableAssetList : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634173736574ull, 0x4c69737400000002ull};

    /// Brings back an earlier state of an asset; the completion's resource answers IZOCAsset.
    virtual bool RestoreAsset(const ImmutableString& inContentID, const Guid& inRequestID,
                              const RequestCompletion& inCompletion) = 0;
    virtual ImmutableString GetAssetFactoryURL() = 0;
};

/// The localised name of an asset type; "Unrecognized Asset" for a type outside the table.
ZOCL_EXPORT UString GetAssetTypeDisplayName(const ImmutableString& inType);
/// True for generated names: a GUID in braces.
ZOCL_EXPORT bool IsZOAssetName(const UString& inName);

using XMPEnclosureMap = std::multimap<ImmutableString, IZOCAssetList::AssetListItem>;
/// From the name of the XMP enclosure of each item's media locator to the item.
ZOCL_EXPORT void GetXMPEnclosureMapForAssetList(const std::vector<IZOCAssetList::AssetListItem>& inItems,
                                                XMPEnclosureMap& outMap);

}  // namespace ZOCL

// Last, since it speaks of assets itself: an item of a list holds a reference to its server.
#include "ZOClient/IZOCDataServer.h"
