// Equality of trees, and the hash that goes with it.
#include <algorithm>
#include <functional>

#include "OrvaneXMP/Namespaces.h"
#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

namespace {

constexpr std::string_view kDefaultLanguage = "x-default";

std::size_t Mix(std::size_t inSeed, std::size_t inValue) noexcept {
    std::uint64_t mixed = (inSeed ^ inValue) * 0x9E3779B97F4A7C15u;
    mixed ^= mixed >> 32;
    return static_cast<std::size_t>(mixed * 0xD6E8FEB86659FD93u);
}

bool AreFieldsEqual(Range<Field> inLeft, Range<Field> inRight) {
    return std::equal(inLeft.begin(), inLeft.end(), inRight.begin(), inRight.end(),
                      [](const Field& inOne, const Field& inOther) {
                          return inOne.name == inOther.name && inOne.node == inOther.node;
                      });
}

bool AreInOrderEqual(Range<Node> inLeft, Range<Node> inRight) {
    return std::equal(inLeft.begin(), inLeft.end(), inRight.begin(), inRight.end());
}

struct Hashed {
    std::size_t hash;
    const Node* node;
};

std::vector<Hashed> SortedByHash(Range<Node> inItems) {
    std::vector<Hashed> hashed;
    hashed.reserve(inItems.size());
    for (const Node& item : inItems) {
        hashed.push_back({item.Hash(), &item});
    }
    std::sort(hashed.begin(), hashed.end(),
              [](const Hashed& inLeft, const Hashed& inRight) { return inLeft.hash < inRight.hash; });
    return hashed;
}

/// Each item of the left finds a partner among the rows of the right with the same hash.
bool AreInAnyOrderEqual(Range<Node> inLeft, Range<Node> inRight) {
    const std::vector<Hashed> left = SortedByHash(inLeft);
    std::vector<Hashed> right = SortedByHash(inRight);
    const auto isSame = [](const Hashed& inOne, const Hashed& inOther) { return inOne.hash == inOther.hash; };
    if (!std::equal(left.begin(), left.end(), right.begin(), right.end(), isSame)) {
        return false;
    }
    for (std::size_t at = 0; at < left.size(); ++at) {
        std::size_t partner = at;
        while (partner < right.size() && right[partner].hash == left[at].hash &&
               *right[partner].node != *left[at].node) {
            ++partner;
        }
        if (partner == right.size() || right[partner].hash != left[at].hash) {
            return false;
        }
        std::swap(right[at], right[partner]);
    }
    return true;
}

}  // namespace

bool Node::IsLanguageAlternative() const {
    if (!IsPresent() || GetKind() != Kind::Alternative) {
        return false;
    }
    std::vector<std::string_view> languages;
    languages.reserve(Items().size());
    for (const Node& item : Items()) {
        const Node& language = item.QualifierNamed(LanguageName());
        if (item.GetKind() != Kind::Text || !language.IsPresent()) {
            return false;
        }
        languages.push_back(language.Value());
    }
    std::sort(languages.begin(), languages.end());
    return std::binary_search(languages.begin(), languages.end(), kDefaultLanguage) &&
           std::adjacent_find(languages.begin(), languages.end()) == languages.end();
}

bool Node::AreEqual(const Node& inLeft, const Node& inRight) {
    if (!inLeft.IsPresent() || !inRight.IsPresent() || inLeft.GetKind() != inRight.GetKind() ||
        inLeft.mData->size != inRight.mData->size ||
        !AreFieldsEqual(inLeft.Qualifiers(), inRight.Qualifiers())) {
        return false;
    }
    switch (inLeft.GetKind()) {
        case Kind::Text:
        case Kind::URI:
            return inLeft.Value() == inRight.Value();
        case Kind::Structure:
            return AreFieldsEqual(inLeft.Fields(), inRight.Fields());
        case Kind::Ordered:
            return AreInOrderEqual(inLeft.Items(), inRight.Items());
        case Kind::Unordered:
            break;
        case Kind::Alternative:
            if (!inLeft.IsLanguageAlternative() || !inRight.IsLanguageAlternative()) {
                return AreInOrderEqual(inLeft.Items(), inRight.Items());
            }
            break;
    }
    return inLeft.Items().size() == 1 ? inLeft.Items()[0] == inRight.Items()[0]
                                      : AreInAnyOrderEqual(inLeft.Items(), inRight.Items());
}

std::size_t Node::Hash() const {
    if (!IsPresent()) {
        return 0;
    }
    std::size_t hash = Mix(static_cast<std::size_t>(GetKind()) + 1, std::hash<std::string_view>()(Value()));
    for (const Field& field : Fields()) {
        hash = Mix(Mix(hash, field.name.Hash()), field.node.Hash());
    }
    const bool isOrdered =
        GetKind() == Kind::Ordered || (GetKind() == Kind::Alternative && !IsLanguageAlternative());
    std::size_t sum = 0;
    for (const Node& item : Items()) {
        sum = isOrdered ? Mix(sum, item.Hash()) : sum + Mix(1, item.Hash());
    }
    hash = Mix(hash, sum);
    for (const Field& qualifier : Qualifiers()) {
        hash = Mix(Mix(hash, qualifier.name.Hash()), qualifier.node.Hash());
    }
    return hash;
}

}  // namespace OrvaneXMP
