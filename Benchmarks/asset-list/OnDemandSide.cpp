#include <simdjson.h>

#include "Sides.h"

namespace od = simdjson::ondemand;

namespace {

void Assign(std::string& outText, od::value inValue) {
    outText = std::string_view(inValue.get_string());
}

std::int64_t ReadTicks(od::value inValue) {
    return inValue.get_object()["ticks"].get_int64();
}

void ReadStrings(od::value inValue, std::vector<std::string>& outTexts) {
    for (auto element : inValue.get_array()) {
        outTexts.emplace_back(std::string_view(element.get_string()));
    }
}

void ReadLinks(od::value inValue, std::vector<plain::Link>& outLinks) {
    for (auto element : inValue.get_array()) {
        plain::Link& link = outLinks.emplace_back();
        for (auto field : element.get_object()) {
            const std::string_view key = field.unescaped_key();
            if (key == "rel") {
                Assign(link.rel, field.value());
            } else if (key == "href") {
                Assign(link.href, field.value());
            } else if (key == "title") {
                Assign(link.title, field.value());
            } else if (key == "type") {
                Assign(link.type, field.value());
            } else if (key == "zo:etag") {
                Assign(link.etag, field.value());
            }
        }
    }
}

plain::SubClip ReadSubClip(od::value inValue) {
    plain::SubClip subClip;
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "mStartBoundary") {
            subClip.start = ReadTicks(field.value());
        } else if (key == "mEndBoundary") {
            subClip.end = ReadTicks(field.value());
        } else if (key == "mBoundaryIsHard") {
            subClip.isHard = field.value().get_bool();
        }
    }
    return subClip;
}

void ReadProperties(od::value inValue, plain::Properties& outProperties) {
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "name") {
            Assign(outProperties.name, field.value());
        } else if (key == "description") {
            Assign(outProperties.description, field.value());
        } else if (key == "mediaLocator") {
            Assign(outProperties.mediaLocator, field.value());
        } else if (key == "zo:parent") {
            Assign(outProperties.parent, field.value());
        } else if (key == "tags") {
            ReadStrings(field.value(), outProperties.tags);
        } else if (key == "subClip") {
            outProperties.subClip = ReadSubClip(field.value());
        } else if (key == "cdzo:assetType") {
            Assign(outProperties.assetType, field.value());
        } else if (key == "projectItemProperties") {
            Assign(outProperties.projectItem, field.value());
        } else if (key == "mergedClipMediaLocators") {
            ReadStrings(field.value(), outProperties.mergedLocators);
        } else if (key == "isMulticamEnabled") {
            outProperties.isMulticam = bool(field.value().get_bool());
        } else if (key == "zeroPoint") {
            outProperties.zeroPoint = ReadTicks(field.value());
        } else if (key == "smartBinQuery") {
            Assign(outProperties.smartBinQuery, field.value());
        }
    }
}

void ReadEnclosure(od::value inValue, plain::Enclosure& outEnclosure) {
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "zo:etag") {
            Assign(outEnclosure.etag, field.value());
        } else if (key == "zo:enclosureContentId") {
            Assign(outEnclosure.contentId, field.value());
        } else if (key == "zo:enclosureId") {
            Assign(outEnclosure.id, field.value());
        } else if (key == "name") {
            Assign(outEnclosure.name, field.value());
        } else if (key == "links") {
            ReadLinks(field.value(), outEnclosure.links);
        }
    }
}

void ReadRendition(od::value inValue, plain::Rendition& outRendition) {
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "zo:renditionId") {
            Assign(outRendition.id, field.value());
        } else if (key == "zo:renditionContentId") {
            Assign(outRendition.contentId, field.value());
        } else if (key == "properties") {
            Assign(outRendition.mimeType, field.value().get_object()["zo:mimeType"]);
        } else if (key == "links") {
            ReadLinks(field.value(), outRendition.links);
        }
    }
}

void ReadContained(od::value inValue, plain::Asset& outAsset) {
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "enclosures") {
            for (auto element : field.value().get_array()) {
                ReadEnclosure(element.value(), outAsset.enclosures.emplace_back());
            }
        } else if (key == "renditions") {
            for (auto element : field.value().get_array()) {
                ReadRendition(element.value(), outAsset.renditions.emplace_back());
            }
        } else if (key == "links") {
            ReadLinks(field.value(), outAsset.enclosureLinks);
        }
    }
}

void ReadAsset(od::value inValue, plain::Asset& outAsset) {
    for (auto field : inValue.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "zo:assetId") {
            Assign(outAsset.id, field.value());
        } else if (key == "zo:etag") {
            Assign(outAsset.etag, field.value());
        } else if (key == "zo:assetContentId") {
            Assign(outAsset.contentId, field.value());
        } else if (key == "properties") {
            ReadProperties(field.value(), outAsset.properties);
        } else if (key == "links") {
            ReadLinks(field.value(), outAsset.links);
        } else if (key == "enclosures" || key == "renditions") {
            ReadContained(field.value(), outAsset);
        }
    }
}

plain::AssetList ReadList(const Body& inBody) {
    // The parser keeps its buffers from one body to the next, as its makers advise.
    static od::parser parser;
    plain::AssetList list;
    od::document document = parser.iterate(simdjson::padded_string_view(
        inBody->data(), inBody->size(), inBody->size() + ostcore::utility::RecycledMemory::kPadding));
    for (auto field : document.get_object()) {
        const std::string_view key = field.unescaped_key();
        if (key == "assets") {
            for (auto element : field.value().get_array()) {
                ReadAsset(element.value(), list.assets.emplace_back());
            }
        } else if (key == "links") {
            ReadLinks(field.value(), list.links);
        }
    }
    return list;
}

}  // namespace

void RunOnDemand(const Body& inBody) {
    ReadList(inBody);
}

Digest DigestOfOnDemand(const Body& inBody) {
    return DigestOf(ReadList(inBody));
}
