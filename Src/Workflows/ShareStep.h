// One attempt to share a session.
#pragma once

#include "ZOClient/IZOCEditingSession.h"
#include "ZOClient/Publish.h"

namespace ZOCL {

struct ShareStep {
    InterfaceRef<IZOCEditingSession> session;
    UString productionName;
    UString comment;
    /// The session's commit that the user has seen.
    ImmutableString commitId;
    Publish::PublishCompletion completion;
    /// No window of any kind.
    bool isSilent = false;
};

struct ShareOutcome {
    int result = kResultFailure;
    /// The server has made a commit of the production; the result alone does not say so.
    bool isShared = false;
    /// That commit; null without one.
    ImmutableString commitId;
};

/// Shares under a progress window, tells the user and the completion what became of it. Without a session or
/// a commit nothing happens and nobody is told. Main thread.
ShareOutcome RunShareStep(const ShareStep& inStep);

}  // namespace ZOCL
