// Marker sets: what two users did to the markers of one clip comes together, or stays whole as a conflict.
#include <vector>

#include "Collaboration/MarkerSetMerge.h"
#include "MergeTest.h"

namespace ZOCL {
namespace {

using OrvaneXMP::Node;

/// A marker in short: its identifier (empty for none), its start and its comment, and further elements.
struct Marker {
    std::string guid;
    int start = 0;
    std::string comment;
    std::string more = {};
};
struct Track {
    std::string name;
    std::vector<Marker> markers;
    std::string rate = "f25";
};

std::string Text(const Marker& inMarker) {
    const std::string parameters =
        inMarker.guid.empty()
            ? ""
            : "<xmpDM:cuePointParams><rdf:Seq><rdf:li xmpDM:key='marker_guid' xmpDM:value='" + inMarker.guid +
                  "'/></rdf:Seq></xmpDM:cuePointParams>";
    return "<rdf:li rdf:parseType='Resource'><xmpDM:startTime>" + std::to_string(inMarker.start) +
           "</xmpDM:startTime><xmpDM:comment>" + inMarker.comment + "</xmpDM:comment>" + parameters +
           inMarker.more + "</rdf:li>";
}

std::string Tracks(const std::vector<Track>& inTracks) {
    std::string text = "<xmpDM:Tracks><rdf:Bag>";
    for (const Track& track : inTracks) {
        text += "<rdf:li rdf:parseType='Resource'><xmpDM:trackName>" + track.name +
                "</xmpDM:trackName><xmpDM:trackType>Comment</xmpDM:trackType><xmpDM:frameRate>" + track.rate +
                "</xmpDM:frameRate><xmpDM:markers><rdf:Seq>";
        for (const Marker& marker : track.markers) {
            text += Text(marker);
        }
        text += "</rdf:Seq></xmpDM:markers></rdf:li>";
    }
    return text + "</rdf:Bag></xmpDM:Tracks>";
}
std::string Markers(const std::vector<Marker>& inMarkers) {
    return Tracks({{"Comments", inMarkers}});
}

const Marker kA{"a", 1, "slate"};
const Marker kB{"b", 2, "action"};
const Marker kC{"c", 3, "cut"};

TEST(MergeMarkersTest, AddedRemovedAndChangedMarkersComeTogether) {
    const Marker moved{"b", 20, "action"};
    const Marker said{"b", 2, "loud"};
    const Marker both{"b", 20, "loud"};
    struct Row {
        const char* what;
        std::vector<Marker> base;
        std::vector<Marker> latest;
        std::vector<Marker> user;
        std::vector<Marker> merged;
    };
    const Row rows[] = {
        {"both added", {kA}, {kA, kB}, {kA, kC}, {kA, kC, kB}},
        {"both added the same", {kA}, {kA, kB, kC}, {kA, kB}, {kA, kB, kC}},
        {"one added, one removed", {kA, kB}, {kA, kB, kC}, {kA}, {kA, kC}},
        {"each removed another", {kA, kB, kC}, {kA, kB}, {kB, kC}, {kB}},
        {"each changed another", {kA, kB}, {kA, moved}, {{"a", 9, "slate"}, kB}, {{"a", 9, "slate"}, moved}},
        {"one marker, two fields", {kA, kB}, {kA, moved}, {kA, said}, {kA, both}},
        {"changed alike, and one more", {kB}, {moved, kC}, {moved}, {moved, kC}},
        {"removed and untouched", {kA, kB}, {kA}, {kA, kB, kC}, {kA, kC}},
    };
    for (const Row& row : rows) {
        const Merged merged(Markers(row.base), Markers(row.latest), Markers(row.user));
        EXPECT_TRUE(merged.IsWhole()) << row.what;
        EXPECT_TRUE(merged.Says(Markers(row.merged))) << row.what;
        // Merged again with either side it stays what it is.
        const Merged again(Markers(row.base), Markers(row.merged), Markers(row.user));
        EXPECT_TRUE(again.Says(Markers(row.merged))) << row.what;
    }
}

TEST(MergeMarkersTest, OneContradictionLeavesAllOfTheMarkers) {
    struct Row {
        const char* what;
        std::vector<Marker> base;
        std::vector<Marker> latest;
        std::vector<Marker> user;
    };
    const Row rows[] = {
        {"moved to two places", {kA, kB}, {kA, {"b", 20, "action"}}, {kA, {"b", 30, "action"}}},
        {"added twice as another", {kA}, {kA, kB}, {kA, {"b", 2, "other"}}},
        {"changed here, removed there", {kA, kB}, {kA, {"b", 20, "action"}}, {kA, kC}},
        {"removed here, changed there", {kA, kB}, {kA, kC}, {kA, {"b", 20, "action"}}},
        {"one field in two ways, another in one",
         {kB},
         {{"b", 20, "x"}},
         {{"b", 2, "y", "<xmpDM:duration>4</xmpDM:duration>"}}},
        {"nameless ones in two ways", {{"", 1, "x"}}, {{"", 1, "y"}}, {{"", 1, "z"}}},
        {"the same identifier twice", {kA}, {kA, kB, kB}, {kA, kC}},
    };
    for (const Row& row : rows) {
        const Merged merged(Markers(row.base), Markers(row.latest), Markers(row.user));
        EXPECT_EQ(merged.result->GetUnResolvedConflicts().size(), 1u) << row.what;
        EXPECT_TRUE(merged.Says(Markers(row.user))) << row.what;
    }
    EXPECT_THROW(
        {
            try {
                MergeMarkerSets(MarkerSet(Node()),
                                MarkerSet(PacketOf(Markers({kA})).Property(XMPNames::Tracks())),
                                MarkerSet(PacketOf(Markers({{"a", 2, ""}})).Property(XMPNames::Tracks())));
            } catch (const std::exception& error) {
                EXPECT_STREQ(error.what(), "Conflict");
                throw;
            }
        },
        MarkerConflict);
    try {
        ReadMarkerInfo(Node::Structure({}), nullptr);
        ADD_FAILURE() << "a null output was taken";
    } catch (const std::exception& error) {
        EXPECT_STREQ(error.what(), "Null output DMO_MarkerInfo pointer");
    }
}

TEST(MergeMarkersTest, WhatNobodyHereKnowsIsKeptAndCountsAsAChange) {
    const auto with = [](const std::string& inOwn) {
        return Marker{"b", 2, "action", "<own:colour>" + inOwn + "</own:colour>"};
    };
    EXPECT_TRUE(Merged(Markers({kA, with("red")}), Markers({kA, with("blue")}), Markers({kC, with("red")}))
                    .Says(Markers({kC, with("blue")})));
    EXPECT_FALSE(Merged(Markers({with("red")}), Markers({with("blue")}), Markers({with("green")})).IsWhole());
    // An identifier can also be a field of its own.
    const Marker own{"", 5, "here", "<xmpDM:marker_guid>o</xmpDM:marker_guid>"};
    const Marker ownMoved{"", 6, "here", "<xmpDM:marker_guid>o</xmpDM:marker_guid>"};
    EXPECT_TRUE(
        Merged(Markers({own}), Markers({ownMoved}), Markers({own, kA})).Says(Markers({ownMoved, kA})));
    // Markers without one go as a whole.
    EXPECT_TRUE(Merged(Markers({{"", 1, "x"}}), Markers({{"", 1, "y"}}), Markers({{"", 1, "x"}, kA}))
                    .Says(Markers({kA, {"", 1, "y"}})));
}

TEST(MergeMarkersTest, TracksComeAndGoWithTheirMarkers) {
    const Track comments{"Comments", {kA}};
    const auto merged = [](const std::vector<Track>& inBase, const std::vector<Track>& inLatest,
                           const std::vector<Track>& inUser) {
        return Merged(Tracks(inBase), Tracks(inLatest), Tracks(inUser));
    };
    // Each side added a track of its own.
    EXPECT_TRUE(merged({comments}, {comments, {"Chapters", {kB}}}, {comments, {"Speech", {kC}}})
                    .Says(Tracks({comments, {"Speech", {kC}}, {"Chapters", {kB}}})));
    // Removed by the user, while the others put a marker into it: it stays for that marker.
    EXPECT_TRUE(merged({comments, {"Chapters", {kB}}}, {comments, {"Chapters", {kB, kC}}}, {comments})
                    .Says(Tracks({comments, {"Chapters", {kC}}})));
    // Removed by the others, untouched by the user.
    EXPECT_TRUE(merged({comments, {"Chapters", {kB}}}, {{"Comments", {kA, kC}}},
                       {{"Comments", {}}, {"Chapters", {kB}}})
                    .Says(Tracks({{"Comments", {kC}}})));
    // Moved to another track by one side, renamed by the other.
    EXPECT_TRUE(merged({comments, {"Chapters", {}}}, {{"Comments", {}}, {"Chapters", {kA}}},
                       {{"Comments", {{"a", 1, "new"}}}, {"Chapters", {}}})
                    .Says(Tracks({{"Comments", {}}, {"Chapters", {{"a", 1, "new"}}}})));
    // Two tracks of one name are two tracks.
    EXPECT_TRUE(merged({{"T", {kA}}, {"T", {kB}}}, {{"T", {kA, kC}}, {"T", {kB}}},
                       {{"T", {kA}}, {"T", {{"b", 7, "action"}}}})
                    .Says(Tracks({{"T", {kA, kC}}, {"T", {{"b", 7, "action"}}}})));
    // Times count in frames: with another frame rate no marker of the old one is taken.
    const Track faster{"Comments", {{"a", 2, "slate"}}, "f50"};
    EXPECT_FALSE(merged({comments}, {faster}, {{"Comments", {kA, kB}}}).IsWhole());
    EXPECT_TRUE(
        merged({comments, {"Chapters", {}}}, {faster, {"Chapters", {}}}, {comments, {"Chapters", {kB}}})
            .Says(Tracks({faster, {"Chapters", {kB}}})));
    // The whole property removed by one side.
    EXPECT_TRUE(
        Merged(Tracks({comments}), Tracks({{"Comments", {kA, kB}}}), "").Says(Tracks({{"Comments", {kB}}})));
    EXPECT_TRUE(Merged(Markers({kA, kB}), "", Markers({kA})).Says(""));
    EXPECT_FALSE(Merged(Markers({kA}), "", Markers({{"a", 1, "x"}})).IsWhole());
    EXPECT_TRUE(Merged("", Markers({kA}), Markers({kB})).Says(Markers({kB, kA})));
}

TEST(MergeMarkersTest, ThousandsOfMarkersOfManyKindsOfChange) {
    constexpr int kMarkers = 12000;
    std::vector<Marker> base;
    std::vector<Marker> latest;
    std::vector<Marker> user;
    for (int number = 0; number < kMarkers; ++number) {
        const Marker marker{"m" + std::to_string(number), number, "c"};
        const Marker moved{marker.guid, number + kMarkers, "c"};
        const Marker said{marker.guid, number, "d"};
        const int kind = number % 6;
        if (kind != 4 && kind != 5) {
            base.push_back(marker);
        }
        if (kind != 1 && kind != 5) {
            latest.push_back(kind == 2 || kind == 3 ? moved : marker);
        }
        if (kind != 4) {
            user.push_back(kind == 3 ? said : marker);
        }
    }
    const Node baseNode = PacketOf(Markers(base)).Property(XMPNames::Tracks());
    const Node latestNode = PacketOf(Markers(latest)).Property(XMPNames::Tracks());
    const Node userNode = PacketOf(Markers(user)).Property(XMPNames::Tracks());
    const MarkerSet merged(MergeMarkerSets(MarkerSet(baseNode), MarkerSet(latestNode), MarkerSet(userNode)));
    ASSERT_EQ(merged.Tracks().size(), 1u);
    EXPECT_EQ(merged.Tracks()[0].markers.size(), static_cast<std::size_t>(kMarkers / 6 * 5));
    for (int number = 0; number < kMarkers; ++number) {
        const MarkerPlace* const place = merged.FindMarker("m" + std::to_string(number));
        const int kind = number % 6;
        ASSERT_EQ(place != nullptr, kind != 1) << number;
        if (place) {
            const bool isMoved = kind == 2 || kind == 3;
            const OrvaneXMP::Name start(OrvaneXMP::kNamespace_XMPDM, "startTime");
            const OrvaneXMP::Name comment(OrvaneXMP::kNamespace_XMPDM, "comment");
            ASSERT_EQ(place->node->FieldNamed(start).Value(),
                      std::to_string(isMoved ? number + kMarkers : number));
            ASSERT_EQ(place->node->FieldNamed(comment).Value(), kind == 3 ? "d" : "c");
        }
    }
}

}  // namespace
}  // namespace ZOCL
