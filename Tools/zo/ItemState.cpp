// Reads documents of items and compares them.
#include "ItemState.h"

#include "Failure.h"
#include "ostcore/serialization/JSON.h"

namespace zo {
namespace {

using ostcore::serialization::JSONValue;
using ostcore::serialization::JSONView;
using Texts = std::map<std::string, std::string>;

std::string TextUnder(JSONView inObject, const char* inKey) {
    const JSONView value = inObject.Find(inKey);
    return value.IsString() ? std::string(value.AsString()) : std::string();
}

void ReadRenditions(JSONView inAsset, Texts& outRenditions) {
    const JSONView contained = inAsset.Find("renditions");
    if (!contained.IsObject()) {
        return;
    }
    contained.Find("renditions").ForEachElement([&](JSONView inRendition) {
        outRenditions[TextUnder(inRendition, "zo:renditionId")] =
            TextUnder(inRendition, "zo:renditionContentId");
    });
}

ItemState Read(const JSONValue& inDocument) {
    ItemState state;
    state.exists = true;
    const JSONView document(inDocument);
    const JSONView properties = document.Find("properties");
    if (properties.IsObject()) {
        properties.ForEachMember([&](std::string_view inKey, JSONView inValue) {
            state.properties[std::string(inKey)] =
                ostcore::serialization::GetJSONUTF8String(inDocument.Own(inValue));
        });
    }
    ReadRenditions(document, state.renditions);
    state.content = TextUnder(document, "zo:enclosureContentId");
    return state;
}

// "parent" for "zo:parent".
std::string ForPeople(const std::string& inKey) {
    const std::size_t colon = inKey.find(':');
    return colon == std::string::npos ? inKey : inKey.substr(colon + 1);
}

std::string ValueOf(const Texts& inTexts, const std::string& inKey) {
    const auto found = inTexts.find(inKey);
    return found == inTexts.end() ? std::string() : found->second;
}

}  // namespace

ItemState LoadItemState(Context& ioContext, const std::string& inURL, const std::string& inWhat) {
    if (inURL.empty()) {
        return {};
    }
    const auto resource = ZOCL::IZOCServerResource::Create(ZOCL::ImmutableString(inURL), ioContext.Server(),
                                                           ZOCL::ResourceWritability::kReadOnly);
    try {
        LoadResource(ioContext, resource, inWhat);
        return Read(ostcore::serialization::JSONParse(resource->GetResponseData()));
    } catch (const Failure& failure) {
        if (failure.Code() == ExitCode::NotFound) {
            return {};
        }
        throw;
    } catch (const std::exception&) {
        throw Failure(ExitCode::Failure, inWhat + ": the hub's answer is not what it should be",
                      "the hub and this program may be of different versions");
    }
}

std::vector<std::string> ChangedParts(const ItemState& inBase, const ItemState& inSide) {
    std::vector<std::string> parts;
    Texts all = inBase.properties;
    all.insert(inSide.properties.begin(), inSide.properties.end());
    for (const auto& [key, value] : all) {
        if (ValueOf(inBase.properties, key) != ValueOf(inSide.properties, key)) {
            parts.push_back(ForPeople(key));
        }
    }
    if (inBase.renditions != inSide.renditions) {
        parts.emplace_back("renditions");
    }
    return parts;
}

bool AreAtOdds(const ItemState& inBase, const ItemState& inMine, const ItemState& inTheirs) {
    const auto differ = [](const auto& inA, const auto& inB, const auto& inC) {
        return inA != inB && inA != inC && inB != inC;
    };
    if (differ(inBase.properties, inMine.properties, inTheirs.properties)) {
        return true;
    }
    Texts all = inBase.renditions;
    all.insert(inMine.renditions.begin(), inMine.renditions.end());
    all.insert(inTheirs.renditions.begin(), inTheirs.renditions.end());
    for (const auto& [id, content] : all) {
        if (differ(ValueOf(inBase.renditions, id), ValueOf(inMine.renditions, id),
                   ValueOf(inTheirs.renditions, id))) {
            return true;
        }
    }
    return false;
}

}  // namespace zo
