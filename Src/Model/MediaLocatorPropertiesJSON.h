// The JSON form of media locator properties.
#pragma once

#include "ostcore/serialization/JSON.h"
#include "ZOClient/MediaLocatorProperties.h"

namespace ZOCL {

/// From an object whose types were checked or that may throw boost::bad_any_cast.
MediaLocatorProperties ReadMediaLocatorProperties(ostcore::serialization::JSONView inObject);
ostcore::serialization::JSONValue WriteMediaLocatorProperties(const MediaLocatorProperties& inProperties);

}  // namespace ZOCL
