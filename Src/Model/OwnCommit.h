// Finds out whether a change that is refused has gone through already: its answer was lost, it was sent
// again, and the server did not know it by its key.
#pragma once

#include "ZOClient/IZOCDataServer.h"

namespace ZOCL {

class Production;

/// Gets the session, loaded as it is now, and the answer that it was loaded from; nulls when the change is
/// not found, or could not be looked for.
using OwnCommitCompletion =
    function<void(const InterfaceRef<Production>& inSession, const shared_ptr<ostnet::Response>& inAnswer)>;

/// Looks for the commit of a transaction in the newest history of its session, by the identifier of the
/// request, which stands in the title of that commit and of no other. The completion is called once, on a
/// worker or, when nothing can be started, on the stack. Threads: any.
void FindOwnCommit(const ImmutableString& inSessionURL, const InterfaceRef<IZOCDataServer>& inServer,
                   const Guid& inRequestID, const OwnCommitCompletion& inCompletion);

struct ShareAttempt {
    /// The commit of the session that was to be shared.
    ImmutableString commit;
    UString message;
};

/// Looks whether the session stands on a newest shared commit that is what it was to share: of this user,
/// with this message, and with exactly the content of that commit of the session. Called as above.
void FindOwnShare(const ImmutableString& inSessionURL, const InterfaceRef<IZOCDataServer>& inServer,
                  const ShareAttempt& inAttempt, const OwnCommitCompletion& inCompletion);

}  // namespace ZOCL
