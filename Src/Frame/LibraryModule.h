// The files that are compiled into this library: layouts, icons and dictionaries.
#pragma once

#include "ostcore/utility/BinaryResource.h"

namespace ZOCL {

/// Threads: any.
const ostcore::utility::BinaryModule& GetLibraryModule();

}  // namespace ZOCL
