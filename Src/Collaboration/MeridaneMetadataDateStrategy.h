// xmp:MetadataDate and xmpMM:InstanceID follow the side whose metadata was changed last.
#pragma once

#include "Collaboration/LatestDateStrategy.h"
#include "Collaboration/XMPMergeNames.h"

namespace ZOCL {

class MeridaneMetadataDateStrategy final : public LatestDateStrategy {
public:
    MeridaneMetadataDateStrategy() : LatestDateStrategy(XMPNames::MetadataDate()) {}

    bool InterestedInResolvingConflict(const Path& inFullPath, NodeType, ConflictReason,
                                       bool inIsInArrayOrStruct) override {
        return IsProperty(inFullPath, inIsInArrayOrStruct, XMPNames::MetadataDate()) ||
               IsProperty(inFullPath, inIsInArrayOrStruct, XMPNames::InstanceID());
    }
    const char* GetName() const noexcept override { return "MeridaneMetadataDateStrategy"; }
};

}  // namespace ZOCL
