// What the strategies of the automatic merge share: counting, the query, and the question about a property.
#pragma once

#include "OrvaneXMPCompareAndMerge/IThreeWayConflictResolutionStrategy_v1.h"
#include "ostcore/Types.h"

namespace ZOCL {

/// Threads: one at a time, as the merge that asks it.
class XMPMergeStrategyBase : public OrvaneXMPCompareAndMerge::IThreeWayConflictResolutionStrategy_v1 {
public:
    using Interface = OrvaneXMPCompareAndMerge::IThreeWayConflictResolutionStrategy_v1;
    using Node = OrvaneXMP::Node;
    using Path = OrvaneXMP::Path;
    using NodeType = OrvaneXMPCompareAndMerge::NodeType;
    using ConflictReason = OrvaneXMPCompareAndMerge::ConflictReason;
    using ResolvedSource = OrvaneXMPCompareAndMerge::ResolvedSource;
    using SideNode = OrvaneXMPCompareAndMerge::SideNode;

    std::uint32_t AddRef() noexcept override { return mReferences.Add(); }
    std::uint32_t Release() noexcept override {
        const std::uint32_t left = mReferences.Drop();
        if (left == 0) {
            delete this;
        }
        return left;
    }
    int QueryInterface(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const int result = QueryInterfaceNoAddRef(inID, outInterface);
        if (result >= 0) {
            AddRef();
        }
        return result;
    }
    int QueryInterfaceNoAddRef(const RFL::InterfaceID& inID, void** outInterface) noexcept override {
        const bool isKnown = inID == Interface::kInterfaceID || inID == RFL::RFLUnknown::kInterfaceID;
        *outInterface = isKnown ? static_cast<Interface*>(this) : nullptr;
        return isKnown ? RFL::kResultSuccess : RFL::kResultInterfaceNotSupported;
    }

protected:
    XMPMergeStrategyBase() = default;
    ~XMPMergeStrategyBase() override = default;

    /// Whether the path leads to the top-level property of this name.
    static bool IsProperty(const Path& inPath, bool inIsInArrayOrStruct, const OrvaneXMP::Name& inName) {
        return !inIsInArrayOrStruct && inPath.size() == 1 &&
               inPath[0] == OrvaneXMP::PathStep::ToField(inName);
    }
    /// Whether a conflict is one of those that the strategies for arrays take.
    static bool IsArrayConflict(NodeType inType, ConflictReason inReason) {
        return inType == NodeType::Array && inReason != ConflictReason::OfDifferentKinds;
    }
    static std::int32_t LeaveConflict(ConflictReason inReason) { return static_cast<std::int32_t>(inReason); }

private:
    RFL::RefCount mReferences;
};

/// A new strategy, released when the last holder lets go.
template <class Strategy>
ostcore::shared_ptr<XMPMergeStrategyBase::Interface> MakeXMPMergeStrategy() {
    Strategy* const made = new Strategy;
    made->AddRef();
    return ostcore::shared_ptr<XMPMergeStrategyBase::Interface>(
        made, [](XMPMergeStrategyBase::Interface* inStrategy) { inStrategy->Release(); });
}

}  // namespace ZOCL
