// Makes the body of a full asset list as a server would write it.
#pragma once

#include <cstddef>
#include <cstdint>

#include "ostcore/Types.h"
#include "ostcore/utility/RecycledMemory.h"

/// The same bytes for the same arguments. Each asset has six links, contained enclosures and renditions;
/// some have tags, sub-clips and zero points.
ostcore::shared_ptr<ostcore::utility::RecycledMemory const> MakeAssetListBody(std::size_t inAssets,
                                                                              std::uint32_t inSeed);
