// Start, end, and the objects that the factory makes.
#include "OrvaneXMPCompareAndMerge/Library.h"

#include <atomic>
#include <stdexcept>

#include "OrvaneXMPCompareAndMerge/detail/CountedObject.h"
#include "OrvaneXMPCompareAndMerge/detail/Merger.h"

namespace OrvaneXMPCompareAndMerge {

namespace {

std::atomic<int> gStarts{0};

class MergeResult final : public CountedObject<IThreeWayMergeResult_v1> {
public:
    explicit MergeResult(MergeOutcome inOutcome) : mOutcome(std::move(inOutcome)) {}
    const Packet& GetMergedPacket() const noexcept override { return mOutcome.merged; }
    const std::vector<Decision>& GetDecisions() const noexcept override { return mOutcome.decisions; }
    const std::vector<RFL::InterfaceRef<IThreeWayResolvedConflict_v1>>& GetResolvedConflicts()
        const noexcept override {
        return mOutcome.resolved;
    }
    const std::vector<RFL::InterfaceRef<IThreeWayUnResolvedConflict_v1>>& GetUnResolvedConflicts()
        const noexcept override {
        return mOutcome.unresolved;
    }

private:
    const MergeOutcome mOutcome;
};

class ThreeWayMerge final : public CountedObject<IThreeWayMerge_v1> {
public:
    void RegisterStrategy(
        const ostcore::shared_ptr<IThreeWayConflictResolutionStrategy_v1>& inStrategy) override {
        if (!inStrategy) {
            throw std::invalid_argument("A strategy of the XMP merge is null");
        }
        mStrategies.push_back(inStrategy);
    }
    RFL::InterfaceRef<IThreeWayMergeResult_v1> Merge(const Packet& inBase, const Packet& inLatest,
                                                     const Packet& inUser) override {
        return RFL::InterfaceRef<IThreeWayMergeResult_v1>(
            new MergeResult(Merger(inBase, inLatest, inUser, mStrategies).Run()));
    }

private:
    Strategies mStrategies;
};

}  // namespace

void StartLibrary() {
    ++gStarts;
}

void EndLibrary() {
    int starts = gStarts.load();
    while (starts > 0 && !gStarts.compare_exchange_weak(starts, starts - 1)) {
    }
}

int CreateObject(const RFL::InterfaceID& inID, void** outObject) {
    *outObject = nullptr;
    if (gStarts.load() == 0) {
        return kResultNotStarted;
    }
    if (inID != IThreeWayMerge_v1::kInterfaceID) {
        return RFL::kResultInterfaceNotSupported;
    }
    IThreeWayMerge_v1* const engine = new ThreeWayMerge;
    engine->AddRef();
    *outObject = engine;
    return RFL::kResultSuccess;
}

}  // namespace OrvaneXMPCompareAndMerge
