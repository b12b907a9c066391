// The data server's caches of live objects and of payloads, for the floors that fill and clear them.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// Every data server of this library answers the query for it. Threads: any; the global lock is taken for the
/// look-up alone.
class ResourceCaches : public RFL::RFLUnknown {
public:
    static constexpr RFL::InterfaceID kInterfaceID{0x7a6f634f626a6563ull, 0x7443616368650001ull};

    /// Under the production's URL, in the place of another one.
    virtual void CacheProduction(const InterfaceRef<IZOCProduction>& inProduction) = 0;
    virtual InterfaceRef<IZOCProduction> GetCachedProduction(const ImmutableString& inURL) = 0;
    /// From the cache, or a new one that is cached and not loaded; null for a null URL.
    virtual InterfaceRef<IZOCProduction> FindOrMakeProduction(const ImmutableString& inURL) = 0;
    /// Under the locator's identifier, in the place of another one. A locator that leads nowhere is left out.
    virtual void CacheMediaLocator(const InterfaceRef<IZOCMediaLocator>& inLocator) = 0;
    virtual InterfaceRef<IZOCMediaLocator> GetCachedMediaLocator(const ImmutableString& inID) = 0;
    virtual void ClearProductionFromCache(const ImmutableString& inURL) = 0;
    virtual void ClearMediaLocatorFromCache(const ImmutableString& inID) = 0;
    /// Keeps a payload that this client has just written and the server knows by that content identifier, so
    /// that it need not be fetched; the work is done on a worker.
    virtual void CacheContent(const ImmutableString& inContentID,
                              const shared_ptr<RecycledMemory const>& inPayload) = 0;
};

}  // namespace ZOCL
