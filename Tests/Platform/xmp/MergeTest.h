// The merge for its tests: packets in short form, the engine, and a strategy that does what it is told.
#pragma once

#include <functional>
#include <map>
#include <set>

#include "OrvaneXMPCompareAndMerge/detail/CountedObject.h"
#include "OrvaneXMPCompareAndMerge/Library.h"
#include "XmpTest.h"

namespace OrvaneXMPCompareAndMerge {

using namespace OrvaneXMP;

using ResultRef = RFL::InterfaceRef<IThreeWayMergeResult_v1>;
using StrategyPtr = ostcore::shared_ptr<IThreeWayConflictResolutionStrategy_v1>;

struct StartedLibrary {
    StartedLibrary() { StartLibrary(); }
    ~StartedLibrary() { EndLibrary(); }
};

inline ResultRef Merge(const Packet& inBase, const Packet& inLatest, const Packet& inUser,
                       const std::vector<StrategyPtr>& inStrategies = {}) {
    const StartedLibrary started;
    const auto engine = Create<IThreeWayMerge_v1>();
    for (const StrategyPtr& strategy : inStrategies) {
        engine->RegisterStrategy(strategy);
    }
    return engine->Merge(inBase, inLatest, inUser);
}

inline std::string PathOf(const Path& inPath) {
    Packet packet;
    packet.prefixes.push_back({"urn:test#", "t"});
    return PathText(inPath, packet);
}

/// "path reason" of each unresolved conflict.
inline std::multiset<std::string> ConflictsOf(const IThreeWayMergeResult_v1& inResult) {
    std::multiset<std::string> conflicts;
    for (const auto& each : inResult.GetUnResolvedConflicts()) {
        conflicts.insert(PathOf(each->GetPath()) + " " + std::to_string(static_cast<int>(each->GetReason())));
    }
    return conflicts;
}

/// Keeps what it was asked and does the rest as its functions say.
class ToldStrategy final : public CountedObject<IThreeWayConflictResolutionStrategy_v1> {
public:
    using Resolve =
        std::function<int(const SideNode&, const SideNode&, const SideNode&, Node&, ResolvedSource&)>;

    static ostcore::shared_ptr<ToldStrategy> Make(std::string inName, std::string inPath, Resolve inResolve) {
        auto* const strategy = new ToldStrategy(std::move(inName), std::move(inPath), std::move(inResolve));
        strategy->AddRef();
        return ostcore::shared_ptr<ToldStrategy>(strategy, [](ToldStrategy* inMade) { inMade->Release(); });
    }

    bool InterestedInResolvingConflict(const Path& inFullPath, NodeType inNodeType, ConflictReason inReason,
                                       bool inIsInArrayOrStruct) override {
        asked.push_back(PathOf(inFullPath) + " type " + std::to_string(static_cast<int>(inNodeType)) +
                        " reason " + std::to_string(static_cast<int>(inReason)) +
                        (inIsInArrayOrStruct ? " inside" : ""));
        return PathOf(inFullPath) == mPath;
    }
    std::int32_t ResolveConflict(ConflictReason, const SideNode& inBase, const SideNode& inLatest,
                                 const SideNode& inUser, Node& outResolvedNode,
                                 ResolvedSource& outResolvedSource,
                                 std::int32_t& outResolvedStatus) override {
        outResolvedStatus = kResolvedStatus_ByStrategy;
        return mResolve(inBase, inLatest, inUser, outResolvedNode, outResolvedSource);
    }
    const char* GetName() const noexcept override { return mName.c_str(); }

    std::vector<std::string> asked;

private:
    ToldStrategy(std::string inName, std::string inPath, Resolve inResolve)
        : mName(std::move(inName)), mPath(std::move(inPath)), mResolve(std::move(inResolve)) {}
    ~ToldStrategy() override = default;

    const std::string mName;
    const std::string mPath;
    const Resolve mResolve;
};

}  // namespace OrvaneXMPCompareAndMerge
