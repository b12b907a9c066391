// Dates are read strictly, given back unchanged, and compared across precisions and zones.
#include "OrvaneXMP/DateTime.h"

#include <gtest/gtest.h>

namespace OrvaneXMP {

TEST(XmpDateTime, EachFormIsGivenBackUnchanged) {
    for (const char* text :
         {"0000", "2024", "2024-02", "2024-02-29", "2024-02-29T23:59", "2024-02-29T23:59Z",
          "2024-02-29T23:59:58", "2024-02-29T23:59:58.120", "2024-02-29T23:59:58.0000000001+05:30",
          "2000-02-29T00:00:00-00:00", "9999-12-31T23:59:59.9+23:59"}) {
        const auto date = ParseDateTime(text);
        ASSERT_TRUE(date) << text;
        EXPECT_EQ(FormatDateTime(*date), text);
    }
}

TEST(XmpDateTime, WhatIsNoDateIsRefused) {
    for (const char* text : {"",
                             "24",
                             "2024-",
                             "2024-13",
                             "2024-00",
                             "2024-2-1",
                             "2023-02-29",
                             "1900-02-29",
                             "2024-04-31",
                             "2024-02-29T",
                             "2024-02-29T24:00",
                             "2024-02-29T12",
                             "2024-02-29T12:60",
                             "2024-02-29T12:00:60",
                             "2024-02-29T12:00:00.",
                             "2024-02-29T12:00:00,5",
                             "2024-02-29Z",
                             "2024Z",
                             "2024-02-29T12:00+5",
                             "2024-02-29T12:00+0530",
                             "2024-02-29T12:00+24:00",
                             "2024-02-29T12:00Zx",
                             " 2024",
                             "2024-02-29 12:00",
                             "-2024",
                             "+2024",
                             "20240",
                             "2024-02-29T12:00:00.123456789012345678901234567890123"}) {
        EXPECT_FALSE(ParseDateTime(text)) << text;
    }
}

TEST(XmpDateTime, TheOrderIsThatOfTheMoments) {
    const auto compare = [](const char* inLeft, const char* inRight) {
        const int there = CompareDateTime(*ParseDateTime(inLeft), *ParseDateTime(inRight));
        EXPECT_EQ(CompareDateTime(*ParseDateTime(inRight), *ParseDateTime(inLeft)), -there);
        return there;
    };
    EXPECT_EQ(compare("2024-03-01T00:30+01:00", "2024-02-29T23:30Z"), 0);
    EXPECT_EQ(compare("2024-02-29T20:00-05:00", "2024-03-01T00:59:59.9Z"), 1);
    EXPECT_EQ(compare("1999-12-31T23:59:59Z", "2000-01-01T00:00:00Z"), -1);
    EXPECT_EQ(compare("2024", "2024-01-01T00:00:00.000"), 0);
    EXPECT_EQ(compare("2024-02", "2024-01-31T23:59"), 1);
    EXPECT_EQ(compare("2024-01-01T12:00", "2024-01-01T12:00Z"), 0);
    EXPECT_EQ(compare("2024-01-01T12:00:00.1", "2024-01-01T12:00:00.10"), 0);
    EXPECT_EQ(compare("2024-01-01T12:00:00.09", "2024-01-01T12:00:00.1"), -1);
    EXPECT_EQ(compare("0000-01-01T00:00+01:00", "0000-01-01"), -1);
}

}  // namespace OrvaneXMP
