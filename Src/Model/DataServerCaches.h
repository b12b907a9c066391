// What the model asks of a data server's caches of objects.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

/// Enters a locator under its identifier, in place of any other.
void CacheMediaLocator(const InterfaceRef<IZOCDataServer>& inServer,
                       const InterfaceRef<IZOCMediaLocator>& inLocator);
void ForgetCachedMediaLocator(const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inID);
/// The object that the server gives out for a URL, not loaded by this call; null for a null URL and for a
/// server without caches.
InterfaceRef<IZOCProduction> FindOrMakeProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                  const ImmutableString& inURL);
/// The object that the server gives out for a URL already; null when there is none.
InterfaceRef<IZOCProduction> FindCachedProduction(const InterfaceRef<IZOCDataServer>& inServer,
                                                  const ImmutableString& inURL);
/// Makes a production the one that the server gives out for its URL.
void CacheProduction(const InterfaceRef<IZOCDataServer>& inServer,
                     const InterfaceRef<IZOCProduction>& inProduction);
void ForgetCachedProduction(const InterfaceRef<IZOCDataServer>& inServer, const ImmutableString& inURL);

}  // namespace ZOCL
