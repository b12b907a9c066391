// What a bulk transaction gathers, and what it knows of the server: plain values.
#pragma once

#include <map>
#include <utility>
#include <vector>

#include "dto/Asset.h"
#include "ZOClient/IZOCBulkTransaction.h"

namespace ZOCL {

using BulkPayload = shared_ptr<RecycledMemory const>;
using BulkCompletions = std::vector<IZOCBulkTransaction::ResultCompletion>;
/// Each of them once, in order; no lock may be held.
inline void CallAll(const BulkCompletions& inCompletions, int inResult) {
    for (const auto& completion : inCompletions) {
        completion(inResult);
    }
}

/// Orders by text, so that the same changes make the same form in every run.
struct TextOrder {
    bool operator()(const ImmutableString& inLeft, const ImmutableString& inRight) const noexcept {
        return inLeft.view() < inRight.view();
    }
};
template <class Value>
using ByText = std::map<ImmutableString, Value, TextOrder>;

struct BulkEnclosureEdit {
    /// Counts for enclosures of the production alone.
    bool createOnly = false;
    BulkPayload data;
    BulkCompletions completions;
};
using BulkEnclosureEdits = ByText<BulkEnclosureEdit>;
using BulkRenditionEdits = ByText<BulkPayload>;

struct BulkAssetEdit {
    BulkEnclosureEdits enclosures;
    BulkRenditionEdits renditions;
    optional<SubClip> subClip;
    optional<ImmutableString> mediaLocator;
    optional<AssetBaseProperties> properties;
    BulkCompletions completions;

    bool HasProperties() const { return subClip || mediaLocator || properties; }
    bool HasItems() const { return !enclosures.empty() || !renditions.empty(); }
};
using BulkAssetEdits = ByText<BulkAssetEdit>;

struct BulkAssetCreation : BulkAssetEdit {
    IZOCBulkTransaction::AssetCompletion completion;
};

struct BulkAssetDeletion {
    ImmutableString assetID;
    IZOCBulkTransaction::ResultCompletion completion;
};

/// The server's identifiers, by enclosure name or by rendition type. Unset: not known.
using BulkIdentifiers = optional<ByText<ImmutableString>>;

struct BulkAssetState {
    BulkIdentifiers enclosures;
    BulkIdentifiers renditions;
    /// The whole object as the server has it, with the sub-clip, the locator and keys that nobody here knows.
    optional<dto::AssetProperties> properties;
};

/// What the server holds of the assets that were touched, and of the production itself.
struct BulkState {
    ByText<BulkAssetState> assets;
    BulkIdentifiers productionEnclosures;
};

}  // namespace ZOCL
