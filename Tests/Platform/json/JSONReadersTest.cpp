// The typed readers: absent, null and wrong values of each kind, and the form of dates.
#include <gtest/gtest.h>

#include <boost/date_time/posix_time/posix_time.hpp>
#include <stdexcept>

#include "ostcore/serialization/JSONReaders.h"

using namespace ostcore::serialization;
using ostcore::ptime;

namespace {

const char* const kBody = R"({"string":"s","number":4,"half":0.5,"yes":true,"null":null,"strings":["a","b"],
    "mixed":["a",1],"nulls":["a",null],"object":{"k":"v"},"objects":[{},{}],"time":{"ticks":-254016000000},
    "small":{"ticks":7},"noTicks":{},"textTicks":{"ticks":"7"},"date":"2016-03-31T10:00:00-05:00","zo:owner":"first",
    "owner":"second","big":4294967296})";

class JSONReaders : public testing::Test {
protected:
    const JSONValue mRoot = JSONParse(kBody);
    const JSONView mBody = mRoot;
};

std::string Iso(std::string_view inText) {
    return boost::posix_time::to_iso_extended_string(ParseDate(inText));
}

}  // namespace

TEST_F(JSONReaders, AbsentKeysLeaveWhatWasThere) {
    ImmutableString string("kept");
    std::string text = "kept";
    bool yes = true;
    ostcore::optional<bool> maybe;
    std::int64_t number = 9;
    ptime date(boost::gregorian::date(2020, 1, 1));
    std::vector<ImmutableString> strings{ImmutableString("kept")};
    for (const char* key : {"absent", "null"}) {
        EXPECT_FALSE(ReadOptionalString(mBody, key, string));
        EXPECT_FALSE(ReadOptionalString(mBody, key, text));
        EXPECT_FALSE(ReadOptionalBoolean(mBody, key, yes));
        EXPECT_FALSE(ReadOptionalBoolean(mBody, key, maybe));
        EXPECT_FALSE(ReadOptionalInt64(mBody, key, number));
        EXPECT_FALSE(ReadOptionalDate(mBody, key, date));
        EXPECT_FALSE(ReadOptionalStringList(mBody, key, strings));
        EXPECT_EQ(ReadTicks(mBody, key), 0);
        EXPECT_EQ(ReadTicks(mBody, key, -5), -5);
        EXPECT_FALSE(ReadObject(mBody, key).IsPresent());
        EXPECT_EQ(ReadList(mBody, key).Size(), 0u);
    }
    EXPECT_EQ(string, ImmutableString("kept"));
    EXPECT_EQ(text, "kept");
    EXPECT_TRUE(yes);
    EXPECT_FALSE(maybe);
    EXPECT_EQ(number, 9);
    EXPECT_EQ(date.date().year(), 2020);
    EXPECT_EQ(strings.size(), 1u);
    EXPECT_TRUE(ReadMandatoryString(mBody, "absent").IsNull());
    EXPECT_THROW(ReadMandatoryString(mBody, "null"), boost::bad_any_cast);
}

TEST_F(JSONReaders, PresentKeysAreRead) {
    ImmutableString string;
    bool yes = false;
    std::int32_t number = 0;
    double half = 0;
    std::vector<ImmutableString> strings;
    EXPECT_EQ(ReadMandatoryString(mBody, "string"), ImmutableString("s"));
    EXPECT_TRUE(ReadOptionalBoolean(mBody, "yes", yes) && yes);
    EXPECT_TRUE(ReadOptionalInt32(mBody, "number", number) && number == 4);
    EXPECT_TRUE(ReadOptionalDouble(mBody, "half", half) && half == 0.5);
    EXPECT_TRUE(ReadOptionalStringList(mBody, "strings", strings));
    EXPECT_EQ(strings, (std::vector<ImmutableString>{ImmutableString("a"), ImmutableString("b")}));
    EXPECT_EQ(ReadTicks(mBody, "time"), -254016000000);
    EXPECT_EQ(ReadTicks(mBody, "small"), 7);
    EXPECT_EQ(ReadTicks(mBody, "noTicks", 3), 0);
    EXPECT_EQ(ReadMandatoryString(ReadObject(mBody, "object"), "k"), ImmutableString("v"));
    EXPECT_EQ(ReadList(mBody, "objects").Size(), 2u);
    EXPECT_TRUE(ReadOptionalString(mBody, "zo:owner", string));
    EXPECT_TRUE(ReadOptionalString(mBody, "owner", string));
    EXPECT_EQ(string, ImmutableString("second"));
}

