// The user's session on the open production: found, made, looked at and remembered.
#pragma once

#include <optional>
#include <string>

#include "Productions.h"
#include "ZOClient/IZOCEditingSession.h"

namespace zo {

/// A loaded session. The view is the session as a production: its commit is the session's head.
struct WorkSession {
    LoadedProduction view;
    ZOCL::InterfaceRef<ZOCL::IZOCEditingSession> session;
    /// The shared production.
    std::string productionID;
    std::string productionName;
};

/// What zo remembers of the open production of the connected user; throws a Failure when there is none.
OpenRecord RequireOpen(Context& ioContext);
/// Changes that record.
void ChangeOpen(Context& ioContext, const std::function<void(OpenRecord&)>& inChange);

/// The session of the connected user on the open production, as it is now; nothing when there is none. Makes
/// nothing and remembers nothing.
std::optional<WorkSession> FindSession(Context& ioContext);
/// The same; throws a Failure (not found) when there is none.
WorkSession RequireSession(Context& ioContext);
/// Finds the session or makes it, and brings it into use.
WorkSession OpenSession(Context& ioContext);
/// From now on the reading verbs read the session, and it counts as seen by the user at this commit.
void RememberSession(Context& ioContext, const WorkSession& inSession);
/// The commit of the session that the user has seen last; as it is loaded when nothing is known.
std::string SeenCommit(Context& ioContext, const WorkSession& inSession);

/// Asks for the latest state of the session.
void RefreshSession(Context& ioContext, WorkSession& ioSession);
/// The shared production at its newest commit.
LoadedProduction LoadSharedProduction(Context& ioContext, const WorkSession& inSession);

/// The object at a URL of the hub, loaded anew.
LoadedProduction LoadByHubURL(Context& ioContext, const std::string& inURL, const std::string& inWhat);

/// What the reading verbs read: the transaction that was left open, else the session when one is in use, else
/// the shared production at the open commit, which --shared chooses in any case.
LoadedProduction LoadForReading(Context& ioContext);

/// The text under a key of a JSON answer; empty when it is not there.
std::string TextInAnswer(const boost::shared_ptr<ostnet::Response>& inResponse, const char* inKey);

/// What to say when the hub refuses since the session has moved: who moved it is looked up in its history.
Failure SessionMoved(Context& ioContext, const WorkSession& inSession, const std::string& inWhat,
                     const std::string& inSeenCommit);

}  // namespace zo
