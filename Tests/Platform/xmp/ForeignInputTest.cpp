// Whatever comes from outside is read or refused, within bounds of time and memory.
#include <malloc.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <ctime>
#include <functional>

#include "XmpTest.h"

namespace OrvaneXMP {

namespace {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr double kMostSeconds = 20;
constexpr std::size_t kMostBytes = std::size_t{2} << 30;
#elif defined(__OPTIMIZE__)
constexpr double kMostSeconds = 1;
constexpr std::size_t kMostBytes = 64u << 20;
#else
constexpr double kMostSeconds = 4;
constexpr std::size_t kMostBytes = 64u << 20;
#endif

const std::string kText = "\xC3\xA9 \xE2\x82\xAC \xF0\x9D\x84\x9E";

Packet Sample() {
    Packet packet;
    packet.properties = Node::Structure(
        {{N("a"), Node::Text(kText)}, {N("b"), Node::Array(Kind::Ordered, {Node::Text("1")})}});
    return packet;
}

/// UTF-8 of the tests in units of so many bytes.
std::string Widened(const std::u32string& inText, std::size_t inUnit, bool inIsLittle) {
    std::string bytes;
    const auto put = [&](std::uint32_t inValue) {
        for (std::size_t at = 0; at < inUnit; ++at) {
            const std::size_t place = inIsLittle ? at : inUnit - 1 - at;
            bytes += static_cast<char>(inValue >> (place * 8) & 0xFF);
        }
    };
    for (const char32_t point : inText) {
        if (inUnit == 2 && point >= 0x10000) {
            put(0xD800 + ((point - 0x10000) >> 10));
            put(0xDC00 + ((point - 0x10000) & 0x3FF));
        } else {
            put(point);
        }
    }
    return bytes;
}

std::u32string AsPoints(const std::string& inUTF8) {
    std::u32string points;
    for (std::size_t at = 0; at < inUTF8.size();) {
        const auto lead = static_cast<unsigned char>(inUTF8[at]);
        const std::size_t size = lead < 0x80 ? 1 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
        char32_t point = size == 1 ? lead : lead & (0xFFu >> (size + 1));
        for (std::size_t further = 1; further < size; ++further) {
            point = point << 6 | (static_cast<unsigned char>(inUTF8[at + further]) & 0x3F);
        }
        points += point;
        at += size;
    }
    return points;
}

std::string Repeated(std::size_t inTimes, const std::function<std::string(std::size_t)>& inPart) {
    std::string text;
    for (std::size_t at = 0; at < inTimes; ++at) {
        text += inPart(at);
    }
    return text;
}

/// Runs the reader in a process of its own and looks at its peak: what it takes beyond what the process had
/// with the input in hand, in bytes. A crash fails the test.
std::size_t BytesTaken(const std::string& inText) {
    malloc_trim(0);
    int ends[2];
    EXPECT_EQ(pipe(ends), 0);
    const pid_t child = fork();
    if (child == 0) {
        struct rusage before {};
        getrusage(RUSAGE_SELF, &before);
        const bool isRead = static_cast<bool>(ReadPacket(inText));
        struct rusage after {};
        getrusage(RUSAGE_SELF, &after);
        const long taken = isRead ? -1 : after.ru_maxrss - before.ru_maxrss;
        _exit(write(ends[1], &taken, sizeof taken) == sizeof taken ? 0 : 1);
    }
    long taken = -1;
    close(ends[1]);
    EXPECT_EQ(read(ends[0], &taken, sizeof taken), static_cast<ssize_t>(sizeof taken));
    close(ends[0]);
    int status = -1;
    waitpid(child, &status, 0);
    EXPECT_EQ(status, 0);
    EXPECT_GE(taken, 0) << "it was read";
    return static_cast<std::size_t>(taken) * 1024;
}

}  // namespace

TEST(XmpForeignInput, AllEncodingsOfUnicodeAreReadWithAndWithoutAMark) {
    const std::u32string text = AsPoints(WritePacket(Sample()));
    for (const bool isMarked : {false, true}) {
        const std::u32string marked = isMarked ? U"\uFEFF" + text : text;
        for (const bool isLittle : {false, true}) {
            EXPECT_EQ(Read(Widened(marked, 2, isLittle)), Sample());
            EXPECT_EQ(Read(Widened(marked, 4, isLittle)), Sample());
        }
        EXPECT_EQ(Read((isMarked ? "\xEF\xBB\xBF" : "") + WritePacket(Sample())), Sample());
    }
    const std::string half = Widened(U"<a>\xD834</a>", 4, true);
    EXPECT_NE(WhyRefused(half).find("UTF-32"), std::string::npos);
    EXPECT_NE(WhyRefused(Widened(text, 2, true) + "x").find("UTF-16"), std::string::npos);
}

TEST(XmpForeignInput, ACutPacketIsAnErrorAtEveryByte) {
    for (const WriteOptions::Layout layout :
         {WriteOptions::Layout::Readable, WriteOptions::Layout::Compact}) {
        WriteOptions options;
        options.layout = layout;
        options.padding = 150;
        const std::string text = WritePacket(Sample(), options);
        ASSERT_EQ(Read(text), Sample());
        for (std::size_t size = 0; size < text.size(); ++size) {
            EXPECT_FALSE(WhyRefused(text.substr(0, size)).empty()) << size;
        }
    }
}

TEST(XmpForeignInput, ABrokenWrapperIsRefused) {
    const std::string begin = "<?xpacket begin='\xEF\xBB\xBF' id='W5M0MpCehiHzreSzNTczkc9d'?>";
    const std::string end = "<?xpacket end='r'?>";
    const std::string body = WithProperties("<t:a>1</t:a>");
    EXPECT_EQ(Read(begin + body + "  \n" + end + "\n"), Read(body));
    for (const std::string& text :
         {begin + body, body + end, begin + begin + body + end, begin + body + end + end, end + body + begin,
          begin + body + "<?xpacket end='x'?>", begin + body + "<?xpacket?>",
          begin + WithProperties("<t:a>1</t:a>" + end), WithProperties(begin) + end}) {
        EXPECT_NE(WhyRefused(text).find("packet wrapper"), std::string::npos) << text;
    }
}

TEST(XmpForeignInput, BadCharactersAndDeclarationsAreRefused) {
    for (const std::string& bad :
         {std::string("\xC0\x80"), std::string("\xED\xA0\x80"), std::string("\xFF"), std::string("\x01"),
          std::string("a\0b", 3), std::string("&#0;"), std::string("&#xD800;"), std::string("&other;"),
          std::string("\xEF\xBF\xBF")}) {
        EXPECT_FALSE(WhyRefused(WithProperties("<t:a>" + bad + "</t:a>")).empty());
        EXPECT_THROW(Node::Text(bad.front() == '&' ? "\x02" : bad), std::invalid_argument);
    }
    const std::string body = WithProperties("<t:a>&b;</t:a>");
    for (const char* declaration :
         {"<!DOCTYPE a>", "<!DOCTYPE a [<!ENTITY b 'c'>]>", "<!DOCTYPE a SYSTEM 'file:///etc/passwd'>",
          "<!DOCTYPE a [<!ENTITY b SYSTEM 'file:///etc/passwd'>]>",
          "<!DOCTYPE a [<!ENTITY c 'cccccccc'><!ENTITY d '&c;&c;&c;&c;'><!ENTITY b '&d;&d;&d;&d;'>]>"}) {
        EXPECT_NE(WhyRefused(declaration + body).find("document type"), std::string::npos);
    }
}

TEST(XmpForeignInput, NestingIsBoundedAndADeepTreeIsStillRead) {
    const auto nested = [](std::size_t inDepth) {
        return WithProperties(
            Repeated(inDepth, [](std::size_t) { return std::string("<t:p rdf:parseType='Resource'>"); }) +
            Repeated(inDepth, [](std::size_t) { return std::string("</t:p>"); }));
    };
    EXPECT_EQ(Read(nested(kMaximumDepth - 1)).properties.Height(), kMaximumDepth);
    EXPECT_NE(WhyRefused(nested(kMaximumDepth)).find("nested too deep"), std::string::npos);
    EXPECT_NE(WhyRefused(nested(100000)).find("nested too deep"), std::string::npos);
    Node node = Node::Text("1");
    for (std::size_t height = 1; height < kMaximumDepth; ++height) {
        node = Node::Array(Kind::Ordered, {node});
    }
    EXPECT_THROW(Node::Array(Kind::Ordered, {node}), std::length_error);
}

TEST(XmpForeignInput, FloodsEndWithinASecondAnd64MiB) {
    const std::string million =
        "<rdf:Description " +
        Repeated(1000000, [](std::size_t inAt) { return "t:a" + std::to_string(inAt) + "='' "; }) + "/>";
    const std::string longURI = "xmlns:l='" + std::string(500000, 'l') + "' ";
    const std::pair<const char*, std::string> floods[] = {
        {"a million attributes in one tag", WithRDF(million)},
        {"a million attributes spread",
         WithProperties(Repeated(800000, [](std::size_t) { return std::string("<t:p t:a=''/>"); }))},
        {"a million items",
         WithProperties("<t:p><rdf:Bag>" +
                        Repeated(700000, [](std::size_t) { return std::string("<rdf:li xml:lang=''/>"); }))},
        {"a million names",
         WithProperties(
             Repeated(800000, [](std::size_t inAt) { return "<t:p" + std::to_string(inAt) + "/>"; }))},
        {"a namespace of half a MiB in each of many attributes",
         WithRDF("<rdf:Description " + longURI +
                 Repeated(60000, [](std::size_t inAt) { return "l:a" + std::to_string(inAt) + "='' "; }) +
                 "/>")},
        {"many namespaces", WithProperties(Repeated(400000,
                                                    [](std::size_t inAt) {
                                                        return "<t:p xmlns:n" + std::to_string(inAt) +
                                                               "='urn:" + std::to_string(inAt) + "'/>";
                                                    }))},
        {"a comment without end", WithProperties("<!--" + std::string(15u << 20, 'c'))},
        {"a packet of 17 MiB", WithProperties("<t:p>" + std::string(17u << 20, 'a') + "</t:p>")},
    };
    for (const auto& [name, text] : floods) {
        SCOPED_TRACE(name);
        const std::size_t taken = BytesTaken(text);
        const std::clock_t begin = std::clock();
        const std::string reason = WhyRefused(text);
        const double seconds = static_cast<double>(std::clock() - begin) / CLOCKS_PER_SEC;
        RecordProperty(name,
                       reason + "; " + std::to_string(seconds) + " s, " + std::to_string(taken) + " bytes");
        EXPECT_LT(seconds, kMostSeconds) << reason;
        EXPECT_LT(taken, kMostBytes) << reason;
    }
}

}  // namespace OrvaneXMP
