// What a program without our layers would read an asset list into.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace plain {

struct Link {
    std::string rel, title, href, type, etag;
};
struct Enclosure {
    std::string etag, contentId, id, name;
    std::vector<Link> links;
};
struct Rendition {
    std::string id, contentId, mimeType;
    std::vector<Link> links;
};
struct SubClip {
    std::int64_t start = 0, end = 0;
    bool isHard = true;
};
struct Properties {
    std::string name, description, mediaLocator, parent, assetType, projectItem, smartBinQuery;
    std::vector<std::string> tags, mergedLocators;
    std::optional<SubClip> subClip;
    std::optional<bool> isMulticam;
    std::int64_t zeroPoint = 0;
};
struct Asset {
    std::string id, etag, contentId;
    Properties properties;
    std::vector<Link> links;
    std::vector<Enclosure> enclosures;
    std::vector<Link> enclosureLinks;
    std::vector<Rendition> renditions;
    std::vector<Link> renditionLinks;
};
struct AssetList {
    std::vector<Asset> assets;
    std::vector<Link> links;
};

}  // namespace plain
