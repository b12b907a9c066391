// The keys of the transfer structures, each written once, and what little they do beside reading.
#include "dto/Asset.h"
#include "dto/MediaLocator.h"
#include "dto/Production.h"
#include "dto/User.h"

namespace ZOCL {
namespace dto {

namespace {

using Kind = BindingKind;

/// The last of the keys that is there wins.
template <class Body>
ImmutableString LastIdentifier(const Body& inBody) {
    ImmutableString identifier = inBody.String("zo:productionId", "zo:sessionId");
    ostcore::serialization::ReadOptionalString(inBody.Body(), "zo:transactionId", identifier);
    return identifier;
}

template <class T>
void AppendItems(const BoundList<T>& inList, std::vector<T>& ioItems) {
    for (const T& item : inList) {
        ioItems.push_back(item);
    }
}

const BindingTable& RenditionPropertiesTable() {
    static const BindingTable table{{"zo:mimeType", Kind::MandatoryString}};
    return table;
}

const BindingTable& StillSequenceTable() {
    static const BindingTable table{
        {"type", Kind::OptionalString},   {"prefix", Kind::OptionalString}, {"suffix", Kind::OptionalString},
        {"startFrame", Kind::Integer32},  {"endFrame", Kind::Integer32},    {"numDigits", Kind::Integer32},
        {"leadingZeroes", Kind::Boolean},
    };
    return table;
}

}  // namespace

const BindingTable& LinkTable() {
    static const BindingTable table{
        {"rel", Kind::OptionalString},  {"title", Kind::OptionalString},   {"href", Kind::OptionalString},
        {"type", Kind::OptionalString}, {"zo:etag", Kind::OptionalString},
    };
    return table;
}

const BindingTable& Enclosure::Table() {
    static const BindingTable table{
        {"zo:etag", Kind::OptionalString},        {"zo:enclosureContentId", Kind::OptionalString},
        {"zo:enclosureId", Kind::OptionalString}, {"name", Kind::MandatoryString},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& ContainedEnclosures::Table() {
    static const BindingTable table{
        {"enclosures", Kind::ObjectList, &Enclosure::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& Rendition::Table() {
    static const BindingTable table{
        {"zo:renditionId", Kind::MandatoryString},
        {"zo:renditionContentId", Kind::OptionalString},
        {"properties", Kind::Object, &RenditionPropertiesTable},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& ContainedRenditions::Table() {
    static const BindingTable table{
        {"renditions", Kind::ObjectList, &Rendition::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& SubClip::Table() {
    static const BindingTable table{
        {"mStartBoundary", Kind::TickTime},
        {"mEndBoundary", Kind::TickTime},
        {"mBoundaryIsHard", Kind::Boolean},
    };
    return table;
}

const BindingTable& AssetProperties::Table() {
    static const BindingTable table{
        {"name", Kind::MandatoryString},
        {"description", Kind::MandatoryString},
        {"mediaLocator", Kind::OptionalString},
        {"zo:parent", Kind::OptionalString},
        {"tags", Kind::StringList},
        {"subClip", Kind::Object, &SubClip::Table},
        {"cdzo:assetType", Kind::MandatoryString},
        {"projectItemProperties", Kind::OptionalString},
        {"mergedClipMediaLocators", Kind::StringList},
        {"isMulticamEnabled", Kind::Boolean},
        {"zeroPoint", Kind::TickTime},
        {"smartBinQuery", Kind::OptionalString},
    };
    return table;
}

void AssetProperties::Set(std::string_view inKey, const JSONValue& inValue) {
    ostcore::serialization::AddToObject(MutableBody(), inKey, inValue);
}

void AssetProperties::Remove(std::string_view inKey) {
    ostcore::serialization::RemoveFromObject(MutableBody(), inKey);
}

const BindingTable& Asset::Table() {
    static const BindingTable table{
        {"zo:assetId", Kind::MandatoryString},
        {"zo:etag", Kind::OptionalString},
        {"zo:assetContentId", Kind::OptionalString},
        {"properties", Kind::Object, &AssetProperties::Table},
        {"links", Kind::ObjectList, &LinkTable},
        {"enclosures", Kind::Object, &ContainedEnclosures::Table},
        {"renditions", Kind::Object, &ContainedRenditions::Table},
    };
    return table;
}

void Asset::SetProperties(const AssetProperties& inProperties) {
    ostcore::serialization::AddToObject(MutableBody(), "properties", inProperties.Body());
}

const BindingTable& ContainedAssets::Table() {
    static const BindingTable table{
        {"assets", Kind::ObjectList, &Asset::Table},
        {"stats", Kind::Any},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& ProductionBaseProperties::Table() {
    static const BindingTable table{
        {"name", Kind::OptionalString},
        {"description", Kind::OptionalString},
        {"tags", Kind::StringList},
        {"commitId", Kind::OptionalString},
    };
    return table;
}

void ProductionBaseProperties::Set(std::string_view inKey, const JSONValue& inValue) {
    ostcore::serialization::AddToObject(MutableBody(), inKey, inValue);
}

const BindingTable& ClientMetadata::Table() {
    static const BindingTable table{
        {"applicationName", Kind::OptionalString},       {"applicationBuildNumber", Kind::OptionalString},
        {"applicationInstanceID", Kind::OptionalString}, {"machineID", Kind::OptionalString},
        {"machineName", Kind::OptionalString},           {"machineIP", Kind::OptionalString},
        {"transactionType", Kind::OptionalString},       {kRequestID, Kind::OptionalString},
    };
    return table;
}

const BindingTable& Production::Table() {
    static const BindingTable table{
        {"zo:productionId", Kind::OptionalString},
        {"zo:sessionId", Kind::OptionalString},
        {"zo:transactionId", Kind::OptionalString},
        {"zo:parentProductionId", Kind::OptionalString},
        {"zo:commitId", Kind::OptionalString},
        {"commitId", Kind::OptionalString},
        {"zo:baseCommitId", Kind::OptionalString},
        {"properties", Kind::Object, &ProductionBaseProperties::Table},
        {"zo:owner", Kind::OptionalString},
        {"owner", Kind::OptionalString},
        {"created", Kind::Date},
        {"modified", Kind::Date},
        {"metadata", Kind::Object, &ClientMetadata::Table},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

ImmutableString Production::Identifier() const {
    return LastIdentifier(*this);
}

void Production::SetProperties(const ProductionBaseProperties& inProperties) {
    ostcore::serialization::AddToObject(MutableBody(), "properties", inProperties.Body());
}

const BindingTable& ProductionListItem::Table() {
    static const BindingTable table{
        {"zo:productionId", Kind::OptionalString},
        {"zo:sessionId", Kind::OptionalString},
        {"zo:transactionId", Kind::OptionalString},
        {"zo:owner", Kind::OptionalString},
        {"owner", Kind::OptionalString},
        {"zo:baseCommitId", Kind::OptionalString},
        {"created", Kind::Date},
        {"modified", Kind::Date},
        {"zo:lastModified", Kind::Date},
        {"zo:lastModifiedOfAllSessions", Kind::Date},
        {"metadata", Kind::Object, &ClientMetadata::Table},
        {"properties", Kind::Object, &ProductionBaseProperties::Table},
        {"hasBin", Kind::Boolean},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

ImmutableString ProductionListItem::Identifier() const {
    return LastIdentifier(*this);
}

const BindingTable& Productions::Table() {
    static const BindingTable table{
        {"links", Kind::ObjectList, &LinkTable},
        {"stats", Kind::Any},
        {"productions", Kind::ObjectList, &ProductionListItem::Table},
        {"sessions", Kind::ObjectList, &ProductionListItem::Table},
        {"transactions", Kind::ObjectList, &ProductionListItem::Table},
    };
    return table;
}

std::vector<ProductionListItem> Productions::Items() const {
    std::vector<ProductionListItem> items;
    for (const char* key : {"productions", "sessions", "transactions"}) {
        AppendItems(List<ProductionListItem>(key), items);
    }
    return items;
}

const BindingTable& MediaLocatorPropertiesTable() {
    static const BindingTable table{
        {"href", Kind::OptionalString},
        {"docId", Kind::OptionalString},
        {"contentStateId", Kind::OptionalString},
        {"displayName", Kind::OptionalString},
        {"stillSequenceParams", Kind::Object, &StillSequenceTable},
        {"numberedStills", Kind::Boolean},
    };
    return table;
}

const BindingTable& MediaLocator::Table() {
    static const BindingTable table{
        {"zo:mediaLocatorId", Kind::OptionalString},
        {"properties", Kind::Object, &MediaLocatorPropertiesTable},
        {"links", Kind::ObjectList, &LinkTable},
    };
    return table;
}

const BindingTable& UserProperties::Table() {
    static const BindingTable table{
        {"firstname", Kind::OptionalString},
        {"lastname", Kind::OptionalString},
        {"email", Kind::OptionalString},
    };
    return table;
}

const BindingTable& Login::Table() {
    static const BindingTable table{
        {"ip", Kind::OptionalString},
        {"hostname", Kind::OptionalString},
        {"useragent", Kind::OptionalString},
    };
    return table;
}

const BindingTable& UserBlock::Table() {
    static const BindingTable table{
        {"zo:userId", Kind::OptionalString},
        {"properties", Kind::Object, &UserProperties::Table},
        {"links", Kind::ObjectList, &LinkTable},
        {"logins", Kind::ObjectList, &Login::Table},
    };
    return table;
}

}  // namespace dto
}  // namespace ZOCL
