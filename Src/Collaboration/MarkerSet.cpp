// Reads xmpDM:Tracks and writes its tracks.
#include "Collaboration/MarkerSet.h"

#include <stdexcept>

#include "Collaboration/XMPArrays.h"
#include "Collaboration/XMPMergeNames.h"

namespace ZOCL {

using OrvaneXMP::Kind;
using OrvaneXMP::Node;

namespace {

/// The name under which a marker's identifier stands among its cue point parameters.
constexpr std::string_view kGuidParameter = "marker_guid";

std::string_view GuidOf(const Node& inMarker) {
    const Node& field = inMarker.FieldNamed(XMPNames::MarkerGuid());
    if (field.IsSimple()) {
        return field.Value();
    }
    for (const Node& parameter : inMarker.FieldNamed(XMPNames::CuePointParams()).Items()) {
        if (parameter.FieldNamed(XMPNames::CuePointKey()).Value() == kGuidParameter) {
            return parameter.FieldNamed(XMPNames::CuePointValue()).Value();
        }
    }
    return {};
}

void CheckIsArray(const Node& inNode, const char* inWhat) {
    if (inNode.IsPresent() && !inNode.IsArray()) {
        throw std::invalid_argument(std::string(inWhat) + " is no array");
    }
}

}  // namespace

void ReadMarkerInfo(const Node& inMarker, DMO_MarkerInfo* outMarker) {
    if (!outMarker) {
        throw std::invalid_argument("Null output DMO_MarkerInfo pointer");
    }
    if (!inMarker.IsStructure()) {
        throw std::invalid_argument("A marker is no structure");
    }
    outMarker->node = inMarker;
    outMarker->guid = GuidOf(outMarker->node);
}

std::string_view MarkerTrack::FrameRate() const noexcept {
    return node.FieldNamed(XMPNames::FrameRate()).Value();
}

MarkerSet::MarkerSet(const Node& inTracks) : mShape(inTracks.IsArray() ? ShapeOf(inTracks) : Node()) {
    CheckIsArray(inTracks, "xmpDM:Tracks");
    mTracks.reserve(inTracks.Items().size());
    for (const Node& track : inTracks.Items()) {
        mTracks.push_back(ReadTrack(track));
    }
    // From here on the tracks stay where they are.
    for (const MarkerTrack& track : mTracks) {
        mTracksByKey.emplace(track.key, &track);
        for (const DMO_MarkerInfo& marker : track.markers) {
            if (!marker.guid.empty() &&
                !mMarkers.emplace(marker.guid, MarkerPlace{&track, &marker.node}).second) {
                throw std::invalid_argument("Two markers have the same marker_guid");
            }
        }
    }
}

std::string MarkerSet::KeyOf(const Node& inTrack) {
    // A NUL stands in no text of XML, so no two pairs of texts look the same.
    std::string key(inTrack.FieldNamed(XMPNames::TrackName()).Value());
    key += '\0';
    key += inTrack.FieldNamed(XMPNames::TrackType()).Value();
    const std::size_t twins = mTwins[key]++;
    return key + '\0' + std::to_string(twins);
}

MarkerTrack MarkerSet::ReadTrack(const Node& inTrack) {
    if (!inTrack.IsStructure()) {
        throw std::invalid_argument("A track of markers is no structure");
    }
    const Node& markers = inTrack.FieldNamed(XMPNames::Markers());
    CheckIsArray(markers, "xmpDM:markers");
    MarkerTrack track;
    track.key = KeyOf(inTrack);
    track.node = inTrack.WithField(XMPNames::Markers(), Node());
    track.shape = ShapeOf(markers);
    track.markers.resize(markers.Items().size());
    for (std::size_t at = 0; at < track.markers.size(); ++at) {
        ReadMarkerInfo(markers.Items()[at], &track.markers[at]);
    }
    return track;
}

const MarkerTrack* MarkerSet::FindTrack(std::string_view inKey) const {
    const auto found = mTracksByKey.find(inKey);
    return found == mTracksByKey.end() ? nullptr : found->second;
}

const MarkerPlace* MarkerSet::FindMarker(std::string_view inGuid) const {
    const auto found = mMarkers.find(inGuid);
    return found == mMarkers.end() ? nullptr : &found->second;
}

Node WriteMarkerTrack(const Node& inTrack, const Node& inShape, std::vector<Node> inMarkers) {
    if (!inShape.IsPresent() && inMarkers.empty()) {
        return inTrack;
    }
    const Node shape = inShape.IsPresent() ? inShape : Node::Array(Kind::Ordered, {});
    return inTrack.WithField(XMPNames::Markers(), ArrayLike(shape, std::move(inMarkers)));
}

}  // namespace ZOCL
