// The prefixes that a packet is written with, and its names with them.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>

#include "OrvaneXMP/Tree.h"

namespace OrvaneXMP {

class PrefixTable {
public:
    /// Visits all names of a tree. Throws std::length_error when it has too many nodes.
    explicit PrefixTable(const Packet& inPacket);

    /// "prefix:local", of a name that is in the tree.
    const std::string& Qualified(const Name& inName) const { return mQualified.find(inName)->second; }
    /// URI to prefix, sorted by URI, without those that the frame of the packet declares itself.
    const std::map<std::string_view, std::string>& Declarations() const { return mPrefixes; }

private:
    void Visit(const Node& inNode);
    void Visit(Range<Field> inFields);
    void Assign(const Packet& inPacket);
    std::string Choose(std::string_view inURI, const Packet& inPacket);

    std::unordered_map<Name, std::string, NameHash> mQualified;
    std::map<std::string_view, std::string> mPrefixes;
    std::unordered_set<std::string> mTaken;
    std::size_t mGenerated = 0;
    std::size_t mNodeCount = 0;
};

}  // namespace OrvaneXMP
