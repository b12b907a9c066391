// Reading of the answers to bulk requests.
#include "Model/BulkAnswer.h"

#include <exception>

#include "dto/TransferStructure.h"
#include "ostcore/debug/Trace.h"

namespace ZOCL {

using dto::BindingKind;
using dto::BindingTable;
using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;

namespace {

// "indexId" is there too; the order of the form says the same.
constexpr const char* kKey_Assets = "assets";
constexpr const char* kKey_AssetID = "assetId";
constexpr const char* kKey_Enclosures = "enclosures";
constexpr const char* kKey_EnclosureID = "enclosureId";
constexpr const char* kKey_EnclosureContentID = "enclosureContentId";
constexpr const char* kKey_Renditions = "renditions";
constexpr const char* kKey_RenditionID = "renditionId";

const BindingTable& EnclosureTable() {
    static const BindingTable table{{kKey_EnclosureID, BindingKind::OptionalString},
                                    {kKey_EnclosureContentID, BindingKind::OptionalString}};
    return table;
}

const BindingTable& RenditionTable() {
    static const BindingTable table{{kKey_RenditionID, BindingKind::OptionalString}};
    return table;
}

const BindingTable& AssetTable() {
    static const BindingTable table{{kKey_AssetID, BindingKind::OptionalString},
                                    {kKey_Enclosures, BindingKind::ObjectList, &EnclosureTable},
                                    {kKey_Renditions, BindingKind::ObjectList, &RenditionTable}};
    return table;
}

const BindingTable& AnswerTable() {
    static const BindingTable table{{kKey_Assets, BindingKind::ObjectList, &AssetTable},
                                    {kKey_Enclosures, BindingKind::ObjectList, &EnclosureTable}};
    return table;
}

ImmutableString TextAt(JSONView inObject, std::string_view inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsNull() ? ImmutableString() : value.AsInternedString();
}

std::vector<BulkAnswer::Enclosure> ReadEnclosures(JSONView inObject) {
    std::vector<BulkAnswer::Enclosure> enclosures;
    inObject.Find(kKey_Enclosures).ForEachElement([&](JSONView inEnclosure) {
        enclosures.push_back(
            {TextAt(inEnclosure, kKey_EnclosureID), TextAt(inEnclosure, kKey_EnclosureContentID)});
    });
    return enclosures;
}

BulkAnswer::Asset ReadAsset(JSONView inObject) {
    BulkAnswer::Asset asset{TextAt(inObject, kKey_AssetID), ReadEnclosures(inObject), {}};
    inObject.Find(kKey_Renditions).ForEachElement([&](JSONView inRendition) {
        asset.renditions.push_back(TextAt(inRendition, kKey_RenditionID));
    });
    return asset;
}

BulkAnswer ReadBody(const shared_ptr<RecycledMemory const>& inPayload) {
    const JSONValue body =
        ostcore::serialization::UnwrapSerializerObject(ostcore::serialization::JSONParse(inPayload));
    AnswerTable().Check(body);
    BulkAnswer answer;
    const JSONView view(body);
    view.Find(kKey_Assets).ForEachElement([&](JSONView inAsset) {
        answer.assets.push_back(ReadAsset(inAsset));
    });
    answer.enclosures = ReadEnclosures(view);
    return answer;
}

}  // namespace

bool ReadBulkAnswer(const shared_ptr<ostnet::Response>& inResponse, BulkAnswer& outAnswer) {
    if (!inResponse || !inResponse->payload || inResponse->payload->empty()) {
        return true;
    }
    try {
        outAnswer = ReadBody(inResponse->payload);
        return true;
    } catch (const std::exception& fault) {
        static ostcore::debug::TraceChannel channel("ZOCL.Production");
        ostcore::debug::StructuredText text("The answer to a bulk request cannot be read");
        text.Add("reason", fault.what());
        ostcore::debug::Trace(channel, ostcore::debug::kTraceLevel_Error, text);
        return false;
    }
}

}  // namespace ZOCL
