// Between the properties that hosts read and write and the object that travels.
#pragma once

#include "dto/Asset.h"
#include "ZOClient/IZOCAsset.h"

namespace ZOCL {

AssetBaseProperties ToAssetBaseProperties(const dto::AssetProperties& inProperties);
/// All keys, in the order of the wire; for a new asset.
dto::AssetProperties MakeAssetProperties(const AssetBaseProperties& inProperties);
/// Sets what differs and nothing else; true when something did.
bool UpdateAssetProperties(dto::AssetProperties& ioProperties, const AssetBaseProperties& inWanted);

/// False when the asset is no sub-clip.
bool ReadSubClip(const dto::AssetProperties& inProperties, SubClip& outSubClip);
void WriteSubClip(dto::AssetProperties& ioProperties, const SubClip& inSubClip);

}  // namespace ZOCL
