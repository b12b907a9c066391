// The objects that tell of conflicts.
#pragma once

#include <string>

#include "OrvaneXMPCompareAndMerge/detail/CountedObject.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayResolvedConflict_v1.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayUnResolvedConflict_v1.h"

namespace OrvaneXMPCompareAndMerge {

class MergeError final : public CountedObject<IMergeError_v1> {
public:
    MergeError(std::string inStrategyName, std::string inText)
        : mStrategyName(std::move(inStrategyName)), mText(std::move(inText)) {}
    const std::string& GetStrategyName() const noexcept override { return mStrategyName; }
    const std::string& GetText() const noexcept override { return mText; }

private:
    const std::string mStrategyName;
    const std::string mText;
};

class ResolvedConflict final : public CountedObject<IThreeWayResolvedConflict_v1> {
public:
    struct Parts {
        SharedPath path;
        NodeType type;
        ConflictReason reason;
        Node node;
        ResolvedSource source;
        std::int32_t status;
        std::string strategyName;
    };
    explicit ResolvedConflict(Parts inParts) : mParts(std::move(inParts)) {}
    Path GetPath() const override { return mParts.path; }
    NodeType GetNodeType() const noexcept override { return mParts.type; }
    ConflictReason GetReason() const noexcept override { return mParts.reason; }
    const Node& GetResolvedNode() const noexcept override { return mParts.node; }
    ResolvedSource GetResolvedSource() const noexcept override { return mParts.source; }
    std::int32_t GetResolvedStatus() const noexcept override { return mParts.status; }
    const std::string& GetStrategyName() const noexcept override { return mParts.strategyName; }

private:
    const Parts mParts;
};

class UnResolvedConflict final : public CountedObject<IThreeWayUnResolvedConflict_v1> {
public:
    struct Parts {
        SharedPath path;
        NodeType type;
        ConflictReason reason;
        Node base;
        Node latest;
        Node user;
        RFL::InterfaceRef<IMergeError_v1> error;
    };
    explicit UnResolvedConflict(Parts inParts) : mParts(std::move(inParts)) {}
    Path GetPath() const override { return mParts.path; }
    NodeType GetNodeType() const noexcept override { return mParts.type; }
    ConflictReason GetReason() const noexcept override { return mParts.reason; }
    bool IsInArrayOrStruct() const noexcept override { return mParts.path.size() > 1; }
    const Node& GetBaseNode() const noexcept override { return mParts.base; }
    const Node& GetLatestNode() const noexcept override { return mParts.latest; }
    const Node& GetUserNode() const noexcept override { return mParts.user; }
    RFL::InterfaceRef<IMergeError_v1> GetError() const noexcept override { return mParts.error; }

private:
    const Parts mParts;
};

}  // namespace OrvaneXMPCompareAndMerge
