// The laws of the merge over random triples: two sides that each edited a common base a little, in a small
// world of names and texts, so that their edits meet. ZOCLIENT_TEST_MERGE_TRIPLES sets how many,
// ZOCLIENT_TEST_MERGE_SEED where to begin; a failure tells the seed that makes it again as the only triple.
#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <iostream>
#include <random>

#include "MergeTest.h"

namespace OrvaneXMPCompareAndMerge {

namespace {

class Random {
public:
    explicit Random(std::uint64_t inSeed) : mEngine(inSeed) {}
    /// From 0 to one below inEnd.
    std::size_t Below(std::size_t inEnd) { return mEngine() % inEnd; }
    bool OneOf(std::size_t inChances) { return Below(inChances) == 0; }

private:
    std::mt19937_64 mEngine;
};

std::vector<Field> FieldsOf(Range<Field> inFields) {
    return std::vector<Field>(inFields.begin(), inFields.end());
}

/// Nodes of every kind, and small edits of them.
class Editor {
public:
    explicit Editor(std::uint64_t inSeed) : mRandom(inSeed) {}

    Packet MakePacket() {
        Packet packet;
        packet.about = mRandom.OneOf(8) ? "urn:x" : "";
        packet.properties = Structure(2 + mRandom.Below(4), 3);
        return packet;
    }

    Packet Edited(Packet inPacket) {
        for (std::size_t edits = mRandom.Below(4); edits > 0; --edits) {
            const Node edited = Edit(inPacket.properties, 4, true);
            inPacket.properties = edited.WithQualifiers({});
        }
        if (mRandom.OneOf(20)) {
            inPacket.about = mRandom.OneOf(2) ? "urn:y" : "";
        }
        return inPacket;
    }

private:
    Name AnyName() {
        static const std::vector<Name> names{N("a"), N("b"), N("c"), Name("urn:other#", "a")};
        return names[mRandom.Below(names.size())];
    }
    std::string AnyText() { return std::string(1, static_cast<char>('a' + mRandom.Below(4))); }
    std::string AnyLanguage() {
        static const char* const languages[] = {"x-default", "de", "fr", "it"};
        return languages[mRandom.Below(4)];
    }

    Node Make(int inDepth) {
        switch (mRandom.Below(inDepth == 0 ? 3 : 10)) {
            case 0:
            case 1:
                return Simple();
            case 2:
                return Simple().WithQualifier(AnyName(), Simple());
            case 3:
            case 4:
                return Structure(mRandom.Below(4), inDepth - 1);
            case 5:
                return Structure(mRandom.Below(3), inDepth - 1).WithQualifier(AnyName(), Make(inDepth - 1));
            case 6:
                return Languages();
            case 7:
                return Array(Kind::Unordered, 0);
            default:
                return Array(static_cast<Kind>(3 + mRandom.Below(3)), inDepth - 1);
        }
    }
    Node Simple() {
        const Node node = mRandom.OneOf(4) ? Node::URI(AnyText()) : Node::Text(AnyText());
        return mRandom.OneOf(6) ? Lang(node, AnyLanguage()) : node;
    }
    Node Structure(std::size_t inFields, int inDepth) {
        Node node = Node::Structure({});
        for (; inFields > 0; --inFields) {
            node = node.WithField(AnyName(), Make(inDepth));
        }
        return node;
    }
    Node Array(Kind inKind, int inDepth) {
        std::vector<Node> items;
        for (std::size_t count = mRandom.Below(5); count > 0; --count) {
            items.push_back(Make(inDepth));
        }
        return Node::Array(inKind, items);
    }
    Node Languages() {
        std::vector<Node> items{Lang(Node::Text(AnyText()), "x-default")};
        for (const char* const language : {"de", "fr", "it"}) {
            if (mRandom.OneOf(2)) {
                items.insert(items.begin() + static_cast<std::ptrdiff_t>(mRandom.Below(items.size() + 1)),
                             Lang(Node::Text(AnyText()), language));
            }
        }
        return Node::Array(Kind::Alternative, items);
    }

