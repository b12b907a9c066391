// The destructors of the interfaces, each of which keeps its table in this library.
#include "OrvaneXMPCompareAndMerge/IMergeError_v1.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayMerge_v1.h"

namespace OrvaneXMPCompareAndMerge {

IMergeError_v1::~IMergeError_v1() = default;
IThreeWayConflictResolutionStrategy_v1::~IThreeWayConflictResolutionStrategy_v1() = default;
IThreeWayMerge_v1::~IThreeWayMerge_v1() = default;
IThreeWayMergeResult_v1::~IThreeWayMergeResult_v1() = default;
IThreeWayResolvedConflict_v1::~IThreeWayResolvedConflict_v1() = default;
IThreeWayUnResolvedConflict_v1::~IThreeWayUnResolvedConflict_v1() = default;

}  // namespace OrvaneXMPCompareAndMerge
