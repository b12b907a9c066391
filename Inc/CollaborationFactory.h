// How the model makes what tells of its history and differences without knowing the floor above it.
#pragma once

#include "ZOClient/IZOCDataServer.h"
#include "ZOClient/IZOCDifferences.h"
#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

/// Declared low, implemented by the collaboration floor, set once in the composition root at Initialize.
/// Each operation makes an unloaded object at a URL and sends nothing; null for a null URL.
class CollaborationFactory {
public:
    virtual ~CollaborationFactory() = default;

    virtual InterfaceRef<IZOCDifferences> MakeDifferences(const ImmutableString& inURL,
                                                          const InterfaceRef<IZOCDataServer>& inServer) = 0;
    virtual InterfaceRef<IZOCProductionHistory> MakeProductionHistory(
        const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer) = 0;
};

}  // namespace ZOCL
