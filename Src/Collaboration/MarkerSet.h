// The markers of a clip as xmpDM:Tracks holds them: tracks, each with its markers, found by their
// marker_guid.
#pragma once

#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "OrvaneXMP/Tree.h"

namespace ZOCL {

/// One marker. All that it carries stays in the node, known fields (comment, cuePointParams, cuePointType,
/// duration, location, probability, speaker, startTime, target) and unknown ones.
struct DMO_MarkerInfo {
    /// The marker's marker_guid: a field of its own, or one of its cue point parameters. Empty when it has
    /// none. Valid as long as the node.
    std::string_view guid;
    OrvaneXMP::Node node;
};

/// Reads one marker. Throws std::invalid_argument for what is no structure, and with the text
/// "Null output DMO_MarkerInfo pointer".
void ReadMarkerInfo(const OrvaneXMP::Node& inMarker, DMO_MarkerInfo* outMarker);

struct MarkerTrack {
    /// The same for the same track of another set: its trackName and trackType, and which of several tracks
    /// with the same ones it is.
    std::string key;
    /// Without its markers.
    OrvaneXMP::Node node;
    /// The array of its markers, without them; absent when the track has no such array.
    OrvaneXMP::Node shape;
    std::vector<DMO_MarkerInfo> markers;

    std::string_view FrameRate() const noexcept;
};

/// Where a marker lies.
struct MarkerPlace {
    const MarkerTrack* track;
    const OrvaneXMP::Node* node;
};

/// Immutable.
class MarkerSet {
public:
    /// An absent node gives an empty set. Throws std::invalid_argument when a track or marker is no
    /// structure, their lists are no arrays, or one marker_guid stands twice.
    explicit MarkerSet(const OrvaneXMP::Node& inTracks);
    MarkerSet(const MarkerSet&) = delete;
    MarkerSet& operator=(const MarkerSet&) = delete;

    const std::vector<MarkerTrack>& Tracks() const noexcept { return mTracks; }
    /// Null when there is none.
    const MarkerTrack* FindTrack(std::string_view inKey) const;
    const MarkerPlace* FindMarker(std::string_view inGuid) const;
    /// The array of the tracks without them; absent for an absent node.
    const OrvaneXMP::Node& Shape() const noexcept { return mShape; }

private:
    MarkerTrack ReadTrack(const OrvaneXMP::Node& inTrack);
    std::string KeyOf(const OrvaneXMP::Node& inTrack);

    const OrvaneXMP::Node mShape;
    std::vector<MarkerTrack> mTracks;
    std::unordered_map<std::string_view, const MarkerTrack*> mTracksByKey;
    std::unordered_map<std::string_view, MarkerPlace> mMarkers;
    /// How many tracks of one name and type have been read.
    std::unordered_map<std::string, std::size_t> mTwins;
};

/// The track as a node, with these markers.
OrvaneXMP::Node WriteMarkerTrack(const OrvaneXMP::Node& inTrack, const OrvaneXMP::Node& inShape,
                                 std::vector<OrvaneXMP::Node> inMarkers);

}  // namespace ZOCL
