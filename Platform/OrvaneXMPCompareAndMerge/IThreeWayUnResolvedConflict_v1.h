// A conflict of a three-way merge that is left to a person.
#pragma once

#include "OrvaneXMPCompareAndMerge/IMergeError_v1.h"
#include "OrvaneXMPCompareAndMerge/Types.h"
#include "RFL/RFLUnknown.h"

namespace OrvaneXMPCompareAndMerge {

/// Immutable. Threads: any.
class ZOPLATFORM_EXPORT IThreeWayUnResolvedConflict_v1 : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x6f586d70556e5265ull, 0x736f6c7643660001ull};

    virtual Path GetPath() const = 0;
    virtual NodeType GetNodeType() const noexcept = 0;
    virtual ConflictReason GetReason() const noexcept = 0;
    virtual bool IsInArrayOrStruct() const noexcept = 0;
    /// The nodes of the three sides, absent where the property does not exist.
    virtual const Node& GetBaseNode() const noexcept = 0;
    virtual const Node& GetLatestNode() const noexcept = 0;
    virtual const Node& GetUserNode() const noexcept = 0;
    /// Null unless a strategy was interested and failed with an exception or a result that fits nowhere.
    virtual RFL::InterfaceRef<IMergeError_v1> GetError() const noexcept = 0;

protected:
    ~IThreeWayUnResolvedConflict_v1() override;
};

}  // namespace OrvaneXMPCompareAndMerge
