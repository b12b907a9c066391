// The names of the parts of a bulk form.
#include "Routes/BulkPartName.h"

#include "Base/Text.h"

namespace zohub {

namespace {

using Kind = BulkPartName::Kind;

std::optional<Kind> EnclosureKind(std::string_view inField) {
    if (inField == "name")
        return Kind::EnclosureName;
    return inField == "data" ? std::optional(Kind::EnclosureData) : std::nullopt;
}

// What stands behind "assets+" and the asset.
std::optional<BulkPartName> ReadOfAsset(std::string_view inAsset,
                                        std::vector<std::string_view> const& inPieces) {
    if (inPieces.size() == 2)
        return BulkPartName{Kind::Asset, inAsset, {}};
    if (inPieces.size() == 3 && inPieces[2] == "properties")
        return BulkPartName{Kind::AssetProperties, inAsset, {}};
    if (inPieces.size() != 5 || !IsIdentifier(inPieces[3]))
        return std::nullopt;
    if (inPieces[2] == "rendition" && inPieces[4] == "data")
        return BulkPartName{Kind::RenditionData, inAsset, inPieces[3]};
    auto const kind = inPieces[2] == "enclosure" ? EnclosureKind(inPieces[4]) : std::nullopt;
    return kind ? std::optional(BulkPartName{*kind, inAsset, inPieces[3]}) : std::nullopt;
}

}  // namespace

std::optional<BulkPartName> ReadBulkPartName(std::string_view inText) {
    auto const pieces = Split(inText, '+');
    if (pieces.size() < 2 || !IsIdentifier(pieces[1]))
        return std::nullopt;
    if (pieces[0] == "assets")
        return ReadOfAsset(pieces[1], pieces);
    if (pieces[0] != "enclosures" || pieces.size() != 3)
        return std::nullopt;
    auto const kind = EnclosureKind(pieces[2]);
    return kind ? std::optional(BulkPartName{*kind, {}, pieces[1]}) : std::nullopt;
}

}  // namespace zohub
