// The way from a node to one below it, for those who name a place in a tree.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "OrvaneXMP/Tree.h"
#include "ostcore/Export.h"

namespace OrvaneXMP {

/// One step down: to a field or a qualifier by name, or to an item by its index from 0, or by its language.
struct PathStep {
    enum class Way : std::uint8_t { ToField, ToItem, ToQualifier, ToLanguage };

    static PathStep ToField(const Name& inName) { return {Way::ToField, inName, 0, {}}; }
    static PathStep ToItem(std::size_t inIndex) { return {Way::ToItem, Name(), inIndex, {}}; }
    static PathStep ToQualifier(const Name& inName) { return {Way::ToQualifier, inName, 0, {}}; }
    /// The first item of an array whose xml:lang is this, byte for byte.
    static PathStep ToLanguage(std::string_view inLanguage) {
        return {Way::ToLanguage, Name(), 0, std::string(inLanguage)};
    }

    friend bool operator==(const PathStep& inLeft, const PathStep& inRight) noexcept {
        return inLeft.way == inRight.way && inLeft.name == inRight.name && inLeft.index == inRight.index &&
               inLeft.language == inRight.language;
    }
    friend bool operator!=(const PathStep& inLeft, const PathStep& inRight) noexcept {
        return !(inLeft == inRight);
    }

    Way way;
    Name name;
    std::size_t index;
    std::string language;
};

using Path = std::vector<PathStep>;

/// The node at the end of a path, an absent one when some step leads nowhere.
ZOPLATFORM_EXPORT Node Find(const Node& inRoot, const Path& inPath);

/// The tree with another node at the end of the path; an absent node takes out what is there, and the index
/// behind the last item, or a language that no item has, adds one. All but the nodes on the path is shared.
/// Throws std::invalid_argument when a step before the last leads nowhere or the last cannot be made, and as
/// the factories of Node.
ZOPLATFORM_EXPORT Node Replace(const Node& inRoot, const Path& inPath, const Node& inNode);

/// The form that people read: xmpMM:History[1]/stEvt:when, with items from 1; a qualifier as
/// dc:title[1]/?xml:lang, a language as dc:title[?xml:lang="de"]. Prefixes are those of the packet, else the
/// usual ones, else the URI in braces.
ZOPLATFORM_EXPORT std::string PathText(const Path& inPath, const Packet& inPacket);

}  // namespace OrvaneXMP