    /// Most often further down, else here: another value, a field or item more or less, another order.
    Node Edit(const Node& inNode, int inDepth, bool inIsRoot) {
        if (!inIsRoot && mRandom.OneOf(8)) {
            return Make(inDepth > 3 ? 3 : inDepth);
        }
        if (!inIsRoot && mRandom.OneOf(6)) {
            return EditQualifiers(inNode);
        }
        const int below = std::max(0, inDepth - 1);
        const Node edited = inNode.IsStructure()             ? EditStructure(inNode, below)
                            : inNode.IsLanguageAlternative() ? EditLanguages(inNode)
                            : inNode.IsArray()               ? EditArray(inNode, below)
                                                             : Simple();
        return edited.WithQualifiers(FieldsOf(inNode.Qualifiers()));
    }
    Node EditQualifiers(const Node& inNode) {
        const Name name = AnyName();
        const Node& former = inNode.QualifierNamed(name);
        return inNode.WithQualifier(name, former.IsPresent() && mRandom.OneOf(3) ? Node() : Simple());
    }
    Node EditStructure(const Node& inNode, int inDepth) {
        if (inNode.Fields().empty() || mRandom.OneOf(4)) {
            return inNode.WithField(AnyName(), Make(std::min(inDepth, 2)));
        }
        const Field& field = inNode.Fields()[mRandom.Below(inNode.Fields().size())];
        return inNode.WithField(field.name, mRandom.OneOf(4) ? Node() : Edit(field.node, inDepth, false));
    }
    Node EditArray(const Node& inNode, int inDepth) {
        std::vector<Node> items(inNode.Items().begin(), inNode.Items().end());
        const std::size_t at = mRandom.Below(items.size() + 1);
        const auto place = items.begin() + static_cast<std::ptrdiff_t>(at);
        if (at == items.size() || mRandom.OneOf(3)) {
            items.insert(place, Make(std::min(inDepth, 1)));
        } else if (mRandom.OneOf(3)) {
            items.erase(place);
        } else if (mRandom.OneOf(3)) {
            std::swap(items.front(), items[at]);
        } else {
            items[at] = Edit(items[at], inDepth, false);
        }
        return Node::Array(inNode.GetKind(), items);
    }
    Node EditLanguages(const Node& inNode) {
        const std::string language = AnyLanguage();
        const Path path{PathStep::ToLanguage(language)};
        const bool isRemoved = language != "x-default" && Find(inNode, path).IsPresent();
        return Replace(inNode.WithQualifiers({}), path,
                       isRemoved && mRandom.OneOf(2) ? Node() : Lang(Node::Text(AnyText()), language));
    }

    Random mRandom;
};

/// The same place on three sides and in the result.
struct Place {
    Node base;
    Node latest;
    Node user;
    Node merged;

