// A conflict of a three-way merge that a strategy settled.
#pragma once

#include <string>

#include "OrvaneXMPCompareAndMerge/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Immutable. Threads: any.
class ZOPLATFORM_EXPORT IThreeWayResolvedConflict_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d705265736full, 0x6c76656443660001ull};

    virtual Path GetPath() const = 0;
    virtual NodeType GetNodeType() const noexcept = 0;
    virtual ConflictReason GetReason() const noexcept = 0;
    /// As the strategy gave them. An absent node was taken out.
    virtual const Node& GetResolvedNode() const noexcept = 0;
    virtual ResolvedSource GetResolvedSource() const noexcept = 0;
    virtual std::int32_t GetResolvedStatus() const noexcept = 0;
    virtual const std::string& GetStrategyName() const noexcept = 0;

protected:
    ~IThreeWayResolvedConflict_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
