// The immutable objects that commits are made of, and their text forms: asset states, and the root of a tree.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "Base/Json.h"
#include "Store/Records.h"

namespace zohub {

/// A named payload. Its content identifier is the hash of the payload.
struct EnclosureState {
    std::string id;
    std::string name;
    std::string type;
    std::string content;
    std::uint64_t size = 0;
    bool isNote = false;  ///< kept with a session and no part of its tree
};

struct RenditionState {
    std::string id;
    std::string type;
    std::string content;
    std::uint64_t size = 0;
};

/// One state of an asset. Parent and locator repeat what stands in the properties, so that a list can be made
/// without reading JSON.
struct AssetState {
    std::string id;
    std::string properties;  ///< compact JSON object, unknown keys included
    std::string parent;
    std::string locator;
    std::vector<EnclosureState> enclosures;
    std::vector<RenditionState> renditions;
};

/// The root of a tree: what a commit points to.
struct TreeRoot {
    std::string assets;  ///< root of the asset map, empty when there is none
    std::uint64_t assetCount = 0;
    std::string properties;  ///< compact JSON object of the production's base properties
    std::vector<EnclosureState> enclosures;
};

std::string WriteAssetState(AssetState const& inState);
std::string WriteTreeRoot(TreeRoot const& inRoot);

/// Throw std::runtime_error for text that was not made by the functions above.
AssetState ReadAssetState(std::string_view inText);
TreeRoot ReadTreeRoot(std::string_view inText);

/// A commit's identifier: the hash of all its other fields.
std::string CommitIdentifier(CommitRecord const& inCommit);

/// Builds the state from properties that have been checked with CheckAssetProperties.
void SetAssetProperties(AssetState& ioState, Json inProperties);

/// Throws Failure 400 when a known key has a wrong form or the asset type is missing.
void CheckAssetProperties(Json const& inProperties);
void CheckProductionProperties(Json const& inProperties);
void CheckLocatorProperties(Json const& inProperties);

template <class State>
State* FindItem(std::vector<State>& ioItems, std::string_view inId) {
    for (auto& item : ioItems)
        if (item.id == inId)
            return &item;
    return nullptr;
}

template <class State>
State const* FindItem(std::vector<State> const& inItems, std::string_view inId) {
    for (auto const& item : inItems)
        if (item.id == inId)
            return &item;
    return nullptr;
}

}  // namespace zohub
