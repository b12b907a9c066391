#include <gmock/gmock.h>

#include "ostuiqt/detail/Mnemonics.h"

namespace {

using testing::ElementsAre;

std::vector<std::string> Assign(const std::vector<std::string>& inCaptions) {
    std::vector<QString> captions;
    for (const std::string& caption : inCaptions) {
        captions.push_back(QString::fromStdString(caption));
    }
    std::vector<std::string> marked;
    for (const QString& caption : ZOClientQt::detail::AssignMnemonics(captions)) {
        marked.push_back(caption.toStdString());
    }
    return marked;
}

TEST(Mnemonics, EachLetterIsGivenOnceAndWordBeginningsGoFirst) {
    EXPECT_THAT(Assign({"Share", "Stop Resolving", "Search"}),
                ElementsAre("&Share", "Stop &Resolving", "S&earch"));
    EXPECT_THAT(Assign({"a", "A", "a"}), ElementsAre("&a", "A", "a"));
    EXPECT_THAT(Assign({"no", "on", "N"}), ElementsAre("&no", "&on", "N"));
}

TEST(Mnemonics, AmpersandsOfTheTextStay) {
    EXPECT_THAT(Assign({"& Sons", "R&D", "", "..."}), ElementsAre("&& &Sons", "&R&&D", "", "..."));
    EXPECT_THAT(Assign({"Über", "über", "日本"}), ElementsAre("&Über", "ü&ber", "&日本"));
}

}  // namespace
