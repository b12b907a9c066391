// How the connection floor makes objects of the floors above it without knowing them.
#pragma once

#include <atomic>

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// Declared low, implemented by the model floor, and set once by the composition root at Initialize.
/// Each operation makes an unloaded object at a URL and sends nothing; null for a null URL.
class ResourceFactory {
public:
    virtual ~ResourceFactory() = default;

    virtual InterfaceRef<IZOCServerResource> MakeResource(const ImmutableString& inURL,
                                                          const InterfaceRef<IZOCDataServer>& inServer,
                                                          ResourceWritability inWritability) = 0;
    virtual InterfaceRef<IZOCProductionList> MakeProductionList(
        const ImmutableString& inURL, const InterfaceRef<IZOCDataServer>& inServer) = 0;
    virtual InterfaceRef<IZOCProduction> MakeProduction(const ImmutableString& inURL,
                                                        const InterfaceRef<IZOCDataServer>& inServer,
                                                        ResourceWritability inWritability) = 0;
    virtual InterfaceRef<IZOCAsset> MakeAsset(const ImmutableString& inURL,
                                              const InterfaceRef<IZOCDataServer>& inServer,
                                              ResourceWritability inWritability) = 0;
    virtual InterfaceRef<IZOCEnclosures> MakeEnclosures(const ImmutableString& inURL,
                                                        const InterfaceRef<IZOCDataServer>& inServer) = 0;
    /// At the expanded template of the identifier.
    virtual InterfaceRef<IZOCMediaLocator> MakeMediaLocator(const ImmutableString& inURL,
                                                            const ImmutableString& inID,
                                                            const InterfaceRef<IZOCDataServer>& inServer) = 0;
    virtual InterfaceRef<IZOCUser> MakeUser(const ImmutableString& inURL,
                                            const InterfaceRef<IZOCDataServer>& inServer) = 0;
    /// Posts the creation of a production to a factory; the completion's resource answers IZOCProduction.
    virtual bool PostNewProduction(const Guid& inRequestID, const ImmutableString& inFactoryURL,
                                   const InterfaceRef<IZOCDataServer>& inServer, const UString& inName,
                                   const UString& inDescription, bool inIsTemporary,
                                   const RequestCompletion& inCompletion) = 0;
};

class CollaborationFactory;
class OutageMinder;
class PollCancellation;

/// What the composition root puts in place; each pointer is null before Initialize and after Shutdown. What
/// they point to lives as long as the process.
struct CompositionRoot {
    std::atomic<ResourceFactory*> resources{nullptr};
    std::atomic<CollaborationFactory*> collaboration{nullptr};
    std::atomic<OutageMinder*> outages{nullptr};
    std::atomic<PollCancellation*> polls{nullptr};
};
/// Written by Initialize and Shutdown on the main thread only. Read on any thread at any time: an operation
/// that Shutdown has cut off may still come to its end.
CompositionRoot& GetCompositionRoot();

}  // namespace ZOCL
