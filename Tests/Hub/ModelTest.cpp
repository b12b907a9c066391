// The asset map against a plain map, and the text forms of objects.
#include <gtest/gtest.h>

#include <atomic>
#include <random>
#include <thread>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "HubFixture.h"
#include "Model/AssetMap.h"
#include "Routes/DocumentCache.h"

namespace zohub::test {

class AssetMapTest : public ::testing::Test {
protected:
    TemporaryDirectory mDirectory;
    std::unique_ptr<Storage> mStorage = OpenSqliteStorage(mDirectory.Path().string());
    std::unique_ptr<Transaction> mTransaction = mStorage->BeginWrite();
};

TEST_F(AssetMapTest, HoldsWhatAPlainMapHoldsAndItsRootDependsOnNothingElse) {
    std::mt19937 random(20261124);
    std::map<std::string, std::string> expected;
    AssetMap::Written current;
    for (int round = 0; round < 60; ++round) {
        AssetMap::Changes changes;
        // Grows past several levels of forks, then shrinks to nothing.
        bool const grows = round < 30;
        for (int i = 0; i < 200; ++i) {
            std::string const id = "asset" + std::to_string(random() % 4000);
            if (grows || random() % 4 == 0)
                changes[id] = Sha256Hex(std::to_string(random()));
            else
                changes[id] = std::nullopt;
        }
        if (round == 59) {
            changes.clear();
            for (auto const& [id, hash] : expected)
                changes[id] = std::nullopt;
        }
        for (auto const& [id, hash] : changes) {
            if (hash)
                expected[id] = *hash;
            else
                expected.erase(id);
        }
        current = AssetMap(*mTransaction, current.root).Apply(changes);
        ASSERT_EQ(current.count, expected.size());
        AssetMap const map(*mTransaction, current.root);
        ASSERT_EQ(map.All(), expected);

        AssetMap::Changes all(expected.begin(), expected.end());
        ASSERT_EQ(AssetMap(*mTransaction, "").Apply(all).root, current.root);
        for (int i = 0; i < 20; ++i) {
            std::string const id = "asset" + std::to_string(random() % 4000);
            auto const found = expected.find(id);
            ASSERT_EQ(map.Find(id), found == expected.end() ? std::nullopt : std::optional(found->second));
        }
    }
    EXPECT_EQ(current.root, "");
}

TEST_F(AssetMapTest, OneChangeAmongManyWritesLittle) {
    AssetMap::Changes many;
    for (int i = 0; i < 20000; ++i)
        many["asset" + std::to_string(i)] = Sha256Hex(std::to_string(i));
    std::string const root = AssetMap(*mTransaction, "").Apply(many).root;
    auto const count = [this] {
        std::size_t objects = 0;
        mTransaction->VisitObjects([&](std::string const&, std::string_view) { ++objects; });
        return objects;
    };
    std::size_t const before = count();
    AssetMap(*mTransaction, root).Apply({{"asset77", Sha256Hex("new")}});
    EXPECT_LE(count() - before, 5u);
}

TEST(Objects, KeepAllFieldsAndRefuseDamage) {
    AssetState state{
        "id",
        R"({"name":"n","zo:parent":"p","mediaLocator":"m","x":"\n"})",
        "p",
        "m",
        {{"e1", "a name\\with:signs", "text/plain; charset=utf-8", Sha256Hex("1"), 12345678901ull}},
        {{"r1", "image/jpeg", Sha256Hex("2"), 0}}};
    std::string const text = WriteAssetState(state);
    EXPECT_EQ(WriteAssetState(ReadAssetState(text)), text);
    AssetState const back = ReadAssetState(text);
    EXPECT_EQ(back.enclosures[0].name, state.enclosures[0].name);
    EXPECT_EQ(back.enclosures[0].size, state.enclosures[0].size);
    EXPECT_EQ(back.properties, state.properties);
    for (std::size_t cut = 0; cut < text.find("properties\n"); ++cut)
        EXPECT_THROW(ReadAssetState(text.substr(0, cut)), std::runtime_error) << cut;
    EXPECT_THROW(ReadTreeRoot(text), std::runtime_error);
}

TEST(DocumentCacheTest, MakesABodyOnceForAllWhoAskAndForgetsTheOldest) {
    DocumentCache cache(2500);
    std::atomic<int> made{0};
    std::vector<std::thread> readers;
    for (int i = 0; i < 8; ++i)
        readers.emplace_back([&] {
            auto const body = cache.FindOrMake("a", [&] {
                ++made;
                return std::string(1000, 'a');
            });
            EXPECT_EQ(body->Plain(), std::string(1000, 'a'));
        });
    for (auto& reader : readers)
        reader.join();
    EXPECT_EQ(made, 1);
    auto const makes = [&](std::string const& inKey, std::size_t inSize) {
        bool asked = false;
        cache.FindOrMake(inKey, [&] {
            asked = true;
            return std::string(inSize, 'x');
        });
        return asked;
    };
    EXPECT_TRUE(makes("b", 1000));
    EXPECT_FALSE(makes("a", 0));
    EXPECT_TRUE(makes("c", 1000));
    EXPECT_TRUE(makes("b", 1000)) << "b was used longest ago";
    EXPECT_TRUE(makes("huge", 3000));
    EXPECT_TRUE(makes("huge", 3000));
    EXPECT_THROW(cache.FindOrMake("bad", []() -> std::string { throw std::runtime_error("no"); }),
                 std::runtime_error);
    EXPECT_TRUE(makes("bad", 1));
}

TEST(TextRules, DecideWhatMayBeANameAndAnIdentifier) {
    EXPECT_TRUE(IsIdentifier("{0a-B}_.x"));
    for (char const* bad : {"", ".", "..", "a/b", "a b", "a\tb", "ä", "a%2e"})
        EXPECT_FALSE(IsIdentifier(bad)) << bad;
    EXPECT_TRUE(IsValidUtf8("aä€😀"));
    for (char const* bad : {"\xc0\xaf", "\xed\xa0\x80", "\xf4\x90\x80\x80", "\xe2\x82", "\x80"})
        EXPECT_FALSE(IsValidUtf8(bad));
    EXPECT_EQ(PercentDecode("a%2Fb%C3%A4").value(), "a/bä");
    EXPECT_FALSE(PercentDecode("a%2").has_value());
    EXPECT_EQ(JsonString("a\"\\\n\x01ä"), "\"a\\\"\\\\\\n\\u0001ä\"");
}

}  // namespace zohub::test
