// Asks a data server for its caches; a server of another make has none, and then nothing is kept.
#include "Model/DataServerCaches.h"

#include "ResourceCaches.h"

namespace ZOCL {

void CacheMediaLocator(const InterfaceRef<IZOCDataServer>& inServer,
                       const InterfaceRef<IZOCMediaLocator>& inLocator) {
    if (const auto caches = RFL::QueryInterface<ResourceCaches>(inServer)) {
        caches->CacheMediaLocator(inLocator);
    }
}

void ForgetCachedMediaLocator(const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inID) {
    if (const auto caches = RFL::QueryInterface<ResourceCaches>(inServer)) {
        caches->ClearMediaLocatorFromCache(inID);
    }
}

InterfaceRef<IZOCProduction> FindOrMakeProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                  const ImmutableString& inURL) {
    const auto caches = RFL::QueryInterface<ResourceCaches>(inServer);
    return caches ? caches->FindOrMakeProduction(inURL) : InterfaceRef<IZOCProduction>();
}

InterfaceRef<IZOCProduction> FindCachedProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                  const ImmutableString& inURL) {
    const auto caches = RFL::QueryInterface<ResourceCaches>(inServer);
    return caches ? caches->GetCachedProduction(inURL) : InterfaceRef<IZOCProduction>();
}

void CacheProduction(const InterfaceRef<IZOCDataServer>& inServer,
                     const InterfaceRef<IZOCProduction>& inProduction) {
    if (const auto caches = RFL::QueryInterface<ResourceCaches>(inServer)) {
        caches->CacheProduction(inProduction);
    }
}

void ForgetCachedProduction(const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inURL) {
    if (const auto caches = RFL::QueryInterface<ResourceCaches>(inServer)) {
        caches->ClearProductionFromCache(inURL);
    }
}

}  // namespace ZOCL
