// Binding tables, with the structures of an asset list in small as the example of their use.
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

#include "ostcore/serialization/JSONBinding.h"

using namespace ostcore::serialization;

namespace {

struct Link : BoundObject {
    static const BindingTable& Table() {
        static const BindingTable table{{"rel", BindingKind::OptionalString},
                                        {"href", BindingKind::OptionalString},
                                        {"zo:etag", BindingKind::OptionalString}};
        return table;
    }
    using BoundObject::BoundObject;
    ImmutableString Relation() const { return String("rel"); }
};

struct Item : BoundObject {
    static const BindingTable& Properties() {
        static const BindingTable table{
            {"name", BindingKind::MandatoryString}, {"tags", BindingKind::StringList},
            {"hard", BindingKind::Boolean},         {"zeroPoint", BindingKind::TickTime},
            {"created", BindingKind::Date},         {"frames", BindingKind::Integer32},
            {"rate", BindingKind::Number},          {"extra", BindingKind::Any},
            {"size", BindingKind::Integer}};
        return table;
    }
    static const BindingTable& Table() {
        static const BindingTable table{{"zo:itemId", BindingKind::MandatoryString},
                                        {"zo:owner", BindingKind::OptionalString},
                                        {"owner", BindingKind::OptionalString},
                                        {"properties", BindingKind::Object, &Properties},
                                        {"links", BindingKind::ObjectList, &Link::Table},
                                        {"items", BindingKind::ObjectList, &Item::Table}};
        return table;
    }
    Item() = default;
    explicit Item(const JSONValue& inBody) : BoundObject(inBody, Table()) {}
    Item(const JSONValue& inBody, AlreadyChecked inTag) : BoundObject(inBody, inTag) {}

    ImmutableString Identifier() const { return String("zo:itemId"); }
    ImmutableString Owner() const { return String("zo:owner", "owner"); }
    BoundObject Details() const { return Structure<BoundObject>("properties"); }
    BoundList<Link> Links() const { return List<Link>("links"); }
    BoundList<Item> Items() const { return List<Item>("items"); }
    void SetOwner(const char* inOwner) { AddToObject(MutableBody(), "owner", inOwner); }
};

Item Bind(std::string_view inText) {
    return Item(JSONParse(inText));
}

}  // namespace

TEST(JSONBinding, FieldsAreReadFromTheKeptBody) {
    const Item item = Bind(
        R"({"unknown":[1],"zo:itemId":"i1","zo:owner":"a","owner":"b","links":[{"rel":"self","href":"/x"},{}],
            "properties":{"name":"n","tags":["t1","t2"],"hard":false,"zeroPoint":{"ticks":5},"frames":12,
            "created":"2016-03-31T10:00:00Z","rate":2,"size":5000000000,"extra":[{}]},
            "items":[{"zo:itemId":"i2"},{"zo:itemId":"i3","links":[{"rel":"edit"}]}]})");
    EXPECT_EQ(item.Identifier(), ImmutableString("i1"));
    EXPECT_EQ(item.Owner(), ImmutableString("b"));
    const BoundObject details = item.Details();
    EXPECT_EQ(details.Text("name"), "n");
    EXPECT_EQ(details.Strings("tags").size(), 2u);
    EXPECT_FALSE(details.Boolean("hard", true));
    EXPECT_TRUE(details.Boolean("absent", true));
    EXPECT_FALSE(details.OptionalBoolean("absent"));
    EXPECT_EQ(details.Ticks("zeroPoint"), 5);
    EXPECT_EQ(details.Integer("frames"), 12);
    EXPECT_EQ(details.Integer("size"), 5000000000);
    EXPECT_EQ(details.Number("rate"), 2.0);
    EXPECT_EQ(details.Date("created").time_of_day().hours(), 10);
    ASSERT_EQ(item.Links().size(), 2u);
    EXPECT_EQ(item.Links()[0].Relation(), ImmutableString("self"));
    EXPECT_TRUE(item.Links()[1].Relation().IsNull());
    std::vector<ImmutableString> identifiers;
    for (const Item& child : item.Items()) {
        identifiers.push_back(child.Identifier());
    }
    EXPECT_EQ(identifiers, (std::vector<ImmutableString>{ImmutableString("i2"), ImmutableString("i3")}));
    EXPECT_EQ(item.Items()[1].Links()[0].Relation(), ImmutableString("edit"));
    EXPECT_EQ(GetVariantInObject(item.Body(), "unknown").Size(), 1u);
}

