// Walks paths and prints them.
#include "OrvaneXMP/Path.h"

#include <algorithm>
#include <stdexcept>

#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

/// The index of the item, or the number of items when none has this language.
std::size_t IndexOfLanguage(Range<Node> inItems, std::string_view inLanguage) {
    const auto found = std::find_if(inItems.begin(), inItems.end(), [&](const Node& inItem) {
        const Node& language = inItem.QualifierNamed(LanguageName());
        return language.IsPresent() && language.Value() == inLanguage;
    });
    return static_cast<std::size_t>(found - inItems.begin());
}

Node ItemAt(const Node& inArray, std::size_t inIndex) {
    return inIndex < inArray.Items().size() ? inArray.Items()[inIndex] : Node();
}

Node Step(const Node& inNode, const PathStep& inStep) {
    switch (inStep.way) {
        case PathStep::Way::ToField:
            return inNode.FieldNamed(inStep.name);
        case PathStep::Way::ToQualifier:
            return inNode.QualifierNamed(inStep.name);
        case PathStep::Way::ToItem:
            return ItemAt(inNode, inStep.index);
        case PathStep::Way::ToLanguage:
            return ItemAt(inNode, IndexOfLanguage(inNode.Items(), inStep.language));
    }
    return Node();
}

Node WithItem(const Node& inArray, std::size_t inIndex, const Node& inItem) {
    std::vector<Node> items(inArray.Items().begin(), inArray.Items().end());
    if (!inArray.IsArray() || inIndex > items.size() || (inIndex == items.size() && !inItem.IsPresent())) {
        throw std::invalid_argument("A path of XMP leads to an item that is not there");
    }
    const auto place = items.begin() + static_cast<std::ptrdiff_t>(inIndex);
    if (!inItem.IsPresent()) {
        items.erase(place);
    } else if (inIndex == items.size()) {
        items.push_back(inItem);
    } else {
        *place = inItem;
    }
    const Range<Field> qualifiers = inArray.Qualifiers();
    return Node::Array(inArray.GetKind(), std::move(items))
        .WithQualifiers(std::vector<Field>(qualifiers.begin(), qualifiers.end()));
}

Node With(const Node& inNode, const PathStep& inStep, const Node& inBelow) {
    switch (inStep.way) {
        case PathStep::Way::ToField:
            return inNode.WithField(inStep.name, inBelow);
        case PathStep::Way::ToQualifier:
            return inNode.WithQualifier(inStep.name, inBelow);
        case PathStep::Way::ToItem:
            return WithItem(inNode, inStep.index, inBelow);
        case PathStep::Way::ToLanguage:
            return WithItem(inNode, IndexOfLanguage(inNode.Items(), inStep.language), inBelow);
    }
    return Node();
}

template <class Table>
std::string_view PrefixIn(const Table& inTable, std::string_view inURI) {
    const auto found = std::find_if(std::begin(inTable), std::end(inTable),
                                    [&](const auto& inEntry) { return inEntry.uri == inURI; });
    return found == std::end(inTable) ? std::string_view() : std::string_view(found->prefix);
}

std::string NameText(const Name& inName, const Packet& inPacket) {
    const std::string_view uri = inName.NamespaceURI();
    std::string_view prefix = PrefixIn(inPacket.prefixes, uri);
    if (prefix.empty()) {
        prefix = PrefixIn(kUsualPrefixes, uri);
    }
    const std::string head = prefix.empty() ? "{" + std::string(uri) + "}" : std::string(prefix) + ":";
    return head + std::string(inName.LocalName());
}

}  // namespace

Node Find(const Node& inRoot, const Path& inPath) {
    Node node = inRoot;
    for (const PathStep& step : inPath) {
        node = Step(node, step);
    }
    return node;
}

Node Replace(const Node& inRoot, const Path& inPath, const Node& inNode) {
    std::vector<Node> above;
    Node node = inRoot;
    for (const PathStep& step : inPath) {
        if (!node.IsPresent()) {
            throw std::invalid_argument("A path of XMP leads through a node that is not there");
        }
        above.push_back(node);
        node = Step(node, step);
    }
    Node changed = inNode;
    for (std::size_t at = inPath.size(); at-- > 0;) {
        changed = With(above[at], inPath[at], changed);
    }
    return changed;
}

std::string PathText(const Path& inPath, const Packet& inPacket) {
    std::string text;
    for (const PathStep& step : inPath) {
        if (step.way == PathStep::Way::ToItem) {
            text += "[" + std::to_string(step.index + 1) + "]";
            continue;
        }
        if (step.way == PathStep::Way::ToLanguage) {
            text += "[?xml:lang=\"" + step.language + "\"]";
            continue;
        }
        text += text.empty() ? "" : "/";
        text += step.way == PathStep::Way::ToQualifier ? "?" : "";
        text += NameText(step.name, inPacket);
    }
    return text;
}

}  // namespace OrvaneXMP
