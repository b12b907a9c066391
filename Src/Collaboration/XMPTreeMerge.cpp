// Puts the engine and the strategies together.
#include "Collaboration/XMPTreeMerge.h"

#include "Collaboration/MeridaneHistoryStrategy.h"
#include "Collaboration/MeridaneMarkerStrategy.h"
#include "Collaboration/MeridaneMetadataDateStrategy.h"
#include "Collaboration/MeridaneModifyDateStrategy.h"
#include "OrvaneXMPCompareAndMerge/Library.h"

namespace ZOCL {

namespace {

/// A merge without a hub needs nothing else of this library to be started.
class MergeLibraryUse {
public:
    MergeLibraryUse() { OrvaneXMPCompareAndMerge::StartLibrary(); }
    ~MergeLibraryUse() { OrvaneXMPCompareAndMerge::EndLibrary(); }
    MergeLibraryUse(const MergeLibraryUse&) = delete;
    MergeLibraryUse& operator=(const MergeLibraryUse&) = delete;
};

}  // namespace

RFL::InterfaceRef<OrvaneXMPCompareAndMerge::IThreeWayMergeResult_v1> MergeXMPTrees(
    const OrvaneXMP::Packet& inBase, const OrvaneXMP::Packet& inLatest, const OrvaneXMP::Packet& inUser) {
    const MergeLibraryUse use;
    const auto engine = OrvaneXMPCompareAndMerge::Create<OrvaneXMPCompareAndMerge::IThreeWayMerge_v1>();
    // Strategies keep what they have decided, so each merge has its own.
    engine->RegisterStrategy(MakeXMPMergeStrategy<MeridaneMetadataDateStrategy>());
    engine->RegisterStrategy(MakeXMPMergeStrategy<MeridaneHistoryStrategy>());
    engine->RegisterStrategy(MakeXMPMergeStrategy<MeridaneMarkerStrategy>());
    engine->RegisterStrategy(MakeXMPMergeStrategy<MeridaneModifyDateStrategy>());
    return engine->Merge(inBase, inLatest, inUser);
}

}  // namespace ZOCL