TEST(JSONBinding, EveryWrongTypeFailsTheWholeBody) {
    for (const char* text : {R"({"zo:itemId":1})",
                             R"({"zo:itemId":null})",
                             R"({"owner":{}})",
                             R"({"properties":[]})",
                             R"({"properties":{"name":true}})",
                             R"({"properties":{"tags":"t"}})",
                             R"({"properties":{"tags":[1]}})",
                             R"({"properties":{"tags":[null]}})",
                             R"({"properties":{"hard":"true"}})",
                             R"({"properties":{"hard":0}})",
                             R"({"properties":{"zeroPoint":5}})",
                             R"({"properties":{"zeroPoint":{"ticks":1.5}}})",
                             R"({"properties":{"created":5}})",
                             R"({"properties":{"frames":4294967296}})",
                             R"({"properties":{"size":18446744073709551615}})",
                             R"({"properties":{"rate":"2"}})",
                             R"({"links":{}})",
                             R"({"links":[[]]})",
                             R"({"links":[null]})",
                             R"({"links":[{"rel":"x"},{"href":7}]})",
                             R"({"items":[{"items":[{"items":[{"zo:itemId":false}]}]}]})",
                             R"({"owner":1,"owner":"later"})",
                             "[]",
                             "\"x\"",
                             "1"}) {
        EXPECT_THROW(Bind(text), boost::bad_any_cast) << text;
    }
    EXPECT_THROW(Bind(R"({"properties":{"created":"yesterday"}})"), std::runtime_error);
}

TEST(JSONBinding, NothingIsRequiredAndOptionalsMayBeNull) {
    for (const char* text : {"{}", "null", R"({"owner":null,"properties":null,"links":null,"items":null})",
                             R"({"properties":{"tags":null,"hard":null,"zeroPoint":null,"created":null}})"}) {
        const Item item = Bind(text);
        EXPECT_TRUE(item.Identifier().IsNull()) << text;
        EXPECT_TRUE(item.Details().Strings("tags").empty()) << text;
        EXPECT_EQ(item.Links().size(), 0u) << text;
        EXPECT_EQ(item.Details().Ticks("zeroPoint", 9), 9) << text;
        EXPECT_TRUE(item.Details().Date("created").is_not_a_date_time()) << text;
    }
    EXPECT_TRUE(Item().Owner().IsNull());
    EXPECT_TRUE(Item().Items().empty());
}

TEST(JSONBinding, AStructureIsChangedWithoutItsCopies) {
    const Item original = Bind(R"({"future":1,"owner":"a","links":[{"rel":"self"}]})");
    Item changed = original;
    changed.SetOwner("b");
    EXPECT_EQ(original.Owner(), ImmutableString("a"));
    EXPECT_EQ(changed.Owner(), ImmutableString("b"));
    EXPECT_EQ(GetJSONUTF8String(changed.Body()), R"({"future":1,"owner":"b","links":[{"rel":"self"}]})");
    EXPECT_EQ(changed.Links()[0].Relation(), ImmutableString("self"));
}

TEST(JSONBinding, AListIsFoundOnceByManyThreads) {
    const Item item = Bind(R"({"items":[{"zo:itemId":"i0"},{"zo:itemId":"i1"},{"zo:itemId":"i2"}]})");
    const BoundList<Item> list = item.Items();
    std::vector<std::thread> threads;
    std::vector<ImmutableString> seen(4);
    for (std::size_t reader = 0; reader < seen.size(); ++reader) {
        threads.emplace_back([&, copy = list, reader] { seen[reader] = copy[2].Identifier(); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(seen, std::vector<ImmutableString>(4, ImmutableString("i2")));
}

TEST(JSONBinding, TablesFindTheirKeysInAnyOrder) {
    // Keys of one length with like ends, so that many fall on one slot.
    static const BindingTable table{{"xa1y", BindingKind::Boolean},    {"xa2y", BindingKind::Boolean},
                                    {"xb1y", BindingKind::Boolean},    {"x41y", BindingKind::OptionalString},
                                    {"", BindingKind::OptionalString}, {"z", BindingKind::Boolean}};
    EXPECT_NO_THROW(
        table.Check(JSONParse(R"({"z":true,"":"s","x41y":"s","xb1y":true,"xa2y":false,"xa1y":true})")));
    for (const char* key : {"xa1y", "xa2y", "xb1y", "x41y", "", "z"}) {
        EXPECT_THROW(table.Check(JSONParse("{\"other\":1,\"" + std::string(key) + "\":7}")),
                     boost::bad_any_cast)
            << key;
    }
    EXPECT_THROW((BindingTable{{"a", BindingKind::Any}, {"a", BindingKind::Any}}), std::logic_error);
}
