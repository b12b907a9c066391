// What merges and comparisons tell, as JSON. The schema is in Docs/xmp-merge.md.
#pragma once

#include <string>
#include <vector>

#include "OrvaneXMPCompareAndMerge/Differences.h"
#include "OrvaneXMPCompareAndMerge/IThreeWayMergeResult_v1.h"
#include "ostcore/Export.h"

namespace OrvaneXMPCompareAndMerge {

/// One object in UTF-8, without a line break at its end.
ZOPLATFORM_EXPORT std::string MergeReport(const IThreeWayMergeResult_v1& inResult);
/// The prefixes of inNew and then those of inOld are used in paths.
ZOPLATFORM_EXPORT std::string DifferenceReport(const std::vector<Difference>& inDifferences,
                                               const Packet& inOld, const Packet& inNew);

}  // namespace OrvaneXMPCompareAndMerge
