// Of two changes of xmp:ModifyDate the later one stays.
#pragma once

#include "Collaboration/LatestDateStrategy.h"
#include "Collaboration/XMPMergeNames.h"

namespace ZOCL {

class MeridaneModifyDateStrategy final : public LatestDateStrategy {
public:
    MeridaneModifyDateStrategy() : LatestDateStrategy(XMPNames::ModifyDate()) {}

    bool InterestedInResolvingConflict(const Path& inFullPath, NodeType, ConflictReason,
                                       bool inIsInArrayOrStruct) override {
        return IsProperty(inFullPath, inIsInArrayOrStruct, XMPNames::ModifyDate());
    }
    const char* GetName() const noexcept override { return "MeridaneModifyDateStrategy"; }
};

}  // namespace ZOCL
