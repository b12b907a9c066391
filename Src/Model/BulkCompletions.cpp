// The ends of bulk requests: what is known of the server now, payloads for the cache, and the host's
// completions.
#include <algorithm>

#include "Model/Asset.h"
#include "Model/BulkTransaction.h"
#include "Model/ResourceCreation.h"
#include "ResourceCaches.h"

namespace ZOCL {

using ostcore::serialization::AddToObject;
using ostcore::serialization::JSONValue;
using ostcore::threads::ScopedLock;

namespace {

using AssetItems = std::map<ImmutableString, const BulkAssetEdit*>;

AssetItems IndexItems(const std::vector<BulkAssetItem>& inItems) {
    AssetItems index;
    for (const auto& [assetID, edit] : inItems) {
        index.emplace(assetID, &edit);
    }
    return index;
}

void CompleteItems(const std::vector<BulkAssetItem>& inItems, int inResult) {
    for (const auto& [assetID, edit] : inItems) {
        for (const auto& [name, enclosure] : edit.enclosures) {
            CallAll(enclosure.completions, inResult);
        }
        CallAll(edit.completions, inResult);
    }
}

}  // namespace

void BulkTransaction::KeepPayloads(const BulkKnownPayloads& inPayloads) {
    const auto caches = RFL::QueryInterface<ResourceCaches>(mSetup.server);
    if (!caches) {
        return;
    }
    for (const auto& [contentID, payload] : inPayloads) {
        caches->CacheContent(contentID, payload);
    }
}

InterfaceRef<IZOCAsset> BulkTransaction::MakeCreatedAsset(const ImmutableString& inAssetID,
                                                          const dto::AssetProperties& inProperties) {
    static const ImmutableString head("HEAD");
    JSONValue body = JSONValue::EmptyObject();
    AddToObject(body, "zo:assetId", inAssetID);
    AddToObject(body, "properties", inProperties.Body());
    AddToObject(body, "links", JSONValue::EmptyArray());
    return MakeFromBody<Asset>(
        dto::Asset(body, dto::AlreadyChecked()),
        ExpandTemplate(mSetup.assetTemplate, {{"{assetId}", inAssetID}, {"{commitId}", head}}), mSetup.server,
        ResourceWritability::kWritable);
}

void BulkTransaction::OnAssetsCreated(int inResult, const BulkAnswer& inAnswer,
                                      std::vector<BulkAssetCreation>& ioItems) {
    std::vector<InterfaceRef<IZOCAsset>> assets(ioItems.size());
    std::vector<std::pair<ImmutableString, BulkAssetState>> states;
    BulkKnownPayloads payloads;
    const std::size_t answered = inResult < 0 ? 0 : (std::min)(ioItems.size(), inAnswer.assets.size());
    for (std::size_t i = 0; i < answered; ++i) {
        const BulkAnswer::Asset& answer = inAnswer.assets[i];
        if (answer.id.empty()) {
            continue;
        }
        BulkAssetState state = MakeBulkState(ioItems[i], answer);
        CollectPayloads(answer.enclosures, state.enclosures, ioItems[i].enclosures, payloads);
        assets[i] = MakeCreatedAsset(answer.id, *state.properties);
        states.emplace_back(answer.id, std::move(state));
    }
    {
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::BulkAssetCreationCompletion");
        for (auto& [assetID, state] : states) {
            mState.assets[assetID] = std::move(state);
        }
    }
    KeepPayloads(payloads);
    for (std::size_t i = 0; i < ioItems.size(); ++i) {
        if (ioItems[i].completion) {
            ioItems[i].completion(inResult >= 0 && !assets[i] ? kResultFailure : inResult, assets[i]);
        }
    }
}

void BulkTransaction::OnItemsCreated(int inResult, const BulkAnswer& inAnswer,
                                     std::vector<BulkAssetItem>& ioItems) {
    BulkKnownPayloads payloads;
    if (inResult >= 0) {
        const AssetItems items = IndexItems(ioItems);
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::BulkEnclosureCreationCompletion");
        for (const BulkAnswer::Asset& answer : inAnswer.assets) {
            const auto item = items.find(answer.id);
            if (item != items.end()) {
                BulkAssetState& state = mState.assets[answer.id];
                AddCreatedItems(*item->second, answer, state);
                CollectPayloads(answer.enclosures, state.enclosures, item->second->enclosures, payloads);
            }
        }
    }
    KeepPayloads(payloads);
    CompleteItems(ioItems, inResult);
}

void BulkTransaction::OnAssetsEdited(int inResult, const BulkAnswer& inAnswer,
                                     std::vector<BulkAssetItem>& ioItems) {
    BulkKnownPayloads payloads;
    if (inResult >= 0) {
        const AssetItems items = IndexItems(ioItems);
        ScopedLock lock(IZOCDataServer::GetLock(), "ZOCL::BulkTransaction::BulkAssetEditCompletion");
        for (const BulkAnswer::Asset& answer : inAnswer.assets) {
            const auto item = items.find(answer.id);
            if (item != items.end()) {
                BulkAssetState& state = mState.assets[answer.id];
                AddWrittenProperties(*item->second, state);
                CollectPayloads(answer.enclosures, state.enclosures, item->second->enclosures, payloads);
            }
        }
    }
    KeepPayloads(payloads);
    CompleteItems(ioItems, inResult);
}

void BulkTransaction::OnProductionEnclosuresCreated(int inResult, const BulkAnswer& inAnswer,
                                                    std::vector<BulkEnclosureItem>& ioItems) {
    const std::size_t answered = inResult < 0 ? 0 : (std::min)(ioItems.size(), inAnswer.enclosures.size());
    BulkKnownPayloads payloads;
    ByText<ImmutableString> created;
    for (std::size_t i = 0; i < answered; ++i) {
        const BulkAnswer::Enclosure& answer = inAnswer.enclosures[i];
        created.emplace(ioItems[i].first, answer.id);
        payloads.emplace_back(answer.contentID, ioItems[i].second.data);
    }
    {
        ScopedLock lock(IZOCDataServer::GetLock(),
                        "ZOCL::BulkTransaction::BulkProductionLevelEnclosureCreationCompletion");
        AddBulkIdentifiers(created, mState.productionEnclosures);
    }
    KeepPayloads(payloads);
}

void BulkTransaction::OnProductionEnclosuresEdited(int inResult, const BulkAnswer& inAnswer,
                                                   std::vector<BulkEnclosureItem>& ioItems) {
    if (inResult < 0) {
        return;
    }
    std::map<ImmutableString, BulkPayload> written;
    for (const auto& [enclosureID, edit] : ioItems) {
        written.emplace(enclosureID, edit.data);
    }
    BulkKnownPayloads payloads;
    for (const BulkAnswer::Enclosure& answer : inAnswer.enclosures) {
        const auto found = written.find(answer.id);
        if (found != written.end()) {
            payloads.emplace_back(answer.contentID, found->second);
        }
    }
    KeepPayloads(payloads);
}

}  // namespace ZOCL
