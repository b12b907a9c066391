// Reads and writes the XMP packets of assets.
#pragma once

#include <string>

#include <QtCore/QString>

#include "Requests.h"
#include "ZOClient/IZOCEditingSession.h"

namespace Desk {

using AssetItem = ZOCL::IZOCAssetList::AssetListItem;

/// A packet as it was loaded; both are empty when the asset has none.
struct Metadata {
    std::string packet;
    ZOCL::ImmutableString contentID;
};

/// Main thread only; both operations end with one call of their function, on the main thread, unless Cancel
/// or the end of this object comes first. An empty error text means success.
class MetadataStore {
public:
    using Loaded = std::function<void(const QString& inError, const Metadata&)>;
    using Saved = std::function<void(const QString& inError)>;

    /// The name of the enclosure that holds the packet; empty for an asset without media, which has none.
    static ZOCL::ImmutableString EnclosureOf(const AssetItem& inItem);

    void Load(const ZOCL::InterfaceRef<ZOCL::IZOCAsset>& inAsset, const AssetItem& inItem,
              const Loaded& inLoaded);
    /// Writes an edited packet in one short transaction, which is committed or rolled back. What others have
    /// changed in the packet since it was loaded is merged with it; what cannot be merged is an error, and
    /// nothing is written.
    void Save(const ZOCL::InterfaceRef<ZOCL::IZOCEditingSession>& inSession, const AssetItem& inItem,
              const Metadata& inBase, const std::string& inPacket, const Saved& inSaved);

    /// Gives up a load. A save goes on: half of it would leave a transaction open.
    void CancelLoad() { mLoads.Cancel(); }
    bool IsSaving() const { return !mSaves.IsIdle(); }

private:
    Requests mLoads;
    Requests mSaves;
};

}  // namespace Desk
