// The factory through which the model makes history and differences.
#pragma once

#include "CollaborationFactory.h"

namespace ZOCL {

/// Lives as long as the process.
CollaborationFactory* GetCollaborationFactory();

}  // namespace ZOCL
