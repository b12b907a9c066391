// The strategies for dates and histories, each case in packets as hosts write them.
#include "Collaboration/MeridaneHistoryStrategy.h"
#include "Collaboration/MeridaneMarkerStrategy.h"
#include "Collaboration/MeridaneMetadataDateStrategy.h"
#include "Collaboration/MeridaneModifyDateStrategy.h"
#include "MergeTest.h"

namespace ZOCL {
namespace {

using OrvaneXMPCompareAndMerge::ConflictReason;
using OrvaneXMPCompareAndMerge::NodeType;

std::string Dated(const std::string& inDate, const std::string& inInstance) {
    return (inDate.empty() ? "" : "<xmp:MetadataDate>" + inDate + "</xmp:MetadataDate>") +
           (inInstance.empty() ? "" : "<xmpMM:InstanceID>" + inInstance + "</xmpMM:InstanceID>");
}

TEST(MergeStrategiesTest, TheSideWithTheLatestMetadataDateGivesDateAndInstance) {
    struct Row {
        const char* base;
        const char* latest;
        const char* user;
        const char* winner;
        const char* date;
    };
    const Row rows[] = {
        {"2024-05-01T10:00:00Z", "2024-05-02T10:00:00Z", "2024-05-03T10:00:00Z", "user",
         "2024-05-03T10:00:00Z"},
        {"2024-05-01T10:00:00Z", "2024-05-03T10:00:00Z", "2024-05-02T10:00:00Z", "latest",
         "2024-05-03T10:00:00Z"},
        // Equal in all three: base's instance stays, too.
        {"2024-05-01T10:00:00Z", "2024-05-01T10:00:00Z", "2024-05-01T10:00:00Z", "base",
         "2024-05-01T10:00:00Z"},
        // The same moment in two zones; ties go to latest before user.
        {"2024-05-01T10:00:00Z", "2024-05-02T12:00:00+02:00", "2024-05-02T10:00:00Z", "latest",
         "2024-05-02T12:00:00+02:00"},
        // Both sides put the clock back.
        {"2024-05-04T10:00:00Z", "2024-05-03T10:00:00Z", "2024-05-02T10:00:00Z", "base",
         "2024-05-04T10:00:00Z"},
        {"", "2024-05-02", "2024-05-02", "latest", "2024-05-02"},
        {"", "2024-05-02", "2024-05-02T00:00:01Z", "user", "2024-05-02T00:00:01Z"},
        // A date that is none does not win.
        {"", "tomorrow", "2024", "user", "2024"},
        {"2024-05-01T10:00:00Z", "", "2024-05-02T10:00:00Z", "user", "2024-05-02T10:00:00Z"},
    };
    for (const Row& row : rows) {
        const Merged merged(Dated(row.base, "base"), Dated(row.latest, "latest"), Dated(row.user, "user"));
        EXPECT_TRUE(merged.IsWhole()) << row.latest << " " << row.user;
        EXPECT_EQ(merged.Text(XMPNames::InstanceID()), row.winner) << row.latest << " " << row.user;
        EXPECT_EQ(merged.Text(XMPNames::MetadataDate()), row.date);
    }
    EXPECT_FALSE(Merged(Dated("", "base"), Dated("", "latest"), Dated("", "user")).IsWhole());
    EXPECT_FALSE(Merged(Dated("", ""), Dated("now", "latest"), Dated("then", "user")).IsWhole());
    // A winner without an instance takes it out rather than pair its date with another's.
    EXPECT_EQ(Merged(Dated("2024", "base"), Dated("2025", "latest"), Dated("2026", ""))
                  .Text(XMPNames::InstanceID()),
              "-");
}

TEST(MergeStrategiesTest, ModifyDateGoesByItselfAndToTheLaterSide) {
    const auto modified = [](const std::string& inDate) {
        return "<xmp:ModifyDate>" + inDate + "</xmp:ModifyDate>";
    };
    const Merged merged(modified("2024-01"), modified("2024-02-01"), modified("2024-02-01T08:00Z"));
    EXPECT_TRUE(merged.IsWhole());
    EXPECT_EQ(merged.Text(XMPNames::ModifyDate()), "2024-02-01T08:00Z");
    EXPECT_EQ(merged.Source(), 3);
    const auto& conflict = *merged.result->GetResolvedConflicts().at(0);
    EXPECT_EQ(conflict.GetResolvedStatus(), 0x7FFFFFFE);
    EXPECT_EQ(conflict.GetStrategyName(), "MeridaneModifyDateStrategy");
    // The two kinds of dates do not mix: here each comes from another side.
    const Merged both(modified("2024-01") + Dated("2024-01", ""), modified("2024-03") + Dated("2024-02", ""),
                      modified("2024-02") + Dated("2024-03", ""));
    EXPECT_TRUE(both.Says(modified("2024-03") + Dated("2024-03", "")));
    // What nobody has a rule for stays, whatever else is settled.
    const Merged title(Dated("2024", "a") + "<dc:format>a</dc:format>",
                       Dated("2025", "b") + "<dc:format>b</dc:format>",
                       Dated("2026", "c") + "<dc:format>c</dc:format>");
    EXPECT_EQ(title.result->GetUnResolvedConflicts().size(), 1u);
    EXPECT_EQ(title.Text(XMPNames::InstanceID()), "c");
}

TEST(MergeStrategiesTest, EachStrategyTakesItsPropertiesAndNothingElse) {
    using OrvaneXMP::Name;
    using OrvaneXMP::PathStep;
    const auto metadata = MakeXMPMergeStrategy<MeridaneMetadataDateStrategy>();
    const auto modify = MakeXMPMergeStrategy<MeridaneModifyDateStrategy>();
    const auto history = MakeXMPMergeStrategy<MeridaneHistoryStrategy>();
    const auto marker = MakeXMPMergeStrategy<MeridaneMarkerStrategy>();
    const auto asked = [](const auto& inStrategy, const Name& inName, NodeType inType, int inReason,
                          bool inIsInside) {
        return inStrategy->InterestedInResolvingConflict({PathStep::ToField(inName)}, inType,
                                                         static_cast<ConflictReason>(inReason), inIsInside);
    };
    for (int reason = 1; reason <= 4; ++reason) {
        EXPECT_TRUE(asked(metadata, XMPNames::MetadataDate(), NodeType::Simple, reason, false));
        EXPECT_TRUE(asked(metadata, XMPNames::InstanceID(), NodeType::Simple, reason, false));
        EXPECT_TRUE(asked(modify, XMPNames::ModifyDate(), NodeType::Simple, reason, false));
        EXPECT_EQ(asked(history, XMPNames::History(), NodeType::Array, reason, false), reason != 2);
        EXPECT_EQ(asked(marker, XMPNames::Tracks(), NodeType::Array, reason, false), reason != 2);
    }
    EXPECT_FALSE(asked(metadata, XMPNames::MetadataDate(), NodeType::Simple, 1, true));
    EXPECT_FALSE(asked(metadata, XMPNames::ModifyDate(), NodeType::Simple, 1, false));
    EXPECT_FALSE(asked(modify, XMPNames::ModifyDate(), NodeType::Simple, 1, true));
    EXPECT_FALSE(asked(modify, XMPNames::MetadataDate(), NodeType::Simple, 1, false));
    EXPECT_FALSE(asked(history, XMPNames::History(), NodeType::Array, 1, true));
    EXPECT_FALSE(asked(history, XMPNames::History(), NodeType::Simple, 1, false));
    EXPECT_FALSE(asked(history, XMPNames::Tracks(), NodeType::Array, 1, false));
    EXPECT_FALSE(asked(marker, XMPNames::Tracks(), NodeType::Array, 1, true));
    EXPECT_FALSE(asked(marker, XMPNames::Tracks(), NodeType::Structure, 1, false));
    // The same name in another namespace is another property.
    EXPECT_FALSE(asked(modify, Name("http://example.com/own/", "ModifyDate"), NodeType::Simple, 1, false));
}

/// "action@when" for each event, parted by blanks; without @ there is no time. An action with a plus carries
/// a field that nobody here knows.
std::string History(const std::string& inEvents) {
    std::string items;
    std::istringstream events(inEvents);
    for (std::string event; events >> event;) {
        const std::size_t at = event.find('@');
        const std::string action = event.substr(0, at);
        items += "<rdf:li rdf:parseType='Resource'><stEvt:action>" + action + "</stEvt:action>";
        if (action.back() == '+') {
            items += "<own:machine>" + action + "</own:machine>";
        }
        if (at != std::string::npos) {
            items += "<stEvt:when>" + event.substr(at + 1) + "</stEvt:when>";
        }
        items += "</rdf:li>";
    }
    return "<xmpMM:History><rdf:Seq>" + items + "</rdf:Seq></xmpMM:History>";
}

TEST(MergeStrategiesTest, HistoriesInterleaveByTime) {
    struct Row {
        const char* base;
        const char* latest;
        const char* user;
        const char* merged;
    };
    const Row rows[] = {
        {"made@2024-01", "made@2024-01 a@2024-02 c@2024-04", "made@2024-01 b@2024-03",
         "made@2024-01 a@2024-02 b@2024-03 c@2024-04"},
        // An event that both have stands once.
        {"made@2024-01", "made@2024-01 saved@2024-02 a@2024-03", "made@2024-01 saved@2024-02 b@2024-03",
         "made@2024-01 saved@2024-02 a@2024-03 b@2024-03"},
        // Latest before user at one time; zones count.
        {"made@2024-01", "made@2024-01 a@2024-02-01T12:00+02:00", "made@2024-01 b@2024-02-01T09:59Z",
         "made@2024-01 b@2024-02-01T09:59Z a@2024-02-01T12:00+02:00"},
        // What a side cut away comes back: an event happened.
        {"made@2024-01 old@2024-02", "old@2024-02 a@2024-03", "made@2024-01 old@2024-02 b@2024-04",
         "made@2024-01 old@2024-02 a@2024-03 b@2024-04"},
        // No time is asked for where nothing is compared.
        {"made@2024-01", "made@2024-01 a", "made@2024-01", "made@2024-01 a"},
        {"", "a+@2024-02", "b+@2024-01", "b+@2024-01 a+@2024-02"},
    };
    for (const Row& row : rows) {
        const Merged merged(History(row.base), History(row.latest), History(row.user));
        EXPECT_TRUE(merged.IsWhole()) << row.merged;
        EXPECT_TRUE(merged.Says(History(row.merged))) << row.merged;
    }
    const Merged noBase("", History("a@2024-02"), History("b@2024-01"));
    EXPECT_TRUE(noBase.Says(History("b@2024-01 a@2024-02")));
    EXPECT_EQ(noBase.Source(), 4);
    // Removed on one side.
    EXPECT_TRUE(Merged(History("a@2024-01"), History("a@2024-01 b@2024-02"), "")
                    .Says(History("a@2024-01 b@2024-02")));
    EXPECT_TRUE(Merged(History("a@2024-01"), "", History("a@2024-01 c@2024-02"))
                    .Says(History("a@2024-01 c@2024-02")));
}

TEST(MergeStrategiesTest, HistoriesThatCannotBeOrderedStayInConflict) {
    EXPECT_FALSE(Merged(History("made@2024-01"), History("made@2024-01 a"), History("made@2024-01 b@2024-02"))
                     .IsWhole());
    EXPECT_FALSE(
        Merged(History("made@2024-01"), History("made@2024-01 a@2024-13"), History("made@2024-01 b@2024-02"))
            .IsWhole());
    EXPECT_FALSE(Merged("", "<xmpMM:History><rdf:Seq><rdf:li>a</rdf:li></rdf:Seq></xmpMM:History>",
                        History("b@2024-02"))
                     .IsWhole());
    EXPECT_FALSE(Merged("", "<xmpMM:History><rdf:Bag><rdf:li>a</rdf:li></rdf:Bag></xmpMM:History>",
                        History("b@2024-02"))
                     .IsWhole());
}

TEST(MergeStrategiesTest, AHistoryOfThousandsOfEventsStaysInOrderAndLosesNone) {
    constexpr int kEvents = 20000;
    std::string base;
    std::string latest;
    std::string user;
    for (int event = 0; event < kEvents; ++event) {
        char text[64];
        std::snprintf(text, sizeof text, "e%d@2024-01-01T%02d:%02d:%02d.%03dZ ", event, event / 3600000 % 24,
                      event / 60000 % 60, event / 1000 % 60, event % 1000);
        base += event % 4 == 0 ? text : "";
        latest += event % 4 == 0 || event % 4 == 1 ? text : "";
        user += event % 4 == 0 || event % 4 == 2 ? text : "";
    }
    const Merged merged(History(base), History(latest), History(user));
    EXPECT_TRUE(merged.IsWhole());
    const OrvaneXMP::Node& history = merged.Packet().Property(XMPNames::History());
    ASSERT_EQ(history.Items().size(), static_cast<std::size_t>(kEvents / 4 * 3));
    std::string_view before;
    for (const OrvaneXMP::Node& event : history.Items()) {
        const std::string_view when = event.FieldNamed(XMPNames::EventTime()).Value();
        ASSERT_LT(before, when);
        before = when;
    }
}

}  // namespace
}  // namespace ZOCL
