// What a host sees of an object: all its accessors in one text, so that two states can be compared.
#pragma once

#include <string>

#include "Client.h"

namespace faults {

/// Asks the object of a step everything that a host can ask without a request. An exception of an accessor
/// becomes part of the picture, and a failure of the test.
std::string PictureOf(Step inStep, const InterfaceRef<IZOCServerResource>& inResource);

}  // namespace faults
