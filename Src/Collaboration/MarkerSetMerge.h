// Merges three marker sets: marker by marker, and field by field where both sides changed one.
#pragma once

#include <stdexcept>

#include "Collaboration/MarkerSet.h"

namespace ZOCL {

/// The sides contradict one another.
class MarkerConflict : public std::runtime_error {
public:
    MarkerConflict() : std::runtime_error("Conflict") {}
};

/// The node of xmpDM:Tracks that holds both sides' work; absent when one side has no such property and
/// nothing is left.
///
/// Markers are paired by marker_guid, those without one by the track as a whole. A marker's track counts like
/// a field of it, and so do fields that nobody here knows. A track that one side removed stays while a marker
/// in it stays. Markers of a track whose frame rate one side changed are taken from that side alone, since
/// times count in frames. Order is that of the user, with what only latest has behind it.
///
/// Throws MarkerConflict: all or nothing. Near linear in the number of markers.
OrvaneXMP::Node MergeMarkerSets(const MarkerSet& inBase, const MarkerSet& inLatest, const MarkerSet& inUser);

}  // namespace ZOCL
