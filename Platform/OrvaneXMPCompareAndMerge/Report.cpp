// Writes the JSON text by hand, so that wide structures cost no more than their size.
#include "OrvaneXMPCompareAndMerge/Report.h"

#include <unordered_map>

#include "ostcore/serialization/JSON.h"

namespace OrvaneXMPCompareAndMerge {

namespace {

using OrvaneXMP::Field;
using OrvaneXMP::Kind;
using OrvaneXMP::Name;
using OrvaneXMP::PathStep;

constexpr int kVersion = 1;
/// Entries that would begin behind this many bytes are left out: paths of a hostile packet can be many and
/// long.
constexpr std::size_t kLongestReport = 64u << 20;

std::string Quoted(std::string_view inText) {
    return ostcore::serialization::GetJSONUTF8String(inText);
}

const char* WordOf(ResolvedSource inSource) noexcept {
    switch (inSource) {
        case ResolvedSource::Base:
            return "base";
        case ResolvedSource::Latest:
            return "latest";
        case ResolvedSource::User:
            return "user";
        case ResolvedSource::New:
            break;
    }
    return "new";
}

const char* WordOf(DecisionCause inCause) noexcept {
    switch (inCause) {
        case DecisionCause::BothSidesSame:
            return "both-sides-same";
        case DecisionCause::OnlyUserChanged:
            return "only-user-changed";
        case DecisionCause::OnlyLatestChanged:
            return "only-latest-changed";
        case DecisionCause::ItemsMerged:
            return "items-merged";
        case DecisionCause::Strategy:
            return "strategy";
        case DecisionCause::Unresolved:
            break;
    }
    return "unresolved";
}

const char* WordOf(NodeType inType) noexcept {
    return inType == NodeType::Array ? "array" : inType == NodeType::Structure ? "structure" : "simple";
}

const char* WordOf(ChangeKind inKind) noexcept {
    return inKind == ChangeKind::Added ? "added" : inKind == ChangeKind::Removed ? "removed" : "changed";
}

/// Looks each name up once.
class NamesOf {
public:
    explicit NamesOf(const Packet& inPacket) : mPacket(inPacket) {}

    const std::string& Text(const Name& inName) {
        std::string& text = mTexts[inName];
        if (text.empty()) {
            text = OrvaneXMP::PathText({PathStep::ToField(inName)}, mPacket);
        }
        return text;
    }

    std::string PathText(const Path& inPath) {
        std::string text;
        for (const PathStep& step : inPath) {
            if (step.way == PathStep::Way::ToField || step.way == PathStep::Way::ToQualifier) {
                text += text.empty() ? "" : "/";
                text += step.way == PathStep::Way::ToQualifier ? "?" : "";
                text += Text(step.name);
            } else {
                text += OrvaneXMP::PathText({step}, mPacket);
            }
        }
        return text;
    }

private:
    const Packet& mPacket;
    std::unordered_map<Name, std::string, OrvaneXMP::NameHash> mTexts;
};

class NodeText {
public:
    NodeText(NamesOf& ioNames, std::string& ioText) : mNames(ioNames), mText(ioText) {}

    void Add(const Node& inNode) {
        if (!inNode.IsPresent()) {
            mText += "null";
        } else if (inNode.Qualifiers().empty()) {
            AddValue(inNode);
        } else {
            mText += "{\"value\":";
            AddValue(inNode);
            mText += ",\"qualifiers\":";
            AddFields(inNode.Qualifiers());
            mText += "}";
        }
    }

private:
    void AddValue(const Node& inNode) {
        switch (inNode.GetKind()) {
            case Kind::Text:
                mText += Quoted(inNode.Value());
                return;
            case Kind::URI:
                mText += "{\"uri\":" + Quoted(inNode.Value()) + "}";
                return;
            case Kind::Structure:
                mText += "{\"structure\":";
                AddFields(inNode.Fields());
                mText += "}";
                return;
            case Kind::Unordered:
                return AddItems("unordered", inNode);
            case Kind::Ordered:
                return AddItems("ordered", inNode);
            case Kind::Alternative:
                return AddItems("alternative", inNode);
        }
    }

    void AddFields(OrvaneXMP::Range<Field> inFields) {
        char before = '{';
        for (const Field& field : inFields) {
            mText += before + Quoted(mNames.Text(field.name)) + ":";
            Add(field.node);
            before = ',';
        }
        mText += inFields.empty() ? "{}" : "}";
    }

    void AddItems(const char* inKind, const Node& inArray) {
        mText += std::string("{\"") + inKind + "\":";
        char before = '[';
        for (const Node& item : inArray.Items()) {
            mText += before;
            Add(item);
            before = ',';
        }
        mText += inArray.Items().empty() ? "[]}" : "]}";
    }

