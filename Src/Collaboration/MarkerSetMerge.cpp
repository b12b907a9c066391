// First every marker gets its state and its track, then the tracks get theirs, then all is put together.
#include "Collaboration/MarkerSetMerge.h"

#include <unordered_set>

#include "Collaboration/XMPArrays.h"

namespace ZOCL {

using OrvaneXMP::Field;
using OrvaneXMP::Node;
using OrvaneXMP::Range;

namespace {

/// What stays of a value that cannot be taken apart.
template <class Value>
const Value& Decide(const Value& inBase, const Value& inLatest, const Value& inUser) {
    if (inLatest == inUser || inLatest == inBase) {
        return inUser;
    }
    if (inUser == inBase) {
        return inLatest;
    }
    throw MarkerConflict();
}

/// Takes the next field of a name from a sorted row, or an absent node when the row has none of that name.
Node Take(Range<Field> inFields, std::size_t& ioAt, const OrvaneXMP::Name& inName) {
    return ioAt < inFields.size() && inFields[ioAt].name == inName ? inFields[ioAt++].node : Node();
}

/// The first of a name and the next one of a sorted row; null when there is neither.
const OrvaneXMP::Name* Earlier(const OrvaneXMP::Name* inName, Range<Field> inFields, std::size_t inAt) {
    const bool isNext = inAt < inFields.size() && (!inName || inFields[inAt].name < *inName);
    return isNext ? &inFields[inAt].name : inName;
}

std::vector<Field> MergeFields(Range<Field> inBase, Range<Field> inLatest, Range<Field> inUser) {
    std::vector<Field> merged;
    std::size_t base = 0;
    std::size_t latest = 0;
    std::size_t user = 0;
    for (;;) {
        const OrvaneXMP::Name* name = Earlier(nullptr, inBase, base);
        name = Earlier(name, inLatest, latest);
        name = Earlier(name, inUser, user);
        if (!name) {
            return merged;
        }
        const Node baseNode = Take(inBase, base, *name);
        const Node latestNode = Take(inLatest, latest, *name);
        const Node userNode = Take(inUser, user, *name);
        const Node node = Decide(baseNode, latestNode, userNode);
        if (node.IsPresent()) {
            merged.push_back({*name, node});
        }
    }
}

Node MergeStructures(const Node& inBase, const Node& inLatest, const Node& inUser) {
    return Node::Structure(MergeFields(inBase.Fields(), inLatest.Fields(), inUser.Fields()))
        .WithQualifiers(MergeFields(inBase.Qualifiers(), inLatest.Qualifiers(), inUser.Qualifiers()));
}

bool AreSame(const MarkerPlace& inLeft, const MarkerPlace& inRight) {
    return inLeft.track->key == inRight.track->key && *inLeft.node == *inRight.node;
}

/// Whose times a marker counts in: of one of these tracks, or of all.
struct Rates {
    const MarkerTrack* first = nullptr;
    const MarkerTrack* second = nullptr;
    bool needsBoth = false;

    bool Allow(std::string_view inRate) const {
        const bool isFirst = first && first->FrameRate() == inRate;
        const bool isSecond = second && second->FrameRate() == inRate;
        return needsBoth ? isFirst && isSecond : isFirst || isSecond;
    }
};

struct ChosenMarker {
    Node node;
    std::string_view track;
    Rates rates;
    bool isWritten = false;
};

std::vector<Node> NamelessMarkers(const MarkerTrack* inTrack) {
    std::vector<Node> markers;
    if (inTrack) {
        for (const DMO_MarkerInfo& marker : inTrack->markers) {
            if (marker.guid.empty()) {
                markers.push_back(marker.node);
            }
        }
    }
    return markers;
}

class MarkerMerger {
public:
    MarkerMerger(const MarkerSet& inBase, const MarkerSet& inLatest, const MarkerSet& inUser)
        : mBase(inBase), mLatest(inLatest), mUser(inUser) {}

    Node Run() {
        ChooseMarkersOf(mUser);
        ChooseMarkersOf(mLatest);
        WriteTracksOf(mUser);
        WriteTracksOf(mLatest);
        const bool isOnBothSides = mUser.Shape().IsPresent() && mLatest.Shape().IsPresent();
        if (!isOnBothSides && mTracks.empty()) {
            return Node();
        }
        const Node& shape = isOnBothSides ? Decide(mBase.Shape(), mLatest.Shape(), mUser.Shape())
                            : mUser.Shape().IsPresent() ? mUser.Shape()
                                                        : mLatest.Shape();
        return ArrayLike(shape, std::move(mTracks));
    }

private:
    void ChooseMarkersOf(const MarkerSet& inSide) {
        for (const MarkerTrack& track : inSide.Tracks()) {
            for (const DMO_MarkerInfo& marker : track.markers) {
                if (!marker.guid.empty() && mSeen.insert(marker.guid).second) {
                    Choose(marker.guid);
                }
            }
        }
    }

    void Choose(std::string_view inGuid) {
        const MarkerPlace* const base = mBase.FindMarker(inGuid);
        const MarkerPlace* const latest = mLatest.FindMarker(inGuid);
        const MarkerPlace* const user = mUser.FindMarker(inGuid);
        if (latest && user) {
            ChooseOfBoth(inGuid, base, *latest, *user);
            return;
        }
        const MarkerPlace& present = latest ? *latest : *user;
        if (!base) {
            Keep(inGuid, present, {present.track, nullptr, false});
        } else if (!AreSame(present, *base)) {
            throw MarkerConflict();
        }
    }

