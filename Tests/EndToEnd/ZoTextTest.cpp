// Text for terminals: width, cutting, and what foreign text may do to a terminal.
#include <gtest/gtest.h>

#include "DisplayWidth.h"
#include "Json.h"
#include "Table.h"

namespace zo {
namespace {

TEST(DisplayWidth, CountsColumnsNotBytes) {
    EXPECT_EQ(DisplayWidth("clip"), 4u);
    EXPECT_EQ(DisplayWidth("海辺"), 4u);
    EXPECT_EQ(DisplayWidth("서울"), 4u);
    EXPECT_EQ(DisplayWidth("e\u0301"), 1u);
    EXPECT_EQ(DisplayWidth("\U0001F3AC"), 2u);
    EXPECT_EQ(DisplayWidth("ｱ"), 1u);
    EXPECT_EQ(DisplayWidth(""), 0u);
}

TEST(Truncate, CutsAtCharactersAndNeverExceedsTheColumns) {
    EXPECT_EQ(Truncate("harbour", 7), "harbour");
    EXPECT_EQ(Truncate("harbour", 6), "harbo\u2026");
    // A wide character that would stick out is left away as a whole.
    EXPECT_EQ(Truncate("海辺の映画", 6), "海辺\u2026");
    EXPECT_EQ(Truncate("e\u0301e\u0301e\u0301", 2), "e\u0301\u2026");
    EXPECT_EQ(Truncate("anything", 0), "");
    for (std::size_t columns = 0; columns < 12; ++columns) {
        EXPECT_LE(DisplayWidth(Truncate("a海e\u0301\U0001F3ACb서", columns)), columns);
    }
}

TEST(ForTerminal, LetsNoControlThrough) {
    EXPECT_EQ(ForTerminal("\x1b[31mred\x07"), "\uFFFD[31mred\uFFFD");
    EXPECT_EQ(ForTerminal("a\nb\tc\r"), "a\uFFFDb\uFFFDc\uFFFD");
    EXPECT_EQ(ForTerminal("\u009b31m\u202e\u2066\u2028"), "\uFFFD31m\uFFFD\uFFFD\uFFFD");
    EXPECT_EQ(ForTerminal(std::string_view("n\0l", 3)), "n\uFFFDl");
    EXPECT_EQ(ForTerminal("\xff\xc3"), "\uFFFD\uFFFD");
    EXPECT_EQ(ForTerminal("été 海"), "été 海");
}

TEST(Table, AlignsByDisplayWidth) {
    Table table({{"NAME", 4}, {"TYPE"}});
    table.AddRow({"clip", "bin"});
    table.AddRow({"海辺", "masterclip"});
    EXPECT_EQ(table.Lines(0), (std::vector<std::string>{"NAME  TYPE", "clip  bin", "海辺  masterclip"}));
}

TEST(Table, ShrinksTheWidestColumnFirstAndKeepsRigidOnes) {
    Table table({{"NAME", 4}, {"ID", 4}, {"DATE"}});
    table.AddRow({"a name of twenty two..", "identifier", "2026-11-24"});
    const std::vector<std::string> lines = table.Lines(34);
    EXPECT_EQ(lines.back(), "a name of\u2026  identifier  2026-11-24");
    // Narrower than the minimum can make it: the lines stay whole rather than lose a column.
    EXPECT_EQ(DisplayWidth(table.Lines(5).back()), 4 + 2 + 4 + 2 + 10u);
}

TEST(Json, CarriesSchemaAndTypeFirstAndKeepsIntegersWhole) {
    Json json("file");
    json.Set("bytes", std::uint64_t(9007199254740993)).Set("none", nullptr).Set("text", "a\"b\xff");
    json.SetList("list", std::vector<std::string>{"x"}).Set("time", boost::posix_time::ptime());
    EXPECT_EQ(
        json.Text(),
        "{\"schema\":1,\"type\":\"file\",\"bytes\":9007199254740993,\"none\":null,\"text\":\"a\\\"b\uFFFD\","
        "\"list\":[\"x\"],\"time\":null}");
}

TEST(Time, IsWrittenInUniversalTime) {
    const boost::posix_time::ptime time(boost::gregorian::date(2026, 2, 3),
                                        boost::posix_time::time_duration(4, 5, 6));
    EXPECT_EQ(IsoTime(time), "2026-02-03T04:05:06Z");
    EXPECT_EQ(ShortTime(time), "2026-02-03 04:05");
    EXPECT_EQ(ShortTime(boost::posix_time::ptime()), "-");
}

}  // namespace
}  // namespace zo
