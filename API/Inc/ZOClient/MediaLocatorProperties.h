// What a media locator says, as a value that crosses the boundary also as JSON text.
#pragma once

#include "ZOClient/Export.h"
#include "ZOClient/Types.h"

namespace ZOCL {

ZOCL_EXPORT extern const ImmutableString kNumberedStillSequenceType_Numeric;
ZOCL_EXPORT extern const ImmutableString kNumberedStillSequenceType_Lexicographic;

/// A numbered sequence of still images behind one locator.
struct ZOCL_EXPORT MediaLocatorStillSequenceParams {
    ImmutableString type;
    ImmutableString prefix;
    ImmutableString suffix;
    std::int32_t startFrame = 0;
    std::int32_t endFrame = 0;
    std::int32_t numDigits = 0;
    bool leadingZeroes = false;

    friend ZOCL_EXPORT bool operator==(const MediaLocatorStillSequenceParams&,
                                       const MediaLocatorStillSequenceParams&);
    friend ZOCL_EXPORT bool operator!=(const MediaLocatorStillSequenceParams&,
                                       const MediaLocatorStillSequenceParams&);
    friend ZOCL_EXPORT bool operator<(const MediaLocatorStillSequenceParams&,
                                      const MediaLocatorStillSequenceParams&);
};

/// Where an asset's media lies. A plain value; the order is stable within one run and serves containers.
class ZOCL_EXPORT MediaLocatorProperties {
public:
    ImmutableString href;
    Guid documentID;
    Guid contentStateID;
    ImmutableString displayName;
    optional<MediaLocatorStillSequenceParams> stillSequenceParams;

    MediaLocatorProperties() = default;
    explicit MediaLocatorProperties(const UString& inHRef);

    /// True when the href is not empty.
    bool IsValid() const;
    /// JSON text.
    std::string AsUTF8String() const;
    UString AsString() const;
    /// Replaces this value by what the JSON text holds; throws std::exception for text that does not parse.
    MediaLocatorProperties& FromString(const UString& inText);
    static MediaLocatorProperties CreateFromString(const UString& inText);

    /// For data of older clients: an unset optional.
    static optional<bool> DefaultNumberedStillsBoolean();
    /// A set and true boolean gives numeric params with all else zero; the boolean is cleared in all cases.
    void UpgradeNumberedStillsBooleanToStillSequenceParams(optional<bool>& ioNumberedStills);

    friend ZOCL_EXPORT bool operator==(const MediaLocatorProperties&, const MediaLocatorProperties&);
    friend ZOCL_EXPORT bool operator!=(const MediaLocatorProperties&, const MediaLocatorProperties&);
    friend ZOCL_EXPORT bool operator<(const MediaLocatorProperties&, const MediaLocatorProperties&);
};

}  // namespace ZOCL
