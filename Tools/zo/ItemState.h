// The state of one item on one side, as its document tells it.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "Sessions.h"

namespace zo {

/// Texts of JSON values, so that states can be compared and told apart property by property.
struct ItemState {
    bool exists = false;
    std::map<std::string, std::string> properties;
    /// From the identifier of a rendition to that of its content.
    std::map<std::string, std::string> renditions;
    /// Of an enclosure.
    std::string content;
};

/// Loads the document of an asset, an enclosure or a production. What is not there does not exist; an empty
/// URL stands for that as well.
ItemState LoadItemState(Context& ioContext, const std::string& inURL, const std::string& inWhat);

/// The names of the properties that differ, for people, with "renditions" last when those differ.
std::vector<std::string> ChangedParts(const ItemState& inBase, const ItemState& inSide);

/// Whether two sides of an asset or of the production's properties are at odds: properties that both have
/// changed in different ways, or such a rendition.
bool AreAtOdds(const ItemState& inBase, const ItemState& inMine, const ItemState& inTheirs);

}  // namespace zo
