// Locations of media that mean something on this machine alone, kept in the registry by locator.
#pragma once

#include "ZOClient/Types.h"

namespace ZOCL {

/// Whether a location never leaves this machine.
bool IsLocalMediaLink(const ImmutableString& inHRef);

/// A failed access to the registry reads as no location, and a failed write leaves nothing behind.
/// An identifier that cannot name a single key (empty, with a backslash or NUL) has no location.
ImmutableString ReadLocalMediaLink(const ImmutableString& inLocatorID);
void WriteLocalMediaLink(const ImmutableString& inLocatorID, const ImmutableString& inHRef);
void ForgetLocalMediaLink(const ImmutableString& inLocatorID);

}  // namespace ZOCL
