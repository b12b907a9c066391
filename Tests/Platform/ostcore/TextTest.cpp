// Conversions of text, replacement of marks, identifiers.
#include <gtest/gtest.h>

#include <set>
#include <string>
#include <thread>
#include <vector>

#include <sys/wait.h>
#include <unistd.h>

#include "ostcore/utility/Guid.h"
#include "ostcore/utility/ReplaceInString.h"
#include "ostcore/utility/StringConversion.h"

namespace {

using namespace ostcore::utility;
using ostcore::UString;

TEST(StringConversion, EachMaximalSubpartOfBadUTF8BecomesOneMark) {
    struct Row {
        std::string input;
        std::u16string expected;
    };
    const std::vector<Row> rows{
        {"", u""},
        {"plain", u"plain"},
        {std::string("a\0b", 3), std::u16string(u"a\0b", 3)},
        {"\xC3\xA4\xE2\x82\xAC\xF0\x9F\x8E\xAC", u"\u00E4\u20AC\U0001F3AC"},
        {"a\x80z", u"a\uFFFDz"},                            // lone continuation
        {"\xC0\xAF", u"\uFFFD\uFFFD"},                      // overlong: no byte can begin it
        {"\xE0\x80\xAF", u"\uFFFD\uFFFD\uFFFD"},            // overlong in three
        {"\xED\xA0\x80", u"\uFFFD\uFFFD\uFFFD"},            // a surrogate
        {"\xF4\x90\x80\x80", u"\uFFFD\uFFFD\uFFFD\uFFFD"},  // beyond U+10FFFF
        {"\xE2\x82z", u"\uFFFDz"},                          // cut short: one subpart
        {"\xF0\x9F\x8E", u"\uFFFD"},
        {"\xF0\x9F\x8E\xC3\xA4", u"\uFFFD\u00E4"},
        {"\xFF\xFE", u"\uFFFD\uFFFD"},
        // The example of the Unicode Standard, table 3-8.
        {"\x61\xF1\x80\x80\xE1\x80\xC2\x62\x80\x63\x80\xBF\x64",
         u"\x61\uFFFD\uFFFD\uFFFD\x62\uFFFD\x63\uFFFD\uFFFD\x64"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(ToUTF16(row.input), row.expected) << testing::PrintToString(row.input);
        EXPECT_EQ(ReplaceInvalidUTF8(row.input), ToUTF8(row.expected)) << testing::PrintToString(row.input);
        EXPECT_EQ(IsValidUTF8(row.input), row.expected.find(u'\uFFFD') == std::u16string::npos);
    }
}

TEST(StringConversion, LoneSurrogatesBecomeMarksAndPairsOneCharacter) {
    const char16_t highThenText[] = {0xD83C, u'x', 0};
    const char16_t lowThenHigh[] = {0xDFAC, 0xD83C, 0};
    EXPECT_EQ(ToUTF8(std::u16string_view(highThenText)), "\xEF\xBF\xBDx");
    EXPECT_EQ(ToUTF8(std::u16string_view(lowThenHigh)), "\xEF\xBF\xBD\xEF\xBF\xBD");
    EXPECT_EQ(ToUTF8(UString(u"\U0001F3AC\U0010FFFF")), "\xF0\x9F\x8E\xAC\xF4\x8F\xBF\xBF");
}

TEST(StringConversion, FoldsOnlyASCII) {
    EXPECT_EQ(FoldCaseASCII("ETag \xC3\x84"), "etag \xC3\x84");
    EXPECT_TRUE(EqualsIgnoreCaseASCII("Set-COOKIE", "set-cookie"));
    EXPECT_FALSE(EqualsIgnoreCaseASCII("a", "ab"));
    EXPECT_FALSE(EqualsIgnoreCaseASCII("@", "`"));  // differ by the bit that parts the cases
}

TEST(ReplaceInString, OnePassThatDoesNotLookAtWhatItPutIn) {
    EXPECT_EQ(ReplaceInString("{a}/{b}/{a}", {{"{a}", "{b}"}, {"{b}", "{a}"}}), "{b}/{a}/{b}");
    EXPECT_EQ(ReplaceInString("@1 @0", {{"@0", "@1"}, {"@1", "one"}}), "one @1");
    EXPECT_EQ(ReplaceInString("abc", {{"", "x"}, {"ab", "1"}, {"abc", "2"}}), "1c");
    EXPECT_EQ(ReplaceInString("no marks {", {{"{a}", "x"}}), "no marks {");
}

TEST(Guid, ReadsWhatItWritesAndRefusesTheRest) {
    const Guid made = Guid::CreateUnique();
    Guid read;
    ASSERT_TRUE(Guid::Parse(made.ToString(), read));
    EXPECT_EQ(read, made);
    ASSERT_TRUE(Guid::Parse("{0123ABCD-4567-89ab-cdef-0123456789AB}", read));
    EXPECT_EQ(read.ToString(), "0123abcd-4567-89ab-cdef-0123456789ab");
    const Guid before = read;
    for (const char* bad :
         {"", "0123abcd-4567-89ab-cdef-0123456789a", "0123abcd-4567-89ab-cdef-0123456789abc",
          "0123abcd_4567-89ab-cdef-0123456789ab", "{0123abcd-4567-89ab-cdef-0123456789ab",
          "0123abcg-4567-89ab-cdef-0123456789ab", "0123abcd45-67-89ab-cdef-0123456789ab"}) {
        EXPECT_FALSE(Guid::Parse(bad, read)) << bad;
        EXPECT_EQ(read, before);
    }
    EXPECT_EQ(made.ToString()[14], '4');
    EXPECT_NE(std::string("89ab").find(made.ToString()[19]), std::string::npos);
}

TEST(Guid, AreUniqueOverThreads) {
    std::vector<std::vector<Guid>> made(4);
    std::vector<std::thread> threads;
    for (auto& list : made) {
        threads.emplace_back([&list] {
            for (int i = 0; i < 5000; ++i) {
                list.push_back(Guid::CreateUnique());
            }
        });
    }
    std::set<Guid> all;
    for (std::size_t i = 0; i < threads.size(); ++i) {
        threads[i].join();
        all.insert(made[i].begin(), made[i].end());
    }
    EXPECT_EQ(all.size(), 20000u);
    EXPECT_FALSE(all.count(Guid()));
}

TEST(Guid, AForkedProcessDoesNotRepeatItsParent) {
    Guid::CreateUnique();  // the parent now holds a store of random words
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    const pid_t child = ::fork();
    if (child == 0) {
        const std::string text = Guid::CreateUnique().ToString();
        ::_exit(::write(ends[1], text.data(), text.size()) == static_cast<ssize_t>(text.size()) ? 0 : 1);
    }
    const std::string own = Guid::CreateUnique().ToString();
    std::string childs(36, ' ');
    ASSERT_EQ(::read(ends[0], childs.data(), childs.size()), 36);
    int status = 0;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    EXPECT_NE(own, childs);
    ::close(ends[0]);
    ::close(ends[1]);
}

}  // namespace
