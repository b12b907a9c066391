// Writing an enclosure of a list: over the one of its name, or as a new one.
#pragma once

#include "Model/ServerResourceWithEnclosures.h"

namespace ZOCL {

struct EnclosureWrite {
    /// Loaded.
    InterfaceRef<Enclosures> list;
    InterfaceRef<IZOCDataServer> server;
    ImmutableString name;
    shared_ptr<RecycledMemory const> payload;
    ImmutableString contentType;
};

/// One request; the list knows a new enclosure when it has ended. The completion's resource answers
/// IZOCEnclosure.
bool StartEnclosureWrite(const EnclosureWrite& inWrite, const Guid& inRequestID,
                         const RequestCompletion& inCompletion);

}  // namespace ZOCL
