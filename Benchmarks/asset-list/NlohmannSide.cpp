#include <nlohmann/json.hpp>

#include "Sides.h"

using nlohmann::json;

namespace {

void Read(const json& inObject, const char* inKey, std::string& outText) {
    const auto found = inObject.find(inKey);
    if (found != inObject.end()) {
        outText = found->get_ref<const std::string&>();
    }
}

std::int64_t ReadTicks(const json& inObject, const char* inKey) {
    const auto found = inObject.find(inKey);
    return found == inObject.end() ? 0 : found->at("ticks").get<std::int64_t>();
}

void ReadStrings(const json& inObject, const char* inKey, std::vector<std::string>& outTexts) {
    const auto found = inObject.find(inKey);
    if (found != inObject.end()) {
        found->get_to(outTexts);
    }
}

std::vector<plain::Link> ReadLinks(const json& inObject) {
    std::vector<plain::Link> links;
    const auto found = inObject.find("links");
    if (found == inObject.end()) {
        return links;
    }
    links.reserve(found->size());
    for (const json& element : *found) {
        plain::Link& link = links.emplace_back();
        Read(element, "rel", link.rel);
        Read(element, "title", link.title);
        Read(element, "href", link.href);
        Read(element, "type", link.type);
        Read(element, "zo:etag", link.etag);
    }
    return links;
}

void ReadProperties(const json& inObject, plain::Properties& outProperties) {
    Read(inObject, "name", outProperties.name);
    Read(inObject, "description", outProperties.description);
    Read(inObject, "mediaLocator", outProperties.mediaLocator);
    Read(inObject, "zo:parent", outProperties.parent);
    Read(inObject, "cdzo:assetType", outProperties.assetType);
    Read(inObject, "projectItemProperties", outProperties.projectItem);
    Read(inObject, "smartBinQuery", outProperties.smartBinQuery);
    ReadStrings(inObject, "tags", outProperties.tags);
    ReadStrings(inObject, "mergedClipMediaLocators", outProperties.mergedLocators);
    outProperties.zeroPoint = ReadTicks(inObject, "zeroPoint");
    const auto multicam = inObject.find("isMulticamEnabled");
    if (multicam != inObject.end()) {
        outProperties.isMulticam = multicam->get<bool>();
    }
    const auto subClip = inObject.find("subClip");
    if (subClip != inObject.end()) {
        outProperties.subClip =
            plain::SubClip{ReadTicks(*subClip, "mStartBoundary"), ReadTicks(*subClip, "mEndBoundary"),
                           subClip->value("mBoundaryIsHard", true)};
    }
}

void ReadEnclosures(const json& inContained, plain::Asset& outAsset) {
    for (const json& element : inContained.at("enclosures")) {
        plain::Enclosure& enclosure = outAsset.enclosures.emplace_back();
        Read(element, "zo:etag", enclosure.etag);
        Read(element, "zo:enclosureContentId", enclosure.contentId);
        Read(element, "zo:enclosureId", enclosure.id);
        Read(element, "name", enclosure.name);
        enclosure.links = ReadLinks(element);
    }
    outAsset.enclosureLinks = ReadLinks(inContained);
}

void ReadRenditions(const json& inContained, plain::Asset& outAsset) {
    for (const json& element : inContained.at("renditions")) {
        plain::Rendition& rendition = outAsset.renditions.emplace_back();
        Read(element, "zo:renditionId", rendition.id);
        Read(element, "zo:renditionContentId", rendition.contentId);
        Read(element.at("properties"), "zo:mimeType", rendition.mimeType);
        rendition.links = ReadLinks(element);
    }
    outAsset.renditionLinks = ReadLinks(inContained);
}

plain::AssetList ReadList(const Body& inBody) {
    const json root = json::parse(inBody->data(), inBody->data() + inBody->size());
    plain::AssetList list;
    const json& assets = root.at("assets");
    list.assets.reserve(assets.size());
    for (const json& element : assets) {
        plain::Asset& asset = list.assets.emplace_back();
        Read(element, "zo:assetId", asset.id);
        Read(element, "zo:etag", asset.etag);
        Read(element, "zo:assetContentId", asset.contentId);
        ReadProperties(element.at("properties"), asset.properties);
        asset.links = ReadLinks(element);
        ReadEnclosures(element.at("enclosures"), asset);
        ReadRenditions(element.at("renditions"), asset);
    }
    list.links = ReadLinks(root);
    return list;
}

}  // namespace

void RunNlohmann(const Body& inBody) {
    ReadList(inBody);
}

Digest DigestOfNlohmann(const Body& inBody) {
    return DigestOf(ReadList(inBody));
}
