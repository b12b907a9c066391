// The value that a media locator carries: its JSON form and its order.
#include "ZOClient/MediaLocatorProperties.h"

#include "Model/MediaLocatorPropertiesJSON.h"
#include "ostcore/serialization/JSONReaders.h"
#include "ostcore/utility/StringConversion.h"

namespace ZOCL {

using namespace ostcore::serialization;

const ImmutableString kNumberedStillSequenceType_Numeric("numeric");
const ImmutableString kNumberedStillSequenceType_Lexicographic("lexicographic");

namespace {

/// The null identifier for an absent key and for text that is no identifier.
Guid ReadGuid(JSONView inObject, std::string_view inKey) {
    std::string text;
    Guid result;
    if (ReadOptionalString(inObject, inKey, text)) {
        Guid::Parse(text, result);
    }
    return result;
}

MediaLocatorStillSequenceParams ReadParams(JSONView inObject) {
    MediaLocatorStillSequenceParams params;
    ReadOptionalString(inObject, "type", params.type);
    ReadOptionalString(inObject, "prefix", params.prefix);
    ReadOptionalString(inObject, "suffix", params.suffix);
    ReadOptionalInt32(inObject, "startFrame", params.startFrame);
    ReadOptionalInt32(inObject, "endFrame", params.endFrame);
    ReadOptionalInt32(inObject, "numDigits", params.numDigits);
    ReadOptionalBoolean(inObject, "leadingZeroes", params.leadingZeroes);
    return params;
}

JSONValue WriteParams(const optional<MediaLocatorStillSequenceParams>& inParams) {
    if (!inParams) {
        return JSONValue();
    }
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "type", inParams->type);
    if (!inParams->prefix.empty()) {
        AddToObject(object, "prefix", inParams->prefix);
    }
    if (!inParams->suffix.empty()) {
        AddToObject(object, "suffix", inParams->suffix);
    }
    if (inParams->startFrame != 0) {
        AddToObject(object, "startFrame", inParams->startFrame);
    }
    if (inParams->endFrame != 0) {
        AddToObject(object, "endFrame", inParams->endFrame);
    }
    if (inParams->numDigits != 0) {
        AddToObject(object, "numDigits", inParams->numDigits);
    }
    if (inParams->leadingZeroes) {
        AddToObject(object, "leadingZeroes", true);
    }
    return object;
}

std::pair<std::int64_t, std::int64_t> SignedHalves(const Guid& inGuid) {
    return {static_cast<std::int64_t>(inGuid.High()), static_cast<std::int64_t>(inGuid.Low())};
}

auto OrderOf(const MediaLocatorStillSequenceParams& inParams) {
    return std::tie(inParams.leadingZeroes, inParams.startFrame, inParams.endFrame, inParams.numDigits,
                    inParams.type, inParams.prefix, inParams.suffix);
}

}  // namespace

MediaLocatorProperties ReadMediaLocatorProperties(JSONView inObject) {
    MediaLocatorProperties properties;
    ReadOptionalString(inObject, "href", properties.href);
    properties.documentID = ReadGuid(inObject, "docId");
    properties.contentStateID = ReadGuid(inObject, "contentStateId");
    ReadOptionalString(inObject, "displayName", properties.displayName);
    const JSONView params = ReadObject(inObject, "stillSequenceParams");
    if (params.IsObject()) {
        properties.stillSequenceParams = ReadParams(params);
    }
    optional<bool> numberedStills = MediaLocatorProperties::DefaultNumberedStillsBoolean();
    if (ReadOptionalBoolean(inObject, "numberedStills", numberedStills)) {
        properties.UpgradeNumberedStillsBooleanToStillSequenceParams(numberedStills);
    }
    return properties;
}

JSONValue WriteMediaLocatorProperties(const MediaLocatorProperties& inProperties) {
    JSONValue object = JSONValue::EmptyObject();
    AddToObject(object, "href", inProperties.href);
    AddToObject(object, "docId", inProperties.documentID.ToString());
    AddToObject(object, "contentStateId", inProperties.contentStateID.ToString());
    AddToObject(object, "displayName", inProperties.displayName);
    AddToObject(object, "stillSequenceParams", WriteParams(inProperties.stillSequenceParams));
    AddToObject(object, "numberedStills", MediaLocatorProperties::DefaultNumberedStillsBoolean());
    return object;
}

MediaLocatorProperties::MediaLocatorProperties(const UString& inHRef)
    : href(ostcore::utility::ToUTF8(inHRef)) {}

bool MediaLocatorProperties::IsValid() const {
    return !href.empty();
}

std::string MediaLocatorProperties::AsUTF8String() const {
    return GetJSONUTF8String(WriteMediaLocatorProperties(*this));
}

UString MediaLocatorProperties::AsString() const {
    return ostcore::utility::ToUTF16(AsUTF8String());
}

MediaLocatorProperties& MediaLocatorProperties::FromString(const UString& inText) {
    const JSONValue parsed = JSONParse(ostcore::utility::ToUTF8(inText));
    *this = ReadMediaLocatorProperties(UnwrapSerializerObject(parsed));
    return *this;
}

MediaLocatorProperties MediaLocatorProperties::CreateFromString(const UString& inText) {
    MediaLocatorProperties properties;
    properties.FromString(inText);
    return properties;
}

optional<bool> MediaLocatorProperties::DefaultNumberedStillsBoolean() {
    return optional<bool>();
}

void MediaLocatorProperties::UpgradeNumberedStillsBooleanToStillSequenceParams(
    optional<bool>& ioNumberedStills) {
    if (ioNumberedStills && *ioNumberedStills) {
        MediaLocatorStillSequenceParams params;
        params.type = kNumberedStillSequenceType_Numeric;
        stillSequenceParams = params;
    }
    ioNumberedStills.reset();
}

bool operator==(const MediaLocatorStillSequenceParams& inLeft,
                const MediaLocatorStillSequenceParams& inRight) {
    return OrderOf(inLeft) == OrderOf(inRight);
}

bool operator!=(const MediaLocatorStillSequenceParams& inLeft,
                const MediaLocatorStillSequenceParams& inRight) {
    return !(inLeft == inRight);
}

bool operator<(const MediaLocatorStillSequenceParams& inLeft,
               const MediaLocatorStillSequenceParams& inRight) {
    return OrderOf(inLeft) < OrderOf(inRight);
}

bool operator==(const MediaLocatorProperties& inLeft, const MediaLocatorProperties& inRight) {
    return inLeft.href == inRight.href && inLeft.documentID == inRight.documentID &&
           inLeft.contentStateID == inRight.contentStateID && inLeft.displayName == inRight.displayName &&
           inLeft.stillSequenceParams == inRight.stillSequenceParams;
}

bool operator!=(const MediaLocatorProperties& inLeft, const MediaLocatorProperties& inRight) {
    return !(inLeft == inRight);
}

bool operator<(const MediaLocatorProperties& inLeft, const MediaLocatorProperties& inRight) {
    const auto order = [](const MediaLocatorProperties& inProperties) {
        return std::make_tuple(inProperties.href, SignedHalves(inProperties.contentStateID),
                               SignedHalves(inProperties.documentID), inProperties.displayName,
                               inProperties.stillSequenceParams);
    };
    return order(inLeft) < order(inRight);
}

}  // namespace ZOCL
