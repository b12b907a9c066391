// Walks a history, page by page, newest version first.
#pragma once

#include "ZOClient/IZOCProductionHistory.h"

namespace ZOCL {

/// Loads the page and those behind it, and shows each version to the visitor until it ends the walk. The
/// completion runs once, on a worker: with the visitor's result and the version at which it ended the walk;
/// with kResultHTTPNotFound and null when nothing was left to show; or with the failure of a load. A history
/// that leads back to a page that was shown ends there. False: nothing was started.
bool WalkHistory(const InterfaceRef<IZOCProductionHistory>& inFirstPage, const HistoryVisitor& inVisitor,
                 const HistoryWalkCompletion& inCompletion);

}  // namespace ZOCL
