// What may become an enclosure or a rendition: the same for single requests and for bulk forms.
#pragma once

#include <string>
#include <string_view>

#include "Model/Objects.h"

namespace zohub {

/// A production holds the metadata of all its clips in enclosures of its own, an asset only what is about it.
inline constexpr std::size_t kMaxEnclosuresOfProduction = 100000;
inline constexpr std::size_t kMaxEnclosuresOfAsset = 1000;
inline constexpr std::size_t kMaxRenditions = 100;

/// Bytes as they came, with the media type that the client stated (or an empty one) and their hash.
struct ItemData {
    std::string_view bytes;
    std::string type;
    std::string hash;
};

/// With a fresh identifier. Throws Failure 400 for a name that cannot be one.
EnclosureState NewEnclosure(std::string_view inName, ItemData const& inData);
/// With a fresh identifier.
RenditionState NewRendition(ItemData const& inData);

/// Other data for what is there. A type goes with them when one was stated.
void SetData(EnclosureState& ioEnclosure, ItemData const& inData);
void SetData(RenditionState& ioRendition, ItemData const& inData);

[[noreturn]] void FailEnclosureExists();
/// Throw Failure 413 unless one more can be added.
void RequireRoomForEnclosure(std::size_t inPresent, std::size_t inMost);
void RequireRoomForRendition(std::size_t inPresent);

}  // namespace zohub