    template <class Get>
    Place Below(const Get& inGet) const {
        return {inGet(base), inGet(latest), inGet(user), inGet(merged)};
    }
    std::array<const Node*, 4> All() const { return {&base, &latest, &user, &merged}; }
};

bool AllAreSimple(const Node& inNode) {
    return std::all_of(inNode.Items().begin(), inNode.Items().end(),
                       [](const Node& inItem) { return inItem.IsSimple(); });
}

std::size_t CountOf(const Node& inArray, const Node& inItem) {
    return static_cast<std::size_t>(std::count(inArray.Items().begin(), inArray.Items().end(), inItem));
}

/// Calls inBody for each place below one that has structures, language alternatives or qualifiers.
template <class Body>
void ForEachBelow(const Place& inPlace, const Body& inBody) {
    std::set<std::string> languages;
    std::set<Name> names;
    std::set<Name> qualifiers;
    for (const Node* const node : inPlace.All()) {
        for (const Field& field : node->Fields()) {
            names.insert(field.name);
        }
        for (const Field& qualifier : node->Qualifiers()) {
            qualifiers.insert(qualifier.name);
        }
        for (const Node& item : node->Items()) {
            languages.insert(std::string(item.QualifierNamed(LanguageName()).Value()));
        }
    }
    for (const Name& name : names) {
        inBody(inPlace.Below([&](const Node& inNode) { return inNode.FieldNamed(name); }));
    }
    for (const Name& name : qualifiers) {
        inBody(inPlace.Below([&](const Node& inNode) { return inNode.QualifierNamed(name); }));
    }
    if (inPlace.latest.IsLanguageAlternative()) {
        for (const std::string& language : languages) {
            inBody(inPlace.Below(
                [&](const Node& inNode) { return Find(inNode, {PathStep::ToLanguage(language)}); }));
        }
    }
}

enum class Parts { None, Named, Counted };

/// What the rules take apart, told again in other words than the engine's.
Parts PartsOf(const Place& inPlace) {
    const auto both = [&](const auto& inIs) {
        return inIs(inPlace.latest) && inIs(inPlace.user) &&
               (!inPlace.base.IsPresent() || inIs(inPlace.base));
    };
    if (both([](const Node& inNode) { return inNode.IsStructure(); }) ||
        both([](const Node& inNode) { return inNode.IsLanguageAlternative(); })) {
        return Parts::Named;
    }
    const bool isCounted = both([](const Node& inNode) {
        return inNode.IsArray() && inNode.GetKind() == Kind::Unordered && AllAreSimple(inNode);
    });
    return isCounted ? Parts::Counted : Parts::None;
}

/// Law 5: what is not as a whole that of one side is made of such parts.
bool IsNothingInvented(const Place& inPlace) {
    const Node& merged = inPlace.merged;
    if (merged == inPlace.base || merged == inPlace.latest || merged == inPlace.user) {
        return true;
    }
    const Parts parts = PartsOf(inPlace);
    bool isSound = parts != Parts::None && merged.IsPresent();
    if (parts == Parts::Counted) {
        isSound = isSound && merged.GetKind() == Kind::Unordered &&
                  std::all_of(merged.Items().begin(), merged.Items().end(), [&](const Node& inItem) {
                      return CountOf(inPlace.latest, inItem) + CountOf(inPlace.user, inItem) > 0;
                  });
    }
    ForEachBelow(inPlace, [&](const Place& inBelow) { isSound = isSound && IsNothingInvented(inBelow); });
    return isSound;
}

/// Law 6, with counts for the items of unordered arrays: as many as the only side that changed them has, as
/// the larger side has when it was added to, and as the smaller when both took some away.
bool IsNothingLost(const Place& inPlace) {
    if (inPlace.base == inPlace.latest) {
        return inPlace.merged == inPlace.user;
    }
    if (inPlace.base == inPlace.user || inPlace.latest == inPlace.user) {
        return inPlace.merged == inPlace.latest;
    }
    const Parts parts = PartsOf(inPlace);
    if (parts == Parts::None) {
        return inPlace.merged == inPlace.user;
    }
    bool isSound = true;
    if (parts == Parts::Counted) {
        for (const Node* const node : inPlace.All()) {
            for (const Node& item : node->Items()) {
                const std::size_t base = CountOf(inPlace.base, item);
                const auto [less, more] =
                    std::minmax({CountOf(inPlace.latest, item), CountOf(inPlace.user, item)});
                const std::size_t wanted = more <= base ? less : more;
                isSound = isSound && CountOf(inPlace.merged, item) == wanted;
            }
        }
    }
    ForEachBelow(inPlace, [&](const Place& inBelow) { isSound = isSound && IsNothingLost(inBelow); });
    return isSound;
}

std::multiset<std::string> Exchanged(const std::multiset<std::string>& inConflicts) {
    std::multiset<std::string> exchanged;
    for (std::string each : inConflicts) {
        char& reason = each.back();
        reason = reason == '3' ? '4' : reason == '4' ? '3' : reason;
        exchanged.insert(each);
    }
    return exchanged;
}

/// Each decision tells the truth, and each property that is not the same on all sides has one.
bool AreDecisionsTrue(const IThreeWayMergeResult_v1& inResult, const Packet& inBase, const Packet& inLatest,
                      const Packet& inUser) {
    std::set<Name> decided;
    for (const Decision& each : inResult.GetDecisions()) {
        const Path path = each.path;
        decided.insert(path.front().name);
        if (path.front().name.NamespaceURI() == kNamespace_RDF) {
            continue;
        }
        const Node merged = Find(inResult.GetMergedPacket().properties, path);
        if (each.isGone == merged.IsPresent()) {
            return false;
        }
        const Packet& source = each.source == ResolvedSource::Latest ? inLatest : inUser;
        const Node its = Find(source.properties, path);
        const bool isOfItems = merged.IsArray() && merged.GetKind() == Kind::Unordered;
        const bool isTrue = each.source == ResolvedSource::New ? each.cause == DecisionCause::ItemsMerged
                            : isOfItems ? merged.WithQualifiers({}) == its.WithQualifiers({})
                                        : merged == its;
        if (!isTrue) {
            return false;
        }
    }
    std::set<Name> changed;
    for (const Packet* side : {&inBase, &inLatest, &inUser}) {
        for (const Field& field : side->properties.Fields()) {
            const bool isSame = inBase.Property(field.name) == inLatest.Property(field.name) &&
                                inBase.Property(field.name) == inUser.Property(field.name);
            if (!isSame) {
                changed.insert(field.name);
            }
        }
    }
    if (inBase.about != inLatest.about || inBase.about != inUser.about) {
        changed.insert(Name(kNamespace_RDF, "about"));
    }
    return decided == changed;
}

/// The number of the first law that does not hold, or none.
std::string BrokenLaw(const Packet& inBase, const Packet& inLatest, const Packet& inUser) {
    const auto isPlain = [](const ResultRef& inResult, const Packet& inWanted) {
        return inResult->GetUnResolvedConflicts().empty() && inResult->GetMergedPacket() == inWanted;
    };
    if (!isPlain(Merge(inBase, inUser, inUser), inUser)) {
        return "1: both sides equal";
    }
    if (!isPlain(Merge(inBase, inBase, inUser), inUser) ||
        !isPlain(Merge(inBase, inLatest, inBase), inLatest)) {
        return "2: one side unchanged";
    }
    const ResultRef result = Merge(inBase, inLatest, inUser);
    const ResultRef turned = Merge(inBase, inUser, inLatest);
    const Packet& merged = result->GetMergedPacket();
    const bool hasConflicts = !result->GetUnResolvedConflicts().empty();
    if (ConflictsOf(*result) != Exchanged(ConflictsOf(*turned)) ||
        (!hasConflicts && merged != turned->GetMergedPacket())) {
        return "3: order of the sides";
    }
    if (!hasConflicts && (!isPlain(Merge(inBase, merged, inUser), merged) ||
                          !isPlain(Merge(inBase, inLatest, merged), merged))) {
        return "4: idempotence";
    }
    const Place root{inBase.properties, inLatest.properties, inUser.properties, merged.properties};
    if (!IsNothingInvented(root)) {
        return "5: nothing is invented";
    }
    if (!IsNothingLost(root)) {
        return "6: nothing is lost";
    }
    if (!AreDecisionsTrue(*result, inBase, inLatest, inUser)) {
        return "the decisions";
    }
    return ReadPacket(WritePacket(merged)).packet == merged ? "" : "the result can be written and read";
}

std::uint64_t NumberIn(const char* inVariable, std::uint64_t inDefault) {
    const char* const text = std::getenv(inVariable);
    return text ? std::strtoull(text, nullptr, 10) : inDefault;
}

}  // namespace

TEST(XmpMergeLaws, HoldForRandomTriples) {
    const auto now = static_cast<std::uint64_t>(std::chrono::system_clock::now().time_since_epoch().count());
    const std::uint64_t seed = NumberIn("ZOCLIENT_TEST_MERGE_SEED", now % 1000000000);
    const std::uint64_t triples = NumberIn("ZOCLIENT_TEST_MERGE_TRIPLES", 1500);
    std::cout << "merge laws: " << triples << " triples, ZOCLIENT_TEST_MERGE_SEED=" << seed << std::endl;
    std::size_t withConflicts = 0;
    std::size_t changedByBoth = 0;
    for (std::uint64_t at = 0; at < triples; ++at) {
        Editor editor(seed + at);
        const Packet base = editor.MakePacket();
        const Packet latest = editor.Edited(base);
        const Packet user = editor.Edited(base);
        const std::string broken = BrokenLaw(base, latest, user);
        ASSERT_EQ(broken, "") << "ZOCLIENT_TEST_MERGE_SEED=" << seed + at << "\n"
                              << WritePacket(base) << "\n"
                              << WritePacket(latest) << "\n"
                              << WritePacket(user) << "\n"
                              << WritePacket(Merge(base, latest, user)->GetMergedPacket());
        withConflicts += Merge(base, latest, user)->GetUnResolvedConflicts().empty() ? 0 : 1;
        changedByBoth += base != latest && base != user && latest != user ? 1 : 0;
    }
    // Else the generator makes nothing that could break a law.
    EXPECT_GT(withConflicts, triples / 20);
    EXPECT_GT(changedByBoth, withConflicts + triples / 10);
}

}  // namespace OrvaneXMPCompareAndMerge