    NamesOf& mNames;
    std::string& mText;
};

/// A growing list of entries under a key.
class Report {
public:
    Report(const char* inSchema, const Packet& inPacket) : mNames(inPacket) {
        mText.append("{\"schema\":\"").append(inSchema).append("\",\"version\":");
        mText.append(std::to_string(kVersion));
    }

    template <class Entries, class Write>
    void AddList(const char* inKey, const Entries& inEntries, const Write& inWrite) {
        mText.append(",\"").append(inKey).append("\":[");
        bool isFirst = true;
        for (const auto& entry : inEntries) {
            if (mText.size() > kLongestReport) {
                mIsCut = true;
                break;
            }
            mText += isFirst ? "{" : ",{";
            isFirst = false;
            inWrite(entry);
            mText += "}";
        }
        mText += "]";
    }
    void AddPath(const Path& inPath) { mText += "\"path\":" + Quoted(mNames.PathText(inPath)); }
    void AddWord(const char* inKey, std::string_view inWord) {
        mText += std::string(",\"") + inKey + "\":" + Quoted(inWord);
    }
    void AddPlain(const char* inKey, const std::string& inValue) {
        mText += std::string(",\"") + inKey + "\":" + inValue;
    }
    void AddNode(const char* inKey, const Node& inNode) {
        AddPlain(inKey, {});
        NodeText(mNames, mText).Add(inNode);
    }
    std::string Take() {
        AddPlain("isCut", mIsCut ? "true" : "false");
        return std::move(mText) + "}";
    }

private:
    NamesOf mNames;
    std::string mText;
    bool mIsCut = false;
};

std::string NumberOf(ConflictReason inReason) {
    return std::to_string(static_cast<std::int32_t>(inReason));
}

void AddDecision(Report& ioReport, const Decision& inDecision) {
    ioReport.AddPath(inDecision.path);
    ioReport.AddWord("cause", WordOf(inDecision.cause));
    ioReport.AddWord("source", WordOf(inDecision.source));
    ioReport.AddPlain("isGone", inDecision.isGone ? "true" : "false");
    const bool isConflict =
        inDecision.cause == DecisionCause::Strategy || inDecision.cause == DecisionCause::Unresolved;
    if (isConflict) {
        ioReport.AddPlain("reason", NumberOf(inDecision.reason));
    }
    if (inDecision.cause == DecisionCause::Strategy) {
        ioReport.AddWord("strategy", inDecision.strategyName);
    }
}

void AddConflict(Report& ioReport, const IThreeWayUnResolvedConflict_v1& inConflict) {
    ioReport.AddPath(inConflict.GetPath());
    ioReport.AddWord("type", WordOf(inConflict.GetNodeType()));
    ioReport.AddPlain("reason", NumberOf(inConflict.GetReason()));
    ioReport.AddNode("base", inConflict.GetBaseNode());
    ioReport.AddNode("latest", inConflict.GetLatestNode());
    ioReport.AddNode("user", inConflict.GetUserNode());
    if (const auto error = inConflict.GetError()) {
        ioReport.AddWord("strategy", error->GetStrategyName());
        ioReport.AddWord("error", error->GetText());
    }
}

}  // namespace

std::string MergeReport(const IThreeWayMergeResult_v1& inResult) {
    Report report("xmp-merge", inResult.GetMergedPacket());
    const auto& conflicts = inResult.GetUnResolvedConflicts();
    report.AddPlain("isMerged", conflicts.empty() ? "true" : "false");
    report.AddPlain("resolvedCount", std::to_string(inResult.GetResolvedConflicts().size()));
    report.AddPlain("conflictCount", std::to_string(conflicts.size()));
    report.AddList("conflicts", conflicts, [&](const auto& inConflict) { AddConflict(report, *inConflict); });
    report.AddList("decisions", inResult.GetDecisions(),
                   [&](const Decision& inDecision) { AddDecision(report, inDecision); });
    return report.Take();
}

std::string DifferenceReport(const std::vector<Difference>& inDifferences, const Packet& inOld,
                             const Packet& inNew) {
    Packet both;
    both.prefixes = inNew.prefixes;
    both.prefixes.insert(both.prefixes.end(), inOld.prefixes.begin(), inOld.prefixes.end());
    Report report("xmp-diff", both);
    report.AddPlain("differenceCount", std::to_string(inDifferences.size()));
    report.AddList("differences", inDifferences, [&](const Difference& inDifference) {
        report.AddPath(inDifference.path);
        report.AddWord("kind", WordOf(inDifference.kind));
        report.AddNode("old", inDifference.oldNode);
        report.AddNode("new", inDifference.newNode);
    });
    return report.Take();
}

}  // namespace OrvaneXMPCompareAndMerge
