// Names that every header of the client library shares.
#pragma once

#include <string>
#include <vector>

#include "ostcore/Types.h"
#include "ostcore/utility/Guid.h"
#include "ostcore/utility/ImmutableString.h"
#include "ostcore/utility/RecycledMemory.h"
#include "ostnet/Response.h"
#include "RFL/RFLUnknown.h"

namespace ZOCL {

using ostcore::utility::Guid;
using ostcore::utility::ImmutableString;
using ostcore::utility::RecycledMemory;
using RFL::InterfaceRef;

class IZOCServerResource;
class IZOCDataServer;

/// Tells how a request of a resource ended: the request's identifier, a result code (ResultCodes.h), the
/// resource, and the response, each of the latter two null when there is none. Called exactly once when the
/// starting call returned true, on a worker of the network layer with no lock held, unless the operation
/// says that it may call on the caller's stack.
using RequestCompletion =
    function<void(const Guid& inRequestID, int inResult, const InterfaceRef<IZOCServerResource>& inResource,
                  const shared_ptr<ostnet::Response>& inResponse)>;

/// Whether a resource may be written through.
enum class ResourceWritability { kReadOnly = 0, kWritable = 1, kKeep = 2 };

}  // namespace ZOCL