TEST_F(JSONReaders, AWrongTypeThrowsAndLeavesTheTarget) {
    ImmutableString string("kept");
    bool yes = true;
    std::int64_t number = 9;
    std::int32_t small = 9;
    ptime date;
    std::vector<ImmutableString> strings{ImmutableString("kept")};
    EXPECT_THROW(ReadMandatoryString(mBody, "number"), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalString(mBody, "number", string), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalBoolean(mBody, "string", yes), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalInt64(mBody, "half", number), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalInt32(mBody, "big", small), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalDate(mBody, "number", date), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalStringList(mBody, "mixed", strings), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalStringList(mBody, "nulls", strings), boost::bad_any_cast);
    EXPECT_THROW(ReadOptionalStringList(mBody, "string", strings), boost::bad_any_cast);
    EXPECT_THROW(ReadTicks(mBody, "number"), boost::bad_any_cast);
    EXPECT_THROW(ReadTicks(mBody, "textTicks"), boost::bad_any_cast);
    EXPECT_THROW(ReadObject(mBody, "strings"), boost::bad_any_cast);
    EXPECT_THROW(ReadList(mBody, "object"), boost::bad_any_cast);
    EXPECT_THROW(ReadMandatoryString(JSONParse("[]"), "a"), boost::bad_any_cast);
    EXPECT_EQ(string, ImmutableString("kept"));
    EXPECT_EQ(strings.size(), 1u);
    EXPECT_EQ(number, 9);
}

TEST_F(JSONReaders, TreesReadLikeDocuments) {
    JSONValue changed = mRoot;
    AddToObject(changed, "string", "t");
    EXPECT_EQ(ReadMandatoryString(changed, "string"), ImmutableString("t"));
    EXPECT_EQ(ReadTicks(changed, "small"), 7);
    EXPECT_EQ(ReadMandatoryString(ReadObject(changed, "object"), "k"), ImmutableString("v"));
}

TEST(JSONDates, AreStoredInUTC) {
    EXPECT_EQ(Iso("2016-03-31T10:00:00-05:00"), "2016-03-31T15:00:00");
    EXPECT_EQ(Iso("2016-03-31T10:00:00+05:30"), "2016-03-31T04:30:00");
    EXPECT_EQ(Iso("2016-03-31T10:00:00Z"), "2016-03-31T10:00:00");
    EXPECT_EQ(Iso("2016-03-31T10:00:00"), "2016-03-31T10:00:00");
    EXPECT_EQ(Iso("2016-03-31T10:00:00.25Z"), "2016-03-31T10:00:00.250000");
    EXPECT_EQ(Iso("2016-03-31T10:00:00.123456789+00:00"), "2016-03-31T10:00:00.123456");
    EXPECT_EQ(Iso("2016-02-29T23:59:59-00:01"), "2016-03-01T00:00:59");
    EXPECT_TRUE(ParseDate("").is_not_a_date_time());
}

TEST(JSONDates, MalformedOnesFail) {
    for (const char* text : {"x",
                             "2016",
                             "2016-03-31",
                             "2016-03-31 10:00:00",
                             "2016-03-31T10:00",
                             "2016-13-01T00:00:00Z",
                             "2016-02-30T00:00:00Z",
                             "2015-02-29T00:00:00Z",
                             "2016-00-10T00:00:00Z",
                             "2016-03-00T00:00:00Z",
                             "2016-03-31T24:00:00Z",
                             "2016-03-31T10:60:00Z",
                             "2016-03-31T10:00:61Z",
                             "2016-03-31T10:00:00z",
                             "2016-03-31T10:00:00.Z",
                             "2016-03-31T10:00:00+0500",
                             "2016-03-31T10:00:00+05",
                             "2016-03-31T10:00:00Zx",
                             "2016-03-31T10:00:00+24:00",
                             "-016-03-31T10:00:00Z",
                             "0000-01-01T00:00:00Z",
                             "2016-3-31T10:00:00Z",
                             "9999-12-31T23:59:59-23:59",
                             "1400-01-01T00:00:00+00:01",
                             "1399-12-31T00:00:00Z"}) {
        EXPECT_THROW(ParseDate(text), std::runtime_error) << text;
    }
}
