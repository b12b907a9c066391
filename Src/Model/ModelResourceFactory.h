// The factory through which the connection floor makes objects of the model.
#pragma once

#include "ResourceFactory.h"

namespace ZOCL {

/// Lives as long as the process.
ResourceFactory* GetModelResourceFactory();

}  // namespace ZOCL
