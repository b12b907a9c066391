// The image of the server's state during a bulk transaction.
#include "Model/BulkState.h"

#include <algorithm>

#include "Model/Asset.h"
#include "Model/BulkAssetProperties.h"

namespace ZOCL {

namespace {

BulkIdentifiers ZipIdentifiers(const std::vector<ImmutableString>& inKeys,
                               const std::vector<ImmutableString>& inIdentifiers) {
    ByText<ImmutableString> identifiers;
    const std::size_t count = (std::min)(inKeys.size(), inIdentifiers.size());
    for (std::size_t i = 0; i < count; ++i) {
        identifiers.emplace(inKeys[i], inIdentifiers[i]);
    }
    return identifiers;
}

template <class List>
bool IsLoadedList(const InterfaceRef<List>& inList) {
    const auto resource = RFL::QueryInterface<IZOCServerResource>(inList);
    return resource && resource->IsLoaded();
}

/// Pairs the keys of a map with the answers, in order.
template <class Map, class Answers, class GetID>
void PairInOrder(const Map& inMap, const Answers& inAnswers, const GetID& inGetID, BulkIdentifiers& ioKnown) {
    if (!ioKnown) {
        ioKnown = ByText<ImmutableString>();
    }
    auto answer = inAnswers.begin();
    for (auto item = inMap.begin(); item != inMap.end() && answer != inAnswers.end(); ++item, ++answer) {
        if (!inGetID(*answer).empty()) {
            (*ioKnown)[item->first] = inGetID(*answer);
        }
    }
}

/// Moves what is not known over to the new ones.
template <class Map>
void MoveUnknown(const BulkIdentifiers& inKnown, Map& ioEdits, Map& ioCreated) {
    for (auto item = ioEdits.begin(); item != ioEdits.end();) {
        const auto next = std::next(item);
        if (!inKnown || inKnown->count(item->first) == 0) {
            ioCreated.insert(ioEdits.extract(item));
        }
        item = next;
    }
}

void AppendCompletions(BulkCompletions& ioFrom, BulkCompletions& ioTo) {
    ioTo.insert(ioTo.end(), std::make_move_iterator(ioFrom.begin()), std::make_move_iterator(ioFrom.end()));
    ioFrom.clear();
}

void SplitOne(const ImmutableString& inAssetID, BulkAssetEdit& ioEdit, const BulkAssetState& inState,
              BulkAssetSplit& ioSplit) {
    BulkAssetEdit created;
    MoveUnknown(inState.enclosures, ioEdit.enclosures, created.enclosures);
    MoveUnknown(inState.renditions, ioEdit.renditions, created.renditions);
    const bool isLeft = ioEdit.HasItems() || ioEdit.HasProperties();
    if (!isLeft) {
        AppendCompletions(ioEdit.completions, created.HasItems() ? created.completions : ioSplit.empty);
    }
    if (created.HasItems()) {
        ioSplit.created.emplace_back(inAssetID, std::move(created));
    }
    if (isLeft) {
        ioSplit.edited.emplace_back(inAssetID, std::move(ioEdit));
    }
}

const ImmutableString& IdentifierOf(const BulkAnswer::Enclosure& inAnswer) {
    return inAnswer.id;
}
const ImmutableString& IdentifierOf(const ImmutableString& inAnswer) {
    return inAnswer;
}
constexpr auto kGetIdentifier = [](const auto& inAnswer) -> const ImmutableString& {
    return IdentifierOf(inAnswer);
};

}  // namespace

BulkIdentifiers ReadBulkIdentifiers(const InterfaceRef<IZOCEnclosures>& inList) {
    return IsLoadedList(inList) ? ZipIdentifiers(inList->GetEnclosureNames(), inList->GetEnclosureIDs())
                                : BulkIdentifiers();
}

BulkIdentifiers ReadBulkIdentifiers(const InterfaceRef<IZOCRenditions>& inList) {
    return IsLoadedList(inList) ? ZipIdentifiers(inList->GetFlavors(), inList->GetRenditionIDs())
                                : BulkIdentifiers();
}

void AddBulkIdentifiers(const BulkIdentifiers& inAdded, BulkIdentifiers& ioKnown) {
    if (!inAdded) {
        return;
    }
    if (!ioKnown) {
        ioKnown = inAdded;
    } else {
        ioKnown->insert(inAdded->begin(), inAdded->end());
    }
}

BulkAssetState ReadBulkAssetState(const InterfaceRef<IZOCAsset>& inAsset,
                                  const InterfaceRef<IZOCEnclosures>& inEnclosures,
                                  const InterfaceRef<IZOCRenditions>& inRenditions) {
    BulkAssetState state;
    state.enclosures = ReadBulkIdentifiers(inEnclosures);
    state.renditions = ReadBulkIdentifiers(inRenditions);
    if (const auto asset = RFL::QueryInterface<Asset>(inAsset)) {
        state.properties = asset->GetStoredProperties();
    }
    return state;
}

void AddToBulkState(const BulkAssetState& inRead, BulkAssetState& ioState) {
    AddBulkIdentifiers(inRead.enclosures, ioState.enclosures);
    AddBulkIdentifiers(inRead.renditions, ioState.renditions);
    if (!ioState.properties) {
        ioState.properties = inRead.properties;
    }
}

BulkAssetState MakeBulkState(const BulkAssetCreation& inCreation, const BulkAnswer::Asset& inAnswer) {
    BulkAssetState state;
    state.properties = MakeBulkAssetProperties(boost::none, inCreation);
    AddCreatedItems(inCreation, inAnswer, state);
    return state;
}

void AddCreatedItems(const BulkAssetEdit& inCreated, const BulkAnswer::Asset& inAnswer,
                     BulkAssetState& ioState) {
    PairInOrder(inCreated.enclosures, inAnswer.enclosures, kGetIdentifier, ioState.enclosures);
    PairInOrder(inCreated.renditions, inAnswer.renditions, kGetIdentifier, ioState.renditions);
}

void AddWrittenProperties(const BulkAssetEdit& inEdit, BulkAssetState& ioState) {
    if (inEdit.HasProperties()) {
        ioState.properties = MakeBulkAssetProperties(ioState.properties, inEdit);
    }
}

void CollectPayloads(const std::vector<BulkAnswer::Enclosure>& inAnswer, const BulkIdentifiers& inIdentifiers,
                     const BulkEnclosureEdits& inWritten, BulkKnownPayloads& ioPayloads) {
    if (!inIdentifiers) {
        return;
    }
    ByText<const BulkEnclosureEdit*> byIdentifier;
    for (const auto& [name, edit] : inWritten) {
        const auto known = inIdentifiers->find(name);
        if (known != inIdentifiers->end()) {
            byIdentifier.emplace(known->second, &edit);
        }
    }
    for (const BulkAnswer::Enclosure& answer : inAnswer) {
        const auto written = byIdentifier.find(answer.id);
        if (written != byIdentifier.end() && !answer.contentID.empty()) {
            ioPayloads.emplace_back(answer.contentID, written->second->data);
        }
    }
}

bool FitsEdit(const BulkAssetEdit& inEdit, const BulkAnswer::Asset& inAnswer) {
    return inAnswer.enclosures.size() <= inEdit.enclosures.size() &&
           inAnswer.renditions.size() <= inEdit.renditions.size();
}

BulkAssetSplit SplitAssetEdits(BulkAssetEdits ioEdits, const BulkState& inState) {
    BulkAssetSplit split;
    for (auto& [assetID, edit] : ioEdits) {
        const auto state = inState.assets.find(assetID);
        if (state != inState.assets.end()) {
            SplitOne(assetID, edit, state->second, split);
        } else if (edit.HasItems() || edit.HasProperties()) {
            split.edited.emplace_back(assetID, std::move(edit));
        } else {
            AppendCompletions(edit.completions, split.empty);
        }
    }
    return split;
}

BulkEnclosureSplit SplitProductionEnclosures(BulkEnclosureEdits ioEdits, const BulkIdentifiers& inKnown) {
    BulkEnclosureSplit split;
    for (auto& [name, edit] : ioEdits) {
        const auto known = inKnown ? inKnown->find(name) : ByText<ImmutableString>::const_iterator();
        if (!inKnown || known == inKnown->end()) {
            split.created.emplace_back(name, std::move(edit));
        } else if (!edit.createOnly) {
            split.edited.emplace_back(known->second, std::move(edit));
        }
    }
    return split;
}

}  // namespace ZOCL
