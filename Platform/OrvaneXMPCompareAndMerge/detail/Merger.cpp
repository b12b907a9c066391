// The rules of Docs/xmp-merge.md, row by row.
#include "OrvaneXMPCompareAndMerge/detail/Merger.h"

#include <exception>
#include <new>
#include <stdexcept>
#include <unordered_set>

#include "OrvaneXMP/detail/NodeFactory.h"
#include "OrvaneXMPCompareAndMerge/detail/Conflicts.h"
#include "OrvaneXMPCompareAndMerge/detail/ItemCounts.h"

namespace OrvaneXMPCompareAndMerge {

using OrvaneXMP::Kind;
using OrvaneXMP::NodeFactory;

namespace {

enum Side : std::size_t { kBase, kLatest, kUser };

/// Why a strategy's answer cannot be used.
struct UnusableAnswer : std::runtime_error {
    using std::runtime_error::runtime_error;
};

ConflictReason ReasonOf(const Row<3>& inSides) {
    const Shape latest = ShapeOf(*inSides[kLatest]);
    const Shape user = ShapeOf(*inSides[kUser]);
    return user == Shape::Absent     ? ConflictReason::RemovedByUser
           : latest == Shape::Absent ? ConflictReason::RemovedFromLatest
           : latest != user          ? ConflictReason::OfDifferentKinds
                                     : ConflictReason::ChangedOnBothSides;
}

/// Keeps what the answer would make within what packets can hold.
void RequireUsable(const Path& inPath, const Node& inNode, ResolvedSource inSource) {
    using Way = OrvaneXMP::PathStep::Way;
    if (inSource < ResolvedSource::Base || inSource > ResolvedSource::New) {
        throw UnusableAnswer("The strategy gave a source that there is not");
    }
    if (inPath.size() + inNode.Height() > OrvaneXMP::kMaximumDepth) {
        throw UnusableAnswer("The strategy gave a node that is nested too deep");
    }
    const OrvaneXMP::PathStep& last = inPath.back();
    if (last.way == Way::ToLanguage) {
        const bool isItem = inNode.IsPresent()
                                ? inNode.GetKind() == Kind::Text && LanguageOf(inNode) == last.language
                                : last.language != "x-default";
        if (!isItem) {
            throw UnusableAnswer("The strategy gave a node that is no text in the language of its place");
        }
    }
    if (last.way == Way::ToQualifier && inNode.IsPresent()) {
        try {
            Node::Text({}).WithQualifier(last.name, inNode);
        } catch (const std::invalid_argument& refusal) {
            throw UnusableAnswer(refusal.what());
        }
    }
}

template <class Entries>
std::array<Entries, 3> Of(const Row<3>& inSides, Entries (*inOf)(const Node&)) {
    return {inOf(*inSides[kBase]), inOf(*inSides[kLatest]), inOf(*inSides[kUser])};
}

}  // namespace

Merger::Sameness& Merger::Sameness::operator&=(const Sameness& inOther) noexcept {
    baseLatest = baseLatest && inOther.baseLatest;
    baseUser = baseUser && inOther.baseUser;
    latestUser = latestUser && inOther.latestUser;
    return *this;
}

Merger::Merger(const Packet& inBase, const Packet& inLatest, const Packet& inUser,
               const Strategies& inStrategies)
    : mBase(inBase), mLatest(inLatest), mUser(inUser), mStrategies(inStrategies) {
    RequireProperties(inBase);
    RequireProperties(inLatest);
    RequireProperties(inUser);
}

MergeOutcome Merger::Run() {
    mOutcome.merged.about = std::string(MergeAbout().Value());
    MergedFields properties =
        MergeFields({mBase.properties.Fields(), mLatest.properties.Fields(), mUser.properties.Fields()},
                    &PathStep::ToField);
    mOutcome.merged.properties =
        properties.isLatest ? mLatest.properties
        : properties.isUser
            ? mUser.properties
            : NodeFactory::MakeStructure(properties.fields.data(), properties.fields.size(), nullptr, 0);
    MergePrefixes();
    return std::move(mOutcome);
}

/// No strategy is asked: whose resource a packet describes is no value that one side has later.
Node Merger::MergeAbout() {
    const Node base = AboutOf(mBase);
    const Node latest = AboutOf(mLatest);
    const Node user = AboutOf(mUser);
    return MergeBelow(PathStep::ToField(AboutName()), {&base, &latest, &user}).node;
}

Merger::Merged Merger::MergeBelow(const PathStep& inStep, const Sides& inSides) {
    mPath.push_back(inStep);
    Merged merged = MergeNode(inSides);
    mPath.pop_back();
    if (mSharedPaths.size() > mPath.size()) {
        mSharedPaths.resize(mPath.size());
    }
    return merged;
}

Merger::Merged Merger::MergeNode(const Sides& inSides) {
    const Node& base = *inSides[kBase];
    const Node& latest = *inSides[kLatest];
    const Node& user = *inSides[kUser];
    const std::size_t decisionsBefore = mOutcome.decisions.size();
    const bool isTakenApart = IsTakenApart(inSides);
    Merged merged =
        isTakenApart ? TakeApart(inSides) : Merged{Node(), {base == latest, base == user, latest == user}};
    const auto takeWhole = [&](const Node& inNode, DecisionCause inCause, ResolvedSource inSource) {
        mOutcome.decisions.resize(decisionsBefore);
        merged.node = inNode;
        Record(inCause, inSource, inNode);
    };
    const Sameness& same = merged.same;
    if (same.latestUser && same.baseLatest) {
        mOutcome.decisions.resize(decisionsBefore);
        merged.node = latest;
    } else if (same.latestUser) {
        takeWhole(latest, DecisionCause::BothSidesSame, ResolvedSource::Latest);
    } else if (same.baseLatest) {
        takeWhole(user, DecisionCause::OnlyUserChanged, ResolvedSource::User);
    } else if (same.baseUser) {
        takeWhole(latest, DecisionCause::OnlyLatestChanged, ResolvedSource::Latest);
    } else if (!isTakenApart) {
        merged.node = Settle(inSides);
    }
    return merged;
}

/// Nodes that are the same storage on all sides need no look inside.
bool Merger::IsTakenApart(const Sides& inSides) const {
    const Node& base = *inSides[kBase];
    const Node& latest = *inSides[kLatest];
    const Node& user = *inSides[kUser];
    const bool isOneStorage = latest.IsSameAs(user) && latest.IsSameAs(base);
    if (isOneStorage || latest.IsSimple() || !latest.IsPresent() || !user.IsPresent()) {
        return false;
    }
    const Shape shape = ShapeOf(latest);
    if (ShapeOf(user) != shape || (base.IsPresent() && ShapeOf(base) != shape)) {
        return false;
    }
    if (shape == Shape::Unordered) {
        return IsUnorderedOfSimple(latest) && IsUnorderedOfSimple(user) &&
               (!base.IsPresent() || IsUnorderedOfSimple(base));
    }
    return shape == Shape::Structure || shape == Shape::LanguageAlternative;
}

Merger::Merged Merger::TakeApart(const Sides& inSides) {
    Merged merged = inSides[kLatest]->IsStructure() ? MergeStructure(inSides)
                    : inSides[kLatest]->GetKind() == Kind::Unordered
                        ? MergeArray(inSides, MergeUnordered(inSides))
                        : MergeArray(inSides, MergeLanguages(inSides));
    if (!inSides[kBase]->IsPresent()) {
        merged.same.baseLatest = false;
        merged.same.baseUser = false;
    }
    return merged;
}

Merger::Merged Merger::MergeStructure(const Sides& inSides) {
    MergedFields fields = MergeFields(
        Of<Range<Field>>(inSides, [](const Node& inNode) { return inNode.Fields(); }), &PathStep::ToField);
    MergedFields qualifiers = MergeQualifiers(inSides);
    Sameness same = fields.same;
    same &= qualifiers.same;
    if (fields.isLatest && qualifiers.isLatest) {
        return {*inSides[kLatest], same};
    }
    if (fields.isUser && qualifiers.isUser) {
        return {*inSides[kUser], same};
    }
    return {NodeFactory::MakeStructure(fields.fields.data(), fields.fields.size(), qualifiers.fields.data(),
                                       qualifiers.fields.size()),
            same};
}

Merger::Merged Merger::MergeArray(const Sides& inSides, const MergedItems& inItems) {
    MergedFields qualifiers = MergeQualifiers(inSides);
    Sameness same = inItems.same;
    same &= qualifiers.same;
    if (inItems.isLatest && qualifiers.isLatest) {
        return {*inSides[kLatest], same};
    }
    if (inItems.isUser && qualifiers.isUser) {
        return {*inSides[kUser], same};
    }
    std::vector<Node> items = inItems.items;
    return {NodeFactory::MakeArray(inSides[kLatest]->GetKind(), items.data(), items.size(),
                                   qualifiers.fields.data(), qualifiers.fields.size()),
            same};
}

Merger::MergedItems Merger::MergeLanguages(const Sides& inSides) {
    MergedItems result;
    std::vector<Node> merged;
    std::vector<const Node*> places;
    ForEachLanguage(Of<std::vector<SpokenItem>>(inSides, &ByLanguage),
                    [&](std::string_view inLanguage, const Sides& inItems) {
                        Merged item = MergeBelow(PathStep::ToLanguage(inLanguage), inItems);
                        result.same &= item.same;
                        result.isLatest = result.isLatest && item.node.IsSameAs(*inItems[kLatest]);
                        result.isUser = result.isUser && item.node.IsSameAs(*inItems[kUser]);
                        merged.push_back(std::move(item.node));
                        places.push_back(inItems[kLatest]->IsPresent() ? inItems[kLatest] : inItems[kUser]);
                    });
    // In the order of latest, and behind that what only the user has, in the user's order.
    std::vector<std::size_t> order;
    for (std::size_t at = 0; at < merged.size(); ++at) {
        if (merged[at].IsPresent()) {
            order.push_back(at);
        }
    }
    const Range<Node> latest = inSides[kLatest]->Items();
    const auto isOfLatest = [&](std::size_t inAt) {
        return !std::less<const Node*>()(places[inAt], latest.begin()) &&
               std::less<const Node*>()(places[inAt], latest.end());
    };
    std::sort(order.begin(), order.end(), [&](std::size_t inLeft, std::size_t inRight) {
        return isOfLatest(inLeft) != isOfLatest(inRight) ? isOfLatest(inLeft)
                                                         : places[inLeft] < places[inRight];
    });
    for (const std::size_t at : order) {
        result.items.push_back(merged[at]);
    }
    return result;
}

Merger::MergedItems Merger::MergeUnordered(const Sides& inSides) {
    const ItemCounts counts(*inSides[kBase], *inSides[kLatest], *inSides[kUser]);
    const Sameness same{counts.IsBaseLatest(), counts.IsBaseUser(), counts.IsLatestUser()};
    const Node& latest = *inSides[kLatest];
    const Node& user = *inSides[kUser];
    const auto whole = [&](const Node& inArray) {
        return MergedItems{std::vector<Node>(inArray.Items().begin(), inArray.Items().end()), same,
                           &inArray == &latest, &inArray == &user};
    };
    if (same.latestUser) {
        if (!same.baseLatest) {
            Record(DecisionCause::BothSidesSame, ResolvedSource::Latest, latest);
        }
        return whole(latest);
    }
    if (same.baseLatest) {
        Record(DecisionCause::OnlyUserChanged, ResolvedSource::User, user);
        return whole(user);
    }
    if (same.baseUser) {
        Record(DecisionCause::OnlyLatestChanged, ResolvedSource::Latest, latest);
        return whole(latest);
    }
    ItemCounts::Merged merged = counts.Merge();
    Record(DecisionCause::ItemsMerged,
           merged.isLatest ? ResolvedSource::Latest
           : merged.isUser ? ResolvedSource::User
                           : ResolvedSource::New,
           latest);
    return {std::move(merged.items), same, merged.isLatest, merged.isUser};
}

Merger::MergedFields Merger::MergeFields(const std::array<Range<Field>, 3>& inSides,
                                         PathStep (*inStep)(const Name&)) {
    MergedFields result;
    result.fields.reserve(std::max(inSides[kLatest].size(), inSides[kUser].size()));
    ForEachName(inSides, [&](const Name& inName, const Sides& inNodes) {
        Merged merged = MergeBelow(inStep(inName), inNodes);
        result.same &= merged.same;
        result.isLatest = result.isLatest && merged.node.IsSameAs(*inNodes[kLatest]);
        result.isUser = result.isUser && merged.node.IsSameAs(*inNodes[kUser]);
        if (merged.node.IsPresent()) {
            result.fields.push_back({inName, std::move(merged.node)});
        }
    });
    return result;
}

Merger::MergedFields Merger::MergeQualifiers(const Sides& inSides) {
    return MergeFields(Of<Range<Field>>(inSides, [](const Node& inNode) { return inNode.Qualifiers(); }),
                       &PathStep::ToQualifier);
}

Node Merger::Settle(const Sides& inSides) {
    const ConflictReason reason = ReasonOf(inSides);
    const Node& typed = inSides[kUser]->IsPresent() ? *inSides[kUser] : *inSides[kLatest];
    return Resolve(inSides, reason, TypeOf(typed));
}

Node Merger::Resolve(const Sides& inSides, ConflictReason inReason, NodeType inType) {
    const bool isAbout = mPath.front().name == AboutName();
    for (const auto& strategy : mStrategies) {
        if (isAbout) {
            break;
        }
        const auto failed = [&](const char* inText) {
            return LeaveToPerson(
                inSides, inReason, inType,
                RFL::InterfaceRef<IMergeError_v1>(new MergeError(strategy->GetName(), inText)));
        };
        try {
            if (strategy->InterestedInResolvingConflict(mPath, inType, inReason, mPath.size() > 1)) {
                return AskStrategy(*strategy, inSides, inReason, inType);
            }
        } catch (const std::bad_alloc&) {
            throw;
        } catch (const std::exception& exception) {
            return failed(exception.what());
        } catch (...) {
            return failed("An exception of an unknown type");
        }
    }
    return LeaveToPerson(inSides, inReason, inType, nullptr);
}

Node Merger::AskStrategy(IThreeWayConflictResolutionStrategy_v1& inStrategy, const Sides& inSides,
                         ConflictReason inReason, NodeType inType) {
    Node node;
    ResolvedSource source{};
    std::int32_t status = 0;
    const std::int32_t answer =
        inStrategy.ResolveConflict(inReason, {*inSides[kBase], mBase}, {*inSides[kLatest], mLatest},
                                   {*inSides[kUser], mUser}, node, source, status);
    if (answer != kResolved) {
        return LeaveToPerson(inSides, inReason, inType, nullptr);
    }
    RequireUsable(mPath, node, source);
    const std::string name = inStrategy.GetName();
    mOutcome.resolved.emplace_back(
        new ResolvedConflict({Here(), inType, inReason, node, source, status, name}));
    Record(DecisionCause::Strategy, source, node, inReason, name);
    return node;
}

Node Merger::LeaveToPerson(const Sides& inSides, ConflictReason inReason, NodeType inType,
                           RFL::InterfaceRef<IMergeError_v1> inError) {
    const Node& user = *inSides[kUser];
    mOutcome.unresolved.emplace_back(new UnResolvedConflict(
        {Here(), inType, inReason, *inSides[kBase], *inSides[kLatest], user, std::move(inError)}));
    Record(DecisionCause::Unresolved, ResolvedSource::User, user, inReason);
    return user;
}

void Merger::Record(DecisionCause inCause, ResolvedSource inSource, const Node& inNode,
                    ConflictReason inReason, const std::string& inStrategyName) {
    mOutcome.decisions.push_back({Here(), inCause, inSource, !inNode.IsPresent(), inReason, inStrategyName});
}

const SharedPath& Merger::Here() {
    while (mSharedPaths.size() < mPath.size()) {
        const SharedPath above = mSharedPaths.empty() ? SharedPath() : mSharedPaths.back();
        mSharedPaths.push_back(above.Below(mPath[mSharedPaths.size()]));
    }
    return mSharedPaths.back();
}

void Merger::MergePrefixes() {
    std::unordered_set<std::string_view> known;
    for (const Packet* side : {&mLatest, &mUser, &mBase}) {
        for (const OrvaneXMP::Prefix& prefix : side->prefixes) {
            if (known.insert(prefix.uri).second) {
                mOutcome.merged.prefixes.push_back(prefix);
            }
        }
    }
}

}  // namespace OrvaneXMPCompareAndMerge
