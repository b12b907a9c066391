// The icons of the lists in the library's windows.
#pragma once

#include "Collaboration/ProductionItemData.h"

namespace ZOCL {

constexpr const char* kIconMetadata = "SP_Tag_Md";
constexpr const char* kIconProduction = "SP_Production_Sm";

/// Empty for a type without one.
std::string GetAssetIcon(const ImmutableString& inAssetType);
/// That of the kind, or for an asset that of its type.
std::string GetChangeIcon(ConflictKind inKind, const ImmutableString& inAssetType);

}  // namespace ZOCL
