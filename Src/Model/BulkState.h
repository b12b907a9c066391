// The image of what the server holds: how it is taken, kept up, and asked which changes are creations.
#pragma once

#include "Model/BulkAnswer.h"
#include "Model/BulkRecords.h"

namespace ZOCL {

using BulkAssetItem = std::pair<ImmutableString, BulkAssetEdit>;
using BulkEnclosureItem = std::pair<ImmutableString, BulkEnclosureEdit>;

/// Payloads with the content identifiers that the server gave them.
using BulkKnownPayloads = std::vector<std::pair<ImmutableString, BulkPayload>>;

/// The identifiers of a list that is loaded; unset for one that is not, or that is not there.
BulkIdentifiers ReadBulkIdentifiers(const InterfaceRef<IZOCEnclosures>& inList);
BulkIdentifiers ReadBulkIdentifiers(const InterfaceRef<IZOCRenditions>& inList);
/// Adds identifiers; one that is known already stays.
void AddBulkIdentifiers(const BulkIdentifiers& inAdded, BulkIdentifiers& ioKnown);

/// What an asset that was there before says of itself.
BulkAssetState ReadBulkAssetState(const InterfaceRef<IZOCAsset>& inAsset,
                                  const InterfaceRef<IZOCEnclosures>& inEnclosures,
                                  const InterfaceRef<IZOCRenditions>& inRenditions);
/// What is known of the asset stays as it is.
void AddToBulkState(const BulkAssetState& inRead, BulkAssetState& ioState);

// After a request. The answers are in the order of the form, which is that of the maps; where an answer ends
// early, the rest is not known.

/// A new asset.
BulkAssetState MakeBulkState(const BulkAssetCreation& inCreation, const BulkAnswer::Asset& inAnswer);
/// New enclosures and renditions of an asset.
void AddCreatedItems(const BulkAssetEdit& inCreated, const BulkAnswer::Asset& inAnswer,
                     BulkAssetState& ioState);
/// Properties that were written.
void AddWrittenProperties(const BulkAssetEdit& inEdit, BulkAssetState& ioState);
/// Finds the written enclosures of an answer by their identifiers and adds their payloads.
void CollectPayloads(const std::vector<BulkAnswer::Enclosure>& inAnswer, const BulkIdentifiers& inIdentifiers,
                     const BulkEnclosureEdits& inWritten, BulkKnownPayloads& ioPayloads);

/// True when the answer tells of no more enclosures and renditions than the edit has.
bool FitsEdit(const BulkAssetEdit& inEdit, const BulkAnswer::Asset& inAnswer);

/// The edits of assets, by what they are to the server.
struct BulkAssetSplit {
    /// Enclosures and renditions that are not there yet; nothing else.
    std::vector<BulkAssetItem> created;
    std::vector<BulkAssetItem> edited;
    /// Of edits in which nothing is set.
    BulkCompletions empty;
};
/// An asset of which nothing is known stays among the edited.
BulkAssetSplit SplitAssetEdits(BulkAssetEdits ioEdits, const BulkState& inState);

struct BulkEnclosureSplit {
    std::vector<BulkEnclosureItem> created;
    /// By identifier.
    std::vector<BulkEnclosureItem> edited;
};
/// What is to be created only, and is there already, is in neither.
BulkEnclosureSplit SplitProductionEnclosures(BulkEnclosureEdits ioEdits, const BulkIdentifiers& inKnown);

}  // namespace ZOCL
