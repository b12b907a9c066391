// Merges and compares packets that somebody has at hand.
#include "ZOClient/XMPMerge.h"

#include <stdexcept>

#include "Collaboration/XMPTreeMerge.h"
#include "OrvaneXMP/PacketReader.h"
#include "OrvaneXMP/PacketWriter.h"
#include "OrvaneXMPCompareAndMerge/Differences.h"
#include "OrvaneXMPCompareAndMerge/Report.h"

namespace ZOCL {

namespace {

using OrvaneXMP::Kind;
using OrvaneXMP::Node;
using OrvaneXMP::Packet;
using OrvaneXMPCompareAndMerge::ChangeKind;
using OrvaneXMPCompareAndMerge::ConflictReason;

constexpr std::size_t kLongestValue = 200;

bool Read(const std::string& inBytes, const char* inName, Packet& outPacket, XMPFailure& outFailure) {
    OrvaneXMP::ReadResult read = OrvaneXMP::ReadPacket(inBytes);
    if (!read) {
        outFailure = {inName, read.failure.reason, read.failure.line, read.failure.column};
        return false;
    }
    outPacket = std::move(*read.packet);
    return true;
}

const char* WordOf(ConflictReason inReason) {
    switch (inReason) {
        case ConflictReason::ChangedOnBothSides:
            return "changed-on-both-sides";
        case ConflictReason::OfDifferentKinds:
            return "of-different-kinds";
        case ConflictReason::RemovedByUser:
            return "removed-by-mine";
        case ConflictReason::RemovedFromLatest:
            return "removed-by-theirs";
    }
    return "changed-on-both-sides";
}

const char* WordOf(ChangeKind inKind) {
    return inKind == ChangeKind::Added ? "added" : inKind == ChangeKind::Removed ? "removed" : "changed";
}

/// Cuts at the beginning of a character.
std::string Shortened(std::string_view inText) {
    std::size_t end = inText.size();
    if (end > kLongestValue) {
        end = kLongestValue;
        while (end > 0 && (static_cast<unsigned char>(inText[end]) & 0xC0) == 0x80) {
            --end;
        }
    }
    std::string text(inText.substr(0, end));
    for (char& character : text) {
        if (character == '\n' || character == '\r' || character == '\t') {
            character = ' ';
        }
    }
    return end == inText.size() ? text : text + "...";
}

std::string CountOf(std::size_t inCount, const char* inWhat) {
    return std::to_string(inCount) + " " + inWhat + (inCount == 1 ? "" : "s");
}

std::string ValueText(const Node& inNode) {
    if (!inNode.IsPresent()) {
        return {};
    }
    if (inNode.IsSimple()) {
        return Shortened(inNode.Value());
    }
    return "[" +
           (inNode.IsStructure() ? CountOf(inNode.Fields().size(), "field")
                                 : CountOf(inNode.Items().size(), "item")) +
           "]";
}

}  // namespace

int MergeXMPPackets(const std::string& inBase, const std::string& inTheirs, const std::string& inMine,
                    XMPMergeOutcome& outOutcome) {
    outOutcome = XMPMergeOutcome();
    Packet base;
    Packet theirs;
    Packet mine;
    if (!Read(inBase, "base", base, outOutcome.failure) ||
        !Read(inTheirs, "theirs", theirs, outOutcome.failure) ||
        !Read(inMine, "mine", mine, outOutcome.failure)) {
        return kResultFailure;
    }
    const auto result = MergeXMPTrees(base, theirs, mine);
    try {
        outOutcome.packet = OrvaneXMP::WritePacket(result->GetMergedPacket());
    } catch (const std::length_error& error) {
        outOutcome.failure = {"merged", error.what(), 0, 0};
        return kResultFailure;
    }
    for (const auto& conflict : result->GetUnResolvedConflicts()) {
        outOutcome.conflicts.push_back({OrvaneXMP::PathText(conflict->GetPath(), result->GetMergedPacket()),
                                        WordOf(conflict->GetReason())});
    }
    outOutcome.report = OrvaneXMPCompareAndMerge::MergeReport(*result);
    return kResultSuccess;
}

int CompareXMPPackets(const std::string& inOld, const std::string& inNew, XMPComparison& outComparison) {
    outComparison = XMPComparison();
    Packet before;
    Packet after;
    if (!Read(inOld, "old", before, outComparison.failure) ||
        !Read(inNew, "new", after, outComparison.failure)) {
        return kResultFailure;
    }
    Packet prefixes = after;
    prefixes.prefixes.insert(prefixes.prefixes.end(), before.prefixes.begin(), before.prefixes.end());
    const auto differences = OrvaneXMPCompareAndMerge::FindDifferences(before, after);
    for (const auto& difference : differences) {
        outComparison.differences.push_back({OrvaneXMP::PathText(difference.path, prefixes),
                                             WordOf(difference.kind), ValueText(difference.oldNode),
                                             ValueText(difference.newNode)});
    }
    outComparison.report = OrvaneXMPCompareAndMerge::DifferenceReport(differences, before, after);
    return kResultSuccess;
}

}  // namespace ZOCL
