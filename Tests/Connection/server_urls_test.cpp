// How URLs of a server are formed and moved.
#include <gtest/gtest.h>

#include "Connection/ServerURLs.h"
#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {
namespace {

TEST(ServerURLs, AreFormedFromWhatTheUserTyped) {
    struct Row {
        const char* server;
        bool secure;
        const char* url;
    };
    for (const Row& row :
         {Row{"host", false, "http://host:60138"}, Row{"host", true, "https://host:60137"},
          Row{"host:80", true, "https://host:80"}, Row{"http://host", true, "http://host:60137"},
          Row{"https://host:1", false, "https://host:1"}, Row{"", false, "http://:60138"}}) {
        EXPECT_STREQ(IZOCDataServer::MakeDataServerURL(ImmutableString(row.server), row.secure).c_str(),
                     row.url);
    }
    EXPECT_STREQ(IZOCDataServer::GetDiscoveryURL(ImmutableString("http://host:1")).c_str(),
                 "http://host:1/content/zo/api/discovery.json");
    EXPECT_TRUE(HasSecureProtocol(u"https://host"));
    EXPECT_FALSE(HasSecureProtocol(u"http://https://"));
}

TEST(ServerURLs, AreMovedOntoTheBase) {
    struct Row {
        const char* url;
        const char* base;
        const char* moved;
    };
    for (const Row& row :
         {Row{"http://elsewhere:1/a/b", "https://host:60137", "https://host:60137/a/b"},
          Row{"http://elsewhere", "https://host", "http://elsewhere"}, Row{"/a/b", "https://host", "/a/b"},
          Row{"https://elsewhere/a", "host:1", "https://host:1/a"},
          Row{"ftp://elsewhere/a", "host:1", "http://host:1/a"},
          Row{"http://elsewhere//a?b#c", "http://host", "http://host//a?b#c"}, Row{"", "http://host", ""}}) {
        EXPECT_EQ(MoveOntoBase(row.url, row.base), row.moved);
    }
}

TEST(ServerURLs, TellTheOwnOrigin) {
    EXPECT_TRUE(IsOnBase("http://host:1/a", "http://host:1"));
    EXPECT_TRUE(IsOnBase("HTTP://HOST:1", "http://host:1"));
    EXPECT_FALSE(IsOnBase("http://host:12/a", "http://host:1"));
    EXPECT_FALSE(IsOnBase("http://host:1@evil/a", "http://host:1"));
    EXPECT_FALSE(IsOnBase("https://host:1/a", "http://host:1"));
    EXPECT_FALSE(IsOnBase("/a", "http://host:1"));
}

TEST(ServerURLs, AreShortInTheLoginList) {
    EXPECT_EQ(MakeServerText("https://host:60137", true), "host");
    EXPECT_EQ(MakeServerText("https://host:60137", false), "host:60137");
    EXPECT_EQ(MakeServerText("http://host:80", false), "host:80");
    EXPECT_EQ(CutToBaseURL("http://host:1/content/zo/api/discovery.json"), "http://host:1");
}

}  // namespace
}  // namespace ZOCL
