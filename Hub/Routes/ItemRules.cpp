// What may become an enclosure or a rendition.
#include "Routes/ItemRules.h"

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"

namespace zohub {

namespace {

constexpr char kDefaultType[] = "application/octet-stream";

template <class State>
void SetDataOf(State& ioState, ItemData const& inData) {
    ioState.content = inData.hash;
    ioState.size = inData.bytes.size();
    if (!inData.type.empty())
        ioState.type = inData.type;
}

}  // namespace

EnclosureState NewEnclosure(std::string_view inName, ItemData const& inData) {
    if (!IsEnclosureName(inName))
        throw Failure(
            400, "name-invalid",
            "An enclosure's name is 1 to 1024 bytes of UTF-8 without control characters, backslashes, a "
            "leading slash or \"..\".");
    return {NewKey(kShortKey), std::string(inName), inData.type.empty() ? kDefaultType : inData.type,
            inData.hash, inData.bytes.size()};
}

RenditionState NewRendition(ItemData const& inData) {
    return {NewKey(kShortKey), inData.type, inData.hash, inData.bytes.size()};
}

void SetData(EnclosureState& ioEnclosure, ItemData const& inData) {
    SetDataOf(ioEnclosure, inData);
}

void SetData(RenditionState& ioRendition, ItemData const& inData) {
    SetDataOf(ioRendition, inData);
}

void FailEnclosureExists() {
    throw Failure(409, "enclosure-exists",
                  "There is an enclosure of that name already; write to its edit address instead.");
}

void RequireRoomForEnclosure(std::size_t inPresent, std::size_t inMost) {
    if (inPresent >= inMost)
        throw Failure(413, "too-many-enclosures", "No more enclosures can be put here; remove some first.");
}

void RequireRoomForRendition(std::size_t inPresent) {
    if (inPresent >= kMaxRenditions)
        throw Failure(413, "too-many-renditions", "No more renditions can be put here; remove some first.");
}

}  // namespace zohub
