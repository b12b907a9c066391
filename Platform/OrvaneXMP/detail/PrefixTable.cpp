// Chooses one prefix for each namespace of a tree.
#include "OrvaneXMP/detail/PrefixTable.h"

#include <algorithm>
#include <stdexcept>

#include "OrvaneXMP/Namespaces.h"

namespace OrvaneXMP {

namespace {

bool IsOfFrame(std::string_view inURI) {
    return inURI == kNamespace_RDF || inURI == kNamespace_XML;
}

/// Plain letters and digits, so that nothing has to be asked of the parser.
bool IsPlainPrefix(std::string_view inPrefix) {
    constexpr std::size_t kLongest = 64;
    const auto isLetter = [](char inByte) {
        return (inByte >= 'a' && inByte <= 'z') || (inByte >= 'A' && inByte <= 'Z') || inByte == '_';
    };
    const auto isFurther = [&](char inByte) {
        return isLetter(inByte) || (inByte >= '0' && inByte <= '9') || inByte == '-' || inByte == '.';
    };
    const auto isOfXML = [](std::string_view inStart) {
        return inStart.size() == 3 && (inStart[0] | 0x20) == 'x' && (inStart[1] | 0x20) == 'm' &&
               (inStart[2] | 0x20) == 'l';
    };
    return !inPrefix.empty() && inPrefix.size() <= kLongest && isLetter(inPrefix.front()) &&
           std::all_of(inPrefix.begin(), inPrefix.end(), isFurther) && !isOfXML(inPrefix.substr(0, 3));
}

}  // namespace

PrefixTable::PrefixTable(const Packet& inPacket) : mTaken{"rdf", "xml", "x"} {
    Visit(inPacket.properties);
    Assign(inPacket);
}

void PrefixTable::Visit(const Node& inNode) {
    if (++mNodeCount > kMaximumNodeCount) {
        throw std::length_error("An XMP packet would have too many nodes");
    }
    Visit(inNode.Qualifiers());
    Visit(inNode.Fields());
    for (const Node& item : inNode.Items()) {
        Visit(item);
    }
}

void PrefixTable::Visit(Range<Field> inFields) {
    for (const Field& field : inFields) {
        if (mQualified.try_emplace(field.name).second) {
            const std::string_view uri = field.name.NamespaceURI();
            if (!IsOfFrame(uri)) {
                mPrefixes.try_emplace(uri);
            }
        }
        Visit(field.node);
    }
}

/// In two rounds, so that a prefix that somebody knows is not lost to a name that was made up.
void PrefixTable::Assign(const Packet& inPacket) {
    for (auto& [uri, prefix] : mPrefixes) {
        prefix = Choose(uri, inPacket);
    }
    for (auto& [uri, prefix] : mPrefixes) {
        while (prefix.empty()) {
            const std::string made = "ns" + std::to_string(++mGenerated);
            prefix = mTaken.insert(made).second ? made : std::string();
        }
    }
    for (auto& [name, qualified] : mQualified) {
        const std::string_view uri = name.NamespaceURI();
        const std::string_view prefix = uri == kNamespace_RDF ? "rdf"
                                        : uri == kNamespace_XML
                                            ? "xml"
                                            : std::string_view(mPrefixes.find(uri)->second);
        qualified.append(prefix).append(":").append(name.LocalName());
    }
}

/// Empty when neither the packet nor custom knows a prefix that is free.
std::string PrefixTable::Choose(std::string_view inURI, const Packet& inPacket) {
    const auto take = [&](std::string_view inPrefix) {
        return IsPlainPrefix(inPrefix) && mTaken.insert(std::string(inPrefix)).second;
    };
    for (const Prefix& known : inPacket.prefixes) {
        if (known.uri == inURI && take(known.prefix)) {
            return known.prefix;
        }
    }
    for (const UsualPrefix& usual : kUsualPrefixes) {
        if (usual.uri == inURI && take(usual.prefix)) {
            return std::string(usual.prefix);
        }
    }
    return {};
}

}  // namespace OrvaneXMP
