// The three-way merge of XMP packets with all strategies of this library.
#pragma once

#include "OrvaneXMPCompareAndMerge/IThreeWayMergeResult_v1.h"

namespace ZOCL {

/// By the rules of Docs/xmp-merge.md; never null. Throws std::bad_alloc alone. Threads: any.
RFL::InterfaceRef<OrvaneXMPCompareAndMerge::IThreeWayMergeResult_v1> MergeXMPTrees(
    const OrvaneXMP::Packet& inBase, const OrvaneXMP::Packet& inLatest, const OrvaneXMP::Packet& inUser);

}  // namespace ZOCL
