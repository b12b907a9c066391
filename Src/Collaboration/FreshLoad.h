// Loading what others may hold, and perhaps an older version of, as well.
#pragma once

#include "ZOClient/IZOCServerResource.h"

namespace ZOCL {

/// Loads a resource, or asks for its latest version when it is loaded. The completion gets 0 also when
/// nothing has changed, and a failure for an answer that the resource did not accept. False: null, or not
/// started.
bool LoadFresh(const InterfaceRef<IZOCServerResource>& inResource, const Guid& inRequestID,
               const RequestCompletion& inCompletion);

}  // namespace ZOCL
