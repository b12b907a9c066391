// Makes the objects of the model for the data server.
#include "Model/ModelResourceFactory.h"

#include "Model/Asset.h"
#include "Model/MediaLocator.h"
#include "Model/Production.h"
#include "Model/ProductionList.h"
#include "Model/ResourceCreation.h"
#include "Model/ServerResourceWithEnclosures.h"
#include "Model/User.h"

namespace ZOCL {

namespace {

class ModelResourceFactory final : public ResourceFactory {
public:
    InterfaceRef<IZOCServerResource> MakeResource(const ImmutableString& inURL,
                                                  const InterfaceRef<IZOCDataServer>& inServer,
                                                  ResourceWritability inWritability) override {
        return MakeAtURL<ServerResource>(inURL, inServer, inWritability);
    }
    InterfaceRef<IZOCProductionList> MakeProductionList(
        const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer) override {
        return MakeAtURL<ProductionList>(inURL, inServer, ResourceWritability::kReadOnly);
    }
    InterfaceRef<IZOCProduction> MakeProduction(const ImmutableString& inURL,
                                                const InterfaceRef<IZOCDataServer>& inServer,
                                                ResourceWritability inWritability) override {
        return MakeAtURL<Production>(inURL, inServer, inWritability);
    }
    InterfaceRef<IZOCAsset> MakeAsset(const ImmutableString& inURL,
                                      const InterfaceRef<IZOCDataServer>& inServer,
                                      ResourceWritability inWritability) override {
        return MakeAtURL<Asset>(inURL, inServer, inWritability);
    }
    InterfaceRef<IZOCEnclosures> MakeEnclosures(const ImmutableString& inURL,
                                                const InterfaceRef<IZOCDataServer>& inServer) override {
        return MakeAtURL<Enclosures>(inURL, inServer, ResourceWritability::kReadOnly);
    }
    InterfaceRef<IZOCMediaLocator> MakeMediaLocator(const ImmutableString& inURL, const ImmutableString& inID,
                                                    const InterfaceRef<IZOCDataServer>& inServer) override {
        return MediaLocator::Make(inURL, inID, inServer);
    }
    InterfaceRef<IZOCUser> MakeUser(const ImmutableString& inURL,
                                    const InterfaceRef<IZOCDataServer>& inServer) override {
        return MakeAtURL<User>(inURL, inServer, ResourceWritability::kReadOnly);
    }
    bool PostNewProduction(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                           const InterfaceRef<IZOCDataServer>& inServer, const UString& inName,
                           const UString& inDescription, bool inIsTemporary,
                           const RequestCompletion& inCompletion) override {
        return PostJSONForNew<Production>(inRequestID, inFactoryURL, inServer,
                                          MakeProductionCreationBody(inName, inDescription, inIsTemporary),
                                          inCompletion);
    }
};

}  // namespace

ResourceFactory* GetModelResourceFactory() {
    static ModelResourceFactory factory;
    return &factory;
}

}  // namespace ZOCL
