// The names of the parts of a bulk form, which say what a part is about.
#pragma once

#include <optional>
#include <string_view>

namespace zohub {

struct BulkPartName {
    enum class Kind { Asset, AssetProperties, EnclosureName, EnclosureData, RenditionData };

    Kind kind = Kind::Asset;
    /// Identifier of an asset, or the index of a new one; empty for the production itself.
    std::string_view asset;
    /// Identifier of an enclosure or rendition, or the index of a new one; empty for an asset.
    std::string_view item;
};

/// Nothing for a text that is no such name. The result points into the text.
std::optional<BulkPartName> ReadBulkPartName(std::string_view inText);

}  // namespace zohub