    void ChooseOfBoth(std::string_view inGuid, const MarkerPlace* inBase, const MarkerPlace& inLatest,
                      const MarkerPlace& inUser) {
        if (AreSame(inLatest, inUser)) {
            Keep(inGuid, inUser, {inLatest.track, inUser.track, false});
        } else if (!inBase) {
            throw MarkerConflict();
        } else if (AreSame(inLatest, *inBase)) {
            Keep(inGuid, inUser, {inUser.track, nullptr, false});
        } else if (AreSame(inUser, *inBase)) {
            Keep(inGuid, inLatest, {inLatest.track, nullptr, false});
        } else {
            const Node node = MergeStructures(*inBase->node, *inLatest.node, *inUser.node);
            const std::string& track = Decide(inBase->track->key, inLatest.track->key, inUser.track->key);
            mChosen[inGuid] = {node, track, {inLatest.track, inUser.track, true}, false};
            mInhabited.insert(track);
        }
    }

    void Keep(std::string_view inGuid, const MarkerPlace& inPlace, const Rates& inRates) {
        mChosen[inGuid] = {*inPlace.node, inPlace.track->key, inRates, false};
        mInhabited.insert(inPlace.track->key);
    }

    void WriteTracksOf(const MarkerSet& inSide) {
        for (const MarkerTrack& track : inSide.Tracks()) {
            if (mWritten.insert(track.key).second) {
                WriteTrack(mBase.FindTrack(track.key), mLatest.FindTrack(track.key),
                           mUser.FindTrack(track.key));
            }
        }
    }

    /// At least one of the sides has the track.
    void WriteTrack(const MarkerTrack* inBase, const MarkerTrack* inLatest, const MarkerTrack* inUser) {
        static const MarkerTrack none;
        const MarkerTrack& base = inBase ? *inBase : none;
        const MarkerTrack& present = inUser ? *inUser : *inLatest;
        const bool isOnBothSides = inLatest && inUser;
        const bool isLatest = NamelessAreOfLatest(inBase, inLatest, inUser);
        const bool isInhabited =
            mInhabited.count(present.key) != 0 || !NamelessMarkers(isLatest ? inLatest : inUser).empty();
        if (!isOnBothSides && inBase) {
            if (present.node != base.node || present.shape != base.shape) {
                throw MarkerConflict();
            }
            if (!isInhabited) {
                return;
            }
        }
        const Node node =
            isOnBothSides ? MergeStructures(base.node, inLatest->node, inUser->node) : present.node;
        const Node shape = isOnBothSides ? Decide(base.shape, inLatest->shape, inUser->shape) : present.shape;
        MarkerTrack written;
        written.key = present.key;
        written.node = node;
        mTracks.push_back(WriteMarkerTrack(node, shape, MarkersOf(written, inLatest, inUser, isLatest)));
    }

    /// Whose markers without an identifier stay; they are one value. Where they are the same, the user's.
    static bool NamelessAreOfLatest(const MarkerTrack* inBase, const MarkerTrack* inLatest,
                                    const MarkerTrack* inUser) {
        const std::vector<Node> base = NamelessMarkers(inBase);
        const std::vector<Node> latest = NamelessMarkers(inLatest);
        const std::vector<Node> user = NamelessMarkers(inUser);
        return &Decide(base, latest, user) == &latest;
    }

    std::vector<Node> MarkersOf(const MarkerTrack& inWritten, const MarkerTrack* inLatest,
                                const MarkerTrack* inUser, bool inNamelessAreOfLatest) {
        std::vector<Node> markers;
        if (inUser) {
            AddMarkers(*inUser, inWritten, !inNamelessAreOfLatest, markers);
        }
        if (inLatest) {
            AddMarkers(*inLatest, inWritten, inNamelessAreOfLatest, markers);
        }
        return markers;
    }

    void AddMarkers(const MarkerTrack& inSide, const MarkerTrack& inWritten, bool inWithNameless,
                    std::vector<Node>& ioMarkers) {
        const std::string_view rate = inWritten.FrameRate();
        for (const DMO_MarkerInfo& marker : inSide.markers) {
            if (marker.guid.empty()) {
                if (inWithNameless) {
                    CheckRate(inSide.FrameRate() == rate);
                    ioMarkers.push_back(marker.node);
                }
                continue;
            }
            const auto chosen = mChosen.find(marker.guid);
            if (chosen == mChosen.end() || chosen->second.isWritten ||
                chosen->second.track != inWritten.key) {
                continue;
            }
            CheckRate(chosen->second.rates.Allow(rate));
            chosen->second.isWritten = true;
            ioMarkers.push_back(chosen->second.node);
        }
    }

    static void CheckRate(bool inIsRight) {
        if (!inIsRight) {
            throw MarkerConflict();
        }
    }

    const MarkerSet& mBase;
    const MarkerSet& mLatest;
    const MarkerSet& mUser;
    std::unordered_set<std::string_view> mSeen;
    std::unordered_map<std::string_view, ChosenMarker> mChosen;
    /// Tracks in which a chosen marker lies.
    std::unordered_set<std::string_view> mInhabited;
    std::unordered_set<std::string_view> mWritten;
    std::vector<Node> mTracks;
};

}  // namespace

Node MergeMarkerSets(const MarkerSet& inBase, const MarkerSet& inLatest, const MarkerSet& inUser) {
    return MarkerMerger(inBase, inLatest, inUser).Run();
}

}  // namespace ZOCL
