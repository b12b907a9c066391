// Makes history and differences for the model.
#include "CollaborationFactory.h"

#include "Collaboration/CollaborationResources.h"
#include "Collaboration/Differences.h"
#include "Collaboration/ProductionHistory.h"
#include "Model/ResourceCreation.h"

namespace ZOCL {

namespace {

class CollaborationResources final : public CollaborationFactory {
public:
    InterfaceRef<IZOCDifferences> MakeDifferences(const ImmutableString& inURL,
                                                  const InterfaceRef<IZOCDataServer>& inServer) override {
        return MakeAtURL<Differences>(inURL, inServer, ResourceWritability::kReadOnly);
    }
    InterfaceRef<IZOCProductionHistory> MakeProductionHistory(
        const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer) override {
        return MakeAtURL<ProductionHistory>(inURL, inServer, ResourceWritability::kReadOnly);
    }
};

}  // namespace

CollaborationFactory* GetCollaborationFactory() {
    static CollaborationResources factory;
    return &factory;
}

}  // namespace ZOCL
